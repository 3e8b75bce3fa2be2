// SPDX-License-Identifier: Apache-2.0
// Growth: the time of one thing among few and among many. The slope is that of the line between two
// sizes where both axes are logarithmic: 1 where twice as many take twice as long.
#include "bench/growth.h"

#include <vesk2.h>
#include <vesk2/verify.h>

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <string_view>

#include "bench/bench.h"
#include "bench/chain.h"
#include "bench/tree.h"
#include "tests/support/test_object.h"
#include "tests/support/worst_inputs.h"

namespace bench {
namespace {

using ZvVesk2::Ref, ZvVesk2::SExpression;

// A chain of that many certificates, or a few less, reduced; no signature is looked at.
class Reduction {
 public:
  explicit Reduction(size_t certificates) {
    constexpr size_t kCertificate = 94;  // bytes
    const vesk2test::WorstLists lists = Chain()(certificates * kCertificate);
    acl_ = vesk2test::Parse(lists.acl);
    certificates_ = vesk2test::Parse(lists.sequence);
    requester_ = vesk2test::Parse(lists.third);
    tag_ = vesk2test::Parse(lists.tag);
  }

  bool Run(size_t times) const {
    bool right = true;
    for (size_t i = 0; i < times; ++i) {
      right = right && ZvVesk2::Verify::ReductA(nullptr, acl_.get(), certificates_.get(),
                                                requester_.get(), tag_.get(), nullptr) == 0;
    }
    return right;
  }

 private:
  static vesk2test::WorstLists (*Chain())(size_t) {
    for (const vesk2test::WorstInput& input : vesk2test::WorstInputs()) {
      if (std::string_view(input.name) == "long chain") return input.make;
    }
    return nullptr;
  }

  Ref<SExpression> acl_, certificates_, requester_, tag_;
};

Outcome ReductionGrowth(const Effort& effort) {
  const Reduction few(200), many(2'000);
  const size_t times = effort.Of(100, 20);
  return Ratio(
      effort, [&] { return many.Run(times); }, [&] { return few.Run(times); });
}

// ---- Slopes ----

// Seconds of one verification among so many; negative for a wrong result.
double OfFiles(size_t files) {
  const Tree& tree = TheTree(files, 64);
  return LeastSeconds([&tree] { return tree.Verify(); });
}

double OfEntries(size_t entries) {
  const Place place("store");
  FillStore(place, entries);
  const std::string chain = WriteChain(place, 3);
  return LeastSeconds([&] { return Vesk2CertVerifyFile(chain.c_str(), "(install)", 0, 0) == 0; });
}

double OfCertificates(size_t certificates) {
  const Reduction reduction(certificates);
  const size_t times = std::max<size_t>(1, 2'000 / certificates);
  return LeastSeconds([&] { return reduction.Run(times); }) / static_cast<double>(times);
}

struct Series {
  const char* name;
  std::vector<size_t> sizes;
  double (*seconds)(size_t size);
};

bool Print(const Series& series) {
  double before = 0;
  for (size_t i = 0; i < series.sizes.size(); ++i) {
    const size_t size = series.sizes[i];
    const double seconds = series.seconds(size);
    if (seconds < 0) return false;
    std::printf("%-40s %9zu %10.2f", series.name, size, seconds / static_cast<double>(size) * 1e6);
    if (i > 0) {
      const double wider = static_cast<double>(size) / static_cast<double>(series.sizes[i - 1]);
      std::printf(" %6.2f", std::log(seconds / before) / std::log(wider));
    }
    std::puts("");
    std::fflush(stdout);
    before = seconds;
  }
  return true;
}

}  // namespace

Figures GrowthFigures() {
  return {{"R1", "reduction of 2,000 over 200 certificates", "ratio", 11, ReductionGrowth}};
}

int RunGrowth() {
  const Series all[] = {
      {"files of a tree, verified", {1'000, 10'000, 100'000, 1'000'000}, OfFiles},
      {"entries of a store, chain of 3 verified", {10, 100, 1'000, 10'000, 20'000}, OfEntries},
      {"certificates of a chain, reduced", {10, 100, 1'000, 10'000, 20'000}, OfCertificates},
  };
  std::printf("%-40s %9s %10s %6s\n", "", "how many", "us of one", "slope");
  return std::ranges::all_of(all, Print) ? 0 : 1;
}

}  // namespace bench
