// SPDX-License-Identifier: Apache-2.0
// Each input runs in a process of its own: its seconds are the processor time of that process (and
// of the command, where one runs) from the finished text on, its memory the most that it held.
#include "bench/worst.h"

#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>
#include <vesk2.h>
#include <vesk2/verify.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <string>
#include <vector>

#include "bench/bench.h"
#include "tests/support/test_load.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"
#include "tests/support/worst_inputs.h"

namespace bench {
namespace {

using namespace ZvVesk2;
using vesk2test::WorstCall;

constexpr size_t kSizes[] = {50'000, 200'000, 1'048'576};
constexpr double kSeconds = 2, kCommandSeconds = 6;
constexpr long kMebibytes = 512;
const std::string kRoot = VESK2_BENCH_DIR "/worst";

// What a row does in its process: makes its text, and then calls for the work that is measured.
using Work = std::function<void()>;
struct Row {
  std::string name;
  double seconds;
  std::function<Work(size_t bytes)> prepare;
};

Ref<SExpression> Read(const std::string& text) {
  return text.empty() ? Ref<SExpression>() : vesk2test::Parse(text);
}

// The engine, through the three functions that lead to it.
Work Reduce(const vesk2test::WorstInput& input, size_t bytes) {
  return [call = input.call, lists = input.make(bytes)] {
    const Ref<SExpression> acl = Read(lists.acl), tag = Read(lists.tag);
    const Ref<SExpression> sequence = Read(lists.sequence), third = Read(lists.third);
    Ref<SExpression> granted, from, to;
    switch (call) {
      case WorstCall::Subset:
        (void)tag->IsSubset(acl.get());
        return;
      case WorstCall::ReductA:
        (void)Verify::ReductA(nullptr, acl.get(), sequence.get(), third.get(), tag.get(), nullptr);
        return;
      case WorstCall::ReductB:
        (void)Verify::ReductB(nullptr, acl.get(), sequence.get(), third.get(), granted.Out(),
                              from.Out(), to.Out());
    }
  };
}

// Two certificates by keys of one's own, in a file.
std::string WriteChain(size_t bytes) {
  const vesk2test::WorstTags tags = vesk2test::TagsThatTakeLong(bytes);
  std::string text;
  for (const unsigned i : {1u, 0u}) {
    const std::string& tag = i == 0 ? tags.first : tags.second;
    const std::string cert = vesk2test::Cert({.issuer = vesk2test::TestKey::Rsa(i).Public(),
                                              .subject = vesk2test::TestKey::Rsa(i + 1).Public(),
                                              .tag = "(3:tag(7:install" + tag + "))",
                                              .propagate = true});
    text += cert + vesk2test::TestKey::Rsa(i).Sign(cert) + "(7:comment)";
  }
  const std::string path = kRoot + "/chain.cert";
  std::ofstream(path) << vesk2test::List({vesk2test::Str("sequence"), text});
  return path;
}

Work VerifyChain(size_t bytes) {
  return [path = WriteChain(bytes)] {
    Vesk2GlobalDirectory(kRoot.c_str());
    [[maybe_unused]] const int code = Vesk2CertVerifyFile(path.c_str(), "(install)", 0, 0);
  };
}

// The command with these arguments.
void Command(const std::vector<std::string>& arguments) {
  if (Run(arguments) == 127) std::abort();
}

Work CommandVerifyChain(size_t bytes) {
  return [path = WriteChain(bytes)] {
    Command({VESK2_COMMAND, "cert", "verify", path, "--tag", "(install)", "--global", kRoot});
  };
}

// A manifest by a stranger, with so many certificates and lists that it has `bytes` in all.
struct Load {
  const char* name;
  bool manyLists;  // small ones, else a long one
  bool keys;
  bool genuine;
};
constexpr Load kLoads[] = {
    {"one forged list, certificates", false, false, false},
    {"one forged list, keys", false, true, false},
    {"one list, certificates", false, false, true},
    {"one list, keys", false, true, true},
    {"many forged lists", true, false, false},
    {"many lists", true, false, true},
};

std::string WriteManifest(const Load& load, size_t bytes) {
  constexpr size_t kCertificate = 1150, kItem = 85, kList = 1100;  // about as long in text
  vesk2test::RevocationLoad made;
  made.certificates = bytes / 4 / kCertificate;
  made.lists = load.manyLists ? bytes * 3 / 4 / kList : 1;
  made.items = load.manyLists ? 1 : bytes * 3 / 4 / kItem;
  made.keys = load.keys;
  made.genuine = load.genuine;
  std::ofstream(kRoot + "/acl/load.acl") << vesk2test::LoadRoot();
  std::filesystem::create_directories(kRoot + "/tree");
  std::ofstream(kRoot + "/tree.manifest") << vesk2test::LoadManifest(made);
  return kRoot + "/tree.manifest";
}

Work VerifyManifestOf(const Load& load, size_t bytes) {
  return [path = WriteManifest(load, bytes)] {
    Vesk2GlobalDirectory(kRoot.c_str());
    Manifest* manifest = nullptr;
    const std::string tree = kRoot + "/tree";
    if (CreateManifestContext(&manifest, tree.c_str(), path.c_str(), "load") != 0) std::abort();
    [[maybe_unused]] const int code = VerifyManifest(manifest, 0, 0);
    DeleteManifestContext(manifest);
  };
}

Work CommandVerifyManifestOf(const Load& load, size_t bytes) {
  return [path = WriteManifest(load, bytes)] {
    Command({VESK2_COMMAND, "manifest", "verify", kRoot + "/tree", path, "--tag", "load",
             "--global", kRoot});
  };
}

std::vector<Row> Rows() {
  std::vector<Row> rows;
  for (const vesk2test::WorstInput& input : vesk2test::WorstInputs()) {
    rows.push_back({input.name, kSeconds, [&input](size_t bytes) { return Reduce(input, bytes); }});
  }
  // Whatever is more than the engine stands here, one row a file that a stranger may send.
  rows.push_back({"flat: chain of two", kSeconds, VerifyChain});
  rows.push_back({"command: chain of two", kCommandSeconds, CommandVerifyChain});
  for (const Load& load : kLoads) {
    rows.push_back({std::string("flat: ") + load.name, kSeconds,
                    [&load](size_t bytes) { return VerifyManifestOf(load, bytes); }});
    rows.push_back({std::string("command: ") + load.name, kCommandSeconds,
                    [&load](size_t bytes) { return CommandVerifyManifestOf(load, bytes); }});
  }
  return rows;
}

double Spent(int who) {
  rusage usage = {};
  getrusage(who, &usage);
  const auto seconds = [](const timeval& t) { return double(t.tv_sec) + double(t.tv_usec) / 1e6; };
  return seconds(usage.ru_utime) + seconds(usage.ru_stime);
}
double SpentByAll() { return Spent(RUSAGE_SELF) + Spent(RUSAGE_CHILDREN); }

struct Cost {
  double seconds = 0;
  long mebibytes = 0;
};

// False when the process did not end as it should.
bool Measure(const Row& row, size_t bytes, Cost& cost) {
  int ends[2];
  if (pipe(ends) != 0) return false;
  const pid_t pid = fork();
  if (pid == 0) {
    const Work work = row.prepare(bytes);
    const double before = SpentByAll();
    work();
    const double seconds = SpentByAll() - before;
    _exit(write(ends[1], &seconds, sizeof seconds) == sizeof seconds ? 0 : 1);
  }
  close(ends[1]);
  const bool told = read(ends[0], &cost.seconds, sizeof cost.seconds) == sizeof cost.seconds;
  close(ends[0]);
  int status = 0;
  rusage usage = {};
  if (wait4(pid, &status, 0, &usage) != pid) return false;
  cost.mebibytes = usage.ru_maxrss / 1024;
  return told && WIFEXITED(status) && WEXITSTATUS(status) == 0;
}

}  // namespace

int RunWorst() {
  std::filesystem::create_directories(kRoot + "/acl");
  std::printf("%-32s %9s %9s %9s   %s\n", "input", "bytes", "seconds", "MiB", "bound");
  int missed = 0;
  for (const Row& row : Rows()) {
    for (const size_t bytes : kSizes) {
      Cost cost;
      const bool met =
          Measure(row, bytes, cost) && cost.seconds <= row.seconds && cost.mebibytes <= kMebibytes;
      if (!met) missed = 1;
      std::printf("%-32s %9zu %9.2f %9ld   %g s, %ld MiB  %s\n", row.name.c_str(), bytes,
                  cost.seconds, cost.mebibytes, row.seconds, kMebibytes, met ? "met" : "MISSED");
      std::fflush(stdout);
    }
  }
  std::error_code ignored;
  std::filesystem::remove_all(kRoot, ignored);
  return missed;
}

}  // namespace bench
