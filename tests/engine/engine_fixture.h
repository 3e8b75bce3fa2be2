// SPDX-License-Identifier: Apache-2.0
// An engine over a counting, failing allocator, with tags written as text: "(ftp (* prefix ab))", a
// display hint as "[hint]word", any other bytes as Raw(bytes). At the end every record must be back
// on its free list and every block back with the allocator.
#ifndef VESK2_TESTS_ENGINE_ENGINE_FIXTURE_H
#define VESK2_TESTS_ENGINE_ENGINE_FIXTURE_H

#include <gtest/gtest.h>

#include <cstdlib>
#include <deque>
#include <string>
#include <vector>

#include "src/engine/pool.h"
#include "src/engine/tag.h"
#include "src/engine/tuple.h"
#include "src/engine/write.h"

namespace ZvVesk2::Engine {

struct CountingAllocator {
  long live = 0;
  long fail_after = -1;  // the allocation with this number fails, and all behind it
  size_t offset = 0;     // how far its memory is off the alignment
  spki_allocator record = {Allocate, Release, this};

  static void* Allocate(size_t size, void* user) {
    auto* self = static_cast<CountingAllocator*>(user);
    if (self->fail_after == 0) return nullptr;
    if (self->fail_after > 0) --self->fail_after;
    ++self->live;
    return static_cast<char*>(std::malloc(size + self->offset)) + self->offset;
  }
  static void Release(void* memory, void* user) {
    auto* self = static_cast<CountingAllocator*>(user);
    --self->live;
    std::free(static_cast<char*>(memory) - self->offset);
  }
};

inline std::string Token(const std::string& text) {
  return std::to_string(text.size()) + ":" + text;
}
inline std::string Raw(const std::string& bytes) { return " #" + Token(bytes) + " "; }

// Canonical bytes of a text of words and parentheses.
inline std::string Canonical(const std::string& text) {
  std::string out;
  for (size_t i = 0, end = 0; i < text.size(); i = end) {
    end = i + 1;
    if (text[i] == '(' || text[i] == ')') {
      out += text[i];
    } else if (text[i] == '[') {
      end = text.find(']', i) + 1;
      out += "[" + Token(text.substr(i + 1, end - i - 2)) + "]";
    } else if (text[i] == '#') {
      end = text.find(':', i) + 1 + std::stoul(text.substr(i + 1));
      out += text.substr(i + 1, end - i - 1);
    } else if (text[i] != ' ') {
      end = std::min(text.find_first_of(" ()", i), text.size());
      out += Token(text.substr(i, end - i));
    }
  }
  return out;
}

inline std::string Text(const spki_elem* chain) {
  struct StringSink final : spki_sink {
    std::string text;
    spki_status Put(const void* data, size_t length) override {
      text.append(static_cast<const char*>(data), length);
      return 0;
    }
  } sink;
  EXPECT_EQ(0, spki_write_pieces(chain, &sink));
  return sink.text;
}

struct TestEngine {
  CountingAllocator allocator_;
  spki_engine engine_;

  TestEngine() { EXPECT_EQ(0, spki_engine_start(&engine_, &allocator_.record)); }
  TestEngine(const TestEngine&) = delete;
  ~TestEngine() {
    for (spki_elem* list : lists_) spki_elem_release(&engine_, list);
    size_t free_records = 0;
    for (auto* a = engine_.free_atoms; a != nullptr; a = a->link) ++free_records;
    for (auto* e = engine_.free_elems; e != nullptr; e = e->link) ++free_records;
    for (auto* t = engine_.free_tuples; t != nullptr; t = t->link) {
      free_records += spki_block_cost(sizeof(spki_tuple));
    }
    EXPECT_EQ(free_records, engine_.budget.live_records) << "a reference was not released";
    spki_engine_stop(&engine_, &allocator_.record);
    EXPECT_EQ(0, allocator_.live);
  }

  // What is parsed lives as long as the engine.
  spki_status TryParse(const std::string& canonical, spki_elem** list) {
    const std::string& kept = buffers_.emplace_back(canonical);
    const auto* start = reinterpret_cast<const unsigned char*>(kept.data());
    spki_input input = {start, start, start + kept.size()};
    const spki_status status = spki_parse_list(&engine_, list, &input);
    Keep(*list);
    return status;
  }
  spki_elem* Parse(const std::string& canonical) {
    spki_elem* list = nullptr;
    EXPECT_EQ(0, TryParse(canonical, &list)) << canonical;
    return list;
  }
  spki_elem* Chain(const std::string& text) { return Parse(Canonical(text)); }
  // Elements as they stand inside a list.
  spki_elem* Elem(const std::string& text) { return Chain("(x " + text + ")")->next; }
  spki_atom* Atom(const std::string& text) { return Elem(text)->value.atom; }

  spki_elem* Keep(spki_elem* list) {
    if (list != nullptr) lists_.push_back(list);
    return list;
  }
  // The text of a new list, which is released; "nothing" for null.
  std::string Consume(spki_elem* list) { return list == nullptr ? "nothing" : Text(Keep(list)); }

 private:
  std::deque<std::string> buffers_;
  std::vector<spki_elem*> lists_;
};

class EngineTest : public testing::Test, protected TestEngine {};

}  // namespace ZvVesk2::Engine

#endif  // VESK2_TESTS_ENGINE_ENGINE_FIXTURE_H
