// SPDX-License-Identifier: Apache-2.0
// ACL entries, and the words in which they are shown.
#include "fuzz/round_trip.h"

using namespace ZvVesk2;
using namespace vesk2fuzz;

FUZZ_TARGET(acl_entry) {
  Ref<AclEntry> entry;
  if (!RoundTrip<AclEntry>(input, entry)) return;
  FUZZ_CHECK(entry->GetSubject() != nullptr && entry->GetTag() != nullptr);
  const Text words(Wording::OfEntry(entry.get()));
  for (const char* c = words.get(); c != nullptr && *c != '\0'; ++c) {
    FUZZ_CHECK(*c >= ' ' && *c <= '~');  // safe for a terminal
  }
}
