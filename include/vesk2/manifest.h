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
#include <vesk2/time_stamp.h>

namespace ZvVesk2 {

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

  // ---- Settings; see vesk2.h ----
  void SetFailOnExtraEntries(bool value) { failOnExtraEntries = value; }
  void SetExtraAclDirectory(char* owned);
  // Replaces the ignored entries by copies, in reverse order. VESK2_ERR_MEM_ALLOC leaves none.
  [[nodiscard]] int SetIgnoredEntries(const FileItem* list);

  // ---- What the object holds, borrowed ----
  Vesk2ContextStruct* GetContext() const { return context; }
  const char* GetDirectory() const { return directory; }
  const char* GetManifestPath() const { return manifestPath; }
  SExpression* GetTag() const { return tag; }
  bool GetFailOnExtraEntries() const { return failOnExtraEntries; }
  const char* GetExtraAclDirectory() const { return extraAclDirectory; }
  FileItem* GetValid() const { return valid; }
  FileItem* GetInvalid() const { return invalid; }
  FileItem* GetMissing() const { return missing; }
  FileItem* GetExtra() const { return extra; }
  FileItem* GetIgnoredEntries() const { return ignoredEntries; }
  // Null before and after a failed read.
  SExpression* GetVersion() const { return version; }
  SExpression* GetType() const { return type; }
  TimeStamp* GetSigningTime() const { return signingTime; }
  // The byte of the manifest file that the last read had come to: after an error of a reader, where
  // the text stopped making sense.
  size_t GetReadPosition() const { return readPosition; }

 private:
  friend class ManifestReader;
  void ClearResults();

  Vesk2ContextStruct* context;
  char* directory = nullptr;
  char* manifestPath = nullptr;
  SExpression* tag = nullptr;
  bool failOnExtraEntries = false;
  char* extraAclDirectory = nullptr;
  FileItem* valid = nullptr;
  FileItem* invalid = nullptr;
  FileItem* missing = nullptr;
  FileItem* extra = nullptr;
  FileItem* ignoredEntries = nullptr;
  SExpression* version = nullptr;
  SExpression* type = nullptr;
  TimeStamp* signingTime = nullptr;
  size_t readPosition = 0;
};

}  // namespace ZvVesk2

#endif  // VESK2_MANIFEST_H
