// SPDX-License-Identifier: Apache-2.0
// For thousands of random refusals: the explanation agrees with the library's answer, and the
// change that it names turns it.
#include <gtest/gtest.h>

#include <fcntl.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <nlohmann/json.hpp>
#include <optional>

#include "tests/tools/store_maker.h"
#include "tools/vesk2/commands/command.h"

#include <vesk2.h>
#include <vesk2/expression.h>
#include <vesk2/ref.h>
#include <vesk2/time_stamp.h>

namespace vesk2test {
namespace {

using Json = nlohmann::json;
using Words = std::vector<std::string>;

// Runs command lines in this process, their output kept off the screen.
class CommandRunner {
 public:
  CommandRunner() {
    std::fflush(stdout);
    for (int i : {1, 2}) saved_[i - 1] = dup(i);
    null_ = open("/dev/null", O_WRONLY | O_CLOEXEC);
  }
  ~CommandRunner() {
    for (const int fd : {saved_[0], saved_[1], null_}) close(fd);
  }
  CommandRunner(const CommandRunner&) = delete;
  CommandRunner& operator=(const CommandRunner&) = delete;

  int Run(const Words& words, std::string* output = nullptr) {
    const int file = output != nullptr ? open(".", O_TMPFILE | O_RDWR, 0600) : dup(null_);
    dup2(file, 1);
    dup2(null_, 2);
    std::vector<const char*> arguments;
    for (const std::string& word : words) arguments.push_back(word.c_str());
    const int code =
        vesk2_command::RunCommand(static_cast<int>(arguments.size()), arguments.data());
    std::fflush(stdout);
    for (int i : {1, 2}) dup2(saved_[i - 1], i);
    if (output != nullptr) {
      output->resize(static_cast<size_t>(lseek(file, 0, SEEK_END)));
      EXPECT_EQ(pread(file, output->data(), output->size(), 0),
                static_cast<ssize_t>(output->size()));
    }
    close(file);
    return code;
  }

