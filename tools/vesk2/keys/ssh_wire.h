// SPDX-License-Identifier: Apache-2.0
// ssh_wire.h: SSH's binary form of keys and messages: numbers of four bytes, strings with their
// length before them. All of it comes from files and programs of others.
#ifndef VESK2_TOOLS_SSH_WIRE_H
#define VESK2_TOOLS_SSH_WIRE_H

#include <cstdint>
#include <string>
#include <string_view>

#include "tools/vesk2/objects/objects.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

// Reads from the front; `fault` is thrown where the bytes end too early. The bytes stay the
// caller's.
class SshReader {
 public:
  SshReader(std::string_view bytes, const Trouble& fault) : rest_(bytes), fault_(fault) {}

  uint8_t Byte() { return static_cast<uint8_t>(Take(1)[0]); }
  uint32_t Number();
  std::string_view String() { return Take(Number()); }
  // A positive big number, without leading zeros.
  std::string_view Positive();
  std::string_view Rest() const { return rest_; }
  // Nothing may be left.
  void End() const { Expect(rest_.empty()); }
  void Expect(bool good) const {
    if (!good) throw Trouble(fault_);
  }

 private:
  std::string_view Take(size_t size);

  std::string_view rest_;
  const Trouble& fault_;
};

std::string SshNumber(uint32_t number);
std::string SshString(std::string_view bytes);

// The principal of a public key blob. Trouble for keys that are neither RSA nor DSA; `source` is
// what the blob came from.
Ref<PublicKey> PublicFromSsh(std::string_view blob, const std::string& source);

// "SHA256:..." as ssh-keygen -l and ssh-add -l print it.
std::string SshFingerprint(std::string_view blob);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_SSH_WIRE_H
