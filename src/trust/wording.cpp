// SPDX-License-Identifier: Apache-2.0
// See wording.h. Each is a TextWriter with one thing in it, so that programs, the command and
// explanations call an object the same.
#include <vesk2/wording.h>

#include "src/trust/text_writer.h"

namespace ZvVesk2::Wording {
namespace {

// A failure of any kind is null: the caller has no text.
char* Taken(TextWriter& writer) {
  std::unique_ptr<char[]> text;
  return writer.Take(text) == 0 ? text.release() : nullptr;
}

}  // namespace

char* Escape(const void* bytes, size_t length) {
  TextWriter writer;
  return Taken(writer.Escaped({static_cast<const char*>(bytes), length}));
}

char* Fingerprint(DExpression* expression) {
  TextWriter writer;
  return Taken(writer.Fingerprint(expression));
}

char* OfSubject(Subject* subject) {
  TextWriter writer;
  return Taken(writer.Of(subject));
}

char* OfEntry(const AclEntry* entry) {
  TextWriter writer;
  return Taken(writer.Of(entry));
}

char* OfList(SExpression* list, const char* keyword) {
  TextWriter writer;
  return Taken(writer.List(list, keyword != nullptr ? keyword : ""));
}

char* OfTag(SExpression* tag) {
  TextWriter writer;
  return Taken(writer.Tag(tag));
}

char* OfPeriod(const TimeStamp* notBefore, const TimeStamp* notAfter) {
  TextWriter writer;
  return Taken(writer.Period(notBefore, notAfter));
}

}  // namespace ZvVesk2::Wording
