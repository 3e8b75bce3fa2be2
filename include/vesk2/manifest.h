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
// body's bytes; the certificate after it must be the signer's own, and authorizes it.
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
struct Vesk2TaskRunner {
  void* user = nullptr;
  void (*run)(void* user, void (*task)(void* work), void* work) = nullptr;
};

struct FileItemDeleter {
  void operator()(FileItem* chain) const { FileItemDelete(chain); }
};
using FileItemList = std::unique_ptr<FileItem, FileItemDeleter>;

class VESK2_API Manifest {
 public:
  explicit Manifest(Vesk2ContextStruct* ctx);
  ~Manifest();
  Manifest(const Manifest&) = delete;
  Manifest& operator=(const Manifest&) = delete;

  // Initialize copies the two paths and parses the tag's text (see CreateManifestContext in
  // vesk2.h).
  [[nodiscard]] int Initialize(const char* directory, const char* manifestPath,
                               const char* tagText);

  // ReadManifest reads the file, checks every signature and the signed digest and, with
  // `verifyChain`, that the chain grants the tag for the period. When `body` is not null, *body
  // receives the body as a buffer that the caller frees with zv_buffer_free; it is null after a
  // failure. Codes: vesk2.h, VerifyManifest.
  [[nodiscard]] int ReadManifest(bool verifyChain, long notBefore, long notAfter, ZvBuffer** body);
  // See the flat functions of the same names in vesk2.h.
  [[nodiscard]] int VerifyManifest(long notBefore, long notAfter);
  [[nodiscard]] int CompareManifest(const char* otherManifestPath);

  // Verify compares a body with a directory on disk, Compare two bodies; both add to the result
  // lists.
  [[nodiscard]] int Verify(ZvBuffer* body, const char* directory);
  [[nodiscard]] int Compare(ZvBuffer* body1, ZvBuffer* body2);

  // Why an entry of a result list was not compared.
  struct Reason {
    const FileItem* entry;
    int code;
  };

  // ---- Settings; see vesk2.h ----
  void SetFailOnExtraEntries(bool value);
  // Adopts `owned`, an array from new[], or null.
  void SetExtraAclDirectory(char* owned);
  // The same with a copy of the text. Without memory for it VESK2_ERR_MEM_ALLOC, which every
  // verification answers then, until the setting is made again: without the directory, and the
  // revocation sources that it names, it would answer another question.
  [[nodiscard]] int CopyExtraAclDirectory(const char* text);
  // Replaces the ignored entries by copies, in reverse order. VESK2_ERR_MEM_ALLOC leaves none.
  [[nodiscard]] int SetIgnoredEntries(const FileItem* list);
  [[nodiscard]] int SetFileCallbacks(const Vesk2FileCallbacks* callbacks);
  // SetTaskRunner has the files of the directory hashed by the threads of `runner` too; null takes
  // it back. Codes, lists and their order are the same. File callbacks are then called on all these
  // threads, for several files at a time.
  void SetTaskRunner(const Vesk2TaskRunner* runner);
  void SetStoreUpdate(bool value);
  // SetEvidence has ReadManifest and VerifyManifest keep what they read and found in `borrowed`,
  // which must outlive them; null takes it back. They then read on after a refusal, for the
  // evidence only: codes, positions and what is stored stay as they are without it. ReadManifest
  // without `verifyChain` then tells all that the file says, proved or not: its version, type and
  // time, the lists that it carries, and its listing where that can be read.
  void SetEvidence(Evidence* borrowed);

  // ---- What the object holds, borrowed ----
  Vesk2ContextStruct* GetContext() const;
  const char* GetDirectory() const;
  const char* GetManifestPath() const;
  SExpression* GetTag() const;
  bool GetFailOnExtraEntries() const;
  const char* GetExtraAclDirectory() const;
  bool GetStoreUpdate() const;
  // Null when none are set.
  const Vesk2FileCallbacks* GetFileCallbacks() const;
  FileItem* GetValid() const;
  FileItem* GetInvalid() const;
  FileItem* GetMissing() const;
  FileItem* GetExtra() const;
  // GetReason tells why an entry of the lists above is there although it was not compared:
  //   VESK2_ERR_FILE_OPEN  it could not be opened: a changed file, which is there, because another
  //                        process held it for Limits::kMaxHeldWait
  //   VESK2_ERR_READ_FILE  it could not be read to its end, or changed meanwhile
  //   VESK2_ERR_FIND_DIR   the directory is missing, or its entries could not be read
  // 0 when it was compared, and for any other entry.
  [[nodiscard]] int GetReason(const FileItem* entry) const;
  FileItem* GetIgnoredEntries() const;
  // Null before and after a failed read (but see SetEvidence).
  SExpression* GetVersion() const;
  SExpression* GetType() const;
  TimeStamp* GetSigningTime() const;
  // The byte of the manifest file that the last read had come to: after an error of a reader, where
  // the text stopped making sense.
  size_t GetReadPosition() const;
  // The listing that the last VerifyManifest with SetEvidence proved and compared, its root named
  // by the directory; or the one that ReadManifest told (see there), its root without a name. Null
  // when it did not come to that.
  BodyDirectory* GetListing() const;
  // How many files the listing names that VerifyManifest compares now, those that are ignored not
  // among them: for callbacks that show how far it has come, on any thread. 0 before the listing is
  // read.
  size_t CountListedFiles() const;

 private:
  friend class ManifestReader;
  VESK2_LOCAL void ClearRead();
  VESK2_LOCAL void ClearResults();
  [[nodiscard]] VESK2_LOCAL int BuildIgnoreList(const char* base, PointerArray<char>& list) const;
  // The two halves of Verify: reading a body, and comparing it.
  [[nodiscard]] VESK2_LOCAL int ParseListing(std::unique_ptr<BodyDirectory>& out, ZvBuffer* body,
                                             const char* directory);
  [[nodiscard]] VESK2_LOCAL int CheckListing(std::unique_ptr<BodyDirectory> root);
  // Moves the records of a comparison to the front of the four lists.
  [[nodiscard]] VESK2_LOCAL int Publish(Findings& findings);
  VESK2_LOCAL FileItemList& ListOf(uint32_t status);

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
