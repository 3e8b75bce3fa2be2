// SPDX-License-Identifier: Apache-2.0
// Other programs, and directories for inputs.
#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

#include "bench/bench.h"

namespace bench {

std::string FindProgram(const std::string& name) {
  const char* const path = std::getenv("PATH");
  std::istringstream folders(path != nullptr ? path : "/usr/bin:/bin");
  for (std::string folder; std::getline(folders, folder, ':');) {
    const std::string program = folder + "/" + name;
    if (access(program.c_str(), X_OK) == 0) return program;
  }
  return {};
}

void Become(const std::vector<std::string>& words) {
  std::vector<char*> arguments;
  for (const std::string& word : words) arguments.push_back(const_cast<char*>(word.c_str()));
  arguments.push_back(nullptr);
  const int nowhere = open("/dev/null", O_WRONLY | O_CLOEXEC);
  dup2(nowhere, STDOUT_FILENO);
  dup2(nowhere, STDERR_FILENO);
  execv(arguments[0], arguments.data());
}

int Run(const std::vector<std::string>& words) {
  const pid_t child = fork();
  if (child == 0) {
    Become(words);
    _exit(127);
  }
  int status = 0;
  if (waitpid(child, &status, 0) != child || !WIFEXITED(status)) return -1;
  return WEXITSTATUS(status);
}

Place::Place(const char* name) : path_(std::string(VESK2_BENCH_DIR "/") + name) {
  std::filesystem::remove_all(path_);
  std::filesystem::create_directories(path_);
}
Place::~Place() {
  std::error_code ignored;
  std::filesystem::remove_all(path_, ignored);
}
std::string Place::Write(const std::string& name, const std::string& bytes) const {
  const std::string path = path_ + "/" + name;
  std::ofstream(path, std::ios::binary) << bytes;
  return path;
}

}  // namespace bench
