// Values by digest. A derived tag may hold the same part many times over, each nesting doubling it,
// so what is walked through is charged piece by piece: written out, such a tag has no end.
#include "src/engine/value.h"

#include "src/engine/budget.h"
#include "src/engine/write.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// Bytes that cost one comparison.
constexpr size_t kBytesPerStep = 64;

class ChargeSink final : public spki_sink {
 public:
  explicit ChargeSink(spki_engine* engine) : engine_(engine) {}

  spki_status Put(const void* /*data*/, size_t length) override {
    const auto cost = static_cast<uint32_t>(1 + length / kBytesPerStep);
    return spki_charge(engine_, &spki_budget::comparisons, cost, Limits::kMaxComparisons);
  }

 private:
  spki_engine* engine_;
};

// Neither form begins with the mark of an absent one, and both say where they end.
spki_status PutAtom(const spki_atom* atom, spki_sink* sink) {
  return atom == nullptr ? sink->Put("-", 1) : spki_write_atom(atom, sink);
}
spki_status PutChain(const spki_elem* chain, spki_sink* sink) {
  return chain == nullptr ? sink->Put("-", 1) : spki_write_pieces(chain, sink);
}

spki_status PutName(const spki_principal* principal, const spki_atom* name, spki_sink* sink) {
  VESK2_TRY(sink->Put(principal->digest, sizeof principal->digest));
  return PutAtom(name, sink);
}

spki_status PutTuple(const spki_tuple* tuple, spki_sink* sink) {
  VESK2_TRY(PutAtom(tuple->issuer_name, sink));
  VESK2_TRY(PutAtom(tuple->subject_name, sink));
  VESK2_TRY(PutChain(tuple->name_rest, sink));
  VESK2_TRY(PutChain(tuple->subject_list, sink));
  VESK2_TRY(PutChain(tuple->tag, sink));
  VESK2_TRY(PutAtom(tuple->not_before, sink));
  return PutAtom(tuple->not_after, sink);
}

}  // namespace

spki_status spki_name_value(spki_engine* engine, const spki_principal* principal,
                            const spki_atom* name, unsigned char (&out)[kSpkiDigestSize]) {
  ChargeSink cost(engine);
  VESK2_TRY(PutName(principal, name, &cost));
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA256));
  VESK2_TRY(PutName(principal, name, &sink));
  return spki_digest_finish(&sink.digest, out);
}

spki_status spki_tuple_charge(spki_engine* engine, const spki_tuple* tuple) {
  ChargeSink cost(engine);
  return PutTuple(tuple, &cost);
}

spki_status spki_tuple_value(spki_engine* engine, spki_tuple* tuple) {
  if (tuple->valued) return 0;
  spki_digest_sink sink;
  VESK2_TRY(spki_digest_start(engine, &sink.digest, ZVCLM_HASH_SHA256));
  VESK2_TRY(PutTuple(tuple, &sink));
  VESK2_TRY(spki_digest_finish(&sink.digest, tuple->value));
  tuple->valued = true;
  return 0;
}

}  // namespace ZvVesk2::Engine
