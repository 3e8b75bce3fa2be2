// SPDX-License-Identifier: Apache-2.0
// manifest_writer.h: ManifestWriter, which makes a manifest up to the signatures: the library holds
// no private key. Whoever holds one asks for the digest, issues a certificate for it, and hands the
// certificates in.
//
//   ManifestWriter writer(ctx);
//   writer.SetHead("my tool 1.0", signedAt);
//   writer.BeginBody(token);                     // 4 random bytes
//   writer.AddFile("calc", digest);              // 32 bytes of SHA-256
//   writer.OpenDirectory("lib"); ... writer.CloseDirectory();
//   writer.EndBody();
//   writer.SignedDigest(subject, ZVCLM_HASH_SHA256);
//   writer.AddCertificate(cert, signature);      // for `subject`; then those for its issuer
//   writer.AddList(list);
//   writer.Write(stream);
//
// What it writes is what Manifest reads; it refuses what Manifest would refuse by its form.
#ifndef VESK2_MANIFEST_WRITER_H
#define VESK2_MANIFEST_WRITER_H

#include <vesk2/cert.h>
#include <vesk2/crl.h>
#include <vesk2/hash.h>
#include <vesk2/signature.h>
#include <vesk2/time_stamp.h>

#include <cstdio>

namespace ZvVesk2 {

// ManifestWriter grows one manifest, in memory, and may write it any number of times. It may lie on
// the stack. Without memory at its birth every call answers VESK2_ERR_MEM_ALLOC.
//
// What it makes is no more careful than its caller: a manifest whose body lists nothing agrees with
// a directory that is not there, so see that something is listed (`vesk2 manifest sign` wants
// `--allow-empty` for it), and the time of signing is what is given.
class VESK2_API ManifestWriter {
 public:
  // Every call but the constructor and destructor returns 0 or a code: VESK2_ERR_INVALID_PARAM for
  // a null argument or a call out of turn, VESK2_ERR_MEM_ALLOC, and what is said of the call. A
  // call that fails changes nothing; one that lacked memory may be made again. `ctx` may be null,
  // and must outlive the object.
  explicit ManifestWriter(Vesk2ContextStruct* ctx);
  ~ManifestWriter();
  ManifestWriter(const ManifestWriter&) = delete;
  ManifestWriter& operator=(const ManifestWriter&) = delete;

  // SetHead says what made the manifest, in the maker's own words (1 to 8192 bytes), and when it
  // was signed: a full stamp of 19 characters, copied. Called again it replaces what was said, and
  // with it the digest that is to be signed. VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_TIME_STAMP.
  [[nodiscard]] int SetHead(const char* creator, TimeStamp* signedAt);

  // BeginBody starts the listing, EndBody ends it. Entries lie between them, in any order; those of
  // a directory between its OpenDirectory and CloseDirectory, at most Limits::kMaxDepth levels
  // deep. A name is one bare component: not empty, ".", ".." nor with "/"
  // (VESK2_ERR_INVALID_PARAM), at most Limits::kMaxBodyPath bytes (VESK2_ERR_MAX_BYTE_STRING). The
  // path that it makes with the directories above it is not measured: one of over
  // Limits::kMaxBodyPath bytes is written, and refused when it is read. Draw `token` at random,
  // anew for each manifest.
  [[nodiscard]] int BeginBody(const unsigned char (&token)[4]);
  [[nodiscard]] int AddFile(const char* name, const unsigned char (&sha256)[32]);
  [[nodiscard]] int OpenDirectory(const char* name);
  [[nodiscard]] int CloseDirectory();
  [[nodiscard]] int EndBody();
  // The body so far, borrowed until the next call, and its bytes in *length (may be null); null
  // before BeginBody.
  const char* GetBody(size_t* length) const;

  // SignedDigest makes the hash that the signer certificate must have as its subject, for the
  // caller to free: over the head and the body, both complete. `out` must be null.
  // VESK2_ERR_HASH_ID for an unknown algorithm, the crypto layer's codes.
  [[nodiscard]] int SignedDigest(Hash*& out, ZvclmHashID id);
  // AddCertificate adds a certificate with its signature, both shared. The signer's comes first; at
  // least one more must speak for its issuer. Neither signatures nor their order are verified:
  // verify what was written.
  [[nodiscard]] int AddCertificate(Cert* cert, Signature* signature);
  // AddList lets the manifest carry a revocation list, shared. The signature does not cover it:
  // readers must not rely on it.
  [[nodiscard]] int AddList(CrlSequence* list);
  // Write writes the whole manifest in canonical form: the head, two certificates at least, and the
  // body must be there. The stream is neither flushed nor closed here. VESK2_ERR_WRITE_FILE leaves
  // part of it written.
  [[nodiscard]] int Write(FILE* stream);

 private:
  struct Parts;
  Parts* parts_;  // null when there was no memory
};

}  // namespace ZvVesk2

#endif  // VESK2_MANIFEST_WRITER_H
