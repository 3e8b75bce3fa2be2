// SPDX-License-Identifier: Apache-2.0
// external_key.cpp: signing by another program.
#include "tools/vesk2/keys/external_key.h"

#include <fcntl.h>
#include <spawn.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <vector>

#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// The longest signature is of a modulus of 16384 bits, half of this.
constexpr size_t kMaxSignature = 4096;

[[noreturn]] void Fail(const std::string& text) {
  throw Trouble("--sign-with: " + text, "sign-with");
}

// This process's environment, with what the program is to know instead of what was inherited.
std::vector<std::string> Environment(const std::vector<std::string>& added) {
  std::vector<std::string> all = added;
  for (char** each = environ; *each != nullptr; ++each) {
    const std::string_view inherited = *each;
    const std::string_view name = inherited.substr(0, inherited.find('='));
    const bool replaced = std::any_of(added.begin(), added.end(), [name](const std::string& mine) {
      return std::string_view(mine).substr(0, mine.find('=')) == name;
    });
    if (!replaced) all.emplace_back(inherited);
  }
  return all;
}

pid_t Start(std::string command, std::vector<std::string> environment, int input, int output) {
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, input, STDIN_FILENO);
  posix_spawn_file_actions_adddup2(&actions, output, STDOUT_FILENO);
  std::vector<char*> variables;
  for (std::string& each : environment) variables.push_back(each.data());
  variables.push_back(nullptr);
  std::string shell = "sh";
  std::string option = "-c";
  char* const arguments[] = {shell.data(), option.data(), command.data(), nullptr};
  (void)std::signal(SIGCHLD, SIG_DFL);  // or how it ended could not be told
  pid_t child = 0;
  const int error = posix_spawn(&child, "/bin/sh", &actions, nullptr, arguments, variables.data());
  posix_spawn_file_actions_destroy(&actions);
  if (error != 0) Fail(std::strerror(error));
  return child;
}

// What the program writes, up to a byte more than it may.
std::string Collect(int descriptor) {
  std::string bytes(kMaxSignature + 1, '\0');
  size_t size = 0;
  while (size < bytes.size()) {
    const ssize_t got = read(descriptor, bytes.data() + size, bytes.size() - size);
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) break;
    size += static_cast<size_t>(got);
  }
  bytes.resize(size);
  return bytes;
}

int Wait(pid_t child) {
  int status = 0;
  while (waitpid(child, &status, 0) < 0) {
    if (errno != EINTR) Fail(std::strerror(errno));
  }
  return status;
}

std::string RunProgram(const std::string& command, std::vector<std::string> environment,
                       std::string_view digest) {
  // Unlike a pipe, a file never blocks nor signals the writer, and the program may open /dev/stdin.
  const Descriptor input(MemoryFile(digest));
  int ends[2] = {-1, -1};
  if (pipe2(ends, O_CLOEXEC) != 0) Fail(std::strerror(errno));
  const Descriptor reading(ends[0]);
  Descriptor writing(ends[1]);
  const pid_t child = Start(command, std::move(environment), input.get(), writing.get());
  writing.Take(-1);
  std::string value = Collect(reading.get());
  if (value.size() > kMaxSignature) kill(child, SIGTERM);
  const int status = Wait(child);
  if (value.size() > kMaxSignature) {
    Fail("wrote more than " + std::to_string(kMaxSignature) + " bytes; a raw signature is wanted");
  }
  if (WIFSIGNALED(status)) Fail("ended by signal " + std::to_string(WTERMSIG(status)));
  if (WEXITSTATUS(status) != 0) Fail("exited with " + std::to_string(WEXITSTATUS(status)));
  if (value.empty()) Fail("wrote no signature");
  return value;
}

}  // namespace

ExternalKey::ExternalKey(const std::string& command, const std::string& publicKey)
    : SigningKey("--sign-with", "sign-with"),
      command_(command),
      path_(publicKey),
      key_(ReadPublicKey(publicKey)) {}

Ref<PublicKey> ExternalKey::Public() const { return Ref<PublicKey>::Share(key_.get()); }

std::string ExternalKey::SignObject(SExpression& /*object*/, std::string_view digest,
                                    const std::string& algorithm) const {
  return RunProgram(
      command_,
      Environment({
          "VESK2_KEY=" + path_,
          std::string("VESK2_DIGEST_ALGORITHM=") + (algorithm == "dsa-sha1" ? "sha1" : "sha256"),
          "VESK2_SIGNATURE_ALGORITHM=" + algorithm,
      }),
      digest);
}

}  // namespace vesk2_command
