// SPDX-License-Identifier: Apache-2.0
// Verifying trees of many files.
#include <thread>

#include "bench/bench.h"
#include "bench/tree.h"

namespace bench {
namespace {

// Small files, of which the number is what counts.
constexpr size_t kSmall = 64;

const Tree& ManyFiles(const Effort& effort, size_t bytes) {
  return TheTree(effort.Of(100'000, 20'000), bytes);
}

Outcome AgainstLoop(const Effort& effort, size_t bytes) {
  const Tree& tree = ManyFiles(effort, bytes);
  return Ratio(
      effort, [&] { return tree.Verify(); }, [&] { return floor::CompareTree(tree.listed); });
}

// What two sizes of trees differ by is a file's share; what comes before and after is not.
Outcome Share(long small, long large, const Tree& few, const Tree& many) {
  if (small < 0 || large < 0) return Failed("nobody may watch system calls here");
  const auto calls = static_cast<double>(large - small);
  return {Outcome::kMeasured, calls / static_cast<double>(many.files - few.files), {}};
}

Outcome CallsOfFile(const Effort&) {
  const Tree& few = TheTree(100, kSmall);
  const Tree& many = TheTree(10'000, kSmall);
  return Share(CountCalls([&] { return few.Verify(); }), CountCalls([&] { return many.Verify(); }),
               few, many);
}

// What people use today, run on a list of its own from within the tree.
Outcome AgainstProgram(const Effort& effort, size_t bytes, const char* name) {
  const std::string program = FindProgram(name);
  if (program.empty()) return NotInstalled(name);
  const Tree& tree = ManyFiles(effort, bytes);
  const std::vector<std::string> theirs =
      name == std::string("mtree")
          ? std::vector<std::string>{program, "-f", tree.MtreeList(), "-p", tree.root}
          : std::vector<std::string>{program, "--quiet", "-c", tree.SumList()};
  return Ratio(
      effort, [&] { return Run(tree.Command()) == 0; }, [&] { return Run(theirs) == 0; });
}

Outcome CallsOfFileByCommand(const Effort&) {
  const Tree& few = TheTree(100, kSmall);
  const Tree& many = TheTree(10'000, kSmall);
  const auto become = [](const Tree& tree) {
    return [words = tree.Command()] {
      Become(words);
      return false;
    };
  };
  return Share(CountCalls(become(few)), CountCalls(become(many)), few, many);
}

Outcome Growth(const Effort& effort) {
  const Tree& few = TheTree(10'000, kSmall);
  const Tree& many = TheTree(effort.Of(1'000'000, 100'000), kSmall);
  const size_t times = many.files / few.files;
  return Ratio(
      effort, [&] { return many.Verify(); },
      [&] {
        bool same = true;
        for (size_t i = 0; i < times; ++i) same = same && few.Verify();
        return same;
      });
}

Outcome TwoJobs(const Effort& effort) {
  if (std::thread::hardware_concurrency() < 2) return Failed("one processor only");
  const Tree& tree = ManyFiles(effort, 4096);
  return ClockRatio(
      effort, [&] { return tree.Verify(2); }, [&] { return tree.Verify(); });
}

Outcome MemoryOfEntry(const Effort& effort) {
  const Tree& tree = TheTree(effort.Of(1'000'000, 100'000), kSmall);
  const double bytes = PeakMemory([&] { return tree.Verify(); });
  if (bytes < 0) return Failed("no child");
  return {Outcome::kMeasured, bytes / static_cast<double>(tree.Entries()), {}};
}

Outcome MemoryOfEntryInCommand(const Effort& effort) {
  const Tree& few = TheTree(100, kSmall);
  const Tree& many = TheTree(effort.Of(1'000'000, 100'000), kSmall);
  const double least = PeakOfProgram(few.Command()), most = PeakOfProgram(many.Command());
  if (least < 0 || most < 0) return Failed("a wrong result");
  return {Outcome::kMeasured, (most - least) / static_cast<double>(many.Entries()), {}};
}

}  // namespace

Figures TreeFigures() {
  return {
      {"F2a", "VerifyManifest, files of 4 KiB", "list, openat, fstat, read, EVP, merge", 1.20,
       [](const Effort& effort) { return AgainstLoop(effort, 4096); }},
      {"F2b", "VerifyManifest, files of 1 KiB", "the same", 1.20,
       [](const Effort& effort) { return AgainstLoop(effort, 1024); }},
      {"F3a1", "vesk2 manifest verify, files of 4 KiB", "sha256sum -c", 0.80,
       [](const Effort& effort) { return AgainstProgram(effort, 4096, "sha256sum"); }},
      {"F3a2", "the same, of 1 KiB", "the same", 0.95,
       [](const Effort& effort) { return AgainstProgram(effort, 1024, "sha256sum"); }},
      {"F3b1", "vesk2 manifest verify, files of 4 KiB", "mtree -f (sha256, type, size)", 0.55,
       [](const Effort& effort) { return AgainstProgram(effort, 4096, "mtree"); }},
      {"F3b2", "the same, of 1 KiB", "the same", 0.75,
       [](const Effort& effort) { return AgainstProgram(effort, 1024, "mtree"); }},
      {"F4a", "system calls of a file, library", "count", 5.1, CallsOfFile},
      {"F4b", "the same, command", "count", 5.2, CallsOfFileByCommand},
      {"F5", "time of a file, 1,000,000 over 10,000", "ratio", 1.10, Growth},
      {"F6a", "memory of an entry at 1,000,000, library", "bytes", 250, MemoryOfEntry},
      {"F6b", "the same, command", "bytes", 260, MemoryOfEntryInCommand},
      {"F7", "two jobs, on the clock", "one job", 0.60, TwoJobs},
  };
}

}  // namespace bench
