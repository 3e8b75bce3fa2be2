// SPDX-License-Identifier: Apache-2.0
#include "fuzz/tag_model.h"

#include <algorithm>
#include <iterator>
#include <set>

namespace vesk2fuzz {
namespace {

// Words of every ordering, some of them just not valid, and some that are keywords.
constexpr const char* kWords[] = {
    "a",          "b",
    "ab",         "abb",
    "aba",        "x",
    "b\xff",      "\xff\xff",
    "tag",        "name",
    "0",          "5",
    "-5",         "+5",
    "-0",         "-",
    "10",         "24",
    "07",         "10:30",
    "10:61",      "2010",
    "2010-02",    "2010-02-28",
    "2010-02-29", "2012-02-29",
    "2010-03-15", "2010-02-28_23",
    "2010-04-31", "2010-12-31_23:59:59",
};
constexpr const char* kOrderings[] = {"alpha", "numeric", "date", "time", "binary", "other"};
constexpr const char* kOperators[] = {"g", "ge", "l", "le", "x"};

std::string AnyWord(Choices& choices) { return kWords[choices.Below(std::size(kWords))]; }

// A lone sign is a number, and 007 is none.
bool IsNumber(std::string value) {
  if (value.starts_with('+') || value.starts_with('-')) value.erase(0, 1);
  const bool digits = value.find_first_not_of("0123456789") == value.npos;
  return digits && (value.size() < 2 || value[0] != '0');
}

// The numbers of a value that has the form of the beginning of `form`, up to a field's end.
std::vector<int> Fields(const std::string& value, std::string_view form) {
  if (value.size() > form.size()) return {};
  if (value.size() < form.size() && form[value.size()] == '#') return {};
  std::vector<int> fields;
  for (size_t i = 0; i < value.size(); ++i) {
    const bool digit = value[i] >= '0' && value[i] <= '9';
    if (form[i] == '#' ? !digit : value[i] != form[i]) return {};
    if (form[i] != '#') continue;
    if (i == 0 || form[i - 1] != '#') fields.push_back(0);
    fields.back() = fields.back() * 10 + value[i] - '0';
  }
  return fields;
}

// A day of March has never been a date here.
bool IsDate(const std::string& value) {
  std::vector<int> f = Fields(value, "####-##-##_##:##:##");
  const size_t count = f.size();
  if (count == 0) return false;
  f.resize(6);
  const bool leap = f[0] % 4 == 0 && (f[0] % 100 != 0 || f[0] % 400 == 0);
  const int days[] = {31, leap ? 29 : 28, 0, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  if (count >= 2 && (f[1] < 1 || f[1] > 12)) return false;
  if (count >= 3 && (f[2] < 1 || f[2] > days[f[1] - 1])) return false;
  return f[3] < 24 && f[4] < 60 && f[5] < 60;
}

bool IsTime(const std::string& value) {
  std::vector<int> f = Fields(value, "##:##:##");
  if (f.empty()) return false;
  f.resize(3);
  return f[0] < 24 && f[1] < 60 && f[2] < 60;
}

bool IsValid(const std::string& value, const std::string& ordering) {
  if (ordering == "numeric") return IsNumber(value);
  if (ordering == "date") return IsDate(value);
  if (ordering == "time") return IsTime(value);
  return ordering == "alpha" || ordering == "binary";
}

int Sign(int order) { return (order > 0) - (order < 0); }

// Numbers without leading zeros: a longer one is larger. Minus nothing is less than nothing.
int CompareNumbers(std::string a, std::string b) {
  const bool a_minus = a[0] == '-', b_minus = b[0] == '-';
  if (a_minus != b_minus) return a_minus ? -1 : 1;
  for (std::string* number : {&a, &b}) {
    number->erase(0, std::min(number->find_first_not_of("+-"), number->size()));
    number->erase(0, std::min(number->find_first_not_of('0'), number->size()));
  }
  const int order = a.size() != b.size() ? (a.size() < b.size() ? -1 : 1) : Sign(a.compare(b));
  return a_minus ? -order : order;
}

int Compare(const std::string& a, const std::string& b, const std::string& ordering) {
  if (ordering == "numeric") return CompareNumbers(a, b);
  if (ordering == "binary" && a.size() != b.size()) return a.size() < b.size() ? -1 : 1;
  return Sign(a.compare(b));
}

bool Holds(const TagTree::Bound& bound, const std::string& value, const std::string& ordering) {
  if (!IsValid(bound.value, ordering)) return false;
  const int order = Compare(value, bound.value, ordering);
  if (bound.op == "g") return order > 0;
  if (bound.op == "ge") return order >= 0;
  if (bound.op == "l") return order < 0;
  return bound.op == "le" && order <= 0;
}

bool InRange(const TagTree& range, const std::string& value) {
  if (!IsValid(value, range.word)) return false;
  return std::ranges::all_of(
      range.bounds, [&](const TagTree::Bound& bound) { return Holds(bound, value, range.word); });
}

void Collect(const TagTree& tag, std::set<std::string>& forms) {
  if (tag.kind == TagTree::kSet) forms.insert("set");
  if (tag.kind == TagTree::kPrefix) forms.insert("alpha");
  if (tag.kind == TagTree::kRange) forms.insert(tag.word);
  for (const TagTree& item : tag.items) Collect(item, forms);
}

TagTree WordTag(std::string word) { return {TagTree::kWord, std::move(word), {}, {}}; }

TagTree AnyRequest(Choices& choices, int depth) {
  if (depth == 0 || !choices.Chance(3)) return WordTag(AnyWord(choices));
  TagTree list{TagTree::kList, "", {WordTag(AnyWord(choices))}, {}};
  for (unsigned n = choices.Below(3); n > 0; --n) {
    list.items.push_back(AnyRequest(choices, depth - 1));
  }
  return list;
}

TagTree MakeTag(Choices& choices, int depth) {
  const unsigned kind = choices.Below(depth == 0 ? 4 : 8);
  TagTree tag;
  if (kind == 1) return {TagTree::kAll, "", {}, {}};
  if (kind == 0 || kind == 2) {
    return {kind == 0 ? TagTree::kWord : TagTree::kPrefix, AnyWord(choices), {}, {}};
  }
  if (kind == 3) {
    tag = {TagTree::kRange, kOrderings[choices.Below(std::size(kOrderings))], {}, {}};
    for (unsigned n = choices.Below(4); n > 0; --n) {
      const unsigned op = choices.Below(std::size(kOperators));
      tag.bounds.push_back({kOperators[op], AnyWord(choices)});
    }
    return tag;
  }
  if (kind == 4) {
    tag.kind = TagTree::kSet;
  } else {
    tag = {TagTree::kList, "", {WordTag(AnyWord(choices))}, {}};
  }
  for (unsigned n = choices.Below(4); n > 0; --n) {
    tag.items.push_back(MakeTag(choices, depth - 1));
  }
  return tag;
}

}  // namespace

std::string Canonical(const TagTree& tag) {
  if (tag.kind == TagTree::kWord) return Token(tag.word);
  if (tag.kind == TagTree::kAll) return "(1:*)";
  if (tag.kind == TagTree::kPrefix) return "(1:*6:prefix" + Token(tag.word) + ")";
  std::string out = tag.kind == TagTree::kList ? "(" : "(1:*3:set";
  if (tag.kind == TagTree::kRange) out = "(1:*5:range" + Token(tag.word);
  for (const TagTree& item : tag.items) out += Canonical(item);
  for (const auto& [op, value] : tag.bounds) out += "(" + Token(op) + Token(value) + ")";
  return out + ")";
}

bool Allows(const TagTree& tag, const TagTree& request) {
  const bool word = request.kind == TagTree::kWord;
  switch (tag.kind) {
    case TagTree::kAll:
      return true;
    case TagTree::kSet:
      return std::ranges::any_of(tag.items,
                                 [&](const TagTree& item) { return Allows(item, request); });
    case TagTree::kWord:
      return word && tag.word == request.word;
    case TagTree::kPrefix:
      return word && request.word.starts_with(tag.word);
    case TagTree::kRange:
      return word && InRange(tag, request.word);
    default:
      break;
  }
  if (word || request.items.size() < tag.items.size()) return false;
  for (size_t i = 0; i < tag.items.size(); ++i) {
    if (!Allows(tag.items[i], request.items[i])) return false;
  }
  return true;
}

bool IsExact(std::span<const TagTree> tags) {
  std::set<std::string> forms;
  for (const TagTree& tag : tags) Collect(tag, forms);
  return !forms.contains("set") && forms.size() <= 1;
}

TagTree MakeWholeTag(Choices& choices, int depth) {
  TagTree tag{TagTree::kList, "", {WordTag("tag")}, {}};
  for (unsigned n = choices.Below(3); n > 0; --n) tag.items.push_back(MakeTag(choices, depth));
  return tag;
}

TagTree MakeRequest(Choices& choices, const TagTree& tag) {
  switch (tag.kind) {
    case TagTree::kWord:
      return tag;
    case TagTree::kPrefix:
      return WordTag(tag.word + (choices.Chance(2) ? AnyWord(choices) : ""));
    case TagTree::kRange:
      return WordTag(choices.Chance(2) && !tag.bounds.empty() ? tag.bounds[0].value
                                                              : AnyWord(choices));
    case TagTree::kSet:
      if (!tag.items.empty()) {
        return MakeRequest(choices,
                           tag.items[choices.Below(static_cast<unsigned>(tag.items.size()))]);
      }
      break;
    case TagTree::kList: {
      TagTree list{TagTree::kList, "", {}, {}};
      for (const TagTree& item : tag.items) list.items.push_back(MakeRequest(choices, item));
      if (choices.Chance(3)) list.items.push_back(AnyRequest(choices, 1));
      return list;
    }
    default:
      break;
  }
  return AnyRequest(choices, 2);
}

TagTree Lengthened(TagTree request) {
  constexpr size_t kLonger = 5;
  if (request.kind != TagTree::kList) return request;
  for (TagTree& item : request.items) item = Lengthened(std::move(item));
  while (request.items.size() < kLonger) request.items.push_back(WordTag("end"));
  return request;
}

}  // namespace vesk2fuzz
