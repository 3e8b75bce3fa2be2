// SPDX-License-Identifier: Apache-2.0
// An ssh-agent is another program: whatever it answers, and if it never does, the command says so
// in a line.
#include "tools/vesk2/keys/ssh_agent.h"

#include <gtest/gtest.h>
#include <sys/socket.h>

#include "tools/vesk2/keys/ssh_wire.h"

namespace vesk2_command {
namespace {

using namespace std::string_literals;

enum class Question { kKeys, kSign };
enum class After { kHangUp, kWait };

// What comes of a question to an agent that gives this answer: the trouble, or "".
std::string Asked(Question question, const std::string& answer, After after = After::kHangUp) {
  int ends[2] = {-1, -1};
  EXPECT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, ends), 0);
  const Descriptor other(ends[1]);
  EXPECT_EQ(write(other.get(), answer.data(), answer.size()), static_cast<ssize_t>(answer.size()));
  if (after == After::kHangUp) shutdown(other.get(), SHUT_WR);
  const SshAgent agent(ends[0], std::chrono::milliseconds(after == After::kWait ? 20 : 60000));
  try {
    if (question == Question::kKeys) {
      for (const std::string& blob : agent.Keys()) (void)SshFingerprint(blob);
    } else {
      (void)agent.Sign("blob", true, "data");
    }
  } catch (const Trouble& trouble) {
    EXPECT_EQ(trouble.reason, "ssh-agent");
    return trouble.what();
  }
  return "";
}

std::string Keys(uint32_t count, const std::string& rest) {
  return SshString("\x0c" + SshNumber(count) + rest);
}
std::string Signed(const std::string& scheme) {
  return SshString("\x0e" + SshString(SshString(scheme) + SshString("value")));
}

TEST(SshAgent, EveryAnswerIsReadWithCare) {
  const std::string key = SshString("blob") + SshString("comment");
  const char* const bad = "ssh-agent: malformed answer";
  const struct {
    Question question;
    std::string answer;
    std::string trouble;
  } cases[] = {
      {Question::kKeys, Keys(2, key + key), ""},
      {Question::kKeys, Keys(0, ""), ""},
      {Question::kKeys, Keys(1, key + key), bad},
      {Question::kKeys, Keys(2, key), bad},
      {Question::kKeys, Keys(0xffffffff, key), bad},
      {Question::kKeys, Keys(1, SshNumber(0xffffffff) + "blob"), bad},
      {Question::kKeys, SshString("\x05"), "ssh-agent: does not tell its keys"},
      {Question::kKeys, SshString("\x0e"), bad},
      {Question::kKeys, SshString(""), bad},
      {Question::kKeys, SshNumber(0xffffffff), bad},
      {Question::kKeys, SshNumber(256 * 1024 + 1), bad},
      {Question::kSign, Signed("rsa-sha2-256"), ""},
      {Question::kSign, Signed("rsa-sha2-512"),
       "ssh-agent: signed as rsa-sha2-512; SHA-256 was asked for"},
      {Question::kSign, Signed("ssh-rsa\x1b"),
       "ssh-agent: signed as ssh-rsa\\x1b; SHA-256 was asked for"},
      {Question::kSign, SshString("\x05"), "ssh-agent: refused to sign"},
      {Question::kSign, SshString("\x0e" + SshString("")), bad},
      {Question::kSign, SshString("\x0e" + SshString(SshString("rsa-sha2-256"))), bad},
  };
  for (const auto& each : cases) {
    EXPECT_EQ(Asked(each.question, each.answer), each.trouble) << each.answer;
    for (size_t size = 0; size < each.answer.size(); ++size) {
      EXPECT_NE(Asked(each.question, each.answer.substr(0, size)), "") << size;
    }
  }
}

TEST(SshAgent, IsNotWaitedForWithoutEnd) {
  EXPECT_EQ(Asked(Question::kKeys, "", After::kWait), "ssh-agent: does not answer");
  EXPECT_EQ(Asked(Question::kSign, SshNumber(9) + "\x0e", After::kWait),
            "ssh-agent: does not answer");
}

TEST(SshAgent, IsNotSentWhatItWouldNotRead) {
  int ends[2] = {-1, -1};
  ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM, 0, ends), 0);
  const Descriptor other(ends[1]);
  EXPECT_THROW((void)SshAgent(ends[0]).Sign("blob", true, std::string(256 * 1024, 'x')), Trouble);
}

// Keys of SSH come from files and agents alike.
TEST(SshWire, PublicKeysAreWhole) {
  const auto key = [](const std::string& e, const std::string& n) {
    return SshString("ssh-rsa") + SshString(e) + SshString(n);
  };
  const auto trouble = [](const std::string& blob) -> std::string {
    try {
      return Canonical(*PublicFromSsh(blob, "file"));
    } catch (const Trouble& caught) {
      return caught.what();
    }
  };
  const std::string good = key("\3", "\0\xc1"s);
  EXPECT_EQ(trouble(good), "(10:public-key(3:rsa(1:e1:\3)(1:n1:\xc1)))");
  EXPECT_EQ(trouble(key("\0\0\3"s, "\0\xc1"s)), trouble(good));  // no other principal
  const std::string bad[] = {good + "x", key("", "\0\xc1"s), key("\0"s, "\0\xc1"s),
                             key("\3", "\xc1")};  // too long, without a number, nought, negative
  for (const std::string& each : bad) EXPECT_EQ(trouble(each), "file: malformed SSH key");
  for (size_t size = 0; size < good.size(); ++size) {
    EXPECT_EQ(trouble(good.substr(0, size)), "file: malformed SSH key");
  }
}

}  // namespace
}  // namespace vesk2_command
