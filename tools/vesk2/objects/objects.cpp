// SPDX-License-Identifier: Apache-2.0
// objects.cpp: reading, building and printing the library's objects.
#include "tools/vesk2/objects/objects.h"

#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/limits.h>
#include <vesk2/wording.h>

namespace vesk2_command {

using ZvVesk2::Hash;

namespace {

bool HasEmptyWord(const SExpression& list) {
  for (auto it = list.Begin(); it; it.Next()) {
    if (const auto* word = dynamic_cast<ByteString*>(it.Value())) {
      if (word->GetLength() == 0) return true;
    } else if (const auto* nested = dynamic_cast<SExpression*>(it.Value())) {
      if (HasEmptyWord(*nested)) return true;
    }
  }
  return false;
}

std::string WordAt(const SExpression::Iterator& it) {
  const auto* word = it ? dynamic_cast<const ByteString*>(it.Value()) : nullptr;
  if (word == nullptr) return "";
  return {reinterpret_cast<const char*>(word->GetData()), word->GetLength()};
}

// What in a typed tag is likely to be meant otherwise; empty for nothing.
std::string LikelyMistake(const SExpression& list) {
  auto it = list.Begin();
  const bool star = WordAt(it) == "*";
  if (it) it.Next();
  const std::string form = WordAt(it);
  if (star && it && form != "set" && form != "prefix" && form != "range") {
    return "(* " + (form.empty() ? "(" : Escape(form)) +
           " ...) is none of (*), (* set ...), (* prefix ...), (* range ...)";
  }
  for (it = list.Begin(); it; it.Next()) {
    const std::string word = WordAt(it);
    if (word.starts_with('"') || word.starts_with('\'')) {
      return "quotes would belong to the words; leave them out";
    }
    const auto* part = dynamic_cast<SExpression*>(it.Value());
    const std::string inside = part == nullptr ? "" : LikelyMistake(*part);
    if (!inside.empty()) return inside;
  }
  return "";
}

}  // namespace

Buffer OpenBuffer(const std::string& path) {
  if (path == kStandard) return WrapBytes(ReadFile(path, ZvVesk2::Limits::kMaxFile));
  Detail("reads " + Escape(path));
  Buffer buffer(ZVsysutil::zv_buffer_wrap_file(path.c_str()));
  if (!buffer) throw FileTrouble(path, WhyUnreadable(path), "io");
  return buffer;
}

Buffer WrapBytes(std::string_view bytes) {
  Buffer buffer(ZVsysutil::zv_buffer_wrap(bytes.data(), bytes.size()));
  if (!buffer) throw std::bad_alloc();
  return buffer;
}

void Check(int code, const std::string& what) {
  if (code == 0) return;
  Trouble trouble(what + ": " + Reason(code), ReasonWord(code));
  trouble.code = code;
  throw trouble;
}

void Malformed(const std::string& path, size_t offset, const std::string& kind, int code) {
  Trouble trouble = FileTrouble(
      path, "byte " + std::to_string(offset) + ": malformed " + kind + ": " + Reason(code),
      "malformed");
  trouble.code = code;
  trouble.byte = offset;
  throw trouble;
}

char* NewText(const std::string& text) {
  char* copy = new char[text.size() + 1];
  std::memcpy(copy, text.c_str(), text.size() + 1);
  return copy;
}

void Append(SExpression& list, DExpression& item) {
  auto shared = Ref<DExpression>::Share(&item);
  Check(list.Insert(shared.get()), "building a list");
  (void)shared.Release();
}

Ref<SExpression> ListOf(const std::vector<DExpression*>& items, const char* keyword) {
  Ref<SExpression> list(new SExpression(nullptr));
  if (keyword != nullptr) Check(list->Insert(keyword), "building a list");
  for (DExpression* item : items) Append(*list, *item);
  return list;
}

std::vector<ZvVesk2::Subject*> MembersOf(ZvVesk2::ThresholdSubject& several) {
  Ref<SExpression> members;
  Check(several.GetSubjects(members.Out()), "reading a subject");
  return ItemsOf<ZvVesk2::Subject>(members.get());
}

std::string Written(const std::function<int(FILE*)>& write) {
  char* data = nullptr;
  size_t size = 0;
  FILE* stream = open_memstream(&data, &size);
  if (stream == nullptr) throw std::bad_alloc();
  const int code = write(stream);
  const bool closed = std::fclose(stream) == 0;
  const std::unique_ptr<char, decltype(&std::free)> owner(data, &std::free);
  Check(code, "writing an object");
  if (!closed) throw std::bad_alloc();
  return std::string(data, size);
}

std::string Canonical(DExpression& expression) {
  return Written([&](FILE* stream) { return expression.PrintCanonical(stream); });
}

Ref<Hash> MakeHash(ZvclmHashID id, std::string_view digest) {
  Ref<Hash> hash(new Hash(nullptr));
  Check(hash->Init(id), "building a hash");
  auto* const copy = new unsigned char[digest.size()];
  std::memcpy(copy, digest.data(), digest.size());
  const Ref<ByteString> bytes(
      new ByteString(copy, static_cast<unsigned>(digest.size()), ByteString::BsNone, nullptr));
  Append(*hash, *bytes);
  return hash;
}

Ref<Hash> HashOf(DExpression& object, ZvclmHashID id, bool ignoreHints) {
  unsigned char* digest = nullptr;
  unsigned int length = 0;
  Check(object.ComputeHash(digest, length, id, ignoreHints), "hashing");
  const std::unique_ptr<unsigned char[]> owner(digest);
  return MakeHash(id, {reinterpret_cast<char*>(digest), length});
}

std::string Fingerprint(DExpression& expression) {
  return Owned(ZvVesk2::Wording::Fingerprint(&expression));
}

std::string AdvancedText(SExpression& list, const std::string& keyword) {
  if (list.AdvancedLength() > ZvVesk2::Limits::kMaxExport) {
    throw Trouble("an object too large to be written");
  }
  return Owned(ZvVesk2::Wording::OfList(&list, keyword.c_str()));
}

std::string TagText(SExpression* tag) {
  return tag == nullptr ? "everything" : AdvancedText(*tag, "tag");
}

Ref<SExpression> ParseTag(const std::string& text, const char* keyword) {
  const std::string what = "tag \"" + Escape(text) + "\"";
  Ref<SExpression> tag;
  Check(SExpression::ParseTagAdvanced(tag.Out(), text.c_str(), keyword, nullptr), what);
  if (tag->Count() < 2) throw Trouble(what + ": empty; a tag names what is granted");
  if (HasEmptyWord(*tag)) throw Trouble(what + ": every list must begin with a word");
  // What is typed may be longer than what can be read back from a file.
  Ref<SExpression> again;
  const Buffer buffer = WrapBytes(Canonical(*tag));
  Check(SExpression::Import(again.Out(), buffer.get(), nullptr), what);
  return tag;
}

Ref<SExpression> ParseTypedTag(const std::string& text) {
  Ref<SExpression> tag = ParseTag(text);
  const std::string mistake = text == "*" ? "everything is \"(*)\"" : LikelyMistake(*tag);
  if (!mistake.empty()) throw Trouble("tag \"" + Escape(text) + "\": " + mistake, "usage");
  return tag;
}

Ref<ByteString> MakeText(const std::string& text) {
  if (text.empty()) return {};
  Ref<ByteString> bytes(new ByteString(nullptr));
  Check(bytes->Set(text.c_str(), ByteString::BsNone), "text \"" + Escape(text) + "\"");
  return bytes;
}

}  // namespace vesk2_command
