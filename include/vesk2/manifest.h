// SPDX-License-Identifier: Apache-2.0
// manifest.h: Manifest, a signed file that lists a directory tree:
//
//   (manifest (version "1" <text>) (type "plain")
//     (signature-block (time-of-signing <stamp>)
//        <signer certificate> <signature> <certificate> <signature> ...)
//     (crl <crl sequence>...)
//     <body>)
//
// The signer certificate's subject is the hash of the version, type and time elements and the
// body's bytes; the certificate after it must be the signer's own, and authorizes it: it counts as
// if it had (propagate), so that a key that may not pass its grant on can sign manifests. Grant a
// tag of its own for what is not to be signed so. Nothing else is covered by the signature: the
// chain behind the signer certificate and the revocation lists can be taken out, or exchanged for
// others that verify, by anyone. Keep current lists in the store, and rely on none that is carried.
//
//   Manifest manifest(nullptr);
//   int code = manifest.Initialize("app", "app.manifest", "(install (app calc))");
//   manifest.SetFailOnExtraEntries(true);
//   manifest.SetStoreUpdate(false);
//   if (code == 0) code = manifest.VerifyManifest(now, now);          0: yes
//
// One object serves any number of verifications, one after the other, and belongs to one thread.
#ifndef VESK2_MANIFEST_H
#define VESK2_MANIFEST_H

#include <vesk2/expression.h>
#include <vesk2/file_item.h>
#include <vesk2/pointer_array.h>
#include <vesk2/ref.h>
#include <vesk2/time_stamp.h>

#include <memory>

namespace ZvVesk2 {

class BodyDirectory;
class Evidence;
class Findings;

// Vesk2TaskRunner lends threads to a verification, which starts none itself. `run` calls task(work)
// on each thread that it lends, on all at the same time, and returns when all these calls have
// returned; it must not let an exception out. Where it lends none, the verification does all alone.
// `user` is handed to `run`, and both must stay valid as long as they are set.
//
//   void LendOne(void*, void (*task)(void*), void* work) {
//     std::thread lent(task, work);            and catch what this throws
//     lent.join();
//   }
//   const Vesk2TaskRunner runner = {nullptr, LendOne};
//   manifest.SetTaskRunner(&runner);           two threads: the caller's takes part afterwards
struct Vesk2TaskRunner {
  void* user = nullptr;
  void (*run)(void* user, void (*task)(void* work), void* work) = nullptr;
};

// FileItemList owns a chain of records, and frees it when it goes.
struct FileItemDeleter {
  void operator()(FileItem* chain) const { FileItemDelete(chain); }
};
using FileItemList = std::unique_ptr<FileItem, FileItemDeleter>;

// Manifest is one manifest file with a directory that it may describe, and what was found when they
// were last looked at. It may lie on the stack: its size stays as it is.
class VESK2_API Manifest {
 public:
  // `ctx` may be null, is not owned, and must outlive the object.
  explicit Manifest(Vesk2ContextStruct* ctx);
  ~Manifest();
  Manifest(const Manifest&) = delete;
  Manifest& operator=(const Manifest&) = delete;

  // Initialize copies the two paths and parses the tag's text (see CreateManifestContext in
  // vesk2.h, also for the codes). Nothing is opened. Call it once, before anything else but the
  // settings.
  [[nodiscard]] int Initialize(const char* directory, const char* manifestPath,
                               const char* tagText);

  // ReadManifest reads the file, checks every signature and the signed digest and, with
  // `verifyChain`, that the chain grants the tag for the period from `notBefore` to `notAfter`, in
  // seconds (0: not given; both 0: the moment of signing). The first failure is the answer. Without
  // `verifyChain` no store is opened, and any key made by anyone passes. When `body` is not null,
  // *body receives the body as a buffer that the caller frees with zv_buffer_free; it is null after
  // a failure. With `verifyChain` the lists that it carries are offered to the store
  // (SetStoreUpdate). Codes: vesk2.h, VerifyManifest, but those about the tree.
  [[nodiscard]] int ReadManifest(bool verifyChain, long notBefore, long notAfter, ZvBuffer** body);
  // See the flat functions of the same names in vesk2.h, which say what a yes is worth.
  [[nodiscard]] int VerifyManifest(long notBefore, long notAfter);
  // The other manifest is read for the call only; this one's directory is not looked at. Signatures
  // and digests are proved of both, authority of neither.
  [[nodiscard]] int CompareManifest(const char* otherManifestPath);

