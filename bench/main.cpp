// Runs the comparisons. The two ways of each take turns, so that a busy machine slows both; the
// best time of each gives the ratios on the last lines.
#include <benchmark/benchmark.h>

#include <algorithm>
#include <cstdio>
#include <limits>
#include <map>
#include <string>
#include <string_view>
#include <vector>

#include "bench/bench.h"
#include "bench/worst.h"

namespace bench {
namespace {

const Comparison* const kComparisons[] = {&kHashFile, &kCertVerify};

void Register(const Comparison& comparison, const char* name, bool (*way)()) {
  const int64_t bytes = comparison.bytes;
  benchmark::RegisterBenchmark(name,
                               [way, bytes](benchmark::State& state) {
                                 for (auto _ : state) {
                                   if (!way()) state.SkipWithError("a wrong result");
                                 }
                                 if (bytes > 0) state.SetBytesProcessed(state.iterations() * bytes);
                               })
      ->Iterations(comparison.iterations)
      ->Repetitions(static_cast<int>(comparison.repetitions))
      ->Unit(benchmark::kMillisecond);
}

// Prints the summaries and keeps the best time of each benchmark, in milliseconds.
class BestTimes : public benchmark::ConsoleReporter {
 public:
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const Run& run : runs) {
      if (run.run_type != Run::RT_Iteration || run.error_occurred) continue;
      const double time = run.GetAdjustedCPUTime();
      const auto [best, first] = best_.try_emplace(run.run_name.function_name, time);
      if (!first) best->second = std::min(best->second, time);
    }
    const bool summary = !runs.empty() && runs.front().run_type == Run::RT_Aggregate;
    if (summary) ConsoleReporter::ReportRuns(runs);
  }
  double Of(const char* name) const {
    const auto best = best_.find(name);
    return best != best_.end() ? best->second : std::numeric_limits<double>::quiet_NaN();
  }

 private:
  std::map<std::string, double> best_;
};

struct CleanUp {
  ~CleanUp() {
    for (const Comparison* comparison : kComparisons) comparison->clean();
  }
};

int Run(int count, char** arguments) {
  std::vector<char*> all(arguments, arguments + count);
  std::string interleaving = "--benchmark_enable_random_interleaving=true";
  all.insert(all.begin() + 1, interleaving.data());
  count = static_cast<int>(all.size());
  benchmark::Initialize(&count, all.data());

  const CleanUp cleanUp;
  for (const Comparison* comparison : kComparisons) {
    if (!comparison->prepare()) {
      std::fprintf(stderr, "vesk2_bench: %s and %s do not agree\n", comparison->name,
                   comparison->reference);
      return 1;
    }
    Register(*comparison, comparison->name, comparison->library);
    Register(*comparison, comparison->reference, comparison->bare);
  }
  BestTimes best;
  benchmark::RunSpecifiedBenchmarks(&best);
  for (const Comparison* comparison : kComparisons) {
    const double ours = best.Of(comparison->name);
    const double theirs = best.Of(comparison->reference);
    std::printf("\n%-20s %9.3f ms\n%-20s %9.3f ms\nratio                %9.2f\n", comparison->name,
                ours, comparison->reference, theirs, ours / theirs);
  }
  return 0;
}

}  // namespace
}  // namespace bench

int main(int count, char** arguments) {
  if (count == 2 && std::string_view(arguments[1]) == "--worst") return bench::RunWorst();
  return bench::Run(count, arguments);
}
