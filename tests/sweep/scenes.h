// SPDX-License-Identifier: Apache-2.0
// Small machines, each with one question, for the sweeps: what the library and the command answer
// when nothing fails, and how they are asked.
#ifndef VESK2_TESTS_SWEEP_SCENES_H
#define VESK2_TESTS_SWEEP_SCENES_H

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "tests/support/temp_dir.h"

namespace vesk2test {

class Scene {
 public:
  explicit Scene(const char* name) : name_(name) {}

  const char* Name() const { return name_; }
  const TempDir& Dir() const { return dir_; }
  std::string File(std::string_view file) const { return dir_.File(file); }
  void Write(std::string_view file, std::string_view bytes) const { dir_.Write(file, bytes); }

  // What the global store holds, by path.
  std::map<std::string, std::string> Stored() const;
  void Restore(const std::map<std::string, std::string>& stored) const;

  // Asks the library, and what it answers.
  std::function<int()> ask;
  int code = 0;
  // How the command is asked (not at all when empty), and its exit status.
  std::vector<std::string> words;
  int exit = 0;
  // Whether the answer leaves a file in the store.
  bool stores = false;

 private:
  const char* name_;
  TempDir dir_;
};

using Scenes = std::vector<std::unique_ptr<Scene>>;
Scenes MakeScenes();

}  // namespace vesk2test

#endif  // VESK2_TESTS_SWEEP_SCENES_H
