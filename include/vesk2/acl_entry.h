// SPDX-License-Identifier: Apache-2.0
// acl_entry.h: AclEntry, a trust root: it grants a tag to a subject by being in the store of this
// machine.
//
//   (entry [(version 1)] (subject <subject>) [(propagate)] <tag>
//          [(valid [(not-before <stamp>)] [(not-after <stamp>)])] [(generation <byte>)]
//          [(comment <text>)])
//
// One entry a file, "acl"/*.acl below the global root; whoever can write there decides what is
// trusted, as entries are not signed. Every look-up reads the directory afresh, in byte order of
// the names, and skips files that it cannot read: with a malformed entry goes the source of
// revocation lists that it names. Who minds reads each file with Import(name); the command notes a
// malformed entry, and refuses to decide past one that cannot be read.
//
// The tag is any list: one that is not headed by "tag" grants whatever is asked, and so does (tag)
// alone. A shorter tag is a wider one. Require a list headed by "tag" before installing an entry. A
// key that an entry names is taken back by removing the entry: it is never looked up in a
// revocation list.
#ifndef VESK2_ACL_ENTRY_H
#define VESK2_ACL_ENTRY_H

#include <cstddef>

#include <vesk2/subject.h>
#include <vesk2/time_stamp.h>

namespace ZvVesk2 {

// AclEntry is read or built whole, and does not change then. GetFileName is the path that it was
// read from.
//
//   Ref<AclEntry> entry;
//   int code = AclEntry::Create(entry.Out(), key, true, tag, nullptr, nullptr, 0, nullptr);
//   if (code == 0) entry->SetStorageType(StorageGlobal);       key and tag are the entry's now
//   if (code == 0) code = entry->Export("vendor");             GLOBAL/acl/vendor.acl
class VESK2_API AclEntry : public SExpression {
 public:
  // An empty entry, for Import. A program that makes one of parts uses Create.
  explicit AclEntry(Vesk2ContextStruct* context);

 protected:
  ~AclEntry() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  // "acl" and ".acl"; the argument changes nothing.
  static const char* DirectoryName(bool);
  static const char* ExtensionName(bool);
  // See SExpression::CalcDir and CalcPath. The store is that of StorageGlobal.
  static char* CalcDir(StorageType type);
  static char* CalcPath(const char* name, StorageType type);

  // Create builds an entry, always with a version, for the caller to free. `subject` and `tag` are
  // required (VESK2_ERR_INVALID_PARAM), the others may be null; `out` must be null. Create takes
  // over the references to subject, tag, times and comment. `generation` 0 writes no element; of
  // others the low byte is written. VESK2_ERR_MEM_ALLOC. It is written to the store by
  // Export(name), with the storage type StorageGlobal, or by `vesk2 acl install`.
  [[nodiscard]] static int Create(AclEntry*& out, Subject* subject, bool propagate,
                                  SExpression* tag, TimeStamp* notBefore, TimeStamp* notAfter,
                                  unsigned int generation, ByteString* comment);
  using SExpression::Create;

