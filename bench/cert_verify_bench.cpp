// Vesk2CertVerifyFile of a chain of three certificates, RSA-2048 and SHA-256 throughout, against
// the least that it has to do: three RSA verifications, each with a key built from its numbers, and
// two scans of the store, whose ten files are opened, read and closed.
#include <fcntl.h>
#include <openssl/core_names.h>
#include <openssl/evp.h>
#include <openssl/param_build.h>
#include <openssl/rsa.h>
#include <unistd.h>
#include <vesk2.h>

#include <array>
#include <filesystem>
#include <memory>
#include <string>

#include "bench/bench.h"
#include "tests/support/test_manifest.h"

namespace {

using vesk2test::TestKey;

constexpr unsigned kCerts = 3;
constexpr unsigned kEntries = 10;
const std::string kRoot = VESK2_BENCH_DIR "/cert-verify";
const std::string kStore = kRoot + "/acl";
const std::string kChain = kRoot + "/chain.cert";

template <typename T, void (*Free)(T*)>
struct Deleter {
  void operator()(T* object) const { Free(object); }
};
template <typename T, void (*Free)(T*)>
using Owned = std::unique_ptr<T, Deleter<T, Free>>;

// One signature, and the numbers of the key that made it.
struct Signed {
  std::string n, e, digest, value;
};
std::array<Signed, kCerts> signatures;

void Write(const std::string& path, const std::string& text) {
  const int fd = open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0600);
  if (fd < 0) return;
  [[maybe_unused]] const ssize_t written = write(fd, text.data(), text.size());
  close(fd);
}

std::string Number(const TestKey& key, const char* name) {
  BIGNUM* raw = nullptr;
  EVP_PKEY_get_bn_param(key.Pkey(), name, &raw);
  const Owned<BIGNUM, BN_free> number(raw);
  std::string bytes(static_cast<size_t>(BN_num_bytes(raw)), '\0');
  BN_bn2bin(raw, reinterpret_cast<unsigned char*>(bytes.data()));
  return bytes;
}

// The certificate by which key i lets key i + 1 install; the last key's comes first.
void MakeChain() {
  std::string text;
  for (unsigned i = kCerts; i-- > 0;) {
    const TestKey& issuer = TestKey::Rsa(i);
    const std::string cert = vesk2test::Cert({.issuer = issuer.Public(),
                                              .subject = TestKey::Rsa(i + 1).Public(),
                                              .tag = vesk2test::Tag("(install)"),
                                              .propagate = true});
    text += cert + issuer.Sign(cert) + "(7:comment)";
    const std::string digest = vesk2test::Digest(cert);
    signatures[i] = {Number(issuer, OSSL_PKEY_PARAM_RSA_N), Number(issuer, OSSL_PKEY_PARAM_RSA_E),
                     digest, issuer.SignDigest(digest, "rsa-1.5", "sha256")};
  }
  Write(kChain, vesk2test::List({vesk2test::Str("sequence"), text}));
}

// The chain's root is the last of the entries; each of the others trusts another key.
void MakeStore() {
  for (unsigned i = 0; i < kEntries; ++i) {
    const unsigned key = i + 1 < kEntries ? kCerts + 1 + i : 0;
    Write(kStore + "/entry" + std::to_string(i) + ".acl",
          vesk2test::AclEntryText(TestKey::Rsa(key).Public(), vesk2test::Tag("(install)")));
  }
}

bool VerifyByLibrary() { return Vesk2CertVerifyFile(kChain.c_str(), "(install)", 0, 0) == 0; }

const unsigned char* Bytes(const std::string& text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

Owned<EVP_PKEY, EVP_PKEY_free> MakeKey(const Signed& by) {
  const auto number = [](const std::string& bytes) {
    return Owned<BIGNUM, BN_free>(BN_bin2bn(Bytes(bytes), static_cast<int>(bytes.size()), nullptr));
  };
  const auto n = number(by.n);
  const auto e = number(by.e);
  const Owned<OSSL_PARAM_BLD, OSSL_PARAM_BLD_free> builder(OSSL_PARAM_BLD_new());
  OSSL_PARAM_BLD_push_BN(builder.get(), OSSL_PKEY_PARAM_RSA_N, n.get());
  OSSL_PARAM_BLD_push_BN(builder.get(), OSSL_PKEY_PARAM_RSA_E, e.get());
  const Owned<OSSL_PARAM, OSSL_PARAM_free> numbers(OSSL_PARAM_BLD_to_param(builder.get()));
  const Owned<EVP_PKEY_CTX, EVP_PKEY_CTX_free> context(
      EVP_PKEY_CTX_new_from_name(nullptr, "RSA", nullptr));
  EVP_PKEY* key = nullptr;
  EVP_PKEY_fromdata_init(context.get());
  EVP_PKEY_fromdata(context.get(), &key, EVP_PKEY_PUBLIC_KEY, numbers.get());
  return Owned<EVP_PKEY, EVP_PKEY_free>(key);
}

bool VerifyOne(const Signed& by) {
  const auto key = MakeKey(by);
  const Owned<EVP_PKEY_CTX, EVP_PKEY_CTX_free> context(
      EVP_PKEY_CTX_new_from_pkey(nullptr, key.get(), nullptr));
  return EVP_PKEY_verify_init(context.get()) == 1 &&
         EVP_PKEY_CTX_set_rsa_padding(context.get(), RSA_PKCS1_PADDING) == 1 &&
         EVP_PKEY_CTX_set_signature_md(context.get(), EVP_sha256()) == 1 &&
         EVP_PKEY_verify(context.get(), Bytes(by.value), by.value.size(), Bytes(by.digest),
                         by.digest.size()) == 1;
}

bool ScanStore() {
  unsigned files = 0;
  for (const auto& file : std::filesystem::directory_iterator(kStore)) {
    const int fd = open(file.path().c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) return false;
    std::array<char, 4096> block;
    while (read(fd, block.data(), block.size()) > 0) {
    }
    close(fd);
    ++files;
  }
  return files == kEntries;
}

bool VerifyByLibcrypto() {
  for (const Signed& one : signatures) {
    if (!VerifyOne(one)) return false;
  }
  return ScanStore() && ScanStore();
}

bool Prepare() {
  std::filesystem::create_directories(kStore);
  MakeStore();
  MakeChain();
  Vesk2GlobalDirectory(kRoot.c_str());
  return VerifyByLibrary() && VerifyByLibcrypto();
}

void Clean() {
  std::error_code ignored;
  std::filesystem::remove_all(kRoot, ignored);
}

}  // namespace

namespace bench {

const Comparison kCertVerify = {.name = "Vesk2CertVerifyFile",
                                .reference = "libcrypto and reads",
                                .repetitions = 51,
                                .iterations = 40,
                                .bytes = 0,
                                .prepare = Prepare,
                                .clean = Clean,
                                .library = VerifyByLibrary,
                                .bare = VerifyByLibcrypto};

}  // namespace bench
