// SPDX-License-Identifier: Apache-2.0
// Values by digest. A derived tag may hold the same part many times over, each nesting doubling it,
// so what is walked through is charged piece by piece: written out, such a tag has no end.
#include "src/engine/value.h"

#include <cstring>

#include "src/engine/write.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// Without the cache: the digest of every byte of the chain, paid by the piece.
[[nodiscard]] spki_status DigestChain(spki_engine* engine, const spki_elem* chain, Digest& out) {
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA256));
  VESK2_TRY(spki_write_pieces(chain, &sink));
  return spki_digest_finish(&sink.digest, out);
}

// Says what stands where: neither a string nor a value begins with the mark of an absent one.
[[nodiscard]] spki_status PutAtom(const spki_atom* atom, spki_sink* sink) {
  return atom == nullptr ? sink->Put("-", 1) : spki_write_atom(atom, sink);
}
[[nodiscard]] spki_status PutChain(spki_engine* engine, spki_elem* chain, spki_sink* sink) {
  if (chain == nullptr) return sink->Put("-", 1);
  Digest value;
  VESK2_TRY(spki_chain_value(engine, chain, value));
  VESK2_TRY(sink->Put("+", 1));
  return sink->Put(value, sizeof value);
}

// What of a tuple is no text. Principals and thresholds are told apart by where they are: both live
// as long as the table of values, so no address comes twice.
struct Identity {
  const void* issuer;
  const void* subject;
  const void* threshold;
  int32_t member;
  uint32_t flags;
};

}  // namespace

spki_status spki_chain_value(spki_engine* engine, spki_elem* chain, Digest& out) {
  if (chain->digest == nullptr) {
    VESK2_TRY(DigestChain(engine, chain, out));
    chain->digest = static_cast<unsigned char*>(spki_allocate(engine, sizeof out));
    VESK2_REQUIRE(chain->digest != nullptr, SPKI_ERR_NO_MEM);
    std::memcpy(chain->digest, out, sizeof out);
  }
  std::memcpy(out, chain->digest, sizeof out);
  return 0;
}

// The principal's digest has a fixed size, so the name behind it needs no mark of its own: no two
// pairs have the same text.
spki_status spki_name_value(spki_engine* engine, const spki_principal* principal,
                            const spki_atom* name, Digest& out) {
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA256));
  VESK2_TRY(sink.Put(principal->digest, sizeof principal->digest));
  VESK2_TRY(PutAtom(name, &sink));
  return spki_digest_finish(&sink.digest, out);
}

// Stands in one table with the values of tuples, and begins with another word.
spki_status spki_definition_value(spki_engine* engine, const Digest& name,
                                  const spki_principal* subject, Digest& out) {
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA256));
  VESK2_TRY(sink.Put("name", 4));
  VESK2_TRY(sink.Put(name, sizeof name));
  VESK2_TRY(sink.Put(subject->digest, sizeof subject->digest));
  return spki_digest_finish(&sink.digest, out);
}

spki_status spki_string_value(spki_engine* engine, const spki_atom* string, Digest& out) {
  size_t end = string->length;
  if (const void* zero = end == 0 ? nullptr : std::memchr(string->data, 0, end)) {
    end = static_cast<size_t>(static_cast<const unsigned char*>(zero) - string->data);
  }
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA256));
  VESK2_TRY(sink.Put(&string->hint_length, sizeof string->hint_length));
  VESK2_TRY(sink.Put(string->hint, string->hint_length));
  VESK2_TRY(sink.Put(string->data, end));
  return spki_digest_finish(&sink.digest, out);
}

// Every field takes part, in a fixed order, and none can be taken for its neighbour: a null is "-",
// a string begins with a digit or "[", a list's digest with "+".
spki_status spki_tuple_value(spki_engine* engine, const spki_tuple* tuple, Digest& out) {
  const Identity identity = {tuple->issuer, tuple->subject, tuple->threshold, tuple->member,
                             (tuple->reaches ? 2u : 0u) | (tuple->propagate ? 1u : 0u)};
  static_assert(sizeof identity == 3 * sizeof(void*) + 8, "no byte without a meaning");
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA256));
  VESK2_TRY(sink.Put("tuple", 5));
  VESK2_TRY(sink.Put(&identity, sizeof identity));
  for (const spki_atom* atom : {tuple->issuer_name, tuple->subject_name}) {
    VESK2_TRY(PutAtom(atom, &sink));
  }
  for (spki_elem* chain : {tuple->name_rest, tuple->subject_list, tuple->tag}) {
    VESK2_TRY(PutChain(engine, chain, &sink));
  }
  for (const spki_atom* atom : {tuple->not_before, tuple->not_after}) {
    VESK2_TRY(PutAtom(atom, &sink));
  }
  return spki_digest_finish(&sink.digest, out);
}

}  // namespace ZvVesk2::Engine