  // Import reads one entry from a file into an empty object: a name with a "/" is a path as it
  // stands, any other is looked up in the store, ".acl" appended unless it is there. After a
  // failure the object is of no use: free it.
  //   VESK2_ERR_INVALID_PARAM  no name, or an object in use
  //   VESK2_ERR_FILE_OPEN      it cannot be opened or read; also: no root, no such path
  //   VESK2_ERR_READ_FILE      another process held it for Limits::kMaxHeldWait
  //   and the buffer form's    of the reader
  [[nodiscard]] int Import(const char* name);
  // Import reads one entry from a buffer into an empty object. An entry that ends right after its
  // tag leaves its ")" unread, and what follows an entry is ignored, by the command too. After a
  // failure the object is of no use: free it.
  //   VESK2_ERR_INVALID_PARAM  no buffer, or an object in use
  //   VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING
  //                            it has another form
  //   VESK2_ERR_PRINCIPAL, VESK2_ERR_HASH_ID, VESK2_ERR_INVALID_HASH
  //                            of its subject
  //   VESK2_ERR_MEM_ALLOC      memory ran out
  [[nodiscard]] int Import(ZvBuffer* buffer);
  // Import loads every entry of the store and then of `extraDir` (may be null) into a new list (acl
  // <entry>...), for the caller to free. An entry that was not read for want of memory or
  // descriptors, or because another process held its file, may be the one that names a revocation
  // list: it is never passed over, here and in the searches below. Any other entry that cannot be
  // read is passed over in silence.
  //   VESK2_ERR_INVALID_PARAM   `out` is not null
  //   VESK2_ERR_FILE_NOT_FOUND  nothing was loaded; or there is no `extraDir`, and there is no
  //                             store or its last file could not be read
  //   VESK2_ERR_READ_FILE       another process held a file for Limits::kMaxHeldWait, in all
  //   VESK2_ERR_MEM_ALLOC       memory or descriptors ran out
  [[nodiscard]] static int Import(SExpression*& out, Vesk2ContextStruct* ctx, const char* extraDir);
  // No context. (A bare nullptr would not tell this from the readers of plain expressions.)
  [[nodiscard]] static int Import(SExpression*& out, std::nullptr_t, const char* extraDir) {
    return Import(out, static_cast<Vesk2ContextStruct*>(nullptr), extraDir);
  }
  using SExpression::Import;

  // ParseTagCanonical returns the tag of the first entry of the canonical text (acl (entry ...))
  // without a version element, for the caller to free: the form that a reduction answers in. In an
  // entry with a version that is taken for the subject, and the subject for the tag.
  // VESK2_ERR_INVALID_PARAM for null, no bytes, or an `out` that is not null; else the codes of
  // SExpression::ParseCanonical.
  [[nodiscard]] static int ParseTagCanonical(SExpression*& out, unsigned char* data,
                                             unsigned int length, Vesk2ContextStruct* ctx);

  // Find looks in the store for a propagating entry that grants `tag` to `principal` (null: to
  // nobody in particular, any entry's grant will do) now and at `notBefore` (may be null). `k`
  // receives the threshold of a k-of-n subject, else 0.
  //
  // Use it to look for entries, not to decide: `notAfter` is accepted and not consulted, so compare
  // the end yourself; one member of a k-of-n is enough to be found, so count to `k` distinct
  // members yourself. CertSequence::Verify does all of it. An entry has ended at its not-after, and
  // not begun at its not-before when that is now. The command decides by the reduction.
  //   0                              an entry contains the tag
  //   VESK2_ERR_AUTH_TAGS_ARE_EQUAL  a success that tells an exact match
  //   VESK2_ERR_ACL_ENTRY_NOT_FOUND  none does; an entry of the principal was seen
  //   VESK2_ERR_ACL_KEY_NOT_FOUND    no entry of the principal was seen, or none was given
  //   VESK2_ERR_PARAM_NULL           no tag; `k` is as it was
  //   VESK2_ERR_FIND_DIR             there is no store
  //   VESK2_ERR_READ_FILE, VESK2_ERR_MEM_ALLOC
  //                                  as in Import
  [[nodiscard]] static int Find(Principal* principal, SExpression* tag, TimeStamp* notBefore,
                                TimeStamp* notAfter, unsigned int& k);
  // FindThresholdEntry is Find among entries whose k-of-n subject has `principal` (required) as a
  // member; here both ends belong to an entry's period, but for its not-after and `notBefore`.
  // `signers` is accepted, may be null, and has no effect: it does not count who signed. One member
  // is enough, and one whose key is revoked counts: count to `k` yourself, or let
  // CertSequence::Verify decide.
  [[nodiscard]] static int FindThresholdEntry(Principal* principal, SExpression* signers,
                                              SExpression* tag, TimeStamp* notBefore,
                                              TimeStamp* notAfter, unsigned int& k);
  // Whether there is a propagating entry whose tag equals `tag`: 0 or
  // VESK2_ERR_ACL_ENTRY_NOT_FOUND. No test of time is made: the entry may have ended.
  // VESK2_ERR_PARAM_NULL for null, VESK2_ERR_FIND_DIR, VESK2_ERR_READ_FILE and VESK2_ERR_MEM_ALLOC
  // as above.
  [[nodiscard]] static int Find(SExpression* tag);
  // Whether there is an entry whose tag contains `tag`. No test of time is made, and entries that
  // may not pass their grant on are accepted unless `needPropagate`. VESK2_ERR_INVALID_PARAM for
  // null, other codes as in Find of a tag.
  [[nodiscard]] static int FindSuperSet(SExpression* tag, bool needPropagate);
  // Whether an entry authorizes the revocation tag (keyword ... (revoke ...)): Find of its middle
  // elements, (tag ...), without a test of time. VESK2_ERR_INVALID_REVOCATION_TAG for a tag that
  // does not end in (revoke ...), VESK2_ERR_INVALID_PARAM for null, other codes as in Find of a
  // tag.
  [[nodiscard]] static int FindRevocationEntry(SExpression* revocationTag);

