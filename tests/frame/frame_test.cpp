// Code texts, the store roots, and records of file names.
#include <vesk2/context.h>
#include <vesk2/file_item.h>

#include <string>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include "src/platform/text.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::zv_strdup;

TEST(Errors, EveryCodeHasItsText) {
  int expected = 0;
#define CHECK_ROW(number, name, text)                                                    \
  EXPECT_EQ(number, expected++);                                                         \
  EXPECT_STREQ(V2Error(number), number < VESK2_MAX_ERROR ? text : "VESK_UNKNOWN_ERROR"); \
  EXPECT_TRUE(number <= 1 || number == 67 || std::string(text) == #name);
  VESK2_ERROR_TABLE(CHECK_ROW)
#undef CHECK_ROW
#define CHECK_ROW(number, name, text) EXPECT_STREQ(V2SpkiError(number), text) << #name;
  VESK2_SPKI_ERROR_TABLE(CHECK_ROW)
#undef CHECK_ROW
}

TEST(Errors, TextsThatCallersCompareWith) {
  const std::pair<const char*, const char*> cases[] = {
      {V2Error(67), "The specified package is not granted the specified authorization"},
      {V2Error(77), "VESK_UNKNOWN_ERROR"},  // the table has a text for it
      {V2Error(-1), "VESK_UNKNOWN_ERROR"},
      {V2SpkiError(-158),
       "Issuer could not be resolved to a public key -- so could not have been validated.  "
       "Rejected during processing."},
      {V2SpkiError(-128), "VESK_UNKNOWN_SPKI_ERROR"},
      {V2SpkiError(0), "VESK_UNKNOWN_SPKI_ERROR"},
      {V2VersionExtra(), "r2441"},
      {V2VersionExtraA(), "r2441"},
  };
  for (const auto& [actual, expected] : cases) EXPECT_STREQ(actual, expected);
  EXPECT_EQ(V2Version(), 10100);
}

TEST(VeskConf, RootsAreIndependentAndCutAt4096) {
  const std::string longest(4096, 'h');
  VeskConf::SetGlobalDirectory("/g");
  VeskConf::SetHomeDirectory((longest + "x").c_str());
  EXPECT_EQ(VeskConf::GetHomeDirectory(), longest);
  EXPECT_STREQ(VeskConf::GetGlobalDirectory(), "/g");
  VeskConf::SetHomeDirectory(nullptr);
  EXPECT_STREQ(VeskConf::GetHomeDirectory(), "");
}

TEST(FileItem, TheMissingFormIsDerived) {
  const std::tuple<const char*, const char*, const char*, const char*> cases[] = {
      {"a", nullptr, "a", "a"}, {nullptr, "b", "b", "b"}, {"c", "d", "c", "d"}};
  FileItem* chain = nullptr;
  for (const auto& [name, nameA, expectedName, expectedNameA] : cases) {
    FileItem* item = FileItemCreate(zv_strdup(name), zv_strdup(nameA));
    EXPECT_STREQ(item->name, expectedName);
    EXPECT_STREQ(item->nameA, expectedNameA);
    EXPECT_EQ(item->size, 28u);
    item->next = std::exchange(chain, item);
  }
  EXPECT_EQ(FileItemDelete(chain), 3u);
  EXPECT_EQ(FileItemDelete(nullptr), 0u);
}

}  // namespace
}  // namespace ZvVesk2
