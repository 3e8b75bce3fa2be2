// SPDX-License-Identifier: Apache-2.0
// threads.cpp: lending threads.
#include "tools/vesk2/tree/threads.h"

#include <algorithm>
#include <filesystem>
#include <thread>
#include <vector>

namespace vesk2_command {
namespace {

constexpr unsigned kMostJobs = 64;
constexpr unsigned kMostByItself = 8;
// About a thousand entries: hashing them takes longer than starting threads.
constexpr uintmax_t kLong = 64 * 1024;

unsigned OwnChoice(const std::string& path) {
  std::error_code error;
  const uintmax_t size = std::filesystem::file_size(path, error);
  if (error || size < kLong) return 1;
  return std::min(std::thread::hardware_concurrency(), kMostByItself);
}

}  // namespace

void LentThreads::AddOption(OptionList& list, unsigned& jobs) {
  list.Add("--jobs", jobs,
           "Hash files on this many threads [one; for long manifests the cores, up to 8]")
      .Range(1, kMostJobs);
}

LentThreads::LentThreads(unsigned jobs, const std::string& path)
    : jobs_(jobs != 0 ? jobs : OwnChoice(path)), runner_{this, Run} {}

// What cannot be had is not lent: the verification does all with the threads that there are, and
// without any by itself.
void LentThreads::Run(void* self, void (*task)(void* work), void* work) {
  const unsigned jobs = static_cast<LentThreads*>(self)->jobs_;
  std::vector<std::thread> threads;
  try {
    threads.reserve(jobs);
    while (threads.size() < jobs) threads.emplace_back(task, work);
  } catch (const std::exception&) {
  }
  for (std::thread& thread : threads) thread.join();
}

}  // namespace vesk2_command
