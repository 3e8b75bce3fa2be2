// SPDX-License-Identifier: Apache-2.0
// Chains of X.509 certificates with a revocation list of each issuer.
#include <openssl/x509.h>
#include <openssl/x509_vfy.h>
#include <openssl/x509v3.h>

#include <fstream>
#include <iterator>

#include "bench/floor/floor.h"

namespace bench::floor {
namespace {

constexpr long kYear = 365 * 24 * 3600;

using Certificate = Owned<X509, X509_free>;
using List = Owned<X509_CRL, X509_CRL_free>;

Owned<X509_NAME, X509_NAME_free> Name(size_t number) {
  Owned<X509_NAME, X509_NAME_free> name(X509_NAME_new());
  const std::string text = "key " + std::to_string(number);
  X509_NAME_add_entry_by_txt(name.get(), "CN", MBSTRING_ASC,
                             reinterpret_cast<const unsigned char*>(text.c_str()), -1, -1, 0);
  return name;
}

std::string Write(X509* cert) {
  std::string der(static_cast<size_t>(i2d_X509(cert, nullptr)), '\0');
  auto* at = reinterpret_cast<unsigned char*>(der.data());
  i2d_X509(cert, &at);
  return der;
}

// Certificate `subject` of the chain, by the key before it; 0 signs for itself.
std::string MakeCert(const std::vector<EVP_PKEY*>& keys, size_t subject) {
  const size_t issuer = subject == 0 ? 0 : subject - 1;
  const Certificate cert(X509_new());
  X509_set_version(cert.get(), 2);
  ASN1_INTEGER_set(X509_get_serialNumber(cert.get()), static_cast<long>(subject) + 1);
  X509_gmtime_adj(X509_getm_notBefore(cert.get()), -kYear);
  X509_gmtime_adj(X509_getm_notAfter(cert.get()), kYear);
  X509_set_subject_name(cert.get(), Name(subject).get());
  X509_set_issuer_name(cert.get(), Name(issuer).get());
  X509_set_pubkey(cert.get(), keys[subject]);
  for (const auto& [kind, value] : {std::pair{NID_basic_constraints, "critical,CA:TRUE"},
                                    {NID_key_usage, "critical,keyCertSign,cRLSign"}}) {
    const Owned<X509_EXTENSION, X509_EXTENSION_free> extension(
        X509V3_EXT_conf_nid(nullptr, nullptr, kind, value));
    X509_add_ext(cert.get(), extension.get(), -1);
  }
  X509_sign(cert.get(), keys[issuer], EVP_sha256());
  return Write(cert.get());
}

std::string MakeList(EVP_PKEY* key, size_t issuer) {
  const List list(X509_CRL_new());
  const Owned<ASN1_TIME, ASN1_TIME_free> from(X509_gmtime_adj(nullptr, -kYear));
  const Owned<ASN1_TIME, ASN1_TIME_free> until(X509_gmtime_adj(nullptr, kYear));
  X509_CRL_set_version(list.get(), 1);
  X509_CRL_set_issuer_name(list.get(), Name(issuer).get());
  X509_CRL_set1_lastUpdate(list.get(), from.get());
  X509_CRL_set1_nextUpdate(list.get(), until.get());
  X509_REVOKED* const revoked = X509_REVOKED_new();
  const Owned<ASN1_INTEGER, ASN1_INTEGER_free> another(ASN1_INTEGER_new());
  ASN1_INTEGER_set(another.get(), 1'000'000);
  X509_REVOKED_set_serialNumber(revoked, another.get());
  X509_REVOKED_set_revocationDate(revoked, from.get());
  X509_CRL_add0_revoked(list.get(), revoked);
  X509_CRL_sign(list.get(), key, EVP_sha256());
  std::string der(static_cast<size_t>(i2d_X509_CRL(list.get(), nullptr)), '\0');
  auto* at = reinterpret_cast<unsigned char*>(der.data());
  i2d_X509_CRL(list.get(), &at);
  return der;
}

void Save(const std::string& path, const std::string& bytes) {
  std::ofstream(path, std::ios::binary) << bytes;
}

Owned<BIO, BIO_free> Open(const std::string& path) {
  return Owned<BIO, BIO_free>(BIO_new_file(path.c_str(), "rb"));
}

}  // namespace

void WriteX509(const std::string& directory, const std::vector<EVP_PKEY*>& keys) {
  for (size_t i = 0; i < keys.size(); ++i) {
    Save(directory + "/" + std::to_string(i) + ".der", MakeCert(keys, i));
    Save(directory + "/" + std::to_string(i) + ".crl", MakeList(keys[i], i));
  }
}

bool VerifyX509(const std::string& directory, size_t certificates) {
  const Owned<X509_STORE, X509_STORE_free> store(X509_STORE_new());
  const Owned<STACK_OF(X509), [](STACK_OF(X509) * all) { sk_X509_pop_free(all, X509_free); }>
      between(sk_X509_new_null());
  Certificate leaf;
  for (size_t i = 0; i <= certificates; ++i) {
    Certificate cert(
        d2i_X509_bio(Open(directory + "/" + std::to_string(i) + ".der").get(), nullptr));
    if (i == 0) {
      X509_STORE_add_cert(store.get(), cert.get());
    } else if (i < certificates) {
      sk_X509_push(between.get(), cert.release());
    } else {
      leaf = std::move(cert);
    }
    if (i == certificates) break;
    const List list(
        d2i_X509_CRL_bio(Open(directory + "/" + std::to_string(i) + ".crl").get(), nullptr));
    X509_STORE_add_crl(store.get(), list.get());
  }
  X509_STORE_set_flags(store.get(), X509_V_FLAG_CRL_CHECK | X509_V_FLAG_CRL_CHECK_ALL);
  const Owned<X509_STORE_CTX, X509_STORE_CTX_free> check(X509_STORE_CTX_new());
  return X509_STORE_CTX_init(check.get(), store.get(), leaf.get(), between.get()) == 1 &&
         X509_verify_cert(check.get()) == 1;
}

}  // namespace bench::floor
