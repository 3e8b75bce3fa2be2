// SPDX-License-Identifier: Apache-2.0
// PublicKey: checking signatures over expressions and over the raw blocks of the mobile format. The
// digest is compared before the arithmetic: a signature over something else is told by its own
// code, and costs no exponentiation. The yes is made in src/platform/verify.cpp, and passed through
// here.
#include <cstring>
#include <memory>
#include <string_view>

#include <vesk2/hash.h>
#include <vesk2/public_key.h>
#include <vesk2/ref.h>

#include "src/frame/check.h"
#include "src/platform/crypto.h"

namespace ZvVesk2 {
namespace {

// The words of the parameter records are marks and ids that the layer below knows.
constexpr ZVCLMDSAParameters kDsaParameters{{20, 0x1A5A6C5B, 0, 0, 0}};

ZVCLMRSAParameters RsaParameters(ZvclmHashID id) {
  const auto hash = static_cast<uint32_t>(id);
  return {{40, 0x7AFAB04D, 0, hash, 0, hash, 0, 0, 4, 0}};
}

// An algorithm name matches a known one that it is a prefix of: signatures with shortened names are
// in use. The empty name is a prefix of them all. With it any short name verifies as the first of
// its kind. It does not weaken what is verified: the key must have signed this digest by that
// scheme.
bool Matches(const ByteString* name, std::string_view known) {
  const auto* const bytes = reinterpret_cast<const char*>(name->GetData());
  return known.starts_with(std::string_view(bytes, name->GetLength()));
}

// With its length: it was made by the algorithm that was asked for, and no digest is compared with
// one of another length.
struct Digest {
  std::unique_ptr<unsigned char[]> bytes;
  unsigned int length = 0;
};

// The digest of `object`, which must be the one that `hash` states. Hints count: the signer's hash
// was made with them, and without them anyone could re-hint what is signed.
[[nodiscard]] int MatchingDigest(Digest& digest, ZvclmHashID id, const Hash* hash,
                                 SExpression* object) {
  unsigned char* computed = nullptr;
  VESK2_TRY(object->ComputeHash(computed, digest.length, id, false));
  digest.bytes.reset(computed);
  const ByteString* const stated = hash->GetDigest();
  VESK2_REQUIRE(stated != nullptr && stated->GetLength() == digest.length &&
                    std::memcmp(stated->GetData(), computed, digest.length) == 0,
                VESK2_ERR_HASH_MISMATCH);
  return 0;
}

// One signature check, as its verdict. "Not valid" is an answer of the layer below and a code of
// this one.
struct Check {
  const ZVCLMPublicKeyData* key;
  int scheme;
  const void* parameters;
  uint32_t handle;

  [[nodiscard]] int Run(const unsigned char* digest, unsigned int digestLength,
                        const unsigned char* signature, unsigned int signatureLength) const {
    int valid = 0;
    VESK2_TRY(zvclm_PublicKeyVerifySignature(key, scheme, parameters, digest, digestLength,
                                             signature, signatureLength, &valid, handle));
    VESK2_REQUIRE(valid != 0, VESK2_ERR_SIGNATURE);
    return 0;
  }
};

}  // namespace

// By the key and not by the name: a signature cannot choose another kind of arithmetic than its
// key's.
int PublicKey::Verify(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                      SExpression* signedObject) {
  switch (keyType) {
    case ZVCLM_KEY_RSA:
      return VerifyRSA(algorithm, signatureValue, hash, signedObject);
    case ZVCLM_KEY_DSA:
      return VerifyDSA(algorithm, signatureValue, hash, signedObject);
    default:
      return VESK2_ERR_NOT_IMPLEMENTED;
  }
}

// PSS is tried first, so that a name that could be both is the better of the two. RMD-160 goes with
// no RSA signature.
int PublicKey::VerifyRSA(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                         SExpression* signedObject) {
  VESK2_REQUIRE(algorithm != nullptr && signatureValue != nullptr && hash != nullptr &&
                    signedObject != nullptr,
                VESK2_ERR_INVALID_PARAM);
  // Both names begin alike, so that "rsa" is both.
  const bool pss = Matches(algorithm, "rsa-pss");
  VESK2_REQUIRE(pss || Matches(algorithm, "rsa-1.5"), VESK2_ERR_SIGNATURE_ID);
  const ZvclmHashID id = hash->GetAlgorithm();
  VESK2_REQUIRE(id == ZVCLM_HASH_SHA1 || id == ZVCLM_HASH_SHA256, VESK2_ERR_SIGNATURE_ID);
  Digest digest;
  VESK2_TRY(MatchingDigest(digest, id, hash, signedObject));
  const ZVCLMRSAParameters parameters = RsaParameters(id);
  const int scheme = pss ? ZVCLM_SCHEME_RSA_PSS : ZVCLM_SCHEME_RSA_PKCS1;
  return Check{key, scheme, &parameters, CryptoHandle()}.Run(
      digest.bytes.get(), digest.length, signatureValue->GetData(), signatureValue->GetLength());
}

// The hash's own algorithm is not asked: DSA here is always over SHA-1. Its digest must be the one
// that SHA-1 gives, by whatever name.
int PublicKey::VerifyDSA(ByteString* algorithm, ByteString* signatureValue, Hash* hash,
                         SExpression* signedObject) {
  VESK2_REQUIRE(algorithm != nullptr && signatureValue != nullptr && hash != nullptr &&
                    signedObject != nullptr,
                VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(Matches(algorithm, "dsa-sha1"), VESK2_ERR_SIGNATURE_ID);
  Digest digest;
  VESK2_TRY(MatchingDigest(digest, ZVCLM_HASH_SHA1, hash, signedObject));
  return Check{key, ZVCLM_SCHEME_DSA, &kDsaParameters, CryptoHandle()}.Run(
      digest.bytes.get(), digest.length, signatureValue->GetData(), signatureValue->GetLength());
}

// The format has room for a DSA signature, and for no other.
int PublicKey::VerifyMobile(ByteString* algorithm, unsigned char* signature,
                            unsigned int signatureLength, unsigned char* data,
                            unsigned int dataLength) {
  VESK2_REQUIRE(keyType == ZVCLM_KEY_DSA, VESK2_ERR_NOT_IMPLEMENTED);
  return VerifyMobileDSA(algorithm, signature, signatureLength, data, dataLength);
}

// The block is a header of 14 bytes, which is signed before the data, and r and s of 20 bytes each.
// Its length is the caller's word, and not asked.
int PublicKey::VerifyMobileDSA(ByteString* algorithm, unsigned char* signature, unsigned int,
                               unsigned char* data, unsigned int dataLength) {
  constexpr unsigned int kHeader = 14;
  constexpr unsigned int kValue = 40;
  VESK2_REQUIRE(
      algorithm != nullptr && signature != nullptr && (data != nullptr || dataLength == 0),
      VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(Matches(algorithm, "dsa-sha1"), VESK2_ERR_SIGNATURE_ID);
  const Ref<Hash> hash(TryNew<Hash>(GetContext()));
  VESK2_REQUIRE(hash, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(hash->Init(ZVCLM_HASH_SHA1));
  VESK2_TRY(hash->Update(signature, kHeader));
  if (dataLength > 0) VESK2_TRY(hash->Update(data, dataLength));
  VESK2_TRY(hash->Finalize());
  const ByteString* const digest = hash->GetDigest();
  return Check{key, ZVCLM_SCHEME_DSA, &kDsaParameters, CryptoHandle()}.Run(
      digest->GetData(), digest->GetLength(), signature + kHeader, kValue);
}

}  // namespace ZvVesk2
