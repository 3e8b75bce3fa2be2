// Values by digest. A derived tag may hold the same part many times over, each nesting doubling it,
// so what is fed is charged piece by piece: written out, such a tag has no end.
#include "src/engine/value.h"

#include "src/engine/budget.h"
#include "src/engine/write.h"
#include "src/frame/check.h"

namespace ZvVesk2::Engine {
namespace {

// Bytes that cost one comparison.
constexpr size_t kBytesPerStep = 64;

class ChargedDigest final : public spki_sink {
 public:
  explicit ChargedDigest(spki_engine* engine) : engine_(engine) {}

  spki_status Start() { return spki_digest_start(engine_, &digest_, ZVCLM_HASH_SHA256); }
  spki_status Put(const void* data, size_t length) override {
    const auto cost = static_cast<uint32_t>(1 + length / kBytesPerStep);
    VESK2_TRY(spki_charge(engine_, &spki_budget::comparisons, cost, Limits::kMaxComparisons));
    return spki_digest_update(&digest_, data, length);
  }
  // Neither form begins with the mark of an absent one, and both say where they end.
  spki_status PutAtom(const spki_atom* atom) {
    return atom == nullptr ? Put("-", 1) : spki_write_atom(atom, this);
  }
  spki_status PutChain(const spki_elem* chain) {
    return chain == nullptr ? Put("-", 1) : spki_write_pieces(chain, this);
  }
  spki_status Finish(unsigned char (&out)[kSpkiDigestSize]) {
    return spki_digest_finish(&digest_, out);
  }

 private:
  spki_engine* engine_;
  spki_digest digest_;
};

}  // namespace

spki_status spki_name_value(spki_engine* engine, const spki_principal* principal,
                            const spki_atom* name, unsigned char (&out)[kSpkiDigestSize]) {
  ChargedDigest digest(engine);
  VESK2_TRY(digest.Start());
  VESK2_TRY(digest.Put(principal->digest, sizeof principal->digest));
  VESK2_TRY(digest.PutAtom(name));
  return digest.Finish(out);
}

spki_status spki_tuple_value(spki_engine* engine, const spki_tuple* tuple,
                             unsigned char (&out)[kSpkiDigestSize]) {
  ChargedDigest digest(engine);
  VESK2_TRY(digest.Start());
  VESK2_TRY(digest.PutAtom(tuple->issuer_name));
  VESK2_TRY(digest.PutAtom(tuple->subject_name));
  VESK2_TRY(digest.PutChain(tuple->name_rest));
  VESK2_TRY(digest.PutChain(tuple->subject_list));
  VESK2_TRY(digest.PutChain(tuple->tag));
  VESK2_TRY(digest.PutAtom(tuple->not_before));
  VESK2_TRY(digest.PutAtom(tuple->not_after));
  return digest.Finish(out);
}

}  // namespace ZvVesk2::Engine
