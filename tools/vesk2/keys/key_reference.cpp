// SPDX-License-Identifier: Apache-2.0
// key_reference.cpp: keys as arguments name them.
#include "tools/vesk2/keys/key_reference.h"

#include <openssl/pem.h>

#include <algorithm>
#include <cctype>
#include <filesystem>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/ssh_agent.h"
#include "tools/vesk2/keys/token_key.h"
#include "tools/vesk2/keys/token_uri.h"

namespace vesk2_command {
namespace {

bool OnToken(const std::string& name) { return name.rfind(kTokenScheme, 0) == 0; }
bool InAgent(const std::string& name) { return name.rfind(kAgentScheme, 0) == 0; }

Ref<PublicKey> PublicFromPem(const Secret& pem, const std::string& path) {
  const Bio bio = ReadOnly(pem);
  const CryptoKey key = OwnKey(PEM_read_bio_PUBKEY(bio.get(), nullptr, nullptr, nullptr));
  Require(key != nullptr, InputName(path) + ": no public key");
  return MakePublicKey(key.get(), path);
}

Ref<PublicKey> PublicFromText(const Secret& text, const std::string& path) {
  const Buffer buffer = WrapBytes(text.text());
  if (buffer->LooksAt("-----BEGIN ")) return PublicFromPem(text, path);
  Ref<PublicKey> key(new PublicKey(nullptr));
  int code = key->Import(buffer.get());
  if (code == 0 && buffer->Remaining() != 0) code = VESK2_ERR_PARSE_FILE;
  if (code != 0) Malformed(path, buffer->Position(), "public key", code);
  return key;
}

bool HoldsPrivateKey(const Secret& pem) {
  return pem.text().find("PRIVATE KEY-----") != std::string::npos;
}

}  // namespace

Ref<PublicKey> ReadPublicKey(const std::string& name) {
  if (OnToken(name)) return ReadTokenPublic(name, {});
  if (InAgent(name)) return AgentKey(name).Public();
  return PublicFromText(Secret(ReadFile(name, kMaxKeyFile)), name);
}

bool IsPrivatePem(const std::string& path) {
  return HoldsPrivateKey(Secret(ReadFile(path, kMaxKeyFile)));
}

PublicHalf ReadPublicHalf(const std::string& name, const PassphraseOptions& options) {
  if (OnToken(name)) return {ReadTokenPublic(name, options), false};
  if (InAgent(name)) return {ReadPublicKey(name), false};
  const Secret text(ReadFile(name, kMaxKeyFile));  // once: it may be standard input
  const bool ofPrivate = HoldsPrivateKey(text);
  return {
      ofPrivate ? PrivateKey::FromPem(text, name, options).Public() : PublicFromText(text, name),
      ofPrivate};
}

std::unique_ptr<SigningKey> OpenKey(const std::string& name, const PassphraseOptions& options) {
  if (OnToken(name)) return std::make_unique<TokenKey>(name, options);
  if (InAgent(name)) return std::make_unique<AgentKey>(name);
  return std::make_unique<PrivateKey>(
      PrivateKey::FromPem(Secret(ReadFile(name, kMaxKeyFile)), name, options));
}

std::string ShownKey(const std::string& name) { return OnToken(name) ? ShownTokenUri(name) : name; }

std::string KeyNickname(const std::string& name) {
  if (InAgent(name)) return "ssh-agent";
  if (!OnToken(name)) return std::filesystem::path(name).stem().string();
  std::string nickname = ParseTokenUri(name).object;
  // A name on a token is any text.
  std::replace_if(
      nickname.begin(), nickname.end(),
      [](char c) {
        return c != '-' && c != '_' && std::isalnum(static_cast<unsigned char>(c)) == 0;
      },
      '-');
  return nickname.empty() ? "token" : nickname;
}

}  // namespace vesk2_command
