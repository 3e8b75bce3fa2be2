// SPDX-License-Identifier: Apache-2.0
// Code texts, the store roots, and records of file names.
#include <vesk2/context.h>
#include <vesk2/file_item.h>

#include <array>
#include <cstring>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include "src/frame/file_item.h"
#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

TEST(Errors, EveryCodeHasItsText) {
  int expected = 0;
#define CHECK_ROW(number, name, text) \
  EXPECT_EQ(number, expected++);      \
  EXPECT_TRUE(number <= 1 || number == 67 || number == 77 || V2Error(number) == std::string(#name));
  VESK2_ERROR_TABLE(CHECK_ROW)
#undef CHECK_ROW
  const std::pair<const char*, const char*> cases[] = {
      {V2Error(0), "Success"},
      {V2Error(1), "Failure"},
      {V2Error(67), "The specified package is not granted the specified authorization"},
      {V2Error(77), "VESK_UNKNOWN_ERROR"},  // the table has a text for it
      {V2Error(-1), "VESK_UNKNOWN_ERROR"},
      {std::strstr(V2SpkiError(-158), "validated."), "validated.  Rejected during processing."},
      {V2SpkiError(-128), "VESK_UNKNOWN_SPKI_ERROR"},
      {V2VersionExtra(), "r2441"}};
  for (const auto& [actual, text] : cases) EXPECT_STREQ(actual, text);
  EXPECT_TRUE(V2Version() == 10100 && V2VersionExtraA() == V2VersionExtra());
}

TEST(VeskConf, RootsAreIndependentAndCutAt4096) {
  VeskConf::SetGlobalDirectory("/g");
  VeskConf::SetHomeDirectory(std::string(4097, 'h').c_str());
  EXPECT_EQ(VeskConf::GetHomeDirectory(), std::string(4096, 'h'));
  EXPECT_STREQ(VeskConf::GetGlobalDirectory(), "/g");
  VeskConf::SetHomeDirectory(nullptr);
  EXPECT_STREQ(VeskConf::GetHomeDirectory(), "");
}

TEST(FileItem, TheMissingFormIsDerived) {
  FileItem* chain = nullptr;
  for (const auto& [name, nameA] : {std::pair{"a", (const char*)nullptr}, {nullptr, "a"}}) {
    FileItem* item = FileItemCreate(ZVsysutil::zv_strdup(name), ZVsysutil::zv_strdup(nameA));
    EXPECT_EQ(item->size, 28u);
    EXPECT_EQ(item->name + std::string(item->nameA), "aa");
    item->next = std::exchange(chain, item);
  }
  EXPECT_EQ(FileItemDelete(chain), 2u);
}

// Records of both kinds stand in one chain, and one call frees them.
TEST(FileItem, OfAPathHoldsItsName) {
  FileItem* chain = FileItemCreate(ZVsysutil::zv_strdup("its own"), nullptr);
  for (const auto& [directory, name, path] : {std::array{(const char*)nullptr, "a", "a"},
                                              {"", "a", "a"},
                                              {"d", "a", "d/a"},
                                              {"d/", "a", "d/a"},
                                              {"/", "a", "/a"},
                                              {"d", "", "d"}}) {
    FileItem* item = FileItemOfPath(directory, name);
    EXPECT_STREQ(item->name, path);
    EXPECT_TRUE(item->size == 28 && item->nameA == item->name && item->isDirectory == 0);
    item->next = std::exchange(chain, item);
  }
  EXPECT_EQ(FileItemDelete(chain), 7u);
}

}  // namespace
}  // namespace ZvVesk2
