// SPDX-License-Identifier: Apache-2.0
// wording.h: what people are told about objects: texts that are safe for a terminal, whoever wrote
// the object. This library's own explanations use them too.
//
//   const std::unique_ptr<char[]> text(Wording::OfTag(cert->GetTag()));
//   if (text != nullptr) std::printf("grants %s\n", text.get());
//
// Each returns a new text, to be released with Vesk2Free (an array from new[]), or null when memory
// runs out or, for an object, when it is nested too deeply to be written. Arguments are borrowed,
// and not null unless that is said. A text is safe for a terminal, not for a shell: quote it last.
// It is for people; programs compare objects.
#ifndef VESK2_WORDING_H
#define VESK2_WORDING_H

#include <vesk2/acl_entry.h>
#include <vesk2/subject.h>
#include <vesk2/time_stamp.h>

#include <cstddef>

namespace ZvVesk2::Wording {

// Escape writes control bytes (ESC and DEL among them), invalid UTF-8 and the characters that
// reorder or break lines on a terminal as \xNN, and a backslash as "\\", so that the result is
// unambiguous. `bytes` may be null when `length` is 0.
VESK2_API char* Escape(const void* bytes, size_t length);
// Fingerprint is "sha256:" and the digest, in hexadecimal, of the canonical form without hints: the
// identity of a key.
VESK2_API char* Fingerprint(DExpression* expression);
// OfSubject is the fingerprint of a key, the algorithm and the digest of a hash ("sha1:..."), and
// "2 of" and the fingerprints of the members of a k-of-n.
VESK2_API char* OfSubject(Subject* subject);
// OfEntry is the name of an entry's file in the store, and of another one its path; empty for an
// entry without a file.
VESK2_API char* OfEntry(const AclEntry* entry);
// OfList is the advanced text of a list, with all of words that hold a 0 byte; with a keyword (may
// be null), of the body of a list that is headed by it. OfTag is that of a tag, "everything" for
// null, as that is what no tag grants.
VESK2_API char* OfList(SExpression* list, const char* keyword);
VESK2_API char* OfTag(SExpression* tag);
// OfPeriod is "from STAMP until STAMP", as far as given, "at STAMP" for one moment, or "always".
VESK2_API char* OfPeriod(const TimeStamp* notBefore, const TimeStamp* notAfter);

}  // namespace ZvVesk2::Wording

#endif  // VESK2_WORDING_H
