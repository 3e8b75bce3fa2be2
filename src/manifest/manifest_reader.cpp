// SPDX-License-Identifier: Apache-2.0
// The reader of manifest files:
//
//   (8:manifest(7:version1:1<text>)(4:type5:plain)
//     (15:signature-block(15:time-of-signing<stamp>)
//        <signer certificate><signature><certificate><signature>...)
//     (3:crl<revocation list sequence>...)
//     <body>)
//
// (without the blanks). The signer certificate's subject is the hash over the version, type and
// time elements and the body's bytes; the revocation lists and the certificates are outside it.
#include "src/manifest/manifest_reader.h"

#include <utility>

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>
#include <vesk2/hash.h>
#include <vesk2/manifest_body.h>
#include <vesk2/signature.h>

#include "src/frame/check.h"
#include "src/objects/build.h"
#include "src/platform/wait.h"
#include "src/sexpr/same.h"
#include "src/trust/lists.h"
#include "src/trust/revocation_lists.h"

namespace ZvVesk2 {
namespace {

constexpr unsigned kStampLength = 19;

}  // namespace

int ManifestReader::Read(ZvBuffer** body) {
  if (body != nullptr) *body = nullptr;
  manifest_.ClearRead();
  if (Inspects()) manifest_.listing.reset();
  evidence_.Clear(Evidence::SignedManifest);
  const ZVsysutil::ZvCall call;
  const char* const path = manifest_.manifestPath.get();
  const int opened = WrapFile(buffer_, path, VESK2_ERR_OPEN_MANIFEST_FILE);
  VESK2_REQUIRE(opened != VESK2_ERR_READ_FILE, VESK2_ERR_OPEN_MANIFEST_FILE);
  VESK2_TRY(opened);
  const int code = ReadFile(body);
  manifest_.readPosition = refusal_ != 0 ? refusedAt_ : buffer_->Position();
  VESK2_REQUIRE(!LacksMemory(code), code);
  if (Inspects()) Publish();
  VESK2_TRY(refusal_);
  VESK2_TRY(code);
  Publish();
  return 0;
}

void ManifestReader::Publish() {
  manifest_.version = Ref<SExpression>::Share(head_.version.get());
  manifest_.type = Ref<SExpression>::Share(head_.type.get());
  manifest_.signingTime = Ref<TimeStamp>::Share(signingTime_.get());
}

int ManifestReader::ReadFile(ZvBuffer** body) {
  VESK2_TRY(ReadHead());
  VESK2_TRY(ReadSignatureBlock());
  Ref<SExpression> carried(TryNew<SExpression>(Context()));
  VESK2_REQUIRE(carried, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(verifyChain_ ? ProveAuthority(*carried) : ReadRevocationLists(*carried));
  return ProveBody(body);
}

int ManifestReader::Refuse(int code) {
  VESK2_REQUIRE(code != 0 && readsOn_ && !LacksMemory(code), code);
  if (refusal_ == 0) {
    refusal_ = code;
    refusedAt_ = buffer_->Position();
  }
  return 0;
}

int ManifestReader::ReadHead() {
  VESK2_TRY(buffer_->Expect("(8:manifest(7:version"));
  VESK2_TRY(ReadVersion());
  VESK2_TRY(buffer_->Expect(")(4:type"));
  VESK2_TRY(ReadType());
  VESK2_TRY(buffer_->Expect(")(15:signature-block(15:time-of-signing"));
  VESK2_TRY(ReadSigningTime());
  return buffer_->Expect(")");
}

int ManifestReader::ReadVersion() {
  Ref<ByteString> number;
  VESK2_TRY(ImportNew(number, buffer_.get(), Context()));
  VESK2_REQUIRE(number->IsEqual("1"), VESK2_ERR_MANIFEST_VERSION);
  // The second text is the signer's own; it is only carried into the digest.
  Ref<ByteString> text;
  VESK2_TRY(ImportNew(text, buffer_.get(), Context()));
  VESK2_TRY(SExpression::Create(head_.version.Out(), "version", Context()));
  VESK2_TRY(Append(head_.version.get(), std::move(number)));
  return Append(head_.version.get(), std::move(text));
}

int ManifestReader::ReadType() {
  Ref<ByteString> name;
  VESK2_TRY(ImportNew(name, buffer_.get(), Context()));
  VESK2_REQUIRE(name->IsEqual("plain"), VESK2_ERR_MANIFEST_TYPE);
  VESK2_TRY(SExpression::Create(head_.type.Out(), "type", Context()));
  return Append(head_.type.get(), std::move(name));
}

int ManifestReader::ReadSigningTime() {
  VESK2_TRY(ImportNew(signingTime_, buffer_.get(), Context()));
  // Stamps are compared by their 19 characters; a shorter or longer text is no moment.
  VESK2_REQUIRE(signingTime_->GetLength() == kStampLength, VESK2_ERR_TIME_STAMP);
  evidence_.SetSigningTime(signingTime_.get());
  VESK2_TRY(SExpression::Create(head_.time.Out(), "time-of-signing", Context()));
  return Append(head_.time.get(), Ref<TimeStamp>::Share(signingTime_.get()));
}

int ManifestReader::ReadSignatureBlock() {
  VESK2_TRY(ReadSigner());
  // The signer certificate speaks for the content only; at least one more must speak for its
  // issuer.
  do {
    Ref<Cert> cert;
    VESK2_TRY(ImportNew(cert, buffer_.get(), Context()));
    VESK2_TRY(ReadSignature(*cert));
  } while (buffer_->Peek() == '(');
  return buffer_->Expect(")");
}

int ManifestReader::ReadSigner() {
  VESK2_TRY(ImportNew(signer_, buffer_.get(), Context()));
  VESK2_TRY(Refuse(signer_->GetSubject()->IsHash() ? 0 : VESK2_ERR_NOT_OBJECT_CERT));
  return ReadSignature(*signer_);
}

int ManifestReader::ReadSignature(Cert& cert) {
  Ref<Signature> signature;
  VESK2_TRY(ImportNew(signature, buffer_.get(), Context()));
  const int code = signature->Verify(&cert);
  VESK2_TRY(evidence_.AddCert(&cert, signature.get(), code));
  return Refuse(code);
}

// Reads the revocation lists that the manifest carries.
int ManifestReader::ReadRevocationLists(SExpression& lists) {
  evidence_.SetLists(nullptr, &lists);
  VESK2_TRY(buffer_->Expect("(3:crl"));
  while (buffer_->Peek() == '(') {
    Ref<CrlSequence> sequence;
    VESK2_TRY(ImportNew(sequence, buffer_.get(), Context()));
    VESK2_TRY(Append(&lists, std::move(sequence)));
  }
  return buffer_->Expect(")");
}

// The period that the grant must meet; with both times 0 the moment of signing.
int ManifestReader::SetPeriod() {
  Ref<TimeStamp> first;
  Ref<TimeStamp> last;
  if (notBefore_ != 0) VESK2_TRY(MakeStamp(first, notBefore_, Context()));
  if (notAfter_ != 0) VESK2_TRY(MakeStamp(last, notAfter_, Context()));
  evidence_.SetPeriod(first.get(), last.get());
  return 0;
}

int ManifestReader::LoadEntries() {
  Ref<SExpression> acls;
  VESK2_TRY(AclEntry::Import(acls.Out(), Context(), manifest_.extraAclDirectory.get()));
  evidence_.SetEntries(acls.get());
  return 0;
}

int ManifestReader::LoadLists(SExpression* carried) {
  Ref<SExpression> stored;
  VESK2_TRY(CrlSequence::ImportStore(stored.Out(), evidence_.GetEntries(), Context()));
  evidence_.SetLists(stored.get(), carried);
  return evidence_.MarkRevoked();
}

int ManifestReader::ProveAuthority(SExpression& carried) {
  VESK2_TRY(Refuse(SetPeriod()));
  VESK2_TRY(Refuse(LoadEntries()));
  VESK2_TRY(ReadRevocationLists(carried));
  return evidence_.GetEntries() != nullptr ? AskAuthority(&carried) : 0;
}

int ManifestReader::AskAuthority(SExpression* carried) {
  VESK2_TRY(Refuse(LoadLists(carried)));
  if (refusal_ != 0) return 0;
  // What cannot be stored changes no answer.
  if (manifest_.storeUpdate) {
    static_cast<void>(RevocationLists(evidence_.GetEntries(), carried).Store(carried));
  }
  return Refuse(evidence_.Prove(manifest_.tag.get()));
}

int ManifestReader::ProveBody(ZvBuffer** body) {
  // All that is left but the final ")".
  VESK2_REQUIRE(buffer_->Remaining() > 0, VESK2_ERR_PARSE_FILE);
  const size_t length = buffer_->Remaining() - 1;
  const unsigned char* const bytes = buffer_->Data();
  const int digest = CheckDigest(bytes, length);
  VESK2_TRY(Refuse(digest));
  if (refusal_ != 0 || Inspects()) VESK2_TRY(InspectBody(bytes, length, digest));
  if (refusal_ != 0) return 0;
  buffer_->Skip(length);
  VESK2_TRY(buffer_->Expect(")"));
  if (body == nullptr) return 0;
  *body = ZVsysutil::zv_buffer_wrap(bytes, length);
  return *body != nullptr ? 0 : VESK2_ERR_FILE_OPEN;
}

// Notes whether a body, refused or not, is whole.
int ManifestReader::InspectBody(const unsigned char* bytes, size_t length, int contentCode) {
  const size_t start = buffer_->Position();
  const BufferOwner body(ZVsysutil::zv_buffer_wrap(bytes, length));
  VESK2_REQUIRE(body, VESK2_ERR_MEM_ALLOC);
  std::unique_ptr<BodyDirectory> listing(TryNew<BodyDirectory>(Context()));
  VESK2_REQUIRE(listing, VESK2_ERR_MEM_ALLOC);
  int code = listing->ParseBody(body.get(), nullptr);
  VESK2_REQUIRE(!LacksMemory(code), code);
  if (code == 0 && body->Remaining() != 0) code = VESK2_ERR_PARSE_FILE;
  evidence_.SetContent(contentCode, code, start + body->Position());
  if (Inspects() && code == 0) manifest_.listing = std::move(listing);
  return 0;
}

int ManifestReader::CheckDigest(const unsigned char* body, size_t length) {
  auto* const signedDigest = dynamic_cast<Hash*>(signer_->GetSubject());
  VESK2_REQUIRE(signedDigest != nullptr, VESK2_ERR_NOT_OBJECT_CERT);
  Ref<Hash> digest;
  VESK2_TRY(SignedDigest(digest, signedDigest->GetAlgorithm(), head_, body, length));
  bool same = false;
  VESK2_TRY(CompareValues(same, digest.get(), signedDigest));
  return same ? 0 : VESK2_ERR_HASH_MATCH;
}

}  // namespace ZvVesk2
