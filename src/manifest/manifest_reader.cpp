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

#include <vesk2/crl.h>
#include <vesk2/hash.h>
#include <vesk2/signature.h>

#include "src/frame/check.h"
#include "src/manifest/manifest_authority.h"
#include "src/objects/build.h"
#include "src/platform/wait.h"
#include "src/sexpr/same.h"

namespace ZvVesk2 {
namespace {

constexpr unsigned kStampLength = 19;

}  // namespace

int ManifestReader::Read(ZvBuffer** body) {
  if (body != nullptr) *body = nullptr;
  manifest_.ClearRead();
  const ZVsysutil::ZvCall call;
  const char* const path = manifest_.manifestPath.get();
  const int opened = WrapFile(buffer_, path, VESK2_ERR_OPEN_MANIFEST_FILE);
  VESK2_REQUIRE(opened != VESK2_ERR_READ_FILE, VESK2_ERR_OPEN_MANIFEST_FILE);
  VESK2_TRY(opened);
  const int code = ReadFile(body);
  manifest_.readPosition = buffer_->Position();
  VESK2_TRY(code);
  manifest_.version = std::move(version_);
  manifest_.type = std::move(type_);
  manifest_.signingTime = std::move(signingTime_);
  return 0;
}

int ManifestReader::ReadFile(ZvBuffer** body) {
  VESK2_TRY(ReadHead());
  VESK2_TRY(ReadSignatureBlock());
  VESK2_TRY(verifyChain_ ? ProveAuthority() : ReadRevocationLists(nullptr));
  return ProveBody(body);
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
  VESK2_TRY(SExpression::Create(version_.Out(), "version", Context()));
  VESK2_TRY(Append(version_.get(), std::move(number)));
  return Append(version_.get(), std::move(text));
}

int ManifestReader::ReadType() {
  Ref<ByteString> name;
  VESK2_TRY(ImportNew(name, buffer_.get(), Context()));
  VESK2_REQUIRE(name->IsEqual("plain"), VESK2_ERR_MANIFEST_TYPE);
  VESK2_TRY(SExpression::Create(type_.Out(), "type", Context()));
  return Append(type_.get(), std::move(name));
}

int ManifestReader::ReadSigningTime() {
  VESK2_TRY(ImportNew(signingTime_, buffer_.get(), Context()));
  // Stamps are compared by their 19 characters; a shorter or longer text is no moment.
  VESK2_REQUIRE(signingTime_->GetLength() == kStampLength, VESK2_ERR_TIME_STAMP);
  VESK2_TRY(SExpression::Create(timeElement_.Out(), "time-of-signing", Context()));
  return Append(timeElement_.get(), Ref<TimeStamp>::Share(signingTime_.get()));
}

int ManifestReader::ReadSignatureBlock() {
  VESK2_TRY(SExpression::Create(certificates_.Out(), "sequence", Context()));
  VESK2_TRY(ReadSigner());
  // The signer certificate speaks for the content only; at least one more must speak for its
  // issuer.
  do {
    Ref<Cert> cert;
    VESK2_TRY(ImportNew(cert, buffer_.get(), Context()));
    VESK2_TRY(ReadSignature(*cert));
    VESK2_TRY(Append(certificates_.get(), std::move(cert)));
  } while (buffer_->Peek() == '(');
  return buffer_->Expect(")");
}

int ManifestReader::ReadSigner() {
  VESK2_TRY(ImportNew(signer_, buffer_.get(), Context()));
  VESK2_REQUIRE(signer_->GetSubject()->IsHash(), VESK2_ERR_NOT_OBJECT_CERT);
  VESK2_TRY(ReadSignature(*signer_));
  return Append(certificates_.get(), Ref<Cert>::Share(signer_.get()));
}

int ManifestReader::ReadSignature(Cert& cert) {
  Ref<Signature> signature;
  VESK2_TRY(ImportNew(signature, buffer_.get(), Context()));
  return signature->Verify(&cert);
}

// Reads the revocation lists that the manifest carries, into `lists` unless it is null.
int ManifestReader::ReadRevocationLists(SExpression* lists) {
  VESK2_TRY(buffer_->Expect("(3:crl"));
  while (buffer_->Peek() == '(') {
    Ref<CrlSequence> sequence;
    VESK2_TRY(ImportNew(sequence, buffer_.get(), Context()));
    if (lists != nullptr) VESK2_TRY(Append(lists, std::move(sequence)));
  }
  return buffer_->Expect(")");
}

int ManifestReader::ProveAuthority() {
  ManifestAuthority authority(Context(), certificates_.get(), signer_.get());
  VESK2_TRY(authority.SetPeriod(notBefore_, notAfter_, signingTime_.get()));
  VESK2_TRY(authority.LoadRoots(manifest_.extraAclDirectory.get()));
  Ref<SExpression> carried(TryNew<SExpression>(Context()));
  VESK2_REQUIRE(carried, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(ReadRevocationLists(carried.get()));
  VESK2_TRY(authority.MarkRevoked(carried.get(), manifest_.storeUpdate));
  return authority.Prove(manifest_.tag.get());
}

int ManifestReader::ProveBody(ZvBuffer** body) {
  // All that is left but the final ")".
  VESK2_REQUIRE(buffer_->Remaining() > 0, VESK2_ERR_PARSE_FILE);
  const size_t length = buffer_->Remaining() - 1;
  const unsigned char* const bytes = buffer_->Data();
  VESK2_TRY(CheckDigest(bytes, static_cast<unsigned int>(length)));
  buffer_->Skip(length);
  VESK2_TRY(buffer_->Expect(")"));
  if (body == nullptr) return 0;
  *body = ZVsysutil::zv_buffer_wrap(bytes, length);
  return *body != nullptr ? 0 : VESK2_ERR_FILE_OPEN;
}

int ManifestReader::CheckDigest(const unsigned char* body, unsigned int length) {
  auto* const signedDigest = dynamic_cast<Hash*>(signer_->GetSubject());
  VESK2_REQUIRE(signedDigest != nullptr, VESK2_ERR_NOT_OBJECT_CERT);
  Ref<Hash> digest(TryNew<Hash>(Context()));
  VESK2_REQUIRE(digest, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(digest->Init(signedDigest->GetAlgorithm()));
  VESK2_TRY(digest->Update(version_.get()));
  VESK2_TRY(digest->Update(type_.get()));
  VESK2_TRY(digest->Update(timeElement_.get()));
  VESK2_TRY(digest->Update(body, length));
  VESK2_TRY(digest->Finalize());
  bool same = false;
  VESK2_TRY(CompareValues(same, digest.get(), signedDigest));
  return same ? 0 : VESK2_ERR_HASH_MATCH;
}

}  // namespace ZvVesk2
