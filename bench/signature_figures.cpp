// SPDX-License-Identifier: Apache-2.0
// Checking single signatures.
#include <openssl/bn.h>
#include <openssl/core_names.h>
#include <openssl/evp.h>
#include <openssl/rsa.h>
#include <vesk2/hash.h>
#include <vesk2/public_key.h>

#include "bench/bench.h"
#include "bench/floor/floor.h"
#include "tests/support/test_key.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace bench {
namespace {

using namespace ZvVesk2;
using vesk2test::List;
using vesk2test::Str;
using vesk2test::TestKey;
using Key = floor::Owned<EVP_PKEY, EVP_PKEY_free>;

const unsigned char* Bytes(const std::string& text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

// What is checked: by our objects, and by libcrypto with a key that it has read already.
struct Checked {
  std::string object, algorithm, hash;
  Key key;
  std::string publicKey, digest, value, theirValue;
};

std::string RsaPublic(EVP_PKEY* key) {
  const auto number = [key](const char* name, const char* parameter) {
    BIGNUM* raw = nullptr;
    EVP_PKEY_get_bn_param(key, parameter, &raw);
    const floor::Owned<BIGNUM, BN_free> owned(raw);
    std::string bytes(static_cast<size_t>(BN_num_bytes(raw)), '\0');
    BN_bn2bin(raw, reinterpret_cast<unsigned char*>(bytes.data()));
    return List({Str(name), Str(bytes)});
  };
  return List({Str("public-key"), List({Str("rsa"), number("e", OSSL_PKEY_PARAM_RSA_E),
                                        number("n", OSSL_PKEY_PARAM_RSA_N)})});
}

void SignRsa(Checked& checked) {
  const floor::Owned<EVP_PKEY_CTX, EVP_PKEY_CTX_free> signer(
      EVP_PKEY_CTX_new_from_pkey(nullptr, checked.key.get(), nullptr));
  EVP_PKEY_sign_init(signer.get());
  EVP_PKEY_CTX_set_rsa_padding(signer.get(), RSA_PKCS1_PADDING);
  EVP_PKEY_CTX_set_signature_md(signer.get(), EVP_sha256());
  size_t size = static_cast<size_t>(EVP_PKEY_get_size(checked.key.get()));
  checked.value.resize(size);
  EVP_PKEY_sign(signer.get(), reinterpret_cast<unsigned char*>(checked.value.data()), &size,
                Bytes(checked.digest), checked.digest.size());
  checked.theirValue = checked.value;
}

// libcrypto's form of r and s: both as positive numbers of DER.
std::string DerOf(const std::string& raw) {
  const auto number = [](std::string bytes) {
    while (bytes.size() > 1 && bytes[0] == '\0') bytes.erase(0, 1);
    if ((bytes[0] & 0x80) != 0) bytes.insert(0, 1, '\0');
    return std::string("\x02") + static_cast<char>(bytes.size()) + bytes;
  };
  const std::string both = number(raw.substr(0, 20)) + number(raw.substr(20));
  return std::string("\x30") + static_cast<char>(both.size()) + both;
}

Checked Rsa(unsigned bits) {
  Checked checked{vesk2test::Tag("install"), "rsa-1.5", "sha256", {}, {}, {}, {}, {}};
  checked.key.reset(EVP_RSA_gen(bits));
  checked.publicKey = RsaPublic(checked.key.get());
  checked.digest = vesk2test::Digest(checked.object);
  SignRsa(checked);
  return checked;
}

Checked Dsa() {
  const TestKey& key = TestKey::Dsa(0);
  Checked checked{vesk2test::Tag("install"), "dsa-sha1", "sha1", {}, {}, {}, {}, {}};
  EVP_PKEY_up_ref(key.Pkey());
  checked.key.reset(key.Pkey());
  checked.publicKey = key.Public();
  checked.digest = vesk2test::Digest(checked.object, "sha1");
  checked.value = key.SignDigest(checked.digest, "dsa-sha1", "sha1");
  checked.theirValue = DerOf(checked.value);
  return checked;
}

bool CheckByLibcrypto(const Checked& checked, bool rsa) {
  const floor::Owned<EVP_PKEY_CTX, EVP_PKEY_CTX_free> check(
      EVP_PKEY_CTX_new_from_pkey(nullptr, checked.key.get(), nullptr));
  if (EVP_PKEY_verify_init(check.get()) != 1) return false;
  if (rsa && (EVP_PKEY_CTX_set_rsa_padding(check.get(), RSA_PKCS1_PADDING) != 1 ||
              EVP_PKEY_CTX_set_signature_md(check.get(), EVP_sha256()) != 1)) {
    return false;
  }
  return EVP_PKEY_verify(check.get(), Bytes(checked.theirValue), checked.theirValue.size(),
                         Bytes(checked.digest), checked.digest.size()) == 1;
}

template <typename T>
Ref<T> Read(const std::string& text) {
  Ref<T> object(new T(nullptr));
  if (object->Import(vesk2test::Wrap(text).get()) != 0) object.Reset();
  return object;
}

Ref<ByteString> String(const std::string& bytes) {
  Ref<ByteString> string(new ByteString(nullptr));
  if (string->Set(Bytes(bytes), static_cast<unsigned>(bytes.size()), ByteString::BsBin) != 0) {
    string.Reset();
  }
  return string;
}

Outcome Check(const Effort& effort, const Checked& checked) {
  const Ref<PublicKey> key = Read<PublicKey>(checked.publicKey);
  const Ref<Hash> hash = Read<Hash>(vesk2test::HashOf(checked.object, checked.hash.c_str()));
  const Ref<SExpression> object = vesk2test::Parse(checked.object);
  const Ref<ByteString> algorithm = String(checked.algorithm);
  const Ref<ByteString> value = String(checked.value);
  if (!key || !hash) return Failed("a key that cannot be read");
  const size_t times = effort.Of(2'000, 500);
  const bool rsa = checked.hash == "sha256";
  return Ratio(
      effort,
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) {
          right = right && key->Verify(algorithm.get(), value.get(), hash.get(), object.get()) == 0;
        }
        return right;
      },
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) right = right && CheckByLibcrypto(checked, rsa);
        return right;
      });
}

}  // namespace

Figures SignatureFigures() {
  return {
      {"S1a", "signature check, RSA-2048", "EVP verify, the key read before", 1.55,
       [](const Effort& effort) { return Check(effort, Rsa(2048)); }},
      {"S1b", "RSA-4096", "the same", 1.25,
       [](const Effort& effort) { return Check(effort, Rsa(4096)); }},
      {"S1c", "DSA-1024", "the same", 1.18,
       [](const Effort& effort) { return Check(effort, Dsa()); }},
  };
}

}  // namespace bench
