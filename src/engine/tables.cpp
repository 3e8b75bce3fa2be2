// The chains of the engine's tables. They grow at the front, so that whoever walks one may go on
// while others add to it.
#include <cstring>

#include "src/engine/budget.h"
#include "src/engine/tuple.h"

namespace ZvVesk2::Engine {
namespace {

void ReleasePrincipal(spki_engine* engine, spki_principal* principal) {
  if (principal == nullptr || --principal->refcount > 0) return;
  spki_entries_clear(engine, &principal->issued);
  spki_entries_clear(engine, &principal->received);
  spki_elem_release(engine, principal->key);
  spki_free(engine, principal);
}

}  // namespace

spki_bucket_entry* spki_entry_find(spki_engine* engine, spki_bucket_entry* chain,
                                   const unsigned char (&digest)[kSpkiDigestSize]) {
  for (; chain != nullptr; chain = chain->next) {
    if (spki_charge_step(engine) != 0) return nullptr;
    if (std::memcmp(chain->digest, digest, sizeof chain->digest) == 0) return chain;
  }
  return nullptr;
}

spki_bucket_entry* spki_entry_push(spki_engine* engine, spki_bucket_entry** chain) {
  auto* entry = static_cast<spki_bucket_entry*>(spki_allocate(engine, sizeof(spki_bucket_entry)));
  if (entry == nullptr) return nullptr;
  *entry = {};
  entry->next = *chain;
  *chain = entry;
  return entry;
}

void spki_entries_clear(spki_engine* engine, spki_bucket_entry** chain) {
  while (spki_bucket_entry* entry = *chain) {
    *chain = entry->next;
    ReleasePrincipal(engine, entry->principal);
    spki_tuple_release(engine, entry->tuple);
    spki_free(engine, entry);
  }
}

}  // namespace ZvVesk2::Engine
