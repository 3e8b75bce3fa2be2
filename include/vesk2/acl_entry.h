// SPDX-License-Identifier: Apache-2.0
// acl_entry.h: AclEntry, a trust root: it grants a tag to a subject by being in the store of this
// machine.
//
//   (entry [(version 1)] (subject <subject>) [(propagate)] <tag>
//          [(valid [(not-before <stamp>)] [(not-after <stamp>)])] [(generation <byte>)]
//          [(comment <text>)])
//
// One entry a file, "acl"/*.acl below the global root; whoever can write there decides what is
// trusted. Every look-up reads the directory afresh, in byte order of the names, and skips files
// that it cannot read.
#ifndef VESK2_ACL_ENTRY_H
#define VESK2_ACL_ENTRY_H

#include <cstddef>

#include <vesk2/subject.h>
#include <vesk2/time_stamp.h>

namespace ZvVesk2 {

class VESK2_API AclEntry : public SExpression {
 public:
  explicit AclEntry(Vesk2ContextStruct* context);

 protected:
  ~AclEntry() override;

 public:
  const char* DirectoryName() const override;
  const char* ExtensionName() const override;
  // "acl" and ".acl"; the argument changes nothing.
  static const char* DirectoryName(bool);
  static const char* ExtensionName(bool);
  // See SExpression::CalcDir and CalcPath.
  static char* CalcDir(StorageType type);
  static char* CalcPath(const char* name, StorageType type);

  // Create builds an entry. `subject` and `tag` are required (VESK2_ERR_INVALID_PARAM), `out` must
  // be null. Create takes over the references to subject, tag, times and comment.
  // `generation` 0 writes no element; of others the low byte is written.
  [[nodiscard]] static int Create(AclEntry*& out, Subject* subject, bool propagate,
                                  SExpression* tag, TimeStamp* notBefore, TimeStamp* notAfter,
                                  unsigned int generation, ByteString* comment);
  using SExpression::Create;

  // Import reads one entry from a file: a name with a "/" is a path, any other is looked up in the
  // store. VESK2_ERR_INVALID_PARAM, VESK2_ERR_FILE_OPEN (also: no root, no such path),
  // VESK2_ERR_READ_FILE (another process held it for Limits::kMaxHeldWait), and the buffer form's.
  [[nodiscard]] int Import(const char* name);
  // Import reads one entry from a buffer into an empty object. An entry that ends right after its
  // tag leaves its ")" unread. After a failure the object is of no use: free it.
  [[nodiscard]] int Import(ZvBuffer* buffer);
  // Import loads every entry of the store and then of `extraDir` (may be null) into a new list
  // (acl <entry>...). VESK2_ERR_INVALID_PARAM; VESK2_ERR_FILE_NOT_FOUND when nothing was loaded, or
  // when the last file of the store could not be read and there is no `extraDir`. An entry that was
  // not read for want of memory or descriptors (VESK2_ERR_MEM_ALLOC), or because another process
  // held its file (VESK2_ERR_READ_FILE), may be the one that names a revocation list: it is never
  // passed over, here and in the searches below.
  [[nodiscard]] static int Import(SExpression*& out, Vesk2ContextStruct* ctx, const char* extraDir);
  // No context. (A bare nullptr would not tell this from the readers of plain expressions.)
  [[nodiscard]] static int Import(SExpression*& out, std::nullptr_t, const char* extraDir) {
    return Import(out, static_cast<Vesk2ContextStruct*>(nullptr), extraDir);
  }
  using SExpression::Import;

  // ParseTagCanonical returns the tag of the first entry of the canonical text (acl (entry ...))
  // without a version element.
  [[nodiscard]] static int ParseTagCanonical(SExpression*& out, unsigned char* data,
                                             unsigned int length, Vesk2ContextStruct* ctx);

  // Find looks in the store for a propagating entry that grants `tag` to `principal` (null: to
  // nobody in particular, any entry's grant will do) now and at `notBefore`; `notAfter` is accepted
  // and not consulted. `k` receives the threshold of a k-of-n subject, else 0.
  //   0; VESK2_ERR_AUTH_TAGS_ARE_EQUAL, a success that tells an exact match;
  //   VESK2_ERR_ACL_ENTRY_NOT_FOUND (the principal was seen), VESK2_ERR_ACL_KEY_NOT_FOUND;
  //   VESK2_ERR_PARAM_NULL (`k` is as it was), VESK2_ERR_FIND_DIR.
  [[nodiscard]] static int Find(Principal* principal, SExpression* tag, TimeStamp* notBefore,
                                TimeStamp* notAfter, unsigned int& k);
  // FindThresholdEntry is Find among entries whose k-of-n subject has `principal` as a member.
  // `signers` is accepted and has no effect.
  [[nodiscard]] static int FindThresholdEntry(Principal* principal, SExpression* signers,
                                              SExpression* tag, TimeStamp* notBefore,
                                              TimeStamp* notAfter, unsigned int& k);
  // Whether there is a propagating entry whose tag equals `tag`: 0 or
  // VESK2_ERR_ACL_ENTRY_NOT_FOUND.
  [[nodiscard]] static int Find(SExpression* tag);
  // Whether there is an entry whose tag contains `tag`. VESK2_ERR_INVALID_PARAM for null.
  [[nodiscard]] static int FindSuperSet(SExpression* tag, bool needPropagate);
  // Whether an entry authorizes the revocation tag (keyword ... (revoke ...)): Find of its middle
  // elements. VESK2_ERR_INVALID_REVOCATION_TAG, VESK2_ERR_INVALID_PARAM.
  [[nodiscard]] static int FindRevocationEntry(SExpression* revocationTag);

  // InstallAcls copies into the store every entry of `dir` whose tag no store entry has, under its
  // file's name; a name that is taken is skipped. Every "*.acl" file of `dir` may become a trust
  // root. When something could not be read for lack of memory or descriptors, nothing is written.
  // Always 0.
  [[nodiscard]] static int InstallAcls(const char* dir, Vesk2ContextStruct* ctx);

  // The parts, borrowed; null, false or 0 when absent.
  SExpression* GetVersion() const;
  Subject* GetSubject() const;
  bool GetPropagate() const;
  SExpression* GetTag() const;
  TimeStamp* GetNotBefore() const;
  TimeStamp* GetNotAfter() const;
  unsigned int GetGeneration() const;
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
