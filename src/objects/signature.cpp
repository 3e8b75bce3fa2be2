// SPDX-License-Identifier: Apache-2.0
// Signature: what was signed, by whom, and the signature bytes. It binds three things: what was
// signed (the hash), who signed it, and the value. Each is believed only when Verify has compared
// it with the object at hand.
#include <vesk2/cert.h>
#include <vesk2/signature.h>

#include "src/objects/build.h"
#include "src/sexpr/same.h"

namespace ZvVesk2 {

Signature::Signature(Vesk2ContextStruct* ctx) : SExpression(ctx) {}

Signature::~Signature() = default;

// (signature <hash> <principal> (<algorithm> <value>)):
//   "(9:signature" <hash> <principal> "(" <algorithm> <value> "))"
// The hash is read as it is stated; that it is the object's own is asked when the object is there.
int Signature::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(buffer->Expect("(9:signature"));
  VESK2_TRY(Insert("signature"));

  Ref<Hash> newHash;
  VESK2_TRY(ImportNew(newHash, buffer, GetContext()));
  VESK2_TRY(Append(this, std::move(newHash), hash));
  Ref<Principal> newPrincipal;
  VESK2_TRY(Principal::Import(newPrincipal.Out(), buffer, GetContext()));
  VESK2_TRY(Append(this, std::move(newPrincipal), principal));

  VESK2_TRY(buffer->Expect("("));
  Ref<ByteString> newAlgorithm;
  Ref<ByteString> newValue;
  VESK2_TRY(ImportNew(newAlgorithm, buffer, GetContext()));
  VESK2_TRY(ImportNew(newValue, buffer, GetContext()));
  VESK2_TRY(AppendValue(std::move(newAlgorithm), std::move(newValue)));
  return buffer->Expect("))");
}

// The object is handed out before it is whole, as callers look at what was made, and free it.
int Signature::Create(Signature*& signature, Hash* hash, Principal* principal,
                      const char* algorithm, unsigned char* value, unsigned int length,
                      Vesk2ContextStruct* context) {
  VESK2_REQUIRE(signature == nullptr && hash != nullptr && principal != nullptr &&
                    algorithm != nullptr && value != nullptr && length != 0,
                VESK2_ERR_INVALID_PARAM);
  signature = TryNew<Signature>(context);
  VESK2_REQUIRE(signature != nullptr, VESK2_ERR_MEM_ALLOC);
  // The list takes references of its own: until all is done the caller's stay the caller's.
  VESK2_TRY(signature->Insert("signature"));
  VESK2_TRY(Append(signature, Ref<Hash>::Share(hash), signature->hash));
  VESK2_TRY(Append(signature, Ref<Principal>::Share(principal), signature->principal));

  Ref<ByteString> newAlgorithm(TryNew<ByteString>(context));
  Ref<ByteString> newValue(TryNew<ByteString>(context));
  VESK2_REQUIRE(newAlgorithm && newValue, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(newAlgorithm->Set(algorithm, ByteString::BsNone));
  VESK2_TRY(newValue->Set(value, length, ByteString::BsBin));
  VESK2_TRY(signature->AppendValue(std::move(newAlgorithm), std::move(newValue)));
  hash->Free();
  principal->Free();
  return 0;
}

// The pair has no keyword, so that it is made by hand.
int Signature::AppendValue(Ref<ByteString> newAlgorithm, Ref<ByteString> newValue) {
  Ref<SExpression> made(TryNew<SExpression>(GetContext()));
  VESK2_REQUIRE(made, VESK2_ERR_MEM_ALLOC);
  SExpression* pair = nullptr;
  VESK2_TRY(Append(this, std::move(made), pair));
  VESK2_TRY(Append(pair, std::move(newAlgorithm), algorithm));
  return Append(pair, std::move(newValue), value);
}

// A certificate is worth what its issuer is: another key's signature over it proves nothing about
// that one. Compared by the canonical form, so that a hash of the issuer's key is not the issuer.
int Signature::Verify(Cert* cert) {
  VESK2_REQUIRE(cert != nullptr, VESK2_ERR_PARAM_NULL);
  // Comparing can fail (a principal nested too deeply), which is no verdict.
  bool own = false;
  VESK2_TRY(CompareValues(own, cert->GetIssuer(), principal));
  VESK2_REQUIRE(own, VESK2_ERR_SIGNATURE);
  return Verify(static_cast<SExpression*>(cert));
}

// An object that was never read has no principal. The code of a lack of memory is the library's
// own, so that callers test for one.
int Signature::Verify(SExpression* object) {
  VESK2_REQUIRE(object != nullptr, VESK2_ERR_PARAM_NULL);
  VESK2_REQUIRE(principal != nullptr, VESK2_ERR_SIGNATURE);
  return InOwnWords(principal->Verify(algorithm, value, hash, object));
}

Hash* Signature::GetHash() const { return hash; }
Principal* Signature::GetPrincipal() const { return principal; }
ByteString* Signature::GetAlgorithm() const { return algorithm; }
ByteString* Signature::GetValue() const { return value; }

}  // namespace ZvVesk2
