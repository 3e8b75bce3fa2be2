// SPDX-License-Identifier: Apache-2.0
// ManifestReader: one reading of one manifest file. It works on its own references and touches the
// manifest's version, type and signing time only when everything held: what callers read from those
// is always what was proved. Only who asks for the evidence of a manifest whose authority is not to
// be judged is told what the file says.
#ifndef VESK2_SRC_MANIFEST_MANIFEST_READER_H
#define VESK2_SRC_MANIFEST_MANIFEST_READER_H

#include <vesk2/cert.h>
#include <vesk2/evidence.h>
#include <vesk2/manifest.h>
#include <vesk2/ref.h>

#include "src/frame/handles.h"
#include "src/manifest/signed_digest.h"

namespace ZvVesk2 {

class ManifestReader {
 public:
  ManifestReader(Manifest& manifest, bool verifyChain, long notBefore, long notAfter)
      : manifest_(manifest),
        own_(manifest.context),
        evidence_(manifest.evidence != nullptr ? *manifest.evidence : own_),
        readsOn_(manifest.evidence != nullptr),
        verifyChain_(verifyChain),
        notBefore_(notBefore),
        notAfter_(notAfter) {}

  // See Manifest::ReadManifest.
  [[nodiscard]] int Read(ZvBuffer** body);

 private:
  [[nodiscard]] int ReadFile(ZvBuffer** body);
  // Refuse returns `code`, which ends the reading, or keeps it as the answer and returns 0.
  [[nodiscard]] int Refuse(int code);
  // One for each part of the form, in its order; what each matches is written above its body.
  [[nodiscard]] int ReadHead();
  [[nodiscard]] int ReadVersion();
  [[nodiscard]] int ReadType();
  [[nodiscard]] int ReadSigningTime();
  [[nodiscard]] int ReadSignatureBlock();
  [[nodiscard]] int ReadSigner();
  [[nodiscard]] int ReadSignature(Cert& cert);
  [[nodiscard]] int ReadRevocationLists(SExpression& lists);
  // And what authority is asked of, in the order in which a failure is told.
  [[nodiscard]] int SetPeriod();
  [[nodiscard]] int LoadEntries();
  [[nodiscard]] int LoadLists(SExpression* carried);
  [[nodiscard]] int ProveAuthority(SExpression& carried);
  [[nodiscard]] int AskAuthority(SExpression* carried);
  // The content: whether it is the one that was signed, and for evidence whether it is whole.
  [[nodiscard]] int ProveBody(ZvBuffer** body);
  [[nodiscard]] int InspectBody(const unsigned char* bytes, size_t length, int contentCode);
  [[nodiscard]] int CheckDigest(const unsigned char* body, size_t length);

  void Publish();
  // Whether what the file says is wanted, proved or not.
  bool Inspects() const { return readsOn_ && !verifyChain_; }

  Vesk2ContextStruct* Context() const { return manifest_.context; }

  Manifest& manifest_;
  // Judging needs one, also when nobody asked for it.
  Evidence own_;
  Evidence& evidence_;
  // Whether the caller wants the evidence of what comes after a refusal.
  const bool readsOn_;
  // The answer, while reading goes on; and the byte at which it was found.
  int refusal_ = 0;
  size_t refusedAt_ = 0;
  const bool verifyChain_;
  const long notBefore_;
  const long notAfter_;
  BufferOwner buffer_;
  ManifestHead head_;
  // The one in the head, shared with it.
  Ref<TimeStamp> signingTime_;
  Ref<Cert> signer_;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_MANIFEST_MANIFEST_READER_H
