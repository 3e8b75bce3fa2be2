// Hash::HashFile, which asks for four bytes a call, against the plainest fast loop: 64 KiB reads
// fed to libcrypto. Both hash the same 256 MiB file from the page cache, taking turns, so that a
// busy machine slows both; the best of each gives the ratio on the last line.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <openssl/evp.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cstdio>
#include <fstream>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include <vesk2/hash.h>

namespace {

constexpr size_t kFileSize = size_t{256} << 20;
constexpr size_t kReadSize = size_t{64} << 10;
const std::string kPath = VESK2_BENCH_DIR "/hash-file.bin";

using Digest = std::array<unsigned char, 32>;

struct RemoveFile {
  ~RemoveFile() { std::remove(kPath.c_str()); }
};

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

template <bool (*Hash)(Digest*)>
void Measure(benchmark::State& state) {
  Digest digest;
  for (auto _ : state) {
    if (!Hash(&digest)) state.SkipWithError("the file could not be hashed");
  }
  state.SetBytesProcessed(state.iterations() * static_cast<int64_t>(kFileSize));
}

void Register(const char* name, void (*measure)(benchmark::State&)) {
  benchmark::RegisterBenchmark(name, measure)->Iterations(1)->Unit(benchmark::kMillisecond);
}

// Prints as usual and keeps the best time of each benchmark.
class BestTimes : public benchmark::ConsoleReporter {
 public:
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const Run& run : runs) {
      if (run.run_type != Run::RT_Iteration || run.error_occurred) continue;
      double& best = run.run_name.function_name == "HashFile" ? hashFile : libcrypto;
      best = std::min(best, run.GetAdjustedCPUTime());
    }
    ConsoleReporter::ReportRuns(runs);
  }

  double hashFile = std::numeric_limits<double>::infinity();
  double libcrypto = std::numeric_limits<double>::infinity();
};

}  // namespace

int main(int count, char** arguments) {
  std::vector<char*> all(arguments, arguments + count);
  std::string repetitions = "--benchmark_repetitions=11";
  std::string interleaving = "--benchmark_enable_random_interleaving=true";
  all.insert(all.begin() + 1, {repetitions.data(), interleaving.data()});
  count = static_cast<int>(all.size());
  benchmark::Initialize(&count, all.data());

  const RemoveFile remove;
  Digest ours{};
  Digest theirs{};
  if (!MakeFile() || !HashByLibrary(&ours) || !HashByLibcrypto(&theirs) || ours != theirs) {
    std::fprintf(stderr, "vesk2_bench: the two ways do not agree on %s\n", kPath.c_str());
    return 1;
  }
  Register("HashFile", Measure<HashByLibrary>);
  Register("libcrypto", Measure<HashByLibcrypto>);
  BestTimes best;
  benchmark::RunSpecifiedBenchmarks(&best);
  std::printf("\nHashFile   %8.1f ms\nlibcrypto  %8.1f ms\nratio      %8.2f\n", best.hashFile,
              best.libcrypto, best.hashFile / best.libcrypto);
  return 0;
}
