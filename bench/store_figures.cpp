// SPDX-License-Identifier: Apache-2.0
// Looking through stores of many entries.
#include <sys/stat.h>
#include <vesk2.h>
#include <vesk2/acl_entry.h>
#include <vesk2/cert_sequence.h>
#include <vesk2/ref.h>

#include "bench/bench.h"
#include "bench/chain.h"
#include "bench/floor/floor.h"
#include "tests/support/test_object.h"
#include "tests/support/test_text.h"

namespace bench {
namespace {

using namespace ZvVesk2;

// Each entry is looked at and none accepted.
Outcome Scan(const Effort& effort, size_t entries) {
  const Place place("store");
  FillStore(place, entries);
  const Ref<SExpression> tag = vesk2test::Parse(vesk2test::Tag("(nothing)"));
  const size_t times = effort.Of(20'000, 10'000) / entries;
  const std::string store = place.Path() + "/acl";
  return Ratio(
      effort,
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i) {
          right = right && AclEntry::Find(tag.get()) == VESK2_ERR_ACL_ENTRY_NOT_FOUND;
        }
        return right;
      },
      [&] {
        bool right = true;
        for (size_t i = 0; i < times; ++i)
          right = right && floor::ScanStore(store.c_str()) == entries;
        return right;
      });
}

// The same work in entries, in a large store and in small ones.
Outcome Growth(const Effort& effort) {
  constexpr size_t kMany = 10'000, kFew = 100;
  const Place large("large"), small("small");
  FillStore(large, kMany);
  FillStore(small, kFew);
  const std::string chain = WriteChain(large, 3);
  const auto verify = [&chain](const Place& place, size_t times) {
    Vesk2GlobalDirectory(place.Path().c_str());
    bool right = true;
    for (size_t i = 0; i < times; ++i) {
      right = right && Vesk2CertVerifyFile(chain.c_str(), "(install)", 0, 0) == 0;
    }
    return right;
  };
  return Ratio(
      effort, [&] { return verify(large, 1); }, [&] { return verify(small, kMany / kFew); });
}

}  // namespace

Figures StoreFigures() {
  return {
      {"A1a", "scan of a store of 100 entries", "opendir, readdir, openat, read, close", 1.8,
       [](const Effort& effort) { return Scan(effort, 100); }},
      {"A1b", "of 1,000", "the same", 1.8,
       [](const Effort& effort) { return Scan(effort, 1'000); }},
      {"A1c", "of 10,000", "the same", 1.8,
       [](const Effort& effort) { return Scan(effort, 10'000); }},
      {"A2", "chain of 3, time of an entry, 10,000 over 100", "ratio", 1.2, Growth},
  };
}

}  // namespace bench
