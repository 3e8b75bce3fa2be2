// SPDX-License-Identifier: Apache-2.0
// AclEntry: building one entry, and reading it from canonical text. Reading fills a Parts and
// builds the list only when all of it made sense: an entry is trusted by its fields, so these must
// never say more than the list that is written and reduced.
#include <vesk2/acl_entry.h>

#include "src/objects/granted_tag.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {

AclEntry::AclEntry(Vesk2ContextStruct* ctx) : SExpression(ctx) {}

AclEntry::~AclEntry() = default;

const char* AclEntry::DirectoryName() const { return DirectoryName(true); }

const char* AclEntry::ExtensionName() const { return ExtensionName(true); }

const char* AclEntry::DirectoryName(bool) { return "acl"; }

const char* AclEntry::ExtensionName(bool) { return ".acl"; }

char* AclEntry::CalcDir(StorageType type) {
  return SExpression::CalcDir(DirectoryName(true), type);
}

char* AclEntry::CalcPath(const char* name, StorageType type) {
  return SExpression::CalcPath(DirectoryName(true), ExtensionName(true), name, type);
}

// What an entry is made of. A reader fills one from text, Create from its arguments. A reference
// that is not handed on to the list goes with this, on every path.
struct AclEntry::Parts {
  bool version = false;
  Ref<Subject> subject;
  bool propagate = false;
  Ref<SExpression> tag;
  bool valid = false;  // the list may be there without a date
  Ref<TimeStamp> notBefore;
  Ref<TimeStamp> notAfter;
  Ref<ByteString> generation;
  Ref<ByteString> comment;
};

namespace {

// [OPENING BYTES ")"], OPENING being for instance "(7:comment"; null when it is not there. Looked
// for at its place only: an element out of order is an error, as the next required text is not
// found, and never passed over. A period that was passed over would be none.
template <typename Atom>
[[nodiscard]] int ImportOptional(Ref<Atom>& out, const char* opening, ZvBuffer* buffer,
                                 Vesk2ContextStruct* ctx) {
  if (!buffer->Accept(opening)) return 0;
  VESK2_TRY(ImportNew(out, buffer, ctx));
  return buffer->Expect(")");
}

}  // namespace

// ---- Building ----

// The one writer of the list. Fields are set to what the list holds, as each part is appended.
int AclEntry::Build(Parts&& parts) {
  ValueBlocks blocks(GetContext());
  VESK2_TRY(blocks.Insert(*this, "entry"));
  // Always the "1" that was matched: no entry says another version.
  if (parts.version) {
    VESK2_TRY(AppendHead(blocks, this, "version", version));
    VESK2_TRY(blocks.Insert(*version, "1"));
  }
  SExpression* pair = nullptr;
  VESK2_TRY(AppendHead(blocks, this, "subject", pair));
  VESK2_TRY(Append(pair, std::move(parts.subject), subject));
  if (parts.propagate) {
    SExpression* flag = nullptr;
    VESK2_TRY(AppendHead(blocks, this, "propagate", flag));
    propagate = true;
  }
  VESK2_TRY(Append(this, std::move(parts.tag), tag));
  if (parts.valid) {
    SExpression* valid = nullptr;
    VESK2_TRY(AppendHead(this, "valid", valid));
    VESK2_TRY(AppendBounds(valid, std::move(parts.notBefore), std::move(parts.notAfter), notBefore,
                           notAfter));
  }
  if (parts.generation) {
    ByteString* number = nullptr;
    VESK2_TRY(AppendPair(this, "generation", std::move(parts.generation), number));
    // The reader refused an empty one, and Create writes one byte.
    generation = number->GetData()[0];
  }
  if (!parts.comment) return 0;
  return AppendPair(this, "comment", std::move(parts.comment), comment);
}

