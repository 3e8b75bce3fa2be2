// SPDX-License-Identifier: Apache-2.0
// ssh_wire.cpp: SSH's binary form.
#include "tools/vesk2/keys/ssh_wire.h"

#include <algorithm>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/crypto.h"

namespace vesk2_command {

std::string_view SshReader::Take(size_t size) {
  Expect(size <= rest_.size());
  const std::string_view taken = rest_.substr(0, size);
  rest_.remove_prefix(size);
  return taken;
}

uint32_t SshReader::Number() {
  uint32_t number = 0;
  for (const char byte : Take(4)) number = number << 8 | static_cast<uint8_t>(byte);
  return number;
}

std::string_view SshReader::Positive() {
  std::string_view bytes = String();
  Expect(!bytes.empty() && (static_cast<uint8_t>(bytes[0]) & 0x80) == 0);
  bytes.remove_prefix(std::min(bytes.find_first_not_of('\0'), bytes.size()));
  Expect(!bytes.empty());
  return bytes;
}

std::string SshNumber(uint32_t number) {
  std::string bytes;
  for (int shift = 24; shift >= 0; shift -= 8) bytes += static_cast<char>(number >> shift & 0xff);
  return bytes;
}

std::string SshString(std::string_view bytes) {
  return SshNumber(static_cast<uint32_t>(bytes.size())).append(bytes);
}

Ref<PublicKey> PublicFromSsh(std::string_view blob, const std::string& source) {
  const Trouble fault = FileTrouble(source, "malformed SSH key", "malformed");
  SshReader reader(blob, fault);
  const std::string_view type = reader.String();
  const bool rsa = type == "ssh-rsa";
  if (!rsa && type != "ssh-dss") RefuseKind(std::string(type), source);
  std::vector<std::string> numbers;
  for (int i = 0; i < (rsa ? 2 : 4); ++i) numbers.emplace_back(reader.Positive());
  reader.End();
  if (!rsa) std::swap(numbers[1], numbers[2]);  // SSH's order is p, q, g, y
  return MakePublicKey(rsa, numbers, source);
}

std::string SshFingerprint(std::string_view blob) {
  unsigned char digest[EVP_MAX_MD_SIZE];
  unsigned size = 0;
  Require(EVP_Digest(blob.data(), blob.size(), digest, &size, EVP_sha256(), nullptr) == 1,
          "hashing");
  std::string text = Base64({reinterpret_cast<char*>(digest), size});
  text.resize(text.find_last_not_of('=') + 1);
  return "SHA256:" + text;
}

}  // namespace vesk2_command