  // Verify compares a body with a directory on disk, Compare two bodies; both add to the result
  // lists, and borrow their arguments, of which none may be null (VESK2_ERR_PARAM_NULL). What they
  // are given is not proved: it may be anybody's.
  //
  // The top directory is not searched for unlisted entries, as the manifest may lie there, and an
  // empty body agrees with a directory that is not there: list the top directory yourself, and see
  // that something is listed. Below it, unlisted entries are VESK2_ERR_EXTRA_FILES here whatever
  // SetFailOnExtraEntries says. Links are followed. The command refuses unlisted entries in the top
  // directory, too, but for the manifest itself.
  //   0                     everything listed is there, and as listed
  //   VESK2_ERR_HASH_MISMATCH, VESK2_ERR_FILE_NOT_FOUND, VESK2_ERR_EXTRA_FILES
  //                         the worst that was found, in this order
  //   VESK2_ERR_PARSE_FILE, VESK2_ERR_RANDOM_TOKEN, VESK2_ERR_UNKNOWN_HASH_ID,
  //     VESK2_ERR_MAX_BYTE_STRING
  //                         the body cannot be read: see BodyDirectory::ParseBody
  //   VESK2_ERR_USER_INTERRUPT, VESK2_ERR_MEM_ALLOC
  //                         ended by a callback; memory or descriptors ran out. The lists are as
  //                         they were
  [[nodiscard]] int Verify(ZvBuffer* body, const char* directory);
  // The same of two bodies: what the first lists alone is missing, what the second lists alone is
  // extra. Names in the results are relative to the bodies' root.
  [[nodiscard]] int Compare(ZvBuffer* body1, ZvBuffer* body2);

  // Why an entry of a result list was not compared.
  struct Reason {
    const FileItem* entry;
    int code;
  };

  // ---- Settings; see vesk2.h ----
  // See FailOnExtraEntries in vesk2.h: without it a tree with unlisted entries below its top
  // directory passes.
  void SetFailOnExtraEntries(bool value);
  // Adopts `owned`, an array from new[], or null. See SetExtraAclDirectory in vesk2.h: every
  // "*.acl" file there becomes a trust root.
  void SetExtraAclDirectory(char* owned);
  // The same with a copy of the text. Without memory for it VESK2_ERR_MEM_ALLOC, which every
  // verification answers then, until the setting is made again: without the directory, and the
  // revocation sources that it names, it would answer another question.
  [[nodiscard]] int CopyExtraAclDirectory(const char* text);
  // Replaces the ignored entries by copies, in reverse order. VESK2_ERR_MEM_ALLOC leaves none. An
  // ignored name is not looked at: a listed file or directory of that name may be changed, missing
  // or new. Name what nobody runs or reads, by full paths.
  [[nodiscard]] int SetIgnoredEntries(const FileItem* list);
  // Copies the record; null takes it back. VESK2_ERR_INVALID_PARAM for one of another size. See
  // Vesk2FileCallbacks in vesk2.h.
  [[nodiscard]] int SetFileCallbacks(const Vesk2FileCallbacks* callbacks);
  // SetTaskRunner has the files of the directory hashed by the threads of `runner`, which is
  // copied, too; null takes it back. Codes, lists and their order are the same. File callbacks are
  // then called on all these threads, for several files at a time, and the wait for files that
  // others hold is shared by all.
  void SetTaskRunner(const Vesk2TaskRunner* runner);
  // See SetStoreUpdate in vesk2.h. True at first: lists that a manifest carries are stored when
  // they verify, also when the answer is then no.
  void SetStoreUpdate(bool value);
  // SetEvidence has ReadManifest and VerifyManifest keep what they read and found in `borrowed`,
  // which must outlive them; null takes it back. They then read on after a refusal, for the
  // evidence only: codes, positions and what is stored stay as they are without it. ReadManifest
  // without `verifyChain` then tells all that the file says, proved or not: its version, type and
  // time, the lists that it carries, and its listing where that can be read.
  void SetEvidence(Evidence* borrowed);

