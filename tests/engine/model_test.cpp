// SPDX-License-Identifier: Apache-2.0
// The engine's state, its records, keywords and orders.
#include <cstring>

#include "src/engine/budget.h"
#include "src/engine/digest.h"
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

using namespace std::string_literals;
using Model = EngineTest;

const unsigned char* Bytes(const std::string& text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

TEST(EngineStart, NothingIsLeftBehind) {
  spki_engine engine;
  CountingAllocator empty, misaligned, allocator;
  empty.fail_after = 0;
  EXPECT_EQ(16386, spki_engine_start(&engine, &empty.record));
  misaligned.offset = 1;
  EXPECT_EQ(SPKI_ERR_NO_MEM, spki_engine_start(&engine, &misaligned.record));
  EXPECT_EQ(0, misaligned.live);
  // Nor what was never released.
  ASSERT_EQ(0, spki_engine_start(&engine, &allocator.record));
  spki_elem_new(&engine);
  void* middle = spki_allocate(&engine, 5000);
  spki_elem_new(&engine);
  spki_free(&engine, middle);
  EXPECT_EQ(2u, engine.budget.live_records);
  spki_engine_stop(&engine, &allocator.record);
  EXPECT_EQ(0, allocator.live);
}

TEST_F(Model, StoringCountsAndReleases) {
  spki_elem* list = Chain("(tag (ftp host))");
  spki_elem* slot = nullptr;
  for (int i = 0; i < 2; ++i) {  // the same record stays alive throughout
    spki_elem_assign(&engine_, &slot, list);
    EXPECT_EQ(2u, list->refcount);
  }
  spki_elem_assign(&engine_, &slot, nullptr);
  EXPECT_EQ(1u, list->refcount);
  spki_atom_assign(&engine_, nullptr, spki_atom_new(&engine_));  // no slot: released
  spki_elem* fresh = spki_elem_new(&engine_);
  fresh->refcount = 0;  // as a new chain is handed out
  spki_elem_assign(&engine_, nullptr, fresh);
  EXPECT_EQ(fresh, spki_elem_new(&engine_)) << "records come from the free list first";
  spki_elem_release(&engine_, fresh);
  spki_atom* atom = spki_atom_new(&engine_);
  atom->refcount = UINT32_MAX - 1;
  spki_atom* counted = nullptr;
  spki_atom_assign(&engine_, &counted, atom);
  for (int i = 0; i < 3; ++i) spki_atom_release(&engine_, atom);
  EXPECT_EQ(UINT32_MAX, atom->refcount) << "a count that is full stays";
  atom->refcount = 1;
  spki_atom_release(&engine_, atom);
}

// The records (which the fixture counts) and the export that they were parsed from.
TEST_F(Model, DisposingGivesAllOfAListBack) {
  spki_elem* list = Chain("(tag (ftp host))");
  spki_elem* disposed = nullptr;
  spki_elem_assign(&engine_, &disposed, list);  // the fixture's is the other reference
  disposed->text = new unsigned char[disposed->text_length];
  spki_list_dispose(&engine_, disposed);
  EXPECT_EQ(1u, list->refcount);
  EXPECT_EQ(nullptr, list->text);
  spki_list_dispose(&engine_, nullptr);
}

TEST_F(Model, LiveRecordsAndBytesAreBounded) {
  EXPECT_EQ(nullptr, spki_allocate(&engine_, size_t{Limits::kMaxRecords} * 256));
  EXPECT_EQ(SPKI_ERR_NO_MEM, engine_.budget.spent);
  EXPECT_EQ(nullptr, spki_elem_new(&engine_)) << "a spent engine stays spent";
}

// The last piece within a limit is given, and none after it.
TEST_F(Model, LimitsAreExact) {
  engine_.budget.combinations = Limits::kMaxCombinations - 1;
  EXPECT_EQ(0, spki_charge_combination(&engine_));
  EXPECT_EQ(SPKI_ERR_THRESHOLD, spki_charge_combination(&engine_, SPKI_ERR_THRESHOLD));
  engine_.budget = {};
  engine_.budget.live_records = Limits::kMaxRecords - 1;
  spki_elem* last = spki_elem_new(&engine_);
  EXPECT_NE(nullptr, last);
  EXPECT_EQ(nullptr, spki_elem_new(&engine_));
  engine_.budget = {};
  engine_.budget.live_records = 1;
  spki_elem_release(&engine_, last);
}

// Every row, so that no number can slip.
TEST(Keywords, RowsAndNumbers) {
  int recognised = 0;
  std::string previous;
  for (int32_t id = 1; id <= 127; ++id) {
    const spki_keyword_entry* row = spki_keyword_row(id);
    ASSERT_EQ(std::strlen(row->name), row->length);
    EXPECT_LT(previous, row->name);
    previous = row->name;
    const int32_t back = spki_keyword_id(Bytes(previous), row->length);
    if (back != -1) ++recognised;
    EXPECT_TRUE(back == -1 || back == id) << row->name;
  }
  EXPECT_EQ(63, recognised + 3);  // and "and", "valid", "sha256"
  const std::pair<std::string, int32_t> numbers[] = {
      {"*", 1},        {"l", 53},        {"name", 64}, {"sha1", 108},     {"version", 123},
      {"sha256", 129}, {"rsa", -1},      {"dsa", -1},  {"threshold", -1}, {"x9-attribute", -1},
      {"and", 65536},  {"valid", 65539}, {"nam", -1},  {"namee", -1},     {"generation", -1},
      {"rmd160", -1},  {"", -1},         {"~", -1},    {"name\0x"s, 64},  {"hashed-password", -1}};
  for (const auto& [word, id] : numbers) {
    EXPECT_EQ(id, spki_keyword_id(Bytes(word), word.size())) << word;
  }
  for (int32_t id : {-1, 0, 128, 129, 0x10004}) EXPECT_STREQ("???", spki_keyword_row(id)->name);
  const char* added[] = {"and", "hashed-password", "prompted-biometric", "valid"};
  for (int32_t i = 0; i < 4; ++i) EXPECT_STREQ(added[i], spki_keyword_row(0x10000 + i)->name);
}

// A zero byte is the end.
TEST(Order, BytesAndPaddedBytes) {
  const struct {
    std::string a, b;
    int bytes;
    int padded;  // with pad "0"
  } cases[] = {{"a", "a", 0, 0},     {"a", "b", 1, 1},         {"b", "a", 2, 2},
               {"a", "ab", 1, 1},    {"ab", "a", 2, 2},        {"\xff", "a", 2, 2},
               {"a\0x"s, "a", 0, 2}, {"a\0x"s, "a\0y"s, 0, 0}, {"007", "7", 1, 0},
               {"7", "007", 2, 0},   {"/7", "7", 1, 2},        {"7", "/7", 2, 1}};
  for (const auto& [a, b, bytes, padded] : cases) {
    const auto length = a.size();
    EXPECT_EQ(bytes, spki_cmp_bytes(Bytes(a), length, Bytes(b), b.size())) << a << " " << b;
    EXPECT_EQ(padded, spki_cmp_padded(Bytes(a), length, Bytes(b), b.size(), '0')) << a << " " << b;
    EXPECT_EQ(bytes, spki_cmp_cstr(Bytes(a), length, b.c_str())) << a << " " << b;
  }
  const std::string text = "x";
  EXPECT_EQ(3, spki_cmp_bytes(nullptr, 0, nullptr, 0));
  constexpr unsigned char kPads[] = {'x', '0'};
  for (const unsigned char pad : kPads) {  // what is left of the other may be nothing
    EXPECT_EQ(3, spki_cmp_padded(nullptr, 0, Bytes(text), 1, pad));
    EXPECT_EQ(3, spki_cmp_padded(Bytes(text), 1, nullptr, 0, pad));
  }
  EXPECT_EQ(3, spki_cmp_cstr(nullptr, 0, "x"));
  EXPECT_EQ(0, spki_cmp_cstr(nullptr, 0, nullptr)) << "identical pointers before the null test";
  EXPECT_EQ(0, spki_cmp_cstr(Bytes(text), 0, text.c_str())) << "whatever the length";
}

TEST_F(Model, AtomsAreEqualByTheOrder) {
  EXPECT_TRUE(spki_atom_equal(&engine_, Atom("x"), Atom(Raw("x\0y"s))));
  EXPECT_TRUE(spki_atom_equal(&engine_, nullptr, nullptr));
  EXPECT_FALSE(spki_atom_equal(&engine_, nullptr, Atom("x")));
  EXPECT_FALSE(spki_atom_equal(&engine_, Atom("x"), nullptr));
}

TEST(CryptoStatus, UnlistedResultsAreSuccess) {
  const std::pair<int, std::vector<int>> cases[] = {
      {0, {0, 1070, 1002, -1}},
      {SPKI_ERR_NULL_PARAM, {1001}},
      {SPKI_ERR_NO_MEM, {1007}},
      {SPKI_ERR_UNKNOWN_HASH_ALG, {1003, 1020}},
      {SPKI_ERR_UNKNOWN, {1009, 1014, 1015, 1017}},
  };
  for (const auto& [code, results] : cases) {
    for (const int result : results) EXPECT_EQ(code, spki_map_crypto_status(result)) << result;
  }
}

}  // namespace
}  // namespace ZvVesk2::Engine
