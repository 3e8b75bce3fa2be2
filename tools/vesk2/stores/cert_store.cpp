// SPDX-License-Identifier: Apache-2.0
// cert_store.cpp: the chains of the user's store.
#include "tools/vesk2/stores/cert_store.h"

#include <filesystem>

#include "tools/vesk2/files/stores.h"

#include <vesk2/limits.h>

namespace vesk2_command {
std::string ChainPath(const std::string& name) {
  const std::string home = HomeRoot(GetStoreOptions()).path;
  if (home.empty()) throw Trouble("there is no home store: --home names one", "no-home-store");
  if (name.empty() || name == "." || name == ".." || name.find('/') != std::string::npos) {
    throw Trouble("--name " + Escape(name) + ": cannot name a chain", "usage");
  }
  return home + "/cert/" + name + (name.ends_with(".cert") ? "" : ".cert");
}

bool IsStored(ZvVesk2::CertSequence& chain, const std::string& name) {
  const std::string path = ChainPath(name);
  std::error_code error;
  return std::filesystem::is_regular_file(path, error) &&
         ReadFile(path, ZvVesk2::Limits::kMaxFile) == Canonical(chain);
}

void StoreChain(ZvVesk2::CertSequence& chain, const std::string& name, const WriteFlags& flags) {
  const std::string path = ChainPath(name);
  if (IsStored(chain, name)) return Note(Escape(path) + " says so already");
  RefuseExisting(path, flags.force);
  std::error_code error;  // what fails is told by the next step
  const std::filesystem::path directory = std::filesystem::path(path).parent_path();
  if (!flags.dryRun) {
    std::filesystem::create_directories(directory, error);
  } else if (!std::filesystem::exists(directory, error)) {
    Result()["would_write"].push_back(Escape(path));
    return Note("would write " + Escape(path));
  }
  WriteSequence(chain, path, flags);
}

}  // namespace vesk2_command
