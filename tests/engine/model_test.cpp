// The engine's state, its records and keywords.
#include <cstring>

#include "src/engine/digest.h"
#include "tests/engine/engine_fixture.h"

namespace ZvVesk2::Engine {
namespace {

using Model = EngineTest;

struct MisalignedRecord {
  alignas(8) char memory[32];
  int live = 0;
  static void* Allocate(size_t, void* user) {
    auto* self = static_cast<MisalignedRecord*>(user);
    ++self->live;
    return self->memory + 1;
  }
  static void Release(void*, void* user) { --static_cast<MisalignedRecord*>(user)->live; }
};

TEST(EngineStart, FailuresLeaveNothingBehind) {
  spki_engine engine;
  CountingAllocator empty;
  empty.fail_after = 0;
  EXPECT_EQ(16386, spki_engine_start(&engine, &empty.record));
  EXPECT_EQ(nullptr, engine.pool);
  MisalignedRecord misaligned;
  const spki_allocator bad = {MisalignedRecord::Allocate, MisalignedRecord::Release, &misaligned};
  EXPECT_EQ(SPKI_ERR_NO_MEM, spki_engine_start(&engine, &bad));
  EXPECT_EQ(nullptr, engine.pool);
  EXPECT_EQ(0, misaligned.live);
}

TEST(EngineStop, FreesWhatWasNeverReleased) {
  CountingAllocator allocator;
  spki_engine engine;
  ASSERT_EQ(0, spki_engine_start(&engine, &allocator.record));
  void* middle = nullptr;
  for (int i = 0; i < 3; ++i) {
    spki_elem_new(&engine);
    if (i == 1) middle = spki_allocate(&engine, 5000);
  }
  spki_free(&engine, middle);
  EXPECT_EQ(3u, engine.budget.live_records);
  spki_engine_stop(&engine, &allocator.record);
  EXPECT_EQ(0, allocator.live);
}

TEST_F(Model, StoringCountsAndReleases) {
  spki_elem* list = Chain("(tag (ftp host))");
  spki_elem* slot = nullptr;
  spki_elem_assign(&engine_, &slot, list);
  EXPECT_EQ(2u, list->refcount);
  spki_elem_assign(&engine_, &slot, list);  // the same record stays alive throughout
  EXPECT_EQ(2u, list->refcount);
  spki_elem_assign(&engine_, &slot, nullptr);
  EXPECT_EQ(1u, list->refcount);
  spki_elem_assign(&engine_, nullptr, spki_elem_new(&engine_));  // no slot: released
  spki_atom_assign(&engine_, nullptr, spki_atom_new(&engine_));
  spki_elem* reused = spki_elem_new(&engine_);
  EXPECT_EQ(nullptr, engine_.free_elems) << "records come from the free list first";
  EXPECT_EQ(1u, reused->refcount);
  reused->refcount = 0;  // as a new chain is handed out
  spki_elem_release(&engine_, reused);
  EXPECT_EQ(reused, engine_.free_elems);
}

TEST_F(Model, SaturatedCountsStay) {
  spki_atom* atom = spki_atom_new(&engine_);
  atom->refcount = UINT32_MAX - 1;
  spki_atom* slot = nullptr;
  spki_atom_assign(&engine_, &slot, atom);
  for (int i = 0; i < 3; ++i) spki_atom_release(&engine_, atom);
  EXPECT_EQ(UINT32_MAX, atom->refcount);
  atom->refcount = 1;
  spki_atom_release(&engine_, atom);
}

TEST_F(Model, DisposingFreesTheBuffer) {
  auto* buffer = new unsigned char[16];
  std::memcpy(buffer, "(3:tag)", 7);
  spki_input input = {buffer, buffer, buffer + 7};
  spki_elem* list = nullptr;
  ASSERT_EQ(0, spki_parse_list(&engine_, &list, &input));
  spki_list_dispose(&engine_, list);
  spki_list_dispose(&engine_, nullptr);
}

TEST_F(Model, LiveRecordsAndBytesAreBounded) {
  EXPECT_EQ(nullptr, spki_allocate(&engine_, size_t{Limits::kMaxRecords} * 256));
  EXPECT_EQ(SPKI_ERR_NO_MEM, engine_.budget.spent);
  EXPECT_EQ(nullptr, spki_elem_new(&engine_)) << "a spent engine stays spent";
}

TEST(Keywords, OnlyKnownWordsAreRecognised) {
  const std::pair<std::string, int32_t> known[] = {
      {"*", 1},        {"and", 0x10000},   {"name", 64},     {"sha1", 108},
      {"sha256", 129}, {"valid", 0x10003}, {"version", 123}, {std::string("name\0x", 6), 64}};
  for (const auto& [word, id] : known) {
    const auto* data = reinterpret_cast<const unsigned char*>(word.data());
    EXPECT_EQ(id, spki_keyword_id(data, word.size())) << word;
  }
  for (const char* word : {"rsa", "dsa", "sha1withrsa", "x509v3", "x9-attribute", "threshold",
                           "hashed-password", "prompted-biometric", "nam", "namee", "", "~"}) {
    const auto* data = reinterpret_cast<const unsigned char*>(word);
    EXPECT_EQ(-1, spki_keyword_id(data, std::strlen(word))) << word;
  }
  EXPECT_EQ(-1, spki_keyword_id(nullptr, 4));
}

// Every row, so that no number can slip.
TEST(Keywords, RowsPrintTheirNumbers) {
  int recognised = 0;
  std::string previous;
  for (int32_t id = 1; id <= 127; ++id) {
    const spki_keyword_entry* row = spki_keyword_row(id);
    ASSERT_EQ(std::strlen(row->name), row->length);
    EXPECT_LT(previous, row->name);
    previous = row->name;
    const auto* name = reinterpret_cast<const unsigned char*>(row->name);
    const int32_t back = spki_keyword_id(name, row->length);
    if (back != -1) ++recognised;
    EXPECT_TRUE(back == -1 || back == id) << row->name;
  }
  EXPECT_EQ(63, recognised + 3);  // and "and", "valid", "sha256"
  const std::pair<int32_t, const char*> cases[] = {{53, "l"},
                                                   {127, "x509v3"},
                                                   {0x10000, "and"},
                                                   {0x10001, "hashed-password"},
                                                   {0x10002, "prompted-biometric"},
                                                   {0x10003, "valid"}};
  for (const auto& [id, name] : cases) EXPECT_STREQ(name, spki_keyword_row(id)->name) << id;
  for (const int32_t id : {-1, 0, 128, 129, 0x10004}) {
    EXPECT_STREQ("???", spki_keyword_row(id)->name) << id;
  }
}

const unsigned char* Bytes(const std::string& text) {
  return reinterpret_cast<const unsigned char*>(text.data());
}

TEST(Comparison, SeesAZeroByteAsTheEnd) {
  using namespace std::string_literals;
  const struct {
    std::string a, b;
    int bytes;
    int padded;  // with pad "0"
  } cases[] = {
      {"a", "a", 0, 0},   {"a", "b", 1, 1},    {"b", "a", 2, 2},     {"a", "ab", 1, 1},
      {"ab", "a", 2, 2},  {"\xff", "a", 2, 2}, {"a\0x"s, "a", 0, 2}, {"a\0x"s, "a\0y"s, 0, 0},
      {"007", "7", 1, 0}, {"7", "007", 2, 0},  {"107", "7", 1, 2},   {"7", "107", 2, 1},
      {"0", "", 2, 0},    {"", "", 0, 0},      {"9", "10", 2, 1},
  };
  for (const auto& c : cases) {
    EXPECT_EQ(c.bytes, spki_cmp_bytes(Bytes(c.a), c.a.size(), Bytes(c.b), c.b.size()))
        << c.a << " " << c.b;
    EXPECT_EQ(c.padded, spki_cmp_padded(Bytes(c.a), c.a.size(), Bytes(c.b), c.b.size(), '0'))
        << c.a << " " << c.b;
    if (c.b.find('\0') == std::string::npos) {
      EXPECT_EQ(c.bytes, spki_cmp_cstr(Bytes(c.a), c.a.size(), c.b.c_str())) << c.a << " " << c.b;
    }
  }
  const std::string text = "x";
  EXPECT_EQ(3, spki_cmp_bytes(nullptr, 0, Bytes(text), 1));
  EXPECT_EQ(3, spki_cmp_bytes(nullptr, 0, nullptr, 0));
  EXPECT_EQ(3, spki_cmp_padded(Bytes(text), 1, nullptr, 0, '0'));
  EXPECT_EQ(3, spki_cmp_cstr(nullptr, 0, "x"));
  EXPECT_EQ(0, spki_cmp_cstr(nullptr, 0, nullptr)) << "identical pointers before the null test";
  EXPECT_EQ(0, spki_cmp_cstr(Bytes(text), 0, text.c_str())) << "whatever the length";
}

// Identity is by canonical bytes, stricter than the order above.
TEST_F(Model, ChainsAreIdenticalByTheirBytes) {
  const struct {
    std::string a, b;
    bool same;
  } cases[] = {
      {"(1:*3:set1:a1:b)", "(1:*3:set1:a1:b)", true},
      {"(1:*3:set1:a1:b)", "(1:*3:set1:b1:a)", false},
      {"(1:x1:a)", "(1:x1:a1:b)", false},
      {"(1:x(1:y1:z))", "(1:x(1:y1:z))", true},
      {"(1:x(1:y1:z))", "(1:x1:y1:z)", false},
      {"(3:tag)", "([1:h]3:tag)", false},
      {"(1:x[1:h]1:a)", "(1:x[1:i]1:a)", false},
      {std::string("(1:x3:a\0b)", 10), std::string("(1:x3:a\0c)", 10), false},
  };
  for (const auto& c : cases) {
    spki_elem* a = Parse(c.a);
    spki_elem* b = Parse(c.b);
    EXPECT_EQ(c.same, spki_chain_equal(a, b)) << c.a << " " << c.b;
    EXPECT_TRUE(spki_chain_equal(a, a));
    EXPECT_FALSE(spki_chain_equal(a, nullptr));
  }
  EXPECT_TRUE(spki_atom_equal(Elem("x")->value.atom,
                              Parse(std::string("(1:x3:x\0y)", 10))->next->value.atom));
  EXPECT_FALSE(spki_atom_equal(Elem("x")->value.atom, nullptr));
}

TEST(CryptoStatus, UnlistedResultsAreSuccess) {
  for (const int status : {0, 1070, 1002, -1}) EXPECT_EQ(0, spki_map_crypto_status(status));
  for (const int status : {1009, 1014, 1015, 1017}) {
    EXPECT_EQ(SPKI_ERR_UNKNOWN, spki_map_crypto_status(status));
  }
  for (const int status : {1003, 1020}) {
    EXPECT_EQ(SPKI_ERR_UNKNOWN_HASH_ALG, spki_map_crypto_status(status));
  }
  EXPECT_EQ(SPKI_ERR_NULL_PARAM, spki_map_crypto_status(1001));
  EXPECT_EQ(SPKI_ERR_NO_MEM, spki_map_crypto_status(1007));
}

}  // namespace
}  // namespace ZvVesk2::Engine