  // InstallAcls copies into the store every entry of `dir` whose tag no store entry has, under its
  // file's name; a name that is taken is skipped. Every "*.acl" file of `dir` may become a trust
  // root. When something could not be read for lack of memory or descriptors, nothing is written; a
  // file is written whole or not at all.
  //
  // Always 0, whatever was installed. An entry whose tag is in the store already is not installed
  // although it is for another subject: look at what is in the store afterwards. `vesk2 acl
  // install` installs each file that it is given, or says why not.
  [[nodiscard]] static int InstallAcls(const char* dir, Vesk2ContextStruct* ctx);

  // The parts, borrowed; null, false or 0 when absent. The version says nothing.
  SExpression* GetVersion() const;
  // Whom this machine trusts: a key, the hash of one, or k of n keys.
  Subject* GetSubject() const;
  // Whether it may pass the grant on: without it a chain of one certificate leads nowhere.
  bool GetPropagate() const;
  // With what. (tag) alone, and any list that is not headed by "tag", are the widest grant. One
  // whose last element is (revoke ...) is a source of revocation lists.
  SExpression* GetTag() const;
  // The period; null where it is open. They are byte strings that nobody checked.
  TimeStamp* GetNotBefore() const;
  TimeStamp* GetNotAfter() const;
  // A number of the writer's, 0 to 255; nothing goes by it.
  unsigned int GetGeneration() const;
  // Text of the writer, as it was written: see Wording::Escape.
  ByteString* GetComment() const;

 private:
  struct Parts;
  // Writes the list of an empty object and sets the fields.
  [[nodiscard]] VESK2_LOCAL int Build(Parts&& parts);
  // Appends every entry of a directory that can be read. The result is that of the last file
  // handled: a bad last file is reported although the others were loaded.
  [[nodiscard]] VESK2_LOCAL static int LoadDirectory(SExpression* list, const char* directory);
  // The two halves of Import: up to the tag, and what follows it.
  [[nodiscard]] VESK2_LOCAL int ImportGrant(Parts& parts, ZvBuffer* buffer) const;
  [[nodiscard]] VESK2_LOCAL int ImportRest(Parts& parts, ZvBuffer* buffer) const;

  SExpression* version = nullptr;
  Subject* subject = nullptr;
  bool propagate = false;
  SExpression* tag = nullptr;
  TimeStamp* notBefore = nullptr;
  TimeStamp* notAfter = nullptr;
  unsigned int generation = 0;
  ByteString* comment = nullptr;
};

}  // namespace ZvVesk2

#endif  // VESK2_ACL_ENTRY_H
