// SPDX-License-Identifier: Apache-2.0
// objects.h: the library's objects as the command handles them: read from files with an error line
// that names file and byte, built from arguments, turned into text.
//
// Every object is made without a context (null), which the library accepts everywhere.
#ifndef VESK2_TOOLS_OBJECTS_H
#define VESK2_TOOLS_OBJECTS_H

#include <cstdio>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include <vesk2/hash.h>
#include <vesk2/public_key.h>
#include <vesk2/ref.h>
#include <vesk2/subject.h>

namespace vesk2_command {

using ZvVesk2::ByteString;
using ZvVesk2::DExpression;
using ZvVesk2::PublicKey;
using ZvVesk2::Ref;
using ZvVesk2::SExpression;
using ZvVesk2::ZvBuffer;

struct FreeBuffer {
  void operator()(ZvBuffer* buffer) const { ZVsysutil::zv_buffer_free(buffer); }
};
using Buffer = std::unique_ptr<ZvBuffer, FreeBuffer>;

struct FreeText {
  void operator()(char* text) const { Vesk2Free(text); }
};
using Text = std::unique_ptr<char, FreeText>;

// OpenBuffer reads a file for the library's readers. Trouble says why it cannot be read.
Buffer OpenBuffer(const std::string& path);
Buffer WrapBytes(std::string_view bytes);

// Check throws Trouble "what: reason" unless `code` is 0.
void Check(int code, const std::string& what);
// Malformed throws the line for a file that a reader refused at a byte.
[[noreturn]] void Malformed(const std::string& path, size_t offset, const std::string& kind,
                            int code);

// The bytes of a byte string, borrowed.
inline std::string_view BytesOf(const ByteString& word) {
  return {reinterpret_cast<const char*>(word.GetData()), word.GetLength()};
}

// A new string from new[], for the setters that adopt one.
char* NewText(const std::string& text);

// Append shares an item with a list; ListOf makes a list of such, behind `keyword` when there is
// one.
void Append(SExpression& list, DExpression& item);
Ref<SExpression> ListOf(const std::vector<DExpression*>& items, const char* keyword = nullptr);
// ItemsOf are the items of a list that are of one class; none of null. They stay the list's.
template <typename Class>
std::vector<Class*> ItemsOf(const SExpression* list) {
  std::vector<Class*> items;
  if (list == nullptr) return items;
  for (auto it = list->Begin(); it; it.Next()) {
    if (auto* const item = dynamic_cast<Class*>(it.Value())) items.push_back(item);
  }
  return items;
}
// Those whom a k-of-n counts; they stay its own.
std::vector<ZvVesk2::Subject*> MembersOf(ZvVesk2::ThresholdSubject& several);

// What a writer of the library writes.
std::string Written(const std::function<int(FILE*)>& write);
// The canonical encoding with display hints, as a file holds it.
std::string Canonical(DExpression& expression);
// A hash that is known, and that of a canonical encoding.
Ref<ZvVesk2::Hash> MakeHash(ZvclmHashID id, std::string_view digest);
Ref<ZvVesk2::Hash> HashOf(DExpression& object, ZvclmHashID id, bool ignoreHints = false);
// "sha256:" and the digest of the canonical form without hints: the identity of a key.
std::string Fingerprint(DExpression& expression);
// The advanced text of a list, escaped, with all of words that hold a 0 byte; what follows the
// keyword when there is one and the list is headed by it, else the whole.
std::string AdvancedText(SExpression& list, const std::string& keyword = "");
// That of a tag's body: "(install (app calc))".
std::string TagText(SExpression* tag);

// ParseTag reads the body of a tag in advanced form. Trouble for what the library's reader refuses,
// for an empty tag, and for empty words: the reduction cannot read those, and one such entry in the
// ACL store would stop every verification. The result is headed by `keyword`.
Ref<SExpression> ParseTag(const std::string& text, const char* keyword = "tag");
// The same of a tag that a person typed, where what is well-formed is likely to be meant otherwise:
// quotes (the advanced form has none), a bare "*" and unknown forms of it.
Ref<SExpression> ParseTypedTag(const std::string& text);
// A byte string, null for an empty text.
Ref<ByteString> MakeText(const std::string& text);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_OBJECTS_H
