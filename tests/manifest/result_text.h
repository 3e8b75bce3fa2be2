// The findings of a manifest as one line of text, for tables of cases.
#ifndef VESK2_TESTS_MANIFEST_RESULT_TEXT_H
#define VESK2_TESTS_MANIFEST_RESULT_TEXT_H

#include <initializer_list>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <vesk2/manifest.h>

namespace vesk2test {

// "V:sub/ sub/f a I: M: X:b": the four lists in their order, paths without `root`, directories with
// a "/" behind them.
inline std::string Findings(const ZvVesk2::Manifest& manifest, const std::string& root = {}) {
  std::string text;
  const std::initializer_list<std::pair<const char*, ZvVesk2::FileItem*>> lists = {
      {"V:", manifest.GetValid()},
      {" I:", manifest.GetInvalid()},
      {" M:", manifest.GetMissing()},
      {" X:", manifest.GetExtra()}};
  for (const auto& [head, list] : lists) {
    text += head;
    for (const ZvVesk2::FileItem* item = list; item != nullptr; item = item->next) {
      std::string name = item->name;
      if (!root.empty() && name.rfind(root + "/", 0) == 0) name.erase(0, root.size() + 1);
      if (item != list) text += " ";
      text += name + (item->isDirectory ? "/" : "");
    }
  }
  return text;
}

// Sets the names to ignore.
inline void Ignore(ZvVesk2::Manifest& manifest, const std::vector<const char*>& names) {
  std::vector<ZvVesk2::FileItem> items(names.size());
  for (size_t i = 0; i < names.size(); ++i) {
    items[i].name = const_cast<char*>(names[i]);
    if (i > 0) items[i - 1].next = &items[i];
  }
  if (manifest.SetIgnoredEntries(items.data()) != 0) throw std::runtime_error("ignored entries");
}

}  // namespace vesk2test

#endif  // VESK2_TESTS_MANIFEST_RESULT_TEXT_H
