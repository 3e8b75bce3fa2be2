// SPDX-License-Identifier: Apache-2.0
// openssh_key.cpp: "openssh-key-v1".
#include "tools/vesk2/keys/openssh_key.h"

#include <openssl/core_names.h>
#include <openssl/crypto.h>
#include <openssl/err.h>
#include <openssl/param_build.h>
#include <openssl/pem.h>

#include <vector>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/ssh_wire.h"
#include "tools/vesk2/say/shell_words.h"

#include <vesk2/limits.h>

namespace vesk2_command {
namespace {

using Big = std::unique_ptr<BIGNUM, decltype(&BN_clear_free)>;

Big Own(BIGNUM* number) {
  if (number == nullptr) throw std::bad_alloc();
  return {number, &BN_clear_free};
}

// The parameters of a key, by the names that libcrypto gives to them.
class Parameters {
 public:
  Parameters() : builder_(OSSL_PARAM_BLD_new(), &OSSL_PARAM_BLD_free) {
    if (!builder_) throw std::bad_alloc();
  }

  const BIGNUM* Push(const char* name, Big number) {
    BN_set_flags(number.get(), BN_FLG_CONSTTIME);
    if (OSSL_PARAM_BLD_push_BN(builder_.get(), name, number.get()) != 1) throw std::bad_alloc();
    numbers_.push_back(std::move(number));
    return numbers_.back().get();
  }

  // Null when libcrypto does not take them for a key.
  CryptoKey Key(const char* type) {
    const std::unique_ptr<OSSL_PARAM, decltype(&OSSL_PARAM_free)> list(
        OSSL_PARAM_BLD_to_param(builder_.get()), &OSSL_PARAM_free);
    const std::unique_ptr<EVP_PKEY_CTX, decltype(&EVP_PKEY_CTX_free)> context(
        EVP_PKEY_CTX_new_from_name(nullptr, type, nullptr), &EVP_PKEY_CTX_free);
    EVP_PKEY* key = nullptr;
    if (list && context && EVP_PKEY_fromdata_init(context.get()) == 1) {
      (void)EVP_PKEY_fromdata(context.get(), &key, EVP_PKEY_KEYPAIR, list.get());
    }
    ERR_clear_error();
    return OwnKey(key);
  }

