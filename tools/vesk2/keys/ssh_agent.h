// SPDX-License-Identifier: Apache-2.0
// ssh_agent.h: keys in an ssh-agent, by its protocol. The agent is another program, maybe a
// forwarded one: its answers are read with care, and waited for a limited time.
#ifndef VESK2_TOOLS_SSH_AGENT_H
#define VESK2_TOOLS_SSH_AGENT_H

#include <chrono>
#include <string>
#include <vector>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/keys/keys.h"

namespace vesk2_command {

inline constexpr std::string_view kAgentScheme = "ssh-agent:";

class SshAgent {
 public:
  // Connect reaches the agent that SSH_AUTH_SOCK names.
  static int Connect();
  // An agent may ask a person, who needs time, whether the key may be used.
  explicit SshAgent(int socket, std::chrono::milliseconds patience = std::chrono::minutes(1))
      : socket_(socket), patience_(patience) {}

  // The public key blobs that it holds.
  std::vector<std::string> Keys() const;
  // The raw signature over `data`, which the agent hashes itself: SHA-256 and PKCS#1 v1.5 for an
  // RSA key, SHA-1 for a DSA key.
  std::string Sign(const std::string& blob, bool rsa, const std::string& data) const;

 private:
  std::string Ask(const std::string& request) const;

  Descriptor socket_;
  std::chrono::milliseconds patience_;
};

// A key named "ssh-agent:SHA256:..." by its fingerprint.
class AgentKey : public SigningKey {
 public:
  explicit AgentKey(const std::string& reference);
  Ref<PublicKey> Public() const override;

 private:
  // The agent's signatures have this padding only.
  const char* UsualAlgorithm() const override { return "rsa-1.5"; }
  std::string SignObject(SExpression& object, std::string_view digest,
                         const std::string& algorithm) const override;

  SshAgent agent_;
  std::string blob_;
  Ref<PublicKey> key_;
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SSH_AGENT_H
