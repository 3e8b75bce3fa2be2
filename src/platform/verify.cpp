// Signature checks. The answer is "not valid" until libcrypto says otherwise, in one place; numbers
// outside the limits never reach its arithmetic, which they could keep busy for minutes.
#include <openssl/dsa.h>
#include <openssl/rsa.h>

#include <span>

#include <vesk2/limits.h>

#include "src/platform/crypto.h"
#include "src/platform/key.h"

using namespace ZVsysutil;
namespace Limits = ZvVesk2::Limits;

namespace {

using Bytes = std::span<const unsigned char>;
using PkeyContext = Evp<EVP_PKEY_CTX, EVP_PKEY_CTX_free>;
using MdOwner = Evp<EVP_MD, EVP_MD_free>;

bool WithinRsaLimits(const ZVCLMPublicKeyData& key) {
  const BIGNUM* n = key.number(kRsaN);
  const BIGNUM* e = key.number(kRsaE);
  return BN_num_bits(n) <= Limits::kMaxRsaModulusBits && BN_is_odd(n) && BN_is_odd(e) &&
         !BN_is_one(e) && BN_num_bits(e) <= Limits::kMaxRsaExponentBits;
}

bool WithinDsaLimits(const ZVCLMPublicKeyData& key) {
  const BIGNUM* p = key.number(kDsaP);
  const int qBits = BN_num_bits(key.number(kDsaQ));
  if (BN_num_bits(p) > Limits::kMaxDsaPrimeBits) return false;
  if (qBits != 160 && qBits != 224 && qBits != 256) return false;
  for (const BIGNUM* element : {key.number(kDsaG), key.number(kDsaY)}) {
    if (BN_cmp(element, BN_value_one()) <= 0 || BN_cmp(element, p) >= 0) return false;
  }
  return true;
}

// A context that is ready to verify with `key`; null when libcrypto refuses it.
PkeyContext StartVerify(const ZVCLMPublicKeyData& key) {
  const PkeyOwner pkey = MakePkey(key);
  if (pkey == nullptr) return nullptr;
  PkeyContext context(EVP_PKEY_CTX_new_from_pkey(nullptr, pkey.get(), nullptr));
  if (context == nullptr || EVP_PKEY_verify_init(context.get()) != 1) return nullptr;
  return context;
}

// Any salt length is taken: the signer chose it. The mask uses the digest's hash.
bool SetRsaScheme(EVP_PKEY_CTX* context, int scheme, const EVP_MD* hash) {
  const bool pss = scheme == ZVCLM_SCHEME_RSA_PSS;
  const int padding = pss ? RSA_PKCS1_PSS_PADDING : RSA_PKCS1_PADDING;
  if (EVP_PKEY_CTX_set_rsa_padding(context, padding) != 1) return false;
  if (EVP_PKEY_CTX_set_signature_md(context, hash) != 1) return false;
  if (!pss) return true;
  return EVP_PKEY_CTX_set_rsa_mgf1_md(context, hash) == 1 &&
         EVP_PKEY_CTX_set_rsa_pss_saltlen(context, RSA_PSS_SALTLEN_AUTO) == 1;
}

bool Check(EVP_PKEY_CTX* context, Bytes digest, Bytes signature) {
  return EVP_PKEY_verify(context, signature.data(), signature.size(), digest.data(),
                         digest.size()) == 1;
}

bool VerifyRsa(const ZVCLMPublicKeyData& key, int scheme, const ZVCLMRSAParameters& parameters,
               Bytes digest, Bytes signature) {
  const uint32_t hashId = parameters.words[3];
  if (!WithinRsaLimits(key) || digest.empty() || digest.size() != HashLength(hashId)) return false;
  if (signature.size() != static_cast<size_t>(BN_num_bytes(key.number(kRsaN)))) return false;
  const MdOwner hash(EVP_MD_fetch(nullptr, HashName(hashId), nullptr));
  const PkeyContext context = StartVerify(key);
  return hash != nullptr && context != nullptr && SetRsaScheme(context.get(), scheme, hash.get()) &&
         Check(context.get(), digest, signature);
}

// The DER form that libcrypto takes, of r and s in two equal halves.
struct DerSignature {
  ~DerSignature() { OPENSSL_free(data); }
  unsigned char* data = nullptr;
  int length = 0;
};

bool ToDer(Bytes signature, DerSignature* out) {
  const auto half = static_cast<int>(signature.size() / 2);
  Evp<BIGNUM, BN_free> r(BN_bin2bn(signature.data(), half, nullptr));
  Evp<BIGNUM, BN_free> s(BN_bin2bn(signature.data() + half, half, nullptr));
  const Evp<DSA_SIG, DSA_SIG_free> pair(DSA_SIG_new());
  if (r == nullptr || s == nullptr || pair == nullptr) return false;
  if (DSA_SIG_set0(pair.get(), r.get(), s.get()) != 1) return false;
  r.release();  // the pair's now
  s.release();
  out->length = i2d_DSA_SIG(pair.get(), &out->data);
  return out->length > 0;
}

// The digest is always SHA-1's; for one of other lengths (none, say) anybody could make a
// signature.
bool VerifyDsa(const ZVCLMPublicKeyData& key, Bytes digest, Bytes signature) {
  if (!WithinDsaLimits(key) || digest.size() != HashLength(ZVCLM_HASH_SHA1)) return false;
  const auto half = static_cast<size_t>(BN_num_bytes(key.number(kDsaQ)));
  if (signature.size() != 2 * half) return false;
  DerSignature der;
  if (!ToDer(signature, &der)) return false;
  const PkeyContext context = StartVerify(key);
  return context != nullptr &&
         Check(context.get(), digest, {der.data, static_cast<size_t>(der.length)});
}

bool Verify(const ZVCLMPublicKeyData& key, int scheme, const void* parameters, Bytes digest,
            Bytes signature) {
  if (scheme == ZVCLM_SCHEME_DSA) {
    return key.type == ZVCLM_KEY_DSA && VerifyDsa(key, digest, signature);
  }
  if (scheme == ZVCLM_SCHEME_RSA_PKCS1 || scheme == ZVCLM_SCHEME_RSA_PSS) {
    const auto& record = *static_cast<const ZVCLMRSAParameters*>(parameters);
    return key.type == ZVCLM_KEY_RSA && VerifyRsa(key, scheme, record, digest, signature);
  }
  return false;
}

}  // namespace

int zvclm_PublicKeyVerifySignature(const ZVCLMPublicKeyData* key, int scheme,
                                   const void* parameters, const unsigned char* digest,
                                   uint32_t digestLength, const unsigned char* signature,
                                   uint32_t signatureLength, int* valid, uint32_t /*handle*/) {
  if (valid == nullptr) return ZVCLM_ERR_NULL_PARAM;
  *valid = 0;
  if (key == nullptr || parameters == nullptr || digest == nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (signature == nullptr && signatureLength > 0) return ZVCLM_ERR_NULL_PARAM;
  const ErrorMark mark;
  const bool good =
      Verify(*key, scheme, parameters, {digest, digestLength}, {signature, signatureLength});
  if (good) *valid = 1;
  return 0;
}