  // ---- What the object holds, borrowed ----
  // The context, the two paths as they were given, and the tag that is asked for; null before
  // Initialize, but for the context.
  Vesk2ContextStruct* GetContext() const;
  const char* GetDirectory() const;
  const char* GetManifestPath() const;
  SExpression* GetTag() const;
  // As it was set; false at first.
  bool GetFailOnExtraEntries() const;
  // As it was set, borrowed until it is set again; null for none.
  const char* GetExtraAclDirectory() const;
  // As it was set; true at first.
  bool GetStoreUpdate() const;
  // Null when none are set.
  const Vesk2FileCallbacks* GetFileCallbacks() const;
  // The lists of the last comparison, or null: see GetValidEntries in vesk2.h. Here what is as it
  // was listed, directories with it.
  FileItem* GetValid() const;
  // What differs, could not be read, or is a directory that holds such an entry or a missing one. A
  // directory that could not be listed is there twice.
  FileItem* GetInvalid() const;
  // Files that are listed and not there; what stands in a file's place and is no regular file is
  // missing, too. Of two bodies also directories.
  FileItem* GetMissing() const;
  // What is there and not listed, and each listed directory that holds such entries and nothing
  // worse. An unlisted directory on the disk is not looked into.
  FileItem* GetExtra() const;
  // GetReason tells why an entry of the lists above is there although it was not compared:
  //   VESK2_ERR_FILE_OPEN  it could not be opened: it counts as missing, or, when another process
  //                        held it for Limits::kMaxHeldWait, as changed
  //   VESK2_ERR_READ_FILE  it could not be read to its end, or changed meanwhile
  //   VESK2_ERR_FIND_DIR   the directory is missing, or its entries could not be read
  // 0 when it was compared, and for any other entry. Asked by the record itself, not by its name.
  [[nodiscard]] int GetReason(const FileItem* entry) const;
  // The copies of SetIgnoredEntries, or null. They are borrowed until the names are set again.
  FileItem* GetIgnoredEntries() const;
  // What the last read proved; null before and after a failed read (but see SetEvidence).
  SExpression* GetVersion() const;
  // (type "plain"), the one type that there is.
  SExpression* GetType() const;
  // The signer's word for when it was signed.
  TimeStamp* GetSigningTime() const;
  // The byte of the manifest file that the last read had come to: after an error of a reader, where
  // the text stopped making sense; after VerifyManifest, how far its listing made sense.
  size_t GetReadPosition() const;
  // The listing that the last VerifyManifest with SetEvidence proved and compared, its root named
  // by the directory; or the one that ReadManifest told (see there), its root without a name. Null
  // when it did not come to that. It lives until the next verification.
  BodyDirectory* GetListing() const;
  // How many files the listing names that VerifyManifest compares now, those that are ignored, and
  // not read, among them: for callbacks that show how far it has come, on any thread. 0 before the
  // listing is read.
  size_t CountListedFiles() const;

 private:
  friend class ManifestReader;
  // What an earlier call left: what was proved, and what was found.
  VESK2_LOCAL void ClearRead();
  VESK2_LOCAL void ClearResults();
  // The ignored names as paths below `base`, sorted: the form that a body's reader picks from.
  [[nodiscard]] VESK2_LOCAL int BuildIgnoreList(const char* base, PointerArray<char>& list) const;
  // The two halves of Verify: reading a body, and comparing it.
  [[nodiscard]] VESK2_LOCAL int ParseListing(std::unique_ptr<BodyDirectory>& out, ZvBuffer* body,
                                             const char* directory);
  [[nodiscard]] VESK2_LOCAL int CheckListing(std::unique_ptr<BodyDirectory> root);
  // Moves the records of a comparison to the front of the four lists.
  [[nodiscard]] VESK2_LOCAL int Publish(Findings& findings);
  // The list of findings of a status.

  Vesk2ContextStruct* context;
  std::unique_ptr<char[]> directory;
  std::unique_ptr<char[]> manifestPath;
  Ref<SExpression> tag;
  bool failOnExtraEntries = false;
  std::unique_ptr<char[]> extraAclDirectory;
  FileItemList valid;
  FileItemList invalid;
  FileItemList missing;
  FileItemList extra;
  std::unique_ptr<Reason[]> reasons;  // sorted by entry
  uint32_t reasonCount = 0;
  FileItemList ignoredEntries;
  Ref<SExpression> version;
  Ref<SExpression> type;
  Ref<TimeStamp> signingTime;
  size_t readPosition = 0;
  size_t listedFiles = 0;
  bool storeUpdate = true;
  bool lostSetting = false;  // there was no memory to keep it
  Vesk2FileCallbacks fileCallbacks{};
  Vesk2TaskRunner taskRunner;
  Evidence* evidence = nullptr;
  std::unique_ptr<BodyDirectory> listing;
};

}  // namespace ZvVesk2

#endif  // VESK2_MANIFEST_H
