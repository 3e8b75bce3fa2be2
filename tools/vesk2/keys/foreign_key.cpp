// SPDX-License-Identifier: Apache-2.0
// foreign_key.cpp: keys as other programs write them.
#include "tools/vesk2/keys/foreign_key.h"

#include <openssl/decoder.h>
#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/x509.h>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/openssh_key.h"
#include "tools/vesk2/keys/ssh_wire.h"

namespace vesk2_command {
namespace {

bool Holds(const Secret& text, std::string_view words) {
  return text.text().find(words) != std::string::npos;
}

ForeignKey FromPrivate(const char* form, CryptoKey key, const std::string& path) {
  ForeignKey result{form, MakePublicKey(key.get(), path)};
  result.privateKey = std::make_unique<PrivateKey>(PrivateKey::Adopt(std::move(key), path));
  return result;
}

// "ssh-rsa AAAA... comment", as in id_rsa.pub and authorized_keys.
ForeignKey FromSshLine(const Secret& text, const std::string& path) {
  std::string_view line = text.text();
  line = line.substr(0, line.find_first_of("\r\n"));
  const std::string_view type = line.substr(0, line.find(' '));
  line.remove_prefix(std::min(type.size() + 1, line.size()));
  const std::string blob = FromBase64(line.substr(0, line.find(' ')), path);
  return {"an OpenSSH public key", PublicFromSsh(blob, path)};
}

ForeignKey FromCertificate(const Secret& text, const std::string& path) {
  const Bio bio = ReadOnly(text);
  const bool pem = Holds(text, "-----BEGIN ");
  const std::unique_ptr<X509, decltype(&X509_free)> certificate(
      pem ? PEM_read_bio_X509_AUX(bio.get(), nullptr, nullptr, nullptr)
          : d2i_X509_bio(bio.get(), nullptr),
      &X509_free);
  const EVP_PKEY* const key = certificate ? X509_get0_pubkey(certificate.get()) : nullptr;
  if (key == nullptr) {
    ERR_clear_error();
    throw FileTrouble(path, "no key in any form that is known here", "malformed");
  }
  ForeignKey result{"an X.509 certificate", MakePublicKey(key, path)};
  result.certificate = true;
  return result;
}

// PKCS#8, PKCS#1, SubjectPublicKeyInfo and the like, in PEM or DER. Null if it is none of them.
CryptoKey Decode(const Secret& text, Asking& asking) {
  const Bio bio = ReadOnly(text);
  if (Holds(text, "PRIVATE KEY-----")) {  // maybe behind a certificate
    return OwnKey(PEM_read_bio_PrivateKey(bio.get(), nullptr, &GivePassphrase, &asking));
  }
  EVP_PKEY* key = nullptr;
  const std::unique_ptr<OSSL_DECODER_CTX, decltype(&OSSL_DECODER_CTX_free)> context(
      OSSL_DECODER_CTX_new_for_pkey(&key, nullptr, nullptr, nullptr, 0, nullptr, nullptr),
      &OSSL_DECODER_CTX_free);
  if (!context) throw std::bad_alloc();
  OSSL_DECODER_CTX_set_pem_password_cb(context.get(), &GivePassphrase, &asking);
  (void)OSSL_DECODER_from_bio(context.get(), bio.get());
  return OwnKey(key);
}

ForeignKey FromDecoder(const Secret& text, const std::string& path,
                       const PassphraseOptions& options) {
  Asking asking{options, path};
  CryptoKey key = Decode(text, asking);
  const bool pem = Holds(text, "-----BEGIN ");
  if (!key && !asking.asked && !pem) {
    ERR_clear_error();
    return FromCertificate(text, path);
  }
  RequireOpened(key != nullptr, asking, "key");
  const Ref<PublicKey> publicKey = MakePublicKey(key.get(), path);
  if (!HasPrivateHalf(key.get())) return {"a public key", Ref<PublicKey>::Share(publicKey.get())};
  ForeignKey result = FromPrivate("a private key", std::move(key), path);
  result.passphrase = asking.used;
  return result;
}

}  // namespace

ForeignKey ReadForeignKey(const std::string& path, const PassphraseOptions& options) {
  const Secret text(ReadFile(path, kMaxKeyFile));
  for (const char* type : {"ssh-", "ecdsa-", "sk-"}) {
    if (text.text().rfind(type, 0) == 0) return FromSshLine(text, path);
  }
  if (Holds(text, kOpensshBegin)) {
    return FromPrivate("an OpenSSH private key", ReadOpensshKey(text, path), path);
  }
  const bool certificate = Holds(text, "CERTIFICATE-----") && !Holds(text, "PRIVATE KEY-----");
  return certificate ? FromCertificate(text, path) : FromDecoder(text, path, options);
}

}  // namespace vesk2_command
