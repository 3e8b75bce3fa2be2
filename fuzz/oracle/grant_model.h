// SPDX-License-Identifier: Apache-2.0
// A small world of keys, names, entries and certificates, made of the input, and who is granted
// what in it: a fixpoint over one request at one moment, plain and slow, that shares nothing with
// the engine.
#ifndef VESK2_FUZZ_GRANT_MODEL_H
#define VESK2_FUZZ_GRANT_MODEL_H

#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include "fuzz/tag_model.h"

namespace vesk2fuzz {

inline constexpr int kKeys = 4;
inline constexpr int kDates = 4;

// A key, k of n of such subjects, or what names mean, the first of them below a key.
struct Grantee {
  int key = 0;             // -1: the issuer's names
  unsigned form = 0;       // how the key is written: as it is, or as one of two digests
  std::vector<int> names;  // none: the key itself
  unsigned k = 0;          // of `members`; 0: no threshold
  std::vector<Grantee> members;
};

struct Credential {
  int issuer = -1;  // -1: an ACL entry
  unsigned form = 0;
  int issuer_name = -1;  // what it defines; -1: it grants
  Grantee subject;
  bool propagate = false;
  int tag = -1;               // of the world's; -1: none
  int from = -1, until = -1;  // dates; -1: none
};

struct World {
  std::vector<TagTree> tags;
  std::vector<Credential> credentials;
  int requester = 0;
  int keys = kKeys;
};
World MakeWorld(Choices& choices);

// Canonical texts; every key of the world is in the sequence, so that digests of it are known.
std::string KeyText(int key, unsigned form);
std::string DateText(int date);
std::string AclText(const World& world);
std::string SequenceText(const World& world);

// Whether the requester is granted `request` at a date. What has no tag grants everything.
bool IsGranted(const World& world, const TagTree& request, int date);

}  // namespace vesk2fuzz

#endif  // VESK2_FUZZ_GRANT_MODEL_H
