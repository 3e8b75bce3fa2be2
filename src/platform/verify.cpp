// SPDX-License-Identifier: Apache-2.0
// Signature checks. The answer is "not valid" until libcrypto says otherwise, in one place. Its own
// check of the whole signature is the only one that makes it good: no arithmetic of ours and no
// look of ours at a block ever does, however much time that would save. Ours can only refuse.
//
// libcrypto answers a bad signature and a lack of memory alike, with "no". Taken for "not valid",
// the second would leave a revocation list unread, and the keys on it in use. So a key or signature
// that cannot be good is refused here, by its numbers, before libcrypto sees it (they could also
// keep its arithmetic busy for minutes). What libcrypto then fails to prepare is a lack of memory,
// and its "no" counts only with the reason that a bad signature leaves behind, or when it is seen
// otherwise that the signature cannot be good.
#include <openssl/bn.h>
#include <openssl/dsa.h>
#include <openssl/rsa.h>

#include <algorithm>
#include <array>
#include <span>
#include <string_view>

#include <vesk2/limits.h>

#include "src/platform/crypto.h"
#include "src/platform/key.h"

using namespace ZVsysutil;
namespace Limits = ZvVesk2::Limits;

namespace {

using Bytes = ZvBytes;
using PkeyContext = Evp<EVP_PKEY_CTX, EVP_PKEY_CTX_free>;
using Number = Evp<BIGNUM, BN_free>;

// Numbers as bytes, without zeros before them.
bool IsOdd(Bytes number) { return !number.empty() && number.back() % 2 != 0; }
bool IsLess(Bytes a, Bytes b) {
  return a.size() != b.size() ? a.size() < b.size() : std::ranges::lexicographical_compare(a, b);
}
bool IsAboveOne(Bytes number) { return CountBits(number) > 1; }

// ---- What a "no" of libcrypto means ----

// Stands in libcrypto's error queue between the caller's entries and ours.
constexpr int kOurs = 1;

// Told by library and reason: a caller may have raised such an entry too, so that the last one
// counts.
bool IsOurs(unsigned long entry) {
  return ERR_GET_LIB(entry) == ERR_LIB_USER && ERR_GET_REASON(entry) == kOurs;
}

// The verdicts of the signature code, as opposed to troubles that any code can have. A number
// without an inverse is a DSA signature's or key's own fault.
bool IsVerdict(unsigned long entry) {
  const int library = ERR_GET_LIB(entry);
  if (library == ERR_LIB_BN) return ERR_GET_REASON(entry) == BN_R_NO_INVERSE;
  return (library == ERR_LIB_RSA || library == ERR_LIB_DSA) && !ERR_COMMON_ERROR(entry);
}

// Whether a verdict stands behind kOurs, the last one: the caller may have such an entry too, and
// old verdicts behind it. The queue can only be read from its old end: the caller's entries are
// taken out and put back, without their texts. An array of the queue's own size, on the stack: this
// must work when memory has run out.
bool FindVerdict() {
  std::array<unsigned long, ERR_NUM_ERRORS> entries;
  size_t count = 0;
  while (const unsigned long entry = ERR_get_error()) {
    if (count < entries.size()) entries[count++] = entry;
  }
  bool found = false;
  while (count > 0 && !IsOurs(entries[count - 1])) {
    --count;
    found = found || IsVerdict(entries[count]);
  }
  if (count == 0) return false;  // there was no memory for kOurs either
  for (const unsigned long entry : std::span(entries).first(count - 1)) {
    ERR_raise(ERR_GET_LIB(entry), ERR_GET_REASON(entry));
  }
  ERR_set_mark();  // the one that was there has been read away
  return found;
}

// The DSA code answers 0 for a bad signature only, and leaves no reason; the RSA code for anything.
enum class Zero { kIsNo, kNeedsReason };

[[nodiscard]] int Ask(bool* good, EVP_PKEY_CTX* context, Bytes digest, Bytes signature, Zero zero) {
  // A failure that libcrypto found another way around must not pass for the caller's entry.
  ERR_pop_to_mark();
  ERR_set_mark();
  ERR_raise(ERR_LIB_USER, kOurs);
  const int answer =
      EVP_PKEY_verify(context, signature.data(), signature.size(), digest.data(), digest.size());
  *good = answer == 1;
  const bool told = *good || (answer == 0 && zero == Zero::kIsNo) || FindVerdict();
  return told ? 0 : ZVCLM_ERR_NO_MEM;
}

// Null is a lack of memory: the key was looked at before.
PkeyContext MakeContext(const ZVCLMPublicKeyData& key) {
  const PkeyOwner pkey = MakePkey(key);
  return PkeyContext(pkey != nullptr ? EVP_PKEY_CTX_new_from_pkey(nullptr, pkey.get(), nullptr)
                                     : nullptr);
}

// A context that is ready to verify with `key`, which libcrypto takes whatever its numbers are.
PkeyContext StartVerify(const ZVCLMPublicKeyData& key) {
  PkeyContext context = MakeContext(key);
  if (context == nullptr || EVP_PKEY_verify_init(context.get()) != 1) return nullptr;
  return context;
}

// ---- RSA ----

constexpr size_t kMaxModulus = Limits::kMaxRsaModulusBits / 8;

// An even modulus or exponent, or an exponent of 1, has no signature that means anything: with 1
// the "signature" is the block itself, and anybody could write one.
bool WithinRsaLimits(const ZVCLMPublicKeyData& key) {
  const Bytes n = key.numbers[kRsaN];
  const Bytes e = key.numbers[kRsaE];
  return CountBits(n) <= Limits::kMaxRsaModulusBits && IsOdd(n) && IsOdd(e) && IsAboveOne(e) &&
         CountBits(e) <= Limits::kMaxRsaExponentBits && IsLess(e, n);
}

// Whether it is as long as n and smaller: a bare number of that range. A longer one, with zeros
// before it, would be a second text of the same signature.
bool FitsModulus(Bytes signature, Bytes n) {
  return signature.size() == n.size() && IsLess(signature, n);
}

// ---- RSA: blocks of PKCS #1 version 1.5 ----

// What stands before the digest in a signed block: the hash's name in DER, its parameters NULL.
struct DigestName {
  uint32_t hash;
  std::string_view der;
};
constexpr DigestName kDigestNames[] = {
    {ZVCLM_HASH_SHA1, {"\x30\x21\x30\x09\x06\x05\x2b\x0e\x03\x02\x1a\x05\x00\x04\x14", 15}},
    {ZVCLM_HASH_SHA256,
     {"\x30\x31\x30\x0d\x06\x09\x60\x86\x48\x01\x65\x03\x04\x02\x01\x05\x00\x04\x20", 19}},
    {ZVCLM_HASH_RMD160, {"\x30\x21\x30\x09\x06\x05\x2b\x24\x03\x02\x01\x05\x00\x04\x14", 15}}};

using Block = std::array<unsigned char, kMaxModulus>;

// Whether the block is the one that there is for the digest:
//   00 01 ff...ff 00 <name> <digest>      with eight or more ff
// Built and compared whole, never parsed: what a parser skips, a forger fills.
bool IsBlockOf(Bytes block, uint32_t hash, Bytes digest) {
  constexpr size_t kFrame = 3 + 8;
  const auto* const name = std::ranges::find(kDigestNames, hash, &DigestName::hash);
  if (name == std::end(kDigestNames)) return false;
  const size_t content = name->der.size() + digest.size();
  if (block.size() < kFrame + content) return false;
  Block expected;
  expected.fill(0xff);
  unsigned char* at = expected.data() + block.size() - content;
  expected[0] = 0;
  expected[1] = 1;
  at[-1] = 0;
  at = std::ranges::copy(name->der, at).out;
  std::ranges::copy(digest, at);
  return std::ranges::equal(block, Bytes(expected).first(block.size()));
}

// libcrypto gave no reason for its "no": some malformed blocks leave none. The block is taken out
// of the signature again, which needs memory only, and looked at. 0 when it cannot be good.
[[nodiscard]] int ExplainPkcs1No(const ZVCLMPublicKeyData& key, uint32_t hash, Bytes digest,
                                 Bytes signature) {
  const PkeyContext context = MakeContext(key);
  if (context == nullptr || EVP_PKEY_verify_recover_init(context.get()) != 1 ||
      EVP_PKEY_CTX_set_rsa_padding(context.get(), RSA_NO_PADDING) != 1) {
    return ZVCLM_ERR_NO_MEM;
  }
  Block block;
  size_t length = block.size();
  if (EVP_PKEY_verify_recover(context.get(), block.data(), &length, signature.data(),
                              signature.size()) != 1) {
    return ZVCLM_ERR_NO_MEM;
  }
  return IsBlockOf(Bytes(block).first(length), hash, digest) ? ZVCLM_ERR_NO_MEM : 0;
}

// ---- RSA ----

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

// Whatever cannot be good is "no" with code 0 and without libcrypto; whatever cannot be found out
// is a code.
[[nodiscard]] int VerifyRsa(bool* good, const ZVCLMPublicKeyData& key, int scheme,
                            const ZVCLMRSAParameters& parameters, Bytes digest, Bytes signature) {
  const uint32_t hashId = parameters.words[3];
  if (!WithinRsaLimits(key) || digest.empty() || digest.size() != HashLength(hashId)) return 0;
  if (!FitsModulus(signature, key.numbers[kRsaN])) return 0;
  const EVP_MD* const hash = HashAlgorithm(hashId);
  const PkeyContext context = StartVerify(key);
  if (hash == nullptr || context == nullptr) return ZVCLM_ERR_NO_MEM;
  if (!SetRsaScheme(context.get(), scheme, hash)) return ZVCLM_ERR_NO_MEM;
  const int code = Ask(good, context.get(), digest, signature, Zero::kNeedsReason);
  const bool explained = code == 0 || scheme == ZVCLM_SCHEME_RSA_PSS;
  return explained ? code : ExplainPkcs1No(key, hashId, digest, signature);
}

// ---- DSA ----

// The lengths of q that the format knows. g and y of 0 or 1 would make every signature good or
// none.
bool WithinDsaLimits(const ZVCLMPublicKeyData& key) {
  const Bytes p = key.numbers[kDsaP];
  const size_t qBits = CountBits(key.numbers[kDsaQ]);
  if (CountBits(p) > Limits::kMaxDsaPrimeBits || !IsOdd(p)) return false;
  if (qBits != 160 && qBits != 224 && qBits != 256) return false;
  for (const Bytes element : {key.numbers[kDsaG], key.numbers[kDsaY]}) {
    if (!IsAboveOne(element) || !IsLess(element, p)) return false;
  }
  return true;
}

// The DER form that libcrypto takes of r and s.
struct DerSignature {
  ~DerSignature() { OPENSSL_free(data); }
  unsigned char* data = nullptr;
  int length = 0;
};

bool ToDer(DerSignature* out, Number r, Number s) {
  const Evp<DSA_SIG, DSA_SIG_free> pair(DSA_SIG_new());
  if (pair == nullptr || DSA_SIG_set0(pair.get(), r.get(), s.get()) != 1) return false;
  static_cast<void>(r.release());  // the pair's now
  static_cast<void>(s.release());
  out->length = i2d_DSA_SIG(pair.get(), &out->data);
  return out->length > 0;
}

// The signature is r and s in two equal halves. The digest is always SHA-1's; for one of other
// lengths (none, say) anybody could make a signature.
[[nodiscard]] int VerifyDsa(bool* good, const ZVCLMPublicKeyData& key, Bytes digest,
                            Bytes signature) {
  if (!WithinDsaLimits(key) || digest.size() != HashLength(ZVCLM_HASH_SHA1)) return 0;
  const auto half = static_cast<int>(key.numbers[kDsaQ].size());
  if (signature.size() != 2 * static_cast<size_t>(half)) return 0;
  Number r(BN_bin2bn(signature.data(), half, nullptr));
  Number s(BN_bin2bn(signature.data() + half, half, nullptr));
  if (r == nullptr || s == nullptr) return ZVCLM_ERR_NO_MEM;
  DerSignature der;
  if (!ToDer(&der, std::move(r), std::move(s))) return ZVCLM_ERR_NO_MEM;
  const PkeyContext context = StartVerify(key);
  if (context == nullptr) return ZVCLM_ERR_NO_MEM;
  return Ask(good, context.get(), digest, {der.data, static_cast<size_t>(der.length)}, Zero::kIsNo);
}

// ---- Either ----

// A scheme that does not go with the key is a "no": the names in signatures are a stranger's.
[[nodiscard]] int Verify(bool* good, const ZVCLMPublicKeyData& key, int scheme,
                         const void* parameters, Bytes digest, Bytes signature) {
  if (scheme == ZVCLM_SCHEME_DSA) {
    return key.type == ZVCLM_KEY_DSA ? VerifyDsa(good, key, digest, signature) : 0;
  }
  if (scheme == ZVCLM_SCHEME_RSA_PKCS1 || scheme == ZVCLM_SCHEME_RSA_PSS) {
    const auto& record = *static_cast<const ZVCLMRSAParameters*>(parameters);
    return key.type == ZVCLM_KEY_RSA ? VerifyRsa(good, key, scheme, record, digest, signature) : 0;
  }
  return 0;
}

}  // namespace

// The one place of yes: *valid is 0 until every test has passed.
int zvclm_PublicKeyVerifySignature(const ZVCLMPublicKeyData* key, int scheme,
                                   const void* parameters, const unsigned char* digest,
                                   uint32_t digestLength, const unsigned char* signature,
                                   uint32_t signatureLength, int* valid, uint32_t /*handle*/) {
  if (valid == nullptr) return ZVCLM_ERR_NULL_PARAM;
  *valid = 0;
  if (key == nullptr || parameters == nullptr || digest == nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (signature == nullptr && signatureLength > 0) return ZVCLM_ERR_NULL_PARAM;
  const ErrorMark mark;
  bool good = false;
  const int code =
      Verify(&good, *key, scheme, parameters, {digest, digestLength}, {signature, signatureLength});
  if (code == 0 && good) *valid = 1;
  return code;
}
