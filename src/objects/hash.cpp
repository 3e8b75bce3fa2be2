// SPDX-License-Identifier: Apache-2.0
// Hash: a digest as a principal, and the running computation of one. A computation and a value are
// one class, as programs insert what they computed where a principal is wanted. An object is one of
// the two, once: what is in use is refused.
#include <vesk2/hash.h>

#include "src/objects/build.h"
#include "src/objects/hash_algorithms.h"
#include "src/platform/crypto.h"

namespace ZvVesk2 {

Hash::Hash(Vesk2ContextStruct* ctx) : Principal(ctx) {}

Hash::~Hash() {
  if (value != nullptr) value->Free();
  if (hashContext != nullptr) zvclm_HashFree(hashContext, CryptoHandle());
}

bool Hash::IsHash() const { return true; }

// (hash <name> <digest>): "(4:hash" <name> <digest> ")", no digest of another length than the
// algorithm's. So an imported digest is always as long as its algorithm makes them.
int Hash::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(buffer->Expect("(4:hash"));
  Ref<ByteString> name;
  Ref<ByteString> digest;
  VESK2_TRY(ImportNew(name, buffer, GetContext()));
  VESK2_TRY(ImportNew(digest, buffer, GetContext()));

  const HashAlgorithm* const known =
      FindHashAlgorithm({reinterpret_cast<const char*>(name->GetData()), name->GetLength()});
  VESK2_REQUIRE(known != nullptr, VESK2_ERR_HASH_ID);
  algorithm = known->id;
  VESK2_REQUIRE(digest->GetLength() == known->digestLength, VESK2_ERR_INVALID_HASH);

  VESK2_TRY(Insert("hash"));
  VESK2_TRY(Append(this, std::move(name)));
  VESK2_TRY(Append(this, Ref<ByteString>::Share(digest.get())));
  value = digest.Release();
  return buffer->Expect(")");
}

// It has no numbers to check a signature with. A chain names its issuers by key for that reason.
int Hash::Verify(ByteString*, ByteString*, Hash*, SExpression*) {
  return VESK2_ERR_NOT_IMPLEMENTED;
}

int Hash::VerifyMobile(ByteString*, unsigned char*, unsigned int, unsigned char*, unsigned int) {
  return VESK2_ERR_NOT_IMPLEMENTED;
}

int Hash::IsRevoked(bool&) { return 0; }

// The context is made first: an object whose hash could not be started holds no list, and can be
// started again.
int Hash::Init(ZvclmHashID id) {
  const HashAlgorithm* const known = FindHashAlgorithm(id);
  VESK2_REQUIRE(known != nullptr, VESK2_ERR_HASH_ID);
  VESK2_REQUIRE(hashContext == nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  algorithm = id;
  VESK2_TRY(zvclm_HashAlloc(&hashContext, id, CryptoHandle()));
  ZVCLMHashInfo info{};
  info.size = sizeof(info);
  VESK2_TRY(zvclm_HashInfo(id, &info));
  digestLength = info.digestLength;
  VESK2_TRY(Insert("hash"));
  return Insert(known->name);
}

// With hints, as in a file: what is signed is what stands there.
int Hash::Update(DExpression* expression) {
  VESK2_REQUIRE(expression != nullptr, VESK2_ERR_INVALID_PARAM);
  return expression->UpdateHash(hashContext, false);
}

// Before Init there is no context, which the layer below refuses.
int Hash::Update(const unsigned char* data, unsigned int length) {
  return zvclm_HashUpdate(hashContext, data, length, CryptoHandle());
}

// The digest is handed to the list by one reference; `value` stays null, as programs tell an
// imported hash by it.
int Hash::Finalize() {
  // A finished computation cannot be finished again: its list would get a second digest.
  VESK2_REQUIRE(hashContext != nullptr && GetDigest() == nullptr, VESK2_ERR_INVALID_PARAM);
  std::unique_ptr<unsigned char[]> digest(TryNewArray<unsigned char>(digestLength));
  VESK2_REQUIRE(digest, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(zvclm_HashFinal(hashContext, digest.get(), CryptoHandle()));
  Ref<ByteString> item(
      TryNew<ByteString>(digest.get(), digestLength, ByteString::BsNone, GetContext()));
  VESK2_REQUIRE(item, VESK2_ERR_MEM_ALLOC);
  (void)digest.release();
  return Append(this, std::move(item));
}

// Adopted on every path, also when it is refused: the caller need not ask what became of it. Its
// length is the caller's word.
int Hash::Set(ZvclmHashID id, unsigned char* data, unsigned int length) {
  std::unique_ptr<unsigned char[]> owned(data);
  const HashAlgorithm* const known = FindHashAlgorithm(id);
  VESK2_REQUIRE(known != nullptr, VESK2_ERR_HASH_ID);
  VESK2_REQUIRE(data != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  algorithm = id;
  Ref<ByteString> digest(TryNew<ByteString>(data, length, ByteString::BsBin, GetContext()));
  VESK2_REQUIRE(digest, VESK2_ERR_MEM_ALLOC);
  (void)owned.release();
  VESK2_TRY(Insert("hash"));
  VESK2_TRY(Insert(known->name));
  return Append(this, std::move(digest));
}

// Wherever it came from: the third element is the digest in each of the three ways of making one.
ByteString* Hash::GetDigest() const {
  if (value != nullptr) return value;
  Iterator element = Begin();
  for (int skipped = 0; skipped < 2 && element; ++skipped) element.Next();
  return element ? dynamic_cast<ByteString*>(element.Value()) : nullptr;
}

ZvclmHashID Hash::GetAlgorithm() const { return algorithm; }
ByteString* Hash::GetValue() const { return value; }

}  // namespace ZvVesk2
