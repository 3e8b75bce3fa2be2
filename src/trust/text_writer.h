// SPDX-License-Identifier: Apache-2.0
// TextWriter: a text for people that grows, without exceptions. A failure is kept, and told when
// the text is taken: sentences are written without a test after each word.
#ifndef VESK2_SRC_TRUST_TEXT_WRITER_H
#define VESK2_SRC_TRUST_TEXT_WRITER_H

#include <cstddef>
#include <memory>
#include <string_view>

#include <vesk2/acl_entry.h>
#include <vesk2/subject.h>
#include <vesk2/time_stamp.h>

namespace ZvVesk2 {

// What is written by << must be ours: everything else goes through one of the named calls, which
// escape it.
class TextWriter {
 public:
  // As it is: words of ours, and what was escaped.
  TextWriter& operator<<(std::string_view text);
  TextWriter& operator<<(size_t number);
  // See wording.h.
  TextWriter& Escaped(std::string_view bytes);
  TextWriter& Fingerprint(DExpression* expression);
  TextWriter& Of(Subject* subject);
  TextWriter& Of(const AclEntry* entry);
  // The directory of the ACL store.
  TextWriter& AclStore();
  TextWriter& List(SExpression* list, std::string_view keyword);
  TextWriter& Tag(SExpression* tag);
  TextWriter& Period(const TimeStamp* notBefore, const TimeStamp* notAfter);
  TextWriter& Of(const TimeStamp* stamp);
  // "WORDS (NAME)", or the name alone.
  TextWriter& Code(int code);

  size_t length() const { return length_; }
  // Take hands the text out. VESK2_ERR_MEM_ALLOC, the codes of hashing and writing objects.
  [[nodiscard]] int Take(std::unique_ptr<char[]>& out);

 private:
  [[nodiscard]] std::unique_ptr<char[]> StorePath();
  bool Reserve(size_t more);
  void Hex(const unsigned char* bytes, size_t length);

  std::unique_ptr<char[]> text_;
  size_t length_ = 0;
  size_t capacity_ = 0;
  // The first failure. Nothing is written behind it.
  int code_ = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_TRUST_TEXT_WRITER_H
