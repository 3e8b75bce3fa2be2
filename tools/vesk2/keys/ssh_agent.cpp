// SPDX-License-Identifier: Apache-2.0
// ssh_agent.cpp: the agent's protocol.
#include "tools/vesk2/keys/ssh_agent.h"

#include <poll.h>
#include <sys/socket.h>
#include <sys/un.h>

#include <cstdlib>
#include <cstring>

#include "tools/vesk2/keys/ssh_wire.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// Agents neither read nor write longer messages.
constexpr size_t kMaxMessage = 256 * 1024;

// Numbers of the protocol.
constexpr char kRequestIdentities = 11;
constexpr uint8_t kIdentitiesAnswer = 12;
constexpr char kSignRequest = 13;
constexpr uint8_t kSignResponse = 14;
constexpr uint8_t kFailure = 5;
constexpr uint32_t kRsaSha256 = 2;

Trouble AgentTrouble(const std::string& text) { return Trouble("ssh-agent: " + text, "ssh-agent"); }

// One exchange with the agent, in the time that it has.
class Exchange {
 public:
  Exchange(int socket, std::chrono::milliseconds patience)
      : socket_(socket), end_(Clock::now() + patience) {}

  void Send(std::string_view bytes) {
    while (!bytes.empty()) {
      Await(POLLOUT);
      const ssize_t sent = send(socket_, bytes.data(), bytes.size(), MSG_NOSIGNAL | MSG_DONTWAIT);
      if (sent < 0 && !Again()) throw AgentTrouble(std::strerror(errno));
      if (sent > 0) bytes.remove_prefix(static_cast<size_t>(sent));
    }
  }

  std::string Receive(size_t size) {
    std::string bytes(size, '\0');
    for (size_t have = 0; have < size;) {
      Await(POLLIN);
      const ssize_t got = recv(socket_, bytes.data() + have, size - have, MSG_DONTWAIT);
      if (got < 0 && !Again()) throw AgentTrouble(std::strerror(errno));
      if (got == 0) throw AgentTrouble("hung up");
      if (got > 0) have += static_cast<size_t>(got);
    }
    return bytes;
  }

 private:
  using Clock = std::chrono::steady_clock;

  static bool Again() { return errno == EINTR || errno == EAGAIN || errno == EWOULDBLOCK; }

  void Await(short event) {
    pollfd wanted = {socket_, event, 0};
    for (;;) {
      const auto left =
          std::chrono::duration_cast<std::chrono::milliseconds>(end_ - Clock::now()).count();
      if (left <= 0) throw AgentTrouble("does not answer");
      const int ready = poll(&wanted, 1, static_cast<int>(left));
      if (ready > 0) return;
      if (ready < 0 && errno != EINTR) throw AgentTrouble(std::strerror(errno));
    }
  }

  int socket_;
  Clock::time_point end_;
};

const Trouble& Malformed() {
  static const Trouble kFault = AgentTrouble("malformed answer");
  return kFault;
}

// A body that begins with the wanted number, without it.
std::string_view BodyOf(std::string_view answer, uint8_t wanted, const char* refused) {
  SshReader reader(answer, Malformed());
  const uint8_t kind = reader.Byte();
  if (kind == kFailure) throw AgentTrouble(refused);
  reader.Expect(kind == wanted);
  return reader.Rest();
}

std::string FindKey(const SshAgent& agent, const std::string& reference) {
  const std::string fingerprint = reference.substr(kAgentScheme.size());
  if (fingerprint.rfind("SHA256:", 0) != 0) {
    throw AgentTrouble("a key is named by its fingerprint, SHA256:..., as ssh-add -l prints it");
  }
  for (std::string& blob : agent.Keys()) {
    if (SshFingerprint(blob) == fingerprint) return std::move(blob);
  }
  throw AgentTrouble("holds no key " + Escape(fingerprint) + "; ssh-add -l lists those it has");
}

}  // namespace

int SshAgent::Connect() {
  const char* const path = std::getenv("SSH_AUTH_SOCK");
  if (path == nullptr || *path == '\0') {
    throw AgentTrouble("none runs here: SSH_AUTH_SOCK is not set");
  }
  sockaddr_un address = {};
  address.sun_family = AF_UNIX;
  if (std::strlen(path) >= sizeof address.sun_path) {
    throw AgentTrouble("SSH_AUTH_SOCK: too long a path");
  }
  std::strcpy(address.sun_path, path);
  const int socket = ::socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0);
  if (socket < 0) throw AgentTrouble(std::strerror(errno));
  if (connect(socket, reinterpret_cast<sockaddr*>(&address), sizeof address) != 0) {
    const int error = errno;
    close(socket);
    throw AgentTrouble(Escape(path) + ": " + std::strerror(error));
  }
  return socket;
}

std::string SshAgent::Ask(const std::string& request) const {
  if (request.size() > kMaxMessage) {
    throw AgentTrouble("what is to be signed is too long for an agent");
  }
  Exchange exchange(socket_.get(), patience_);
  exchange.Send(SshString(request));
  const std::string head = exchange.Receive(4);
  const uint32_t size = SshReader(head, Malformed()).Number();
  if (size == 0 || size > kMaxMessage) throw Trouble(Malformed());
  return exchange.Receive(size);
}

std::vector<std::string> SshAgent::Keys() const {
  const std::string answer = Ask({kRequestIdentities});
  SshReader reader(BodyOf(answer, kIdentitiesAnswer, "does not tell its keys"), Malformed());
  std::vector<std::string> blobs;
  for (uint32_t left = reader.Number(); left > 0; --left) {
    blobs.emplace_back(reader.String());
    (void)reader.String();  // its comment
  }
  reader.End();
  return blobs;
}

std::string SshAgent::Sign(const std::string& blob, bool rsa, const std::string& data) const {
  const std::string answer =
      Ask(kSignRequest + SshString(blob) + SshString(data) + SshNumber(rsa ? kRsaSha256 : 0));
  SshReader reader(BodyOf(answer, kSignResponse, "refused to sign"), Malformed());
  SshReader signature(reader.String(), Malformed());
  reader.End();
  // An agent that does not know the flag signs over SHA-1.
  const std::string_view scheme = signature.String();
  if (scheme != (rsa ? "rsa-sha2-256" : "ssh-dss")) {
    throw AgentTrouble("signed as " + Escape(scheme) + "; SHA-256 was asked for");
  }
  std::string value(signature.String());
  signature.End();
  return value;
}

AgentKey::AgentKey(const std::string& reference)
    : SigningKey("ssh-agent", "ssh-agent"),
      agent_(SshAgent::Connect()),
      blob_(FindKey(agent_, reference)),
      key_(PublicFromSsh(blob_, reference)) {}

Ref<PublicKey> AgentKey::Public() const { return Ref<PublicKey>::Share(key_.get()); }

std::string AgentKey::SignObject(SExpression& object, std::string_view /*digest*/,
                                 const std::string& algorithm) const {
  if (algorithm == "rsa-pss") {
    throw Trouble("--algorithm rsa-pss: an ssh-agent signs by rsa-1.5 only", "usage");
  }
  const bool rsa = key_->GetType() == ZVCLM_KEY_RSA;
  std::string value = agent_.Sign(blob_, rsa, Canonical(object));
  const size_t width = rsa ? (key_->GetLength() + 7) / 8 : value.size();
  if (value.size() < width) value.insert(0, width - value.size(), '\0');
  return value;
}

}  // namespace vesk2_command
