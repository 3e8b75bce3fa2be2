// SPDX-License-Identifier: Apache-2.0
// CrlSequence: reading one, and proving it against the trust roots. A list is worth what an entry
// of this machine makes of its issuer. The proof is kept with the list, so that a list is proved
// once for all the questions that are put to it; who wants it proved by other entries takes it back
// (ForgetProof).
#include <vesk2/crl.h>

#include <vesk2/acl_entry.h>

#include "src/sexpr/same.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

CrlSequence::CrlSequence(Vesk2ContextStruct* ctx) : SExpression(ctx) {}

CrlSequence::~CrlSequence() {
  // The fields hold references of their own beside those of the list.
  const std::initializer_list<DExpression*> fields = {crl, signature, reserved, cert};
  for (DExpression* field : fields) {
    if (field != nullptr) field->Free();
  }
}

const char* CrlSequence::DirectoryName() const { return DirectoryName(true); }

const char* CrlSequence::ExtensionName() const { return ExtensionName(true); }

const char* CrlSequence::DirectoryName(bool) { return "cert"; }

const char* CrlSequence::ExtensionName(bool) { return ".crl"; }

char* CrlSequence::CalcDir(StorageType type) {
  return SExpression::CalcDir(DirectoryName(true), type);
}

char* CrlSequence::CalcPath(const char* name, StorageType type) {
  return SExpression::CalcPath(DirectoryName(true), ExtensionName(true), name, type);
}

// ---- Reading ----

// The path is taken as it stands, without an extension being added: the store's names and a scan's
// paths are whole.
int CrlSequence::Import(const char* path) {
  VESK2_REQUIRE(First() == nullptr && crl == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(path != nullptr, VESK2_ERR_FILE_NOT_FOUND);
  SetStorageType(StoragePath);
  VESK2_TRY(SetFilePath(path));
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, path, VESK2_ERR_FILE_NOT_FOUND));
  return Import(buffer.get());
}

namespace {

// Makes a part and reads it. The field is set first: a part that fails stays with its owner.
template <typename T>
[[nodiscard]] int ImportPart(T*& field, ZvBuffer* buffer, Vesk2ContextStruct* ctx) {
  field = TryNew<T>(ctx);
  VESK2_REQUIRE(field != nullptr, VESK2_ERR_MEM_ALLOC);
  return field->Import(buffer);
}

}  // namespace

// (8:sequence CRL CERT SIGNATURE)
int CrlSequence::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(First() == nullptr && crl == nullptr, VESK2_ERR_INVALID_PARAM);
  // Stored files may lack the opening, and the end: neither is insisted on.
  static_cast<void>(buffer->Accept("(8:sequence"));
  VESK2_TRY(ImportPart(crl, buffer, GetContext()));
  VESK2_TRY(ImportPart(cert, buffer, GetContext()));
  VESK2_TRY(ImportPart(signature, buffer, GetContext()));
  static_cast<void>(buffer->Accept(")"));
  return BuildSExpression();
}

int CrlSequence::BuildSExpression() {
  DeleteNodes();
  // An object that is not complete has no list: the other operations go by that.
  VESK2_REQUIRE(crl != nullptr && cert != nullptr && signature != nullptr, VESK2_ERR_PARAM_NULL);
  VESK2_TRY(Insert("sequence"));
  VESK2_TRY(AppendShared(this, crl));
  VESK2_TRY(AppendShared(this, cert));
  return AppendShared(this, signature);
}

// ---- Checking ----

// For callers with a period of their own; the verifications ask list by list (crl_status.cpp). A
// list without an end reads as one that ended in 1970, and is refused when both times are given.
int CrlSequence::VerifyValidity(long* notBefore, long* notAfter) {
  VESK2_REQUIRE(notBefore != nullptr && notAfter != nullptr && cert != nullptr,
                VESK2_ERR_PARAM_NULL);
  const long begin = cert->GetNotBefore() != nullptr ? cert->GetNotBefore()->ToTime() : 0;
  const long end = cert->GetNotAfter() != nullptr ? cert->GetNotAfter()->ToTime() : 0;
  int code = 0;
  if (*notBefore != 0 && *notAfter != 0) {
    // Each code is named for the bound that was asked about and is missed.
    if (begin > *notAfter) {
      code = VESK2_ERR_NOT_AFTER;
    } else if (end < *notBefore) {
      code = VESK2_ERR_NOT_BEFORE;
    }
  }
  *notBefore = begin;
  *notAfter = end;
  return code;
}

