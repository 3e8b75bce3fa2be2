// SPDX-License-Identifier: Apache-2.0
// The way out of the engine. Measuring and writing are two walks of the one canonical writer, so
// they cannot disagree.
#include <cstring>

#include "src/engine/interface/interface.h"
#include "src/engine/write.h"

namespace ZvVesk2::Engine {
namespace {

// Ends the walk once the length is past what a result may have: a derived tag may share its parts,
// and written out have more bytes than there are.
struct LengthSink final : spki_sink {
  uint64_t length = 0;

  [[nodiscard]] spki_status Put(const void* /*data*/, size_t size) override {
    length += size;
    return length > Limits::kMaxResult ? SPKI_ERR_NO_MEM : 0;
  }
};

// Takes every piece: the room was measured by the same walk.
struct MemorySink final : spki_sink {
  unsigned char* cursor;

  explicit MemorySink(unsigned char* start) : cursor(start) {}
  [[nodiscard]] spki_status Put(const void* data, size_t size) override {
    std::memcpy(cursor, data, size);
    cursor += size;
    return 0;
  }
};

}  // namespace

uint64_t spki_canonical_length(const spki_elem* chain) {
  LengthSink sink;
  (void)spki_write_pieces(chain, &sink);
  return sink.length;
}

void spki_write_chain(const spki_elem* chain, unsigned char** cursor) {
  MemorySink sink(*cursor);
  (void)spki_write_pieces(chain, &sink);
  *cursor = sink.cursor;
}

}  // namespace ZvVesk2::Engine
