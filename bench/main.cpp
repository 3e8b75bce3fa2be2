// SPDX-License-Identifier: Apache-2.0
// Measures the figures and prints one table of them.
#include <cstdio>
#include <exception>
#include <string>
#include <string_view>

#include "bench/bench.h"
#include "bench/growth.h"
#include "bench/worst.h"

namespace bench {
namespace {

constexpr char kHelp[] =
    "usage: vesk2_bench [--quick] [ID...]   the table, or the figures whose ids begin so\n"
    "       vesk2_bench --worst             the worst inputs known\n"
    "       vesk2_bench --growth            how the work grows with what is asked about\n";

void Print(const Figure& figure, const Outcome& outcome) {
  std::string value = "-";
  const char* verdict = "FAILED";
  if (outcome.kind == Outcome::kNotInstalled) verdict = "not installed";
  if (outcome.kind == Outcome::kMeasured) {
    char text[32];
    std::snprintf(text, sizeof text, figure.goal < 20 ? "%.2f" : "%.0f", outcome.value);
    value = text;
    verdict = outcome.value <= figure.goal ? "met" : "MISSED";
  }
  std::printf("%-5s %-46s  %-42s  %7s  %6g  %s%s%s\n", figure.id, figure.what, figure.yardstick,
              value.c_str(), figure.goal, verdict, outcome.note.empty() ? "" : ": ",
              outcome.note.c_str());
  std::fflush(stdout);
}

// Whether all that was asked for was measured. A goal that was missed is no failure of the run.
bool PrintTable(const Effort& effort, const std::vector<std::string_view>& ids) {
  bool whole = true;
  std::printf("%-5s %-46s  %-42s  %7s  %6s\n", "", "figure", "yardstick", "ratio", "goal");
  for (const auto& group : {HashFigures, ExpressionFigures, TreeFigures, StoreFigures, ChainFigures,
                            GrowthFigures, SignatureFigures, CommandFigures}) {
    for (const Figure& figure : group()) {
      bool wanted = ids.empty();
      for (const std::string_view id : ids) wanted |= std::string_view(figure.id).starts_with(id);
      if (!wanted) continue;
      const Outcome outcome = figure.measure(effort);
      Print(figure, outcome);
      whole &= outcome.kind != Outcome::kFailed;
    }
  }
  return whole;
}

}  // namespace
}  // namespace bench

int main(int count, char** arguments) {
  bench::Effort effort;
  std::vector<std::string_view> ids;
  for (int i = 1; i < count; ++i) {
    const std::string_view word = arguments[i];
    if (word == "--worst") return bench::RunWorst();
    if (word == "--growth") return bench::RunGrowth();
    if (word == "--quick") {
      effort.quick = true;
    } else if (word.starts_with("-")) {
      std::fputs(bench::kHelp, word == "--help" ? stdout : stderr);
      return word == "--help" ? 0 : 2;
    } else {
      ids.push_back(word);
    }
  }
  return bench::PrintTable(effort, ids) ? 0 : 1;
}
