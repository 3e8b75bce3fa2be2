// SPDX-License-Identifier: Apache-2.0
// request.cpp: taking requested sets apart.
#include "tools/vesk2/objects/request.h"

#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

constexpr size_t kMaxMembers = 64;
using Texts = std::vector<std::string>;

std::string Word(const ByteString& word) {
  return {reinterpret_cast<const char*>(word.GetData()), word.GetLength()};
}

// Whether a list is (* set ...) with at least one member.
bool IsSet(const SExpression& list) {
  auto it = list.Begin();
  for (const char* expected : {"*", "set"}) {
    const auto* word = it ? dynamic_cast<ByteString*>(it.Value()) : nullptr;
    if (word == nullptr || !word->IsEqual(expected)) return false;
    it.Next();
  }
  return static_cast<bool>(it);
}

void RequireFew(size_t count) {
  if (count <= kMaxMembers) return;
  throw Trouble("the requested sets have more than " + std::to_string(kMaxMembers) +
                " members; ask for fewer at a time");
}

Texts Alternatives(DExpression& element);

// Every choice of one alternative for each element from `it` on.
Texts Choices(SExpression::Iterator it) {
  Texts lines = {""};
  for (; it; it.Next()) {
    const Texts choices = Alternatives(*it.Value());
    RequireFew(lines.size() * choices.size());
    Texts longer;
    for (const std::string& line : lines) {
      for (const std::string& choice : choices) {
        longer.push_back(line.empty() ? choice : line + " " + choice);
      }
    }
    lines = std::move(longer);
  }
  return lines;
}

// The members of a set, or what a list or word itself can stand for, as text.
Texts Alternatives(DExpression& element) {
  if (const auto* word = dynamic_cast<ByteString*>(&element)) return {Word(*word)};
  const auto& list = dynamic_cast<SExpression&>(element);
  auto it = list.Begin();
  if (!IsSet(list)) {
    Texts lines = Choices(it);
    for (std::string& line : lines) line = "(" + line + ")";
    return lines;
  }
  it.Next();
  Texts members;
  for (it.Next(); it; it.Next()) {
    for (std::string& each : Alternatives(*it.Value())) members.push_back(std::move(each));
    RequireFew(members.size());
  }
  return members;
}

// A tag's text, if `parse` reads it back.
std::string ReadBack(SExpression* tag, Ref<SExpression> (*parse)(const std::string&)) {
  if (tag == nullptr) return "";
  const Text text(tag->ExportTag("tag"));
  if (!text) return "";
  try {
    return parse(text.get())->IsEqual(tag) ? text.get() : "";
  } catch (const Trouble&) {
    return "";
  }
}

}  // namespace

Request ParseRequest(const std::string& text) {
  Request request{text, ParseTag(text), {}};
  auto body = request.tag->Begin();
  body.Next();  // the keyword
  for (const std::string& member : Choices(body)) {
    request.members.push_back({ParseTag(member), member});
  }
  return request;
}

Ref<SExpression> MemberList(const Request& request) {
  std::vector<DExpression*> tags;
  for (const Request::Member& member : request.members) tags.push_back(member.tag.get());
  return ListOf(tags);
}

void NoteMeantRequest(const Request& request) {
  const std::string why = WhyNotOneList(*request.tag, request.text);
  if (!why.empty()) Note(why);
}

void TellMember(const Request& request, size_t index, int code) {
  if (request.members.size() < 2) return;
  const std::string tag = Escape(request.members[index].text);
  Say(VerdictPrefix() + "member " + tag + ": " + (code == 0 ? "yes" : "no: " + Reason(code)));
  Result()["members"].push_back({{"tag", tag},
                                 {"verdict", code == 0 ? "yes" : "no"},
                                 {"reason", ReasonWord(code)},
                                 {"code", code}});
}

std::string ReadableTag(SExpression* tag) { return ReadBack(tag, ParseTypedTag); }
std::string IssuableTag(SExpression* tag) { return ReadBack(tag, ParseIssuedTag); }

}  // namespace vesk2_command
