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
// time elements and the body's bytes; the revocation lists and the certificates are outside it. It
// reads once, from the front, in the order of the file: form, signatures, authority, content. The
// first failure is the answer. Who wants evidence is told more: the reader then keeps that answer
// and reads on (Refuse), as long as the form allows.
//
// What it costs: an exponentiation for each certificate and list, a reduction with its budget, a
// digest of the file. A file is at most Limits::kMaxFile bytes.
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

// The file is read whole before anything is looked at: what is proved and what is handed on are the
// same bytes, whatever happens to the file.
int ManifestReader::Read(ZvBuffer** body) {
  if (body != nullptr) *body = nullptr;
  manifest_.ClearRead();
  if (Inspects()) manifest_.listing.reset();
  evidence_.Clear(Evidence::SignedManifest);
  const ZVsysutil::ZvCall call;
  const char* const path = manifest_.manifestPath.get();
  const int opened = WrapFile(buffer_, path, VESK2_ERR_OPEN_MANIFEST_FILE);
  // For a manifest, and unlike a list in the store, "held" and "not there" are both a no.
  VESK2_REQUIRE(opened != VESK2_ERR_READ_FILE, VESK2_ERR_OPEN_MANIFEST_FILE);
  VESK2_TRY(opened);
  const int code = ReadFile(body);
  // Where it stopped making sense, or where the answer was found.
  manifest_.readPosition = refusal_ != 0 ? refusedAt_ : buffer_->Position();
  VESK2_REQUIRE(!LacksMemory(code), code);
  if (Inspects()) Publish();
  VESK2_TRY(refusal_);
  VESK2_TRY(code);
  Publish();
  return 0;
}

// Shared with the evidence, which may outlive the manifest.
void ManifestReader::Publish() {
  manifest_.version = Ref<SExpression>::Share(head_.version.get());
  manifest_.type = Ref<SExpression>::Share(head_.type.get());
  manifest_.signingTime = Ref<TimeStamp>::Share(signingTime_.get());
}

// The lists lie between the certificates and the body, so that authority is asked before the
// content is known to be the signed one: the answers keep that order.
int ManifestReader::ReadFile(ZvBuffer** body) {
  VESK2_TRY(ReadHead());
  VESK2_TRY(ReadSignatureBlock());
  Ref<SExpression> carried(TryNew<SExpression>(Context()));
  VESK2_REQUIRE(carried, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(verifyChain_ ? ProveAuthority(*carried) : ReadRevocationLists(*carried));
  return ProveBody(body);
}

// A lack of memory is never kept: with it nothing is known, and going on would only find it again.
// The first answer stays, so that evidence changes no answer.
int ManifestReader::Refuse(int code) {
  VESK2_REQUIRE(code != 0 && readsOn_ && !LacksMemory(code), code);
  if (refusal_ == 0) {
    refusal_ = code;
    refusedAt_ = buffer_->Position();
  }
  return 0;
}

// What is hashed later is made anew from what is read here.
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

// One type is known, whose body is a listing; another would be read wrong.
int ManifestReader::ReadType() {
  Ref<ByteString> name;
  VESK2_TRY(ImportNew(name, buffer_.get(), Context()));
  VESK2_REQUIRE(name->IsEqual("plain"), VESK2_ERR_MANIFEST_TYPE);
  VESK2_TRY(SExpression::Create(head_.type.Out(), "type", Context()));
  return Append(head_.type.get(), std::move(name));
}

// It is the signer's word. With no period given it decides what chain is good, so that at least it
// must be one.
int ManifestReader::ReadSigningTime() {
  VESK2_TRY(ImportNew(signingTime_, buffer_.get(), Context()));
  // Stamps are compared by their 19 characters; a shorter or longer text is no moment.
  VESK2_REQUIRE(signingTime_->GetLength() == kStampLength, VESK2_ERR_TIME_STAMP);
  evidence_.SetSigningTime(signingTime_.get());
  VESK2_TRY(SExpression::Create(head_.time.Out(), "time-of-signing", Context()));
  return Append(head_.time.get(), Ref<TimeStamp>::Share(signingTime_.get()));
}

// All pairs are verified, whether or not the chain will need them: a certificate with a bad
// signature in a manifest is a damaged manifest.
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

// The signer certificate is kept: its subject is what the content is compared with.
int ManifestReader::ReadSigner() {
  VESK2_TRY(ImportNew(signer_, buffer_.get(), Context()));
  VESK2_TRY(Refuse(signer_->GetSubject()->IsHash() ? 0 : VESK2_ERR_NOT_OBJECT_CERT));
  return ReadSignature(*signer_);
}

// Verified when it is read, so that the position of the first bad one is known.
int ManifestReader::ReadSignature(Cert& cert) {
  Ref<Signature> signature;
  VESK2_TRY(ImportNew(signature, buffer_.get(), Context()));
  const int code = signature->Verify(&cert);
  VESK2_TRY(evidence_.AddCert(&cert, signature.get(), code));
  return Refuse(code);
}

// Reads the revocation lists that the manifest carries. They lie outside of what is signed: anybody
// can take them out or put others in. Each is proved before it counts, and none can take another's
// revocation back.
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

// With the further directory, whose entries also vouch for lists.
int ManifestReader::LoadEntries() {
  Ref<SExpression> acls;
  VESK2_TRY(AclEntry::Import(acls.Out(), Context(), manifest_.extraAclDirectory.get()));
  evidence_.SetEntries(acls.get());
  return 0;
}

// Stored and carried lists together: a carried one may be newer, and what either revokes is
// revoked.
int ManifestReader::LoadLists(SExpression* carried) {
  Ref<SExpression> stored;
  VESK2_TRY(CrlSequence::ImportStore(stored.Out(), evidence_.GetEntries(), Context()));
  evidence_.SetLists(stored.get(), carried);
  return evidence_.MarkRevoked();
}

// The period first, as a time without a text is the caller's mistake and not the manifest's.
int ManifestReader::ProveAuthority(SExpression& carried) {
  VESK2_TRY(Refuse(SetPeriod()));
  VESK2_TRY(Refuse(LoadEntries()));
  VESK2_TRY(ReadRevocationLists(carried));
  return evidence_.GetEntries() != nullptr ? AskAuthority(&carried) : 0;
}

// Carried lists are offered to the store whatever the chain is worth: they are proved by
// themselves, and a manifest that is refused may bring the list that says why. Who does not want
// that sets SetStoreUpdate.
int ManifestReader::AskAuthority(SExpression* carried) {
  VESK2_TRY(Refuse(LoadLists(carried)));
  if (refusal_ != 0) return 0;
  // What cannot be stored changes no answer.
  if (manifest_.storeUpdate) {
    static_cast<void>(RevocationLists(evidence_.GetEntries(), carried).Store(carried));
  }
  return Refuse(evidence_.Prove(manifest_.tag.get()));
}

// The body is what is left up to the last byte; that it is whole is its own reader's to say.
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
  // Known to callers by this code, though it is memory that lacks.
  return *body != nullptr ? 0 : VESK2_ERR_FILE_OPEN;
}

// Notes whether a body, refused or not, is whole. Only for evidence: a refusal because of the
// content is mostly a damaged file, and the byte at which it stops making sense is the best hint
// there is.
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

// By the algorithm that the signer chose, of the three that there are.
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
