// SPDX-License-Identifier: Apache-2.0
// What is found about a tree, for tables of cases: its codes, the findings of a manifest as one
// line of text, and names to ignore from one.
#ifndef VESK2_TESTS_MANIFEST_RESULT_TEXT_H
#define VESK2_TESTS_MANIFEST_RESULT_TEXT_H

#include <list>
#include <sstream>
#include <stdexcept>
#include <string>

#include <vesk2/manifest.h>

namespace vesk2test {

inline constexpr int kDiffers = VESK2_ERR_HASH_MISMATCH;
inline constexpr int kMissing = VESK2_ERR_FILE_NOT_FOUND;
inline constexpr int kExtra = VESK2_ERR_EXTRA_FILES;

// "V:sub/ sub/f a I: M: X:b": the four lists in their order, paths without `prefix`, directories
// with a "/" behind them.
inline std::string Findings(const ZvVesk2::Manifest& manifest, const std::string& prefix = {}) {
  const auto text = [&](const ZvVesk2::FileItem* item) {
    std::string names;
    for (; item != nullptr; item = item->next) {
      const std::string name = item->name;
      names += name.substr(name.rfind(prefix, 0) == 0 ? prefix.size() : 0);
      names += item->isDirectory ? "/ " : " ";
    }
    if (!names.empty()) names.pop_back();
    return names;
  };
  return "V:" + text(manifest.GetValid()) + " I:" + text(manifest.GetInvalid()) +
         " M:" + text(manifest.GetMissing()) + " X:" + text(manifest.GetExtra());
}

// Sets the names to ignore, given with blanks between them.
inline void Ignore(ZvVesk2::Manifest& manifest, const std::string& words) {
  std::istringstream in(words);
  std::list<std::string> names;
  std::list<ZvVesk2::FileItem> items;
  for (std::string word; in >> word;) {
    names.push_back(word);
    ZvVesk2::FileItem* const next = items.empty() ? nullptr : &items.front();
    items.push_front({names.back().data(), nullptr, nullptr, nullptr, next, 28, 0});
  }
  if (manifest.SetIgnoredEntries(items.empty() ? nullptr : &items.front()) != 0) {
    throw std::runtime_error("ignored entries");
  }
}

}  // namespace vesk2test

#endif  // VESK2_TESTS_MANIFEST_RESULT_TEXT_H