 private:
  int saved_[2];
  int null_;
};

time_t Seconds(const std::string& stamp) {
  if (stamp.empty()) return 0;
  ZvVesk2::Ref<ZvVesk2::TimeStamp> time(new ZvVesk2::TimeStamp(nullptr));
  EXPECT_EQ(time->Set(stamp.c_str(), false), 0);
  return time->ToTime();
}

int AskChain(const std::string& file, const std::string& tag, const StoreCase& made) {
  const time_t at = Seconds(made.at.empty() ? "2024-06-01_00:00:00" : made.at);
  return Vesk2CertVerifyFile(file.c_str(), tag.c_str(), at, at);
}

// What the library says itself about one request.
int AskLibrary(const StoreCase& made, const std::string& tag) {
  const time_t at = Seconds(made.at);
  if (!made.manifest) return Vesk2CertVerifyFile("chain.cert", tag.c_str(), at, at);
  Manifest* manifest = nullptr;
  EXPECT_EQ(CreateManifestContext(&manifest, "tree", "tree.manifest", tag.c_str()), 0);
  FailOnExtraEntries(manifest);
  const int code = VerifyManifest(manifest, at, at);
  DeleteManifestContext(manifest);
  return code;
}

Words Question(const StoreCase& made) {
  Words words = {"vesk2", "cert", "verify", "chain.cert"};
  if (made.manifest) words = {"vesk2", "manifest", "verify", "tree", "tree.manifest"};
  words.insert(words.end(), {"--tag", made.tag, "--json", "--explain", "--quiet"});
  // As the library judges, which believes the time of signing and passes over lists that are
  // broken.
  words.push_back("--ignore-broken-lists");
  if (!made.at.empty()) words.insert(words.end(), {"--at", made.at});
  if (made.at.empty() && made.manifest) words.insert(words.end(), {"--at", "signing"});
  return words;
}

// What the explanation says about signatures and revocation must fit the answer.
void CheckFacts(const Json& answer, int code) {
  const Json& result = answer["result"];
  bool holds = true;
  bool known = true;
  bool revoked = false;
  for (const Json& cert : result["chain"]) {
    holds &= cert["signature"]["holds"].get<bool>();
    const std::string state = cert["revocation"]["state"];
    known &= state != "undetermined";
    revoked |= state == "revoked" || state == "key-revoked";
  }
  EXPECT_EQ(holds, code != VESK2_ERR_SIGNATURE && code != VESK2_ERR_HASH_MISMATCH);
  EXPECT_TRUE(code != VESK2_ERR_CRL_NOT_FOUND || !known);
  EXPECT_TRUE(code != VESK2_ERR_CERT_REVOKED || revoked);
  EXPECT_TRUE(code == 0 ? !result["authority"].is_null() : !result["lost"].empty());
}

// Whether a tag lies within another, the text of a tag.
bool IsWithin(const std::string& tag, const std::string& granted) {
  using ZvVesk2::SExpression;
  ZvVesk2::Ref<SExpression> a;
  ZvVesk2::Ref<SExpression> b;
  EXPECT_EQ(SExpression::ParseTagAdvanced(a.Out(), tag.c_str(), "tag", nullptr), 0);
  EXPECT_EQ(SExpression::ParseTagAdvanced(b.Out(), granted.c_str(), "tag", nullptr), 0);
  return a->IsSubset(b.get());
}

// The tags that a remedy's words grant: those that it names, and those of the certificates that it
// has issued again. A list that was missing, and a manifest signed again, restore what was granted.
bool GrantedByWords(const Json& remedy, const Json& chain, const std::string& tag) {
  for (const Json& command : remedy["commands"]) {
    const Words words = command.get<Words>();
    const std::string what = words[1] + " " + words[2];
    if (what == "crl import" || what == "manifest sign") return true;
    const auto named = std::find(words.begin(), words.end(), "--tag");
    if (named != words.end() && what != "crl issue" && IsWithin(tag, named[1])) return true;
    // An approval is for what the signer signed for.
    const bool approval = what == "manifest approve";
    if (words[1] != "cert" && !approval) continue;
    const size_t number = approval ? 1 : std::stoul(words[3].substr(words[3].rfind(':') + 1));
    const Json& cert = chain[number - 1];
    // With a signature that does not hold the file had been refused whole.
    if (!cert["signature"]["holds"] || cert["tag"].is_null() || IsWithin(tag, cert["tag"])) {
      return true;
    }
  }
  return false;
}

// What a store lets happen beside what was asked.
struct Powers {
  std::set<std::string> granted;                       // requests to the same file
  std::set<std::pair<unsigned, std::string>> revoked;  // and who may pass them on, revoked
  std::set<std::pair<unsigned, std::string>> alone;    // or one of several who must agree
  std::map<std::string, std::string> thresholds;       // the entries of those

  explicit Powers(const StoreCase& made) {
    for (const std::string& tag : StoreMaker::Requests()) {
      if (AskLibrary(made, tag) == 0) granted.insert(tag);
      for (const unsigned key : made.revoked) {
        if (Passes(made, key, tag, !made.manifest)) revoked.emplace(key, tag);
      }
      for (const unsigned key : made.members) {
        if (Passes(made, key, tag, false)) alone.emplace(key, tag);
      }
    }
    for (const auto& file : std::filesystem::directory_iterator("global/acl")) {
      const std::string text = ReadAll(file.path());
      if (text.find("6:k-of-n") != std::string::npos) thresholds[file.path()] = text;
    }
  }

 private:
  static std::string ReadAll(const std::filesystem::path& path) {
    std::ifstream in(path, std::ios::binary);
    return {std::istreambuf_iterator<char>(in), {}};
  }

  // Whether a key can have another authorized, by itself or with the chain that is there.
  static bool Passes(const StoreCase& made, unsigned key, const std::string& tag, bool chain) {
    const std::string probe = "probe" + std::to_string(key) + ".cert";
    if (AskChain(probe, tag, made) == 0) return true;
    if (!chain) return false;
    const std::string text = ReadAll(probe);
    std::ofstream("longer.cert", std::ios::binary)
        << text.substr(0, text.size() - 1)
        << ReadAll("chain.cert").substr(std::string("(8:sequence").size());
    return AskChain("longer.cert", tag, made) == 0;
  }
};

class Mending {
 public:
  explicit Mending(unsigned seed) : maker_(directory_, seed), random_(seed) {
    home_ = std::filesystem::current_path();
    std::filesystem::current_path(directory_.Path());
    setenv("VESK2_GLOBAL", directory_.File("global").c_str(), 1);
    setenv("VESK2_HOME", directory_.File("home").c_str(), 1);
  }
  ~Mending() { std::filesystem::current_path(home_); }
  Mending(const Mending&) = delete;
  Mending& operator=(const Mending&) = delete;