// Everything that can fail is done before the caller's references are taken, so that a caller need
// not know how far it came.
int AclEntry::Create(AclEntry*& out, Subject* subject, bool propagate, SExpression* tag,
                     TimeStamp* notBefore, TimeStamp* notAfter, unsigned int generation,
                     ByteString* comment) {
  VESK2_REQUIRE(out == nullptr && subject != nullptr && tag != nullptr, VESK2_ERR_INVALID_PARAM);
  Ref<AclEntry> entry(TryNew<AclEntry>(subject->GetContext()));
  VESK2_REQUIRE(entry, VESK2_ERR_MEM_ALLOC);

  // The list takes references of its own: after a failure everything is still the caller's.
  Parts parts;
  parts.version = true;
  parts.subject = Ref<Subject>::Share(subject);
  parts.propagate = propagate;
  parts.tag = Ref<SExpression>::Share(tag);
  parts.valid = notBefore != nullptr || notAfter != nullptr;
  parts.notBefore = Ref<TimeStamp>::Share(notBefore);
  parts.notAfter = Ref<TimeStamp>::Share(notAfter);
  if (generation != 0) {
    // More than a byte has no form: readers take the first byte alone.
    const auto lowByte = static_cast<unsigned char>(generation);
    parts.generation.Reset(TryNew<ByteString>(subject->GetContext()));
    VESK2_REQUIRE(parts.generation, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(parts.generation->Set(&lowByte, 1, ByteString::BsNone));
  }
  parts.comment = Ref<ByteString>::Share(comment);
  VESK2_TRY(entry->Build(std::move(parts)));

  DExpression* const handedOver[] = {subject, tag, notBefore, notAfter, comment};
  for (DExpression* value : handedOver) {
    if (value != nullptr) value->Free();
  }
  out = entry.Release();
  return 0;
}

// ---- Reading ----

// (5:entry [(7:version1:1)] (7:subject SUBJECT) [(9:propagate)] TAG
//   [(5:valid [(10:not-before STAMP)] [(9:not-after STAMP)])]
//   [(10:generation BYTE)] [(7:comment TEXT)])
int AclEntry::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  Parts parts;
  VESK2_TRY(ImportGrant(parts, buffer));
  // Entries in stores may end here: their ")" is left unread, and nothing optional follows.
  if (buffer->Peek() != ')') VESK2_TRY(ImportRest(parts, buffer));
  return Build(std::move(parts));
}

// What an entry cannot do without: for whom, and what. There is no test of the tag: any list is
// one, and stores hold such entries.
int AclEntry::ImportGrant(Parts& parts, ZvBuffer* buffer) const {
  VESK2_TRY(buffer->Expect("(5:entry"));
  // Version and subject both begin "(7:".
  VESK2_TRY(buffer->Expect("(7:"));
  parts.version = buffer->Peek() == 'v';
  if (parts.version) VESK2_TRY(buffer->Expect("version1:1)(7:"));
  VESK2_TRY(buffer->Expect("subject"));
  VESK2_TRY(Subject::Import(parts.subject.Out(), buffer, GetContext()));
  VESK2_TRY(buffer->Expect(")"));
  // A place of its own, before the tag, so that no tag can be mistaken for it.
  parts.propagate = buffer->Accept("(9:propagate)");
  return SExpression::Import(parts.tag.Out(), buffer, GetContext());
}

// The stamps are read as byte strings. The reduction compares them as such, and judges what a wrong
// one is worth by that alone.
int AclEntry::ImportRest(Parts& parts, ZvBuffer* buffer) const {
  Vesk2ContextStruct* const ctx = GetContext();
  parts.valid = buffer->Accept("(5:valid");
  if (parts.valid) {
    VESK2_TRY(ImportOptional(parts.notBefore, "(10:not-before", buffer, ctx));
    VESK2_TRY(ImportOptional(parts.notAfter, "(9:not-after", buffer, ctx));
    VESK2_TRY(buffer->Expect(")"));
  }
  VESK2_TRY(ImportOptional(parts.generation, "(10:generation", buffer, ctx));
  // Without a byte there would be none to read the number from.
  VESK2_REQUIRE(!parts.generation || parts.generation->GetLength() > 0, VESK2_ERR_PARSE_FILE);
  VESK2_TRY(ImportOptional(parts.comment, "(7:comment", buffer, ctx));
  return buffer->Expect(")");
}

// Of the reduction's answer, whose reader lies further down: the reduction may not look up here.
int AclEntry::ParseTagCanonical(SExpression*& out, unsigned char* data, unsigned int length,
                                Vesk2ContextStruct* ctx) {
  return ReadGrantedTag(out, data, length, ctx);
}

SExpression* AclEntry::GetVersion() const { return version; }
Subject* AclEntry::GetSubject() const { return subject; }
bool AclEntry::GetPropagate() const { return propagate; }
SExpression* AclEntry::GetTag() const { return tag; }
TimeStamp* AclEntry::GetNotBefore() const { return notBefore; }
TimeStamp* AclEntry::GetNotAfter() const { return notAfter; }
ByteString* AclEntry::GetComment() const { return comment; }
unsigned int AclEntry::GetGeneration() const { return generation; }

}  // namespace ZvVesk2
