// SPDX-License-Identifier: Apache-2.0
// Tags as a plain tree, what each allows by a definition that is as short as it can be, and random
// tags and requests. Nothing here comes from the engine: it is what the engine is compared with.
#ifndef VESK2_FUZZ_TAG_MODEL_H
#define VESK2_FUZZ_TAG_MODEL_H

#include <span>
#include <string>
#include <vector>

#include "fuzz/fuzz_support.h"

namespace vesk2fuzz {

struct TagTree {
  enum Kind { kWord, kList, kAll, kSet, kPrefix, kRange } kind = kWord;
  std::string word;            // a word, what a prefix begins with, or the ordering of a range
  std::vector<TagTree> items;  // of a list (the head is a word) or a set
  struct Bound {
    std::string op, value;
  };
  std::vector<Bound> bounds;
};

std::string Canonical(const TagTree& tag);
// Whether it allows a request, which holds words and lists only.
bool Allows(const TagTree& tag, const TagTree& request);
// Whether an intersection of some of the tags must allow all that each of them allows. Sets are
// judged more strictly than their members, and what mixes orderings shares nothing.
bool IsExact(std::span<const TagTree> tags);

// A tag of that many levels, as it stands in a credential: a list headed by "tag".
TagTree MakeWholeTag(Choices& choices, int depth);
// A request that the tag may allow.
TagTree MakeRequest(Choices& choices, const TagTree& tag);
// The request with lists that are longer than those of any tag made here. A list is wider than what
// it begins; now a tag allows the request or has nothing in common with it.
TagTree Lengthened(TagTree request);

}  // namespace vesk2fuzz

#endif  // VESK2_FUZZ_TAG_MODEL_H