  // One store; false when the request was granted.
  bool Next() {
    const StoreCase made = maker_.Make();
    const Words question = Question(made);
    std::string text;
    const int exit = runner_.Run(question, &text);
    const Json answer = Json::parse(text);
    Compare(made, answer, exit);
    CheckFacts(answer, answer["code"]);
    if (exit != 1) return false;
    const Json& remedies = answer["result"]["remedies"];
    if (remedies.empty() || remedies[0]["commands"].empty()) {
      ++unnamed_[answer["reason"]];
      return true;
    }
    ++named_;
    const Json& remedy = remedies[random_() % remedies.size()];
    ++kinds_[remedy["kind"]];
    const bool watched = !made.revoked.empty() || !made.members.empty();
    const std::optional<Powers> before =
        watched || named_ % 4 == 0 ? std::make_optional<Powers>(made) : std::nullopt;
    for (const Json& command : remedy["commands"]) {
      EXPECT_EQ(runner_.Run(WithKeys(command)), 0) << command;
    }
    EXPECT_EQ(runner_.Run(question, &text), 0) << answer.dump(1) << text;
    watched_ += watched ? 1 : 0;
    if (before) KeepsPolicy(*before, Powers(made), answer, remedy);
    return true;
  }

  unsigned named_ = 0;
  unsigned watched_ = 0;  // cases with keys that must get no power
  std::map<std::string, unsigned> unnamed_;
  std::map<std::string, unsigned> kinds_;

 private:
  static void Compare(const StoreCase& made, const Json& answer, int exit) {
    const int code = answer["code"];
    EXPECT_EQ(exit, code == 0 ? 0 : 1) << answer.dump(1);
    if (answer["result"]["members"].is_null()) {
      EXPECT_EQ(AskLibrary(made, made.tag), code) << answer.dump(1);
      return;
    }
    int first = 0;
    for (const Json& member : answer["result"]["members"]) {
      EXPECT_EQ(AskLibrary(made, member["tag"]), member["code"].get<int>());
      if (first == 0) first = member["code"];
    }
    EXPECT_EQ(first, code);
  }

  // What a remedy must leave as it was.
  static void KeepsPolicy(const Powers& before, const Powers& after, const Json& answer,
                          const Json& remedy) {
    const std::string what = remedy.dump(1) + answer["result"].dump(1);
    for (const auto& power : after.revoked) {
      EXPECT_EQ(before.revoked.count(power), 1U) << "revoked: key" << power.first << what;
    }
    for (const auto& power : after.alone) {
      EXPECT_EQ(before.alone.count(power), 1U) << "alone: key" << power.first << what;
    }
    EXPECT_EQ(before.thresholds, after.thresholds) << what;
    for (const std::string& tag : after.granted) {
      if (before.granted.count(tag) != 0) continue;
      EXPECT_TRUE(GrantedByWords(remedy, answer["result"]["chain"], tag)) << tag << what;
    }
  }

  Words WithKeys(const Json& command) const {
    constexpr std::string_view kMark = "KEY-OF-";
    Words words = command.get<Words>();
    for (std::string& word : words) {
      if (word.starts_with(kMark)) word = maker_.KeyFile(word.substr(kMark.size()));
    }
    return words;
  }

  TempDir directory_;
  StoreMaker maker_;
  CommandRunner runner_;
  std::mt19937 random_;
  std::filesystem::path home_;
};

TEST(Remedy, TurnsTheAnswerOfRandomRefusals) {
  // Files are synced when they are written: on a disk that would take most of the time.
  if (std::filesystem::is_directory("/dev/shm")) setenv("TMPDIR", "/dev/shm", 1);
  Mending mending(20261123);
  unsigned denied = 0;
  while (denied < VESK2_REFUSALS && !HasFailure()) denied += mending.Next() ? 1 : 0;
  for (const auto& [kind, count] : mending.kinds_) RecordProperty(kind, static_cast<int>(count));
  for (const auto& [reason, count] : mending.unnamed_) {
    RecordProperty("unnamed-" + reason, static_cast<int>(count));
  }
  RecordProperty("watched", static_cast<int>(mending.watched_));
  EXPECT_GE(mending.watched_ * 20, denied);
  EXPECT_GE(mending.named_ * 100, denied * 80);
}

}  // namespace
}  // namespace vesk2test
