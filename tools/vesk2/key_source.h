// key_source.h: public keys named by where they stand: the issuer or subject of a certificate in a
// chain, a manifest or a revocation list, so that nobody has to extract a key to trust it.
#ifndef VESK2_TOOLS_KEY_SOURCE_H
#define VESK2_TOOLS_KEY_SOURCE_H

#include <string>

#include "tools/vesk2/objects.h"

namespace vesk2_command {

// FILE or FILE:N. `number` counts from 1; 0 when none was given.
struct Place {
  std::string path;
  size_t number = 0;
};
Place ParsePlace(const std::string& argument);

// ReadKeyOf reads the issuer or the subject of the N-th certificate of FILE[:N]: by default of the
// last for an issuer, where a chain has its root, and of the first for a subject. Trouble when it
// is no key.
Ref<PublicKey> ReadKeyOf(const std::string& argument, bool issuer);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_KEY_SOURCE_H
