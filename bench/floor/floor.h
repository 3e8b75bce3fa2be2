// SPDX-License-Identifier: Apache-2.0
// The smallest honest programs that do the work of the figures: the same bytes read by the same
// kinds of system calls, the same hashes and signature checks by libcrypto, and nothing else. They
// take no care of hostile input.
#ifndef VESK2_BENCH_FLOOR_FLOOR_H
#define VESK2_BENCH_FLOOR_FLOOR_H

#include <array>
#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include <openssl/evp.h>

namespace bench::floor {

using Digest = std::array<unsigned char, 32>;

// An owned object of libcrypto's.
template <auto Free>
struct Deleter {
  template <typename T>
  void operator()(T* object) const {
    Free(object);
  }
};
template <typename T, auto Free>
using Owned = std::unique_ptr<T, Deleter<Free>>;

// A SHA-256 whose algorithm was fetched once and whose context serves again and again.
class Sha256 {
 public:
  Sha256();
  void Start();
  void Add(const void* bytes, size_t count);
  Digest End();

 private:
  Owned<EVP_MD, EVP_MD_free> algorithm_;
  Owned<EVP_MD_CTX, EVP_MD_CTX_free> context_;
};

// Hashes a file in reads of 64 KiB; false when it cannot be read.
bool HashFile(const char* path, Digest& digest);

// A listed tree, a directory a time, the files of each in byte order.
struct ListedFile {
  std::string name;
  Digest digest;
};
struct ListedDirectory {
  std::string path;
  std::vector<ListedFile> files;
};
// Whether the directories hold these files with these contents and no others: each is listed, and
// each file opened from its directory, looked at, read and hashed.
bool CompareTree(const std::vector<ListedDirectory>& tree);

// Opens, reads and closes each entry of a directory; how many there were.
size_t ScanStore(const char* directory);

// A signature with RSASSA-PKCS1-v1_5 and SHA-256, and the numbers of the key that made it.
struct Signed {
  std::string n, e, digest, value;
};
// Builds the key and checks the signature.
bool CheckSignature(const Signed& by);

// Writes certificates in X.509's form, each by the key before it, the first by itself, and a
// revocation list of each key.
void WriteX509(const std::string& directory, const std::vector<EVP_PKEY*>& keys);
// Reads them, and has libcrypto verify the chain that ends `certificates` after the first, with the
// lists.
bool VerifyX509(const std::string& directory, size_t certificates);

}  // namespace bench::floor

#endif  // VESK2_BENCH_FLOOR_FLOOR_H
