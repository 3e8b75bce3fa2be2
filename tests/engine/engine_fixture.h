// An engine over a counting, failing allocator, with tags written as text: "(ftp (* prefix ab))",
// a display hint as "[hint]word". At the end every record must be back on its free list and every
// block back with the allocator.
#ifndef VESK2_TESTS_ENGINE_ENGINE_FIXTURE_H
#define VESK2_TESTS_ENGINE_ENGINE_FIXTURE_H

#include <gtest/gtest.h>

#include <cstdlib>
#include <deque>
#include <string>
#include <string_view>
#include <vector>

#include "src/engine/owned.h"
#include "src/engine/tag.h"
#include "src/engine/write.h"

namespace ZvVesk2::Engine {

struct CountingAllocator {
  long live = 0;
  long fail_after = -1;  // the allocation with this number fails, and all behind it
  spki_allocator record = {Allocate, Release, this};

  static void* Allocate(size_t size, void* user) {
    auto* self = static_cast<CountingAllocator*>(user);
    if (self->fail_after == 0) return nullptr;
    if (self->fail_after > 0) --self->fail_after;
    ++self->live;
    return std::malloc(size);
  }
  static void Release(void* memory, void* user) {
    if (memory != nullptr) --static_cast<CountingAllocator*>(user)->live;
    std::free(memory);
  }
};

inline std::string Token(const std::string& text) {
  return std::to_string(text.size()) + ":" + text;
}

// Canonical bytes of a text of words and parentheses.
inline std::string Canonical(const std::string& text) {
  std::string out;
  for (size_t i = 0; i < text.size();) {
    if (text[i] == '(' || text[i] == ')') {
      out += text[i++];
    } else if (text[i] == ' ') {
      ++i;
    } else if (text[i] == '[') {
      const size_t end = text.find(']', i);
      out += "[" + Token(text.substr(i + 1, end - i - 1)) + "]";
      i = end + 1;
    } else {
      const size_t end = std::min(text.find_first_of(" ()", i), text.size());
      out += Token(text.substr(i, end - i));
      i = end;
    }
  }
  return out;
}

struct StringSink final : spki_sink {
  std::string text;
  spki_status Put(const void* data, size_t length) override {
    text.append(static_cast<const char*>(data), length);
    return 0;
  }
};

// The bytes outlive the list.
inline int ParseBytes(spki_engine* engine, std::string_view canonical, spki_elem** list) {
  const auto* start = reinterpret_cast<const unsigned char*>(canonical.data());
  spki_input input = {start, start, start + canonical.size()};
  return spki_parse_list(engine, list, &input);
}

// An engine of its own whose allocations can be made to fail; what it still holds at the end goes
// with its pool.
struct FailingEngine {
  CountingAllocator allocator;
  spki_engine engine;

  FailingEngine() { EXPECT_EQ(0, spki_engine_start(&engine, &allocator.record)); }
  ~FailingEngine() {
    spki_engine_stop(&engine, &allocator.record);
    EXPECT_EQ(0, allocator.live);
  }
};

class EngineTest : public testing::Test {
 protected:
  EngineTest() { EXPECT_EQ(0, spki_engine_start(&engine_, &allocator_.record)); }
  ~EngineTest() override {
    for (spki_elem* list : lists_) spki_elem_release(&engine_, list);
    uint32_t free_records = 0;
    for (auto* a = engine_.free_atoms; a != nullptr; a = a->link) ++free_records;
    for (auto* e = engine_.free_elems; e != nullptr; e = e->link) ++free_records;
    EXPECT_EQ(free_records, engine_.budget.live_records) << "a reference was not released";
    spki_engine_stop(&engine_, &allocator_.record);
    EXPECT_EQ(0, allocator_.live);
  }

  // The chain of a list; lives as long as the test.
  spki_elem* Chain(const std::string& text) { return Parse(Canonical(text)); }
  spki_elem* Parse(const std::string& canonical) {
    spki_elem* list = nullptr;
    EXPECT_EQ(0, TryParse(canonical, &list)) << canonical;
    return Keep(list);
  }
  int TryParse(const std::string& canonical, spki_elem** list) {
    return ParseBytes(&engine_, buffers_.emplace_back(canonical), list);
  }
  // An element as it stands inside a list.
  spki_elem* Elem(const std::string& text) { return Chain("(x " + text + ")")->next; }

  spki_elem* Keep(spki_elem* list) {
    if (list != nullptr) lists_.push_back(list);
    return list;
  }
  // What a new element looks like; releases it. "nothing" for null.
  std::string Consume(spki_elem* elem) {
    if (elem == nullptr) return "nothing";
    Keep(elem);
    return Text(elem);
  }
  static std::string Text(const spki_elem* chain) {
    StringSink sink;
    EXPECT_EQ(0, spki_write_pieces(chain, &sink));
    return sink.text;
  }

  CountingAllocator allocator_;
  spki_engine engine_;

 private:
  std::deque<std::string> buffers_;
  std::vector<spki_elem*> lists_;
};

}  // namespace ZvVesk2::Engine

#endif  // VESK2_TESTS_ENGINE_ENGINE_FIXTURE_H