namespace {

// The last entry with the tag decides; null when there is none. Entries are loaded in byte order of
// their names, so that of two for one source the later name counts, everywhere alike:
// RevocationLists::Prove goes by it, too.
[[nodiscard]] int LastWithTag(AclEntry*& found, SExpression* entries, SExpression* tag) {
  found = nullptr;
  for (auto it = entries->Begin(); it; it.Next()) {
    auto* entry = dynamic_cast<AclEntry*>(it.Value());
    if (entry == nullptr) continue;
    bool equal = false;
    VESK2_TRY(CompareValues(equal, entry->GetTag(), tag));
    if (equal) found = entry;
  }
  return 0;
}

// `mismatch` unless the two are equal; another code when that cannot be told.
[[nodiscard]] int RequireEqual(DExpression* a, DExpression* b, int mismatch) {
  bool equal = false;
  VESK2_TRY(CompareValues(equal, a, b));
  return equal ? 0 : mismatch;
}

// Whether `subject` is the hash of the list. With display hints: the issuer's certificate is for
// what was signed, byte for byte.
[[nodiscard]] int VerifyHash(Crl* crl, Subject* subject) {
  auto* const expected = dynamic_cast<Hash*>(subject);
  VESK2_REQUIRE(expected != nullptr, VESK2_ERR_HASH_ID);
  Ref<Hash> computed(TryNew<Hash>(crl->GetContext()));
  VESK2_REQUIRE(computed, VESK2_ERR_MEM_ALLOC);
  // An algorithm that is none of the three is VESK2_ERR_HASH_ID.
  VESK2_TRY(computed->Init(expected->GetAlgorithm()));
  VESK2_TRY(computed->Update(crl));
  VESK2_TRY(computed->Finalize());
  return RequireEqual(computed.get(), expected, VESK2_ERR_SIGNATURE);
}

}  // namespace

// In the order of what it costs: comparing before hashing, hashing before the signature. The period
// of the certificate is not asked (the questions ask for it, list by list), and neither are the
// entry's period and propagate flag: a list is not a grant, and an entry that has ended still says
// whose lists to believe. An entry is taken back by removing it.
int CrlSequence::VerifySelf(SExpression* aclEntries) {
  VESK2_REQUIRE(aclEntries != nullptr && aclEntries->First() != nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(First() != nullptr, VESK2_ERR_INVALID_PARAM);

  AclEntry* root = nullptr;
  VESK2_TRY(LastWithTag(root, aclEntries, cert->GetTag()));
  VESK2_REQUIRE(root != nullptr, VESK2_ERR_ACL_ENTRY_NOT_FOUND);
  VESK2_TRY(RequireEqual(root->GetSubject(), cert->GetIssuer(), VESK2_ERR_ACL_ENTRY_NOT_FOUND));
  VESK2_TRY(VerifyHash(crl, cert->GetSubject()));
  VESK2_TRY(signature->Verify(cert));

  // Proved again: the reference of the earlier proof goes.
  if (crl->issuerTag != nullptr) crl->issuerTag->Free();
  crl->issuerTag = Ref<SExpression>::Share(cert->GetTag()).Release();
  return 0;
}

void CrlSequence::ForgetProof() {
  if (crl == nullptr || crl->issuerTag == nullptr) return;
  crl->issuerTag->Free();
  crl->issuerTag = nullptr;
}

Crl* CrlSequence::GetCrl() const { return crl; }
Cert* CrlSequence::GetCert() const { return cert; }
Signature* CrlSequence::GetSignature() const { return signature; }

}  // namespace ZvVesk2
