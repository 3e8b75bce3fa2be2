// Byte strings and lists in memory: what Set takes, who owns what, equality, nesting without end.
#include <vesk2/expression.h>
#include <vesk2/ref.h>

#include <climits>
#include <memory>
#include <string>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include "src/frame/check.h"
#include "tests/support/test_object.h"

namespace ZvVesk2 {
namespace {

using vesk2test::Bytes;
using vesk2test::Canonical;
using vesk2test::Parse;

const unsigned char* Raw(const std::string& text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

Ref<ByteString> Make(const char* text, ByteString::BsType type = ByteString::BsNone) {
  Ref<ByteString> string(TryNew<ByteString>(nullptr));
  EXPECT_EQ(string->Set(text, type), 0);
  return string;
}

TEST(ByteString, SetTakes1To8192Bytes) {
  const std::string bytes(8193, 'x');
  const std::tuple<const unsigned char*, unsigned, int> cases[] = {
      {Raw(bytes), 0, VESK2_ERR_INVALID_PARAM},
      {nullptr, 1, VESK2_ERR_INVALID_PARAM},
      {Raw(bytes), 8192, 0},
      {Raw(bytes), 8193, VESK2_ERR_MAX_BYTE_STRING},
      {Raw(bytes), 0x80000001u, VESK2_ERR_MAX_BYTE_STRING},
  };
  const Ref<ByteString> string(TryNew<ByteString>(nullptr));
  for (const auto& [data, length, code] : cases) {
    EXPECT_EQ(string->Set(data, length, ByteString::BsBin), code) << length;
  }
  EXPECT_EQ(string->Set("", ByteString::BsNone), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(string->Set(bytes.c_str(), ByteString::BsNone), VESK2_ERR_MAX_BYTE_STRING);
  EXPECT_EQ(string->GetLength(), 8192u) << "a refused Set leaves the value";
}

TEST(ByteString, KeepsItsArrayForUpToSevenBytesLess) {
  const std::pair<unsigned, bool> cases[] = {{20, true}, {13, true}, {12, false}, {21, false}};
  for (const auto& [length, kept] : cases) {
    const Ref<ByteString> string = Make("abcdefghijklmnopqrst");
    const unsigned char* before = string->GetData();
    ASSERT_EQ(string->Set(std::string(length, 'x').c_str(), ByteString::BsNone), 0);
    EXPECT_EQ(string->GetData() == before, kept) << length;
  }
  // The new bytes may be its own: within the array that is kept, and within one that is replaced.
  for (const unsigned offset : {2u, 18u}) {
    const Ref<ByteString> string = Make("abcdefghijklmnopqrst");
    ASSERT_EQ(string->Set(string->GetData() + offset, 20 - offset, ByteString::BsNone), 0);
    EXPECT_EQ(Bytes(string.get()), std::string("abcdefghijklmnopqrst").substr(offset));
  }
}

TEST(ByteString, AdoptsAnArrayAndComparesWithoutHints) {
  auto* array = new unsigned char[2]{'h', 0};
  const Ref<ByteString> string(TryNew<ByteString>(array, 2u, ByteString::BsUtf8, nullptr));
  EXPECT_EQ(string->GetData(), array);
  EXPECT_FALSE(string->IsEqual("h")) << "the 0 byte counts";
  EXPECT_STREQ(std::unique_ptr<char[]>(string->ToString()).get(), "h") << "and cuts the text";

  const Ref<ByteString> plain = Make("abc");
  EXPECT_TRUE(plain->IsEqual(Make("abc", ByteString::BsBin).get()));
  EXPECT_TRUE(plain->IsEqual("abc"));
  EXPECT_FALSE(plain->IsEqual(Make("abd").get()));
  EXPECT_FALSE(plain->IsEqual(static_cast<DExpression*>(nullptr)));
  EXPECT_FALSE(plain->IsEqual(Parse("(3:abc)").get()));
}

TEST(SExpression, CreateAndInsert) {
  Vesk2ContextStruct context = {7};
  Ref<SExpression> list;
  ASSERT_EQ(SExpression::Create(list.Out(), "a", "b", &context), 0);
  EXPECT_EQ(list->Last()->GetContext(), &context);
  EXPECT_EQ(list->Insert(""), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(list->Insert(static_cast<DExpression*>(nullptr)), VESK2_ERR_PARAM_NULL);
  EXPECT_EQ(Canonical(list), "(1:a1:b)");
  EXPECT_EQ(SExpression::Create(list.Out(), "t", "", nullptr), VESK2_ERR_INVALID_PARAM);
  EXPECT_FALSE(list);
  const Ref<ByteString> value = Make("v");
  EXPECT_EQ(SExpression::Create(list.Out(), "", value.get(), nullptr), VESK2_ERR_INVALID_PARAM);
  EXPECT_EQ(value->GetRefCount(), 1) << "still the caller's";
}

TEST(SExpression, RemoveGoesByIdentityAndGivesTheReferenceBack) {
  const Ref<SExpression> list = Parse("(1:x1:y1:z)");
  EXPECT_EQ(list->Remove(Make("x").get()), VESK2_ERR_NOT_IN_LIST);
  auto middle = list->Begin();
  middle.Next();
  const std::pair<DExpression*, const char*> cases[] = {
      {middle.Value(), "(1:x1:z)"}, {list->Last(), "(1:x)"}, {list->First(), "()"}};
  for (const auto& [element, left] : cases) {
    const auto back = Ref<DExpression>::Share(element);
    EXPECT_EQ(list->Remove(element), 0);
    EXPECT_EQ(back->GetRefCount(), 2) << "the list's reference is the caller's";
    element->Free();
    EXPECT_EQ(Canonical(list), left);
  }
  EXPECT_EQ(list->Last(), nullptr);
  EXPECT_EQ(list->Insert("w"), 0);
  EXPECT_EQ(Canonical(list), "(1:w)");
}

TEST(SExpression, ElementsAreShared) {
  const Ref<SExpression> list = Parse("(1:a(1:b(1:c)))");
  Ref<SExpression> rest(list->Rest());
  EXPECT_EQ(Canonical(rest), "((1:b(1:c)))");
  EXPECT_EQ(Canonical(list), "(1:a(1:b(1:c)))");
  EXPECT_EQ(rest->Last()->GetRefCount(), 2);
  rest.Reset(rest->Rest());
  EXPECT_EQ(rest->Count(), 0u);
  rest.Reset(rest->Rest());
  EXPECT_EQ(rest->Count(), 0u) << "of nothing, nothing";

  EXPECT_TRUE(list->Contains(Parse("([bin]1:b(1:c))").get()));
  EXPECT_FALSE(list->Contains(Parse("(1:c)").get()));
  const auto shared = Ref<SExpression>::Share(static_cast<SExpression*>(list->Last()));
  list->DeleteNodes();
  EXPECT_EQ(list->Last(), nullptr);
  EXPECT_EQ(shared->GetRefCount(), 1);
  EXPECT_EQ(Canonical(shared), "(1:b(1:c))") << "it keeps its own elements";
}

TEST(SExpression, NestingThatACallerBuildsIsRefusedNotFollowed) {
  for (const auto& [levels, isWritten] : {std::pair{256, true}, {257, false}, {100000, false}}) {
    Ref<SExpression> list(TryNew<SExpression>(nullptr));
    for (int i = 1; i < levels; ++i) {
      Ref<SExpression> outer(TryNew<SExpression>(nullptr));
      ASSERT_EQ(outer->Insert(list.Release()), 0);
      list = std::move(outer);
    }
    const int expected = isWritten ? 0 : VESK2_ERR_BUFFER_OVERFLOW;
    unsigned char* out = nullptr;
    unsigned length = 0;
    EXPECT_EQ(list->Export(out, length), expected);
    const std::unique_ptr<unsigned char[]> exported(out);
    unsigned char buffer[1024];
    unsigned pos = 0;
    EXPECT_EQ(list->Export(buffer, pos, sizeof buffer), expected);
    EXPECT_EQ(list->CanonicalLength(), isWritten ? 512 : UINT_MAX);
    EXPECT_EQ(list->IsEqual(list.get()), isWritten);
    EXPECT_EQ(std::unique_ptr<char[]>(list->ExportTag(nullptr)) != nullptr, isWritten);
    list->PrintAdvanced([](const char*, unsigned, void*) { return 0; }, nullptr, 0);
  }  // freed here, however deep
}

}  // namespace
}  // namespace ZvVesk2