 private:
  std::unique_ptr<OSSL_PARAM_BLD, decltype(&OSSL_PARAM_BLD_free)> builder_;
  std::vector<Big> numbers_;
};

Big ReadBig(SshReader& reader) {
  const std::string_view bytes = reader.Positive();
  reader.Expect(bytes.size() <= ZvVesk2::Limits::kMaxRsaModulusBits / 8);
  return Own(BN_bin2bn(reinterpret_cast<const unsigned char*>(bytes.data()),
                       static_cast<int>(bytes.size()), nullptr));
}

// d modulo a prime less one, as PKCS#1 wants it beside the primes.
Big Exponent(const BIGNUM* d, const BIGNUM* prime) {
  const std::unique_ptr<BN_CTX, decltype(&BN_CTX_free)> context(BN_CTX_secure_new(), &BN_CTX_free);
  Big less = Own(BN_dup(prime));
  Big result = Own(BN_new());
  BN_set_flags(less.get(), BN_FLG_CONSTTIME);
  Require(context != nullptr && BN_sub_word(less.get(), 1) == 1 && BN_is_zero(less.get()) == 0 &&
              BN_mod(result.get(), d, less.get(), context.get()) == 1,
          "reading a key");
  return result;
}

CryptoKey ReadRsa(SshReader& reader) {
  Parameters parameters;
  parameters.Push(OSSL_PKEY_PARAM_RSA_N, ReadBig(reader));
  parameters.Push(OSSL_PKEY_PARAM_RSA_E, ReadBig(reader));
  const BIGNUM* const d = parameters.Push(OSSL_PKEY_PARAM_RSA_D, ReadBig(reader));
  parameters.Push(OSSL_PKEY_PARAM_RSA_COEFFICIENT1, ReadBig(reader));
  const BIGNUM* const p = parameters.Push(OSSL_PKEY_PARAM_RSA_FACTOR1, ReadBig(reader));
  const BIGNUM* const q = parameters.Push(OSSL_PKEY_PARAM_RSA_FACTOR2, ReadBig(reader));
  parameters.Push(OSSL_PKEY_PARAM_RSA_EXPONENT1, Exponent(d, p));
  parameters.Push(OSSL_PKEY_PARAM_RSA_EXPONENT2, Exponent(d, q));
  return parameters.Key("RSA");
}

CryptoKey ReadDsa(SshReader& reader) {
  Parameters parameters;
  for (const char* name : {OSSL_PKEY_PARAM_FFC_P, OSSL_PKEY_PARAM_FFC_Q, OSSL_PKEY_PARAM_FFC_G,
                           OSSL_PKEY_PARAM_PUB_KEY, OSSL_PKEY_PARAM_PRIV_KEY}) {
    parameters.Push(name, ReadBig(reader));
  }
  return parameters.Key("DSA");
}

// The file's bytes, out of their PEM.
std::unique_ptr<Secret> Unwrap(const Secret& pem, const Trouble& fault) {
  const Bio bio = ReadOnly(pem);
  char* name = nullptr;
  char* header = nullptr;
  unsigned char* data = nullptr;
  long size = 0;
  const int read = PEM_read_bio(bio.get(), &name, &header, &data, &size);
  OPENSSL_free(name);
  OPENSSL_free(header);
  ERR_clear_error();
  if (read != 1) throw Trouble(fault);
  auto bytes = std::make_unique<Secret>(
      std::string(reinterpret_cast<char*>(data), static_cast<size_t>(size)));
  OPENSSL_clear_free(data, static_cast<size_t>(size));
  return bytes;
}

// The numbers that follow the type, and what ends a file.
CryptoKey ReadPrivatePart(std::string_view part, const std::string& path, const Trouble& fault) {
  SshReader reader(part, fault);
  const uint32_t check = reader.Number();
  reader.Expect(check == reader.Number());
  const std::string_view type = reader.String();
  if (type != "ssh-rsa" && type != "ssh-dss") RefuseKind(std::string(type), path);
  CryptoKey key = type == "ssh-rsa" ? ReadRsa(reader) : ReadDsa(reader);
  (void)reader.String();  // its comment
  uint8_t padding = 0;
  for (const char byte : reader.Rest()) reader.Expect(static_cast<uint8_t>(byte) == ++padding);
  reader.Expect(key != nullptr);
  return key;
}

// Numbers that do not belong together sign wrongly, which can give the key away.
bool BelongsTogether(EVP_PKEY* key) {
  const std::unique_ptr<EVP_PKEY_CTX, decltype(&EVP_PKEY_CTX_free)> context(
      EVP_PKEY_CTX_new(key, nullptr), &EVP_PKEY_CTX_free);
  const bool good = context && EVP_PKEY_check(context.get()) == 1;
  ERR_clear_error();
  return good;
}

}  // namespace

CryptoKey ReadOpensshKey(const Secret& pem, const std::string& path) {
  using namespace std::string_view_literals;
  const Trouble fault = FileTrouble(path, "malformed OpenSSH key", "malformed");
  const std::unique_ptr<Secret> bytes = Unwrap(pem, fault);
  constexpr std::string_view kMagic = "openssh-key-v1\0"sv;
  std::string_view text = bytes->text();
  if (text.substr(0, kMagic.size()) != kMagic) throw Trouble(fault);
  text.remove_prefix(kMagic.size());
  SshReader reader(text, fault);
  const std::string_view cipher = reader.String();
  (void)reader.String();  // how the cipher's key is made of a passphrase,
  (void)reader.String();  // with what
  reader.Expect(reader.Number() == 1);
  const Ref<PublicKey> publicKey = PublicFromSsh(reader.String(), path);
  if (cipher != "none") {
    throw FileTrouble(
        path,
        "under a passphrase in OpenSSH's own way; convert it first: ssh-keygen -p -m PKCS8 -f " +
            ShellWord(path),
        "passphrase");
  }
  CryptoKey key = ReadPrivatePart(reader.String(), path, fault);
  reader.End();
  reader.Expect(BelongsTogether(key.get()) &&
                MakePublicKey(key.get(), path)->IsEqual(publicKey.get()));
  return key;
}

}  // namespace vesk2_command
