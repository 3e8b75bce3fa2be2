// Hash::HashFile, which asks for four bytes a call, against the plainest fast loop: 64 KiB reads
// fed to libcrypto. Both hash the same 256 MiB file from the page cache.
#include <fcntl.h>
#include <openssl/evp.h>
#include <unistd.h>

#include <array>
#include <cstdio>
#include <fstream>
#include <memory>
#include <string>
#include <vector>

#include <vesk2/hash.h>

#include "bench/bench.h"

namespace {

constexpr size_t kFileSize = size_t{256} << 20;
constexpr size_t kReadSize = size_t{64} << 10;
const std::string kPath = VESK2_BENCH_DIR "/hash-file.bin";

using Digest = std::array<unsigned char, 32>;

bool MakeFile() {
  std::vector<char> block(kReadSize);
  uint32_t state = 1;
  for (char& byte : block) byte = static_cast<char>((state = state * 1664525 + 1013904223) >> 24);
  std::ofstream file(kPath, std::ios::binary);
  for (size_t size = 0; size < kFileSize; size += kReadSize) file.write(block.data(), kReadSize);
  file.close();
  return file.good();
}

bool HashByLibrary(Digest* digest) {
  auto length = static_cast<unsigned int>(digest->size());
  return ZvVesk2::Hash::HashFile(kPath.c_str(), digest->data(), &length, nullptr) == 0;
}

bool HashByLibcrypto(Digest* digest) {
  const std::unique_ptr<EVP_MD_CTX, void (*)(EVP_MD_CTX*)> hash(EVP_MD_CTX_new(), EVP_MD_CTX_free);
  const int fd = open(kPath.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0 || EVP_DigestInit_ex2(hash.get(), EVP_sha256(), nullptr) != 1) return false;
  std::vector<unsigned char> block(kReadSize);
  ssize_t count;
  while ((count = read(fd, block.data(), block.size())) > 0) {
    EVP_DigestUpdate(hash.get(), block.data(), static_cast<size_t>(count));
  }
  close(fd);
  return count == 0 && EVP_DigestFinal_ex(hash.get(), digest->data(), nullptr) == 1;
}

bool Prepare() {
  Digest ours{};
  Digest theirs{};
  return MakeFile() && HashByLibrary(&ours) && HashByLibcrypto(&theirs) && ours == theirs;
}

void RemoveFile() { std::remove(kPath.c_str()); }

template <bool (*Hash)(Digest*)>
bool Once() {
  Digest digest;
  return Hash(&digest);
}

}  // namespace

namespace bench {

const Comparison kHashFile = {.name = "HashFile",
                              .reference = "libcrypto",
                              .repetitions = 11,
                              .iterations = 1,
                              .bytes = int64_t{kFileSize},
                              .prepare = Prepare,
                              .clean = RemoveFile,
                              .library = Once<HashByLibrary>,
                              .bare = Once<HashByLibcrypto>};

}  // namespace bench
