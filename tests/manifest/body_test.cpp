// SPDX-License-Identifier: Apache-2.0
// Arrays, ignored names and the reader of bodies.
#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include <vesk2/limits.h>
#include <vesk2/manifest_body.h>

#include "src/manifest/ignore.h"
#include "tests/support/test_manifest.h"
#include "tests/support/test_object.h"

using namespace vesk2test;
using ZvVesk2::BodyDirectory;
using ZvVesk2::BodyFile;
using ZvVesk2::BodyObject;
using ZvVesk2::PointerArray;

namespace {

char* NewText(const std::string& text) {
  char* const copy = new char[text.size() + 1];
  std::memcpy(copy, text.c_str(), text.size() + 1);
  return copy;
}

void Push(PointerArray<char>& array, std::initializer_list<const char*> texts) {
  for (const char* text : texts) ASSERT_EQ(array.push(NewText(text)), 1);
}

int Parse(const std::string& text, const char* name = nullptr) {
  BodyDirectory root(nullptr);
  if (name != nullptr) root.SetName(NewText(name));
  return root.ParseBody(Wrap(text).get(), nullptr);
}

TEST(PointerArray, GrowsByThirtyTwoAndClears) {
  PointerArray<BodyObject> array;
  for (uint32_t i = 0; i < 33; ++i) {
    ASSERT_EQ(array.push(new BodyObject(nullptr)), 1);
    EXPECT_EQ(array.GetCapacity(), i < 32 ? 32u : 64u);
  }
  EXPECT_EQ(array.GetCount(), 33u);
  array.next();
  array.clear();
  EXPECT_EQ(array.GetCount() + array.GetCapacity() + array.GetCursor(), 0u);

  PointerArray<BodyObject> ofArrays(true);
  ASSERT_EQ(ofArrays.push(new BodyObject[1]{BodyObject(nullptr)}), 1);
}

TEST(PointerArray, SignOfTheModeTellsWhenTheCursorMoves) {
  PointerArray<char> array;
  EXPECT_EQ(array.begin(), nullptr);
  Push(array, {"a", "b"});
  EXPECT_STREQ(array.begin(), "a");
  EXPECT_EQ(array.GetCursor(), 1u);
  array.reset();
  EXPECT_STREQ(array.get(0), "a");
  EXPECT_STREQ(array.get(-1), "a");
  EXPECT_STREQ(array.get(0), "b");
  array.reset();
  EXPECT_STREQ(array.get(1), "b");
  EXPECT_EQ(array.get(1), nullptr);
  EXPECT_EQ(array.next(), nullptr);
}

TEST(BodyObject, NamelessObjectsComeLast) {
  PointerArray<BodyObject> array;
  for (const char* name : {"b", "", "B", "a"}) {
    auto* const object = new BodyObject(nullptr);
    if (*name != '\0') object->SetName(NewText(name));
    ASSERT_EQ(array.push(object), 1);
  }
  array.sort(BodyObject::Cmp);
  EXPECT_STREQ(array.at(0)->GetName(), "B");
  EXPECT_STREQ(array.at(2)->GetName(), "b");
  EXPECT_EQ(array.at(3)->GetName(), nullptr);
}

TEST(IgnoreWalk, MergesForwardAndUsesEntriesUp) {
  PointerArray<char> ignored;
  Push(ignored, {"a", "c", "c", "x"});
  ZvVesk2::IgnoreWalk walk(ignored);
  std::string found;
  for (const char* name : {"/d/a", "a", "b", "c", "c", "c", "d", "x"}) {
    found += walk.Ignores(name) ? name : "-";
  }
  EXPECT_EQ(found, "/d/a--cc--x");
}

TEST(BodyParse, RefusesWhatIsNoBody) {
  const std::string digest = Str(Digest("x"));
  const auto sized = [](size_t length) {
    return Body("(4:file1:a1:-" + Str(std::string(length, 'h')) + ")");
  };
  const struct {
    std::string text;
    int code;
  } cases[] = {
      {Body(""), 0},
      {Body("(4:file1:a0:" + digest + ")"), 0},
      {Body(DirEntry("d", "") + FileEntry("d", "") + FileEntry("...", "")), 0},
      {"(4:body(12:random-token3:abc))", VESK2_ERR_RANDOM_TOKEN},
      {"(4:body(12:random-token5:abcde))", VESK2_ERR_RANDOM_TOKEN},
      {"(4:bodx(12:random-token4:abcd))", VESK2_ERR_PARSE_FILE},
      {Body("(4:link1:a1:-" + digest + ")"), VESK2_ERR_PARSE_FILE},
      {Body("1:a"), VESK2_ERR_PARSE_FILE},
      // Byte strings in all their forms.
      {Body("(4:file[bin]01:a[utf-8]:[bin]" + digest + ")(3:dir[num]1:d:)"), 0},
      {Body("(4:file00001:a0:" + digest + ")"), VESK2_ERR_MAX_BYTE_STRING},
      {Body("(4:file8193:" + std::string(9000, 'a')), VESK2_ERR_MAX_BYTE_STRING},
      {Body("(4:file[bix]1:a0:" + digest + ")"), VESK2_ERR_PARSE_FILE},
      {Body("(4:file1;a0:" + digest + ")"), VESK2_ERR_PARSE_FILE},
      {"(4:body(12:random-token4:abcd)(4:file5:abcd", VESK2_ERR_PARSE_FILE},
      {"(4:body(12:random-token4:abcd)(4:file5", VESK2_ERR_PARSE_FILE},
      // Nor is a string that is cut off one of no bytes.
      {"(4:body(12:random-token4:abcd)(4:file1:a9:xyz", VESK2_ERR_PARSE_FILE},
      {"(4:body(12:random-token4:abcd)(4:file1:a0:32:xyz", VESK2_ERR_PARSE_FILE},
      {sized(20), VESK2_ERR_UNKNOWN_HASH_ID},
      {sized(31), VESK2_ERR_UNKNOWN_HASH_ID},
      {sized(33), VESK2_ERR_UNKNOWN_HASH_ID},
  };
  for (const auto& row : cases) EXPECT_EQ(Parse(row.text), row.code) << row.text;
  for (const std::string name : {"", ".", "..", "a/b", "/etc"}) {
    EXPECT_EQ(Parse(Body(FileEntry(name, ""))), VESK2_ERR_PARSE_FILE) << name;
    EXPECT_EQ(Parse(Body(DirEntry(name, ""))), VESK2_ERR_PARSE_FILE) << name;
  }
  EXPECT_EQ(Parse(Body(FileEntry(std::string("a\0b", 3), ""))), VESK2_ERR_PARSE_FILE);
  EXPECT_EQ(BodyDirectory(nullptr).ParseBody(nullptr, nullptr), VESK2_ERR_PARAM_NULL);

  const std::string whole = Body(DirEntry("d", FileEntry("f", "x")));
  for (size_t length = 0; length < whole.size(); ++length) {
    EXPECT_NE(Parse(whole.substr(0, length)), 0) << length;
  }
}

TEST(BodyParse, BoundsDepthAndPaths) {
  std::string deep;
  for (unsigned level = 1; level < ZvVesk2::Limits::kMaxDepth; ++level) deep = DirEntry("d", deep);
  EXPECT_EQ(Parse(Body(deep)), 0);
  EXPECT_EQ(Parse(Body(DirEntry("d", deep))), VESK2_ERR_PARSE_FILE);

  const std::string most(ZvVesk2::Limits::kMaxBodyPath - 2, 'n');
  for (const char* root : {"", "r", "a root of any length"}) {
    EXPECT_EQ(Parse(Body(DirEntry("d", FileEntry(most, "") + DirEntry(most, ""))), root), 0);
    EXPECT_EQ(Parse(Body(DirEntry("dd", FileEntry(most, ""))), root), VESK2_ERR_PARSE_FILE);
    EXPECT_EQ(Parse(Body(DirEntry("dd", DirEntry(most, ""))), root), VESK2_ERR_PARSE_FILE);
  }
}

TEST(BodyParse, NamesDirectoriesByPathAndSorts) {
  BodyDirectory root(nullptr);
  const std::string text = Body(FileEntry("b", "x") + DirEntry("s", DirEntry("t", "")) +
                                FileEntry("a", "") + DirEntry("S", ""));
  ASSERT_EQ(root.ParseBody(Wrap(text).get(), nullptr), 0);
  EXPECT_STREQ(root.GetFiles().at(0)->GetName(), "a");
  EXPECT_STREQ(root.GetFiles().at(1)->GetName(), "b");
  EXPECT_STREQ(root.GetSubdirectories().at(0)->GetName(), "S");
  auto* const s = dynamic_cast<BodyDirectory*>(root.GetSubdirectories().at(1));
  ASSERT_NE(s, nullptr);
  EXPECT_STREQ(s->GetSubdirectories().at(0)->GetName(), "s/t");
  EXPECT_TRUE(s->GetIsDirectory());

  const auto* const file = dynamic_cast<BodyFile*>(root.GetFiles().at(1));
  ASSERT_NE(file, nullptr);
  const std::string digest = Digest("x");
  const auto* const bytes = reinterpret_cast<const unsigned char*>(digest.data());
  EXPECT_TRUE(file->Equal(bytes, 32));
  EXPECT_FALSE(file->Equal(bytes, 31));
  EXPECT_FALSE(file->Equal(root.GetFiles().at(0)));
}

}  // namespace
