// SPDX-License-Identifier: Apache-2.0
// What the command takes beside the library: signing, drawing its progress, starting.
#include <algorithm>

#include "bench/bench.h"
#include "bench/tree.h"

namespace bench {
namespace {

// A place with a signing key, "signer.pem".
const Place& WithKey() {
  static const Place place("command");
  [[maybe_unused]] static const int made =
      Run({VESK2_COMMAND, "key", "new", "--bits", "2048", place.Path() + "/signer"});
  return place;
}

Outcome SignAgainstSums(const Effort& effort, size_t bytes) {
  const Tree& tree = TheTree(effort.Of(100'000, 20'000), bytes);
  const Place& place = WithKey();
  const std::vector<std::string> ours = {VESK2_COMMAND,
                                         "manifest",
                                         "sign",
                                         tree.root,
                                         "--key",
                                         place.Path() + "/signer.pem",
                                         "--tag",
                                         "(install)",
                                         "--force",
                                         "-o",
                                         place.Path() + "/signed"};
  const std::vector<std::string> theirs = {
      "/bin/sh", "-c", "exec find " + tree.root + " -type f -exec sha256sum {} +"};
  return Ratio(
      effort, [&] { return Run(ours) == 0; }, [&] { return Run(theirs) == 0; });
}

// script(1) gives the command a terminal; both ways pay for it.
Outcome ProgressAgainstNone(const Effort& effort) {
  const std::string script = FindProgram("script");
  if (script.empty()) return NotInstalled("script");
  const Tree& tree = TheTree(effort.Of(100'000, 20'000), 4096);
  std::string line = "exec";
  for (const std::string& word : tree.Command()) line += " '" + word + "'";
  const auto run = [&](const std::string& more) {
    return Run({script, "-qec", line + more, "/dev/null"}) == 0;
  };
  return Ratio(
      effort, [&] { return run(""); }, [&] { return run(" --no-progress"); });
}

// The processor time of many runs of a program, in seconds; negative when one failed.
double TimeOf(const std::vector<std::string>& words) {
  constexpr int kRuns = 50;
  const double before = Spent();
  for (int i = 0; i < kRuns; ++i) {
    if (Run(words) != 0) return -1;
  }
  return Spent() - before;
}

// What starting and answering takes above a program that does nothing, over what another takes.
Outcome Start(const Effort& effort, const std::vector<std::string>& ours,
              const std::vector<std::string>& other) {
  double least[3] = {1e9, 1e9, 1e9};
  for (int round = 0; round < effort.rounds; ++round) {
    const std::vector<std::string> programs[3] = {{"/bin/true"}, ours, other};
    for (int i = 0; i < 3; ++i) {
      const double taken = TimeOf(programs[i]);
      if (taken < 0) return Failed(programs[i][0]);
      least[i] = std::min(least[i], taken);
    }
  }
  return {Outcome::kMeasured, (least[1] - least[0]) / (least[2] - least[0]), {}};
}

Outcome StartAgainstPeer(const Effort& effort, const std::vector<std::string>& ours) {
  const std::string peer = FindProgram("minisign");
  if (peer.empty()) return NotInstalled("minisign");
  const Place& place = WithKey();
  const std::string file = place.Write("file", "x");
  const std::string keys[] = {place.Path() + "/peer.pub", place.Path() + "/peer.key"};
  Run({peer, "-G", "-W", "-f", "-p", keys[0], "-s", keys[1]});
  Run({peer, "-S", "-s", keys[1], "-m", file});
  return Start(effort, ours, {peer, "-V", "-p", keys[0], "-m", file});
}

}  // namespace

Figures CommandFigures() {
  return {
      {"F3c1", "vesk2 manifest sign, files of 4 KiB", "find -exec sha256sum", 1.10,
       [](const Effort& effort) { return SignAgainstSums(effort, 4096); }},
      {"F3c2", "the same, of 1 KiB", "the same", 1.30,
       [](const Effort& effort) { return SignAgainstSums(effort, 1024); }},
      {"F3d", "verify on a terminal, progress shown", "without", 1.03, ProgressAgainstNone},
      {"U1a", "vesk2 version, above /bin/true", "minisign -V of a file, above it", 3,
       [](const Effort& effort) {
         return StartAgainstPeer(effort, {VESK2_COMMAND, "version"});
       }},
      {"U1b", "vesk2 manifest verify of one file, above it", "the same", 5,
       [](const Effort& effort) { return StartAgainstPeer(effort, TheTree(1, 64).Command()); }},
      {"U2a", "vesk2 version, above /bin/true", "loading libcrypto and the C++ runtime", 1.5,
       [](const Effort& effort) {
         return Start(effort, {VESK2_COMMAND, "version"}, {VESK2_FLOOR_START});
       }},
      {"U2b", "vesk2 manifest verify of one file, above it", "that, and fetching SHA-256", 2,
       [](const Effort& effort) {
         return Start(effort, TheTree(1, 64).Command(), {VESK2_FLOOR_START, "fetch"});
       }},
  };
}

}  // namespace bench
