// Digests that stand for values: what a name is filed under, and what makes two tuples equal.
#ifndef VESK2_SRC_ENGINE_VALUE_H
#define VESK2_SRC_ENGINE_VALUE_H

#include "src/engine/tuple.h"

namespace ZvVesk2::Engine {

// The SHA-256 of the principal's digest and the canonical name.
spki_status spki_name_value(spki_engine* engine, const spki_principal* principal,
                            const spki_atom* name, unsigned char (&out)[kSpkiDigestSize]);
// Charges the walk through a tuple's lists and strings: what its value costs, once or never made.
spki_status spki_tuple_charge(spki_engine* engine, const spki_tuple* tuple);
// Makes `tuple->value`, the SHA-256 of a charged tuple's lists and strings, each absent one marked,
// unless it is there.
spki_status spki_tuple_value(spki_engine* engine, spki_tuple* tuple);

}  // namespace ZvVesk2::Engine

#endif  // VESK2_SRC_ENGINE_VALUE_H
