/* SPDX-License-Identifier: Apache-2.0 */
/* vesk2.h: the flat interface of libvesk2.
 *
 * libvesk2 answers, offline, whether signed objects are to be trusted: is this directory exactly
 * what its signed manifest says, and was its signer authorized for it? This header is all that a
 * C or C++ program needs; the exported C++ classes are in vesk2.hpp.
 *
 * Conventions
 *   - Functions return an int: 0 is success, a positive value is a VESK2_ERR_* code, a negative one
 *     an SPKI_ERR_* code of the reduction engine, from the functions that verify a chain only.
 *   - Times are seconds since 1970-01-01 00:00:00 UTC; 0 means "not given". Lengths are bytes.
 *   - Text is 0-terminated bytes. A function whose name ends in A takes 8-bit ASCII text where its
 *     base function takes the platform's file-name string; on Linux both are bytes.
 *   - Arrays and strings handed out are released with Vesk2Free, records with the function named
 *     beside them. Outputs are null after a failure unless a function says otherwise.
 *   - The library starts no thread and takes no lock. The store roots are process-wide; everything
 *     else belongs to the objects a caller makes, which must not be shared between threads.
 *   - Nothing is cached: every verification reads the stores and the files afresh, and its answer
 *     speaks of the moment of reading only.
 */
#ifndef VESK2_H
#define VESK2_H

#include <stddef.h>
#include <stdint.h>
#include <time.h>

#if defined(__GNUC__)
#define VESK2_API __attribute__((visibility("default")))
/* What belongs to an exported class and is not for callers. */
#define VESK2_LOCAL __attribute__((visibility("hidden")))
/* The result is the answer that the call was made for: a program that drops it trusts whatever it
 * asked about. Compilers warn of that; a cast to void does not silence all of them. */
#define VESK2_VERDICT VESK2_API __attribute__((warn_unused_result))
#else
#define VESK2_API
#define VESK2_LOCAL
#define VESK2_VERDICT
#endif

/* ---- Error codes --------------------------------------------------------------------------- */

/* One row a code: number, constant, the text that Vesk2ErrorMessage returns. 0 and 1 have no
 * constant of their own in the list of failures. Code 67's text is a sentence, and 41 and 42 are
 * spelled ERROR: what searches logs for these texts finds them so. */
#define VESK2_ERROR_TABLE(X)                                                  \
  X(0, VESK2_SUCCESS, "Success")                                              \
  X(1, VESK2_GENERAL_FAILURE, "Failure")                                      \
  X(2, VESK2_ERR_INVALID_PARAM, "VESK2_ERR_INVALID_PARAM")                    \
  X(3, VESK2_ERR_MEM_ALLOC, "VESK2_ERR_MEM_ALLOC")                            \
  X(4, VESK2_ERR_STAT_FILE, "VESK2_ERR_STAT_FILE")                            \
  X(5, VESK2_ERR_FILE_NOT_FOUND, "VESK2_ERR_FILE_NOT_FOUND")                  \
  X(6, VESK2_ERR_INVALID_DATA, "VESK2_ERR_INVALID_DATA")                      \
  X(7, VESK2_ERR_FILE_OPEN, "VESK2_ERR_FILE_OPEN")                            \
  X(8, VESK2_ERR_RESERVED8, "VESK2_ERR_RESERVED8")                            \
  X(9, VESK2_ERR_PARSE_FILE, "VESK2_ERR_PARSE_FILE")                          \
  X(10, VESK2_ERR_READ_FILE, "VESK2_ERR_READ_FILE")                           \
  X(11, VESK2_ERR_PRINCIPAL, "VESK2_ERR_PRINCIPAL")                           \
  X(12, VESK2_ERR_INVALID_HASH, "VESK2_ERR_INVALID_HASH")                     \
  X(13, VESK2_ERR_UNKNOWN_HASH_ID, "VESK2_ERR_UNKNOWN_HASH_ID")               \
  X(14, VESK2_ERR_MAX_BYTE_STRING, "VESK2_ERR_MAX_BYTE_STRING")               \
  X(15, VESK2_ERR_SIGNATURE_ID, "VESK2_ERR_SIGNATURE_ID")                     \
  X(16, VESK2_ERR_HASH_ID, "VESK2_ERR_HASH_ID")                               \
  X(17, VESK2_ERR_BIG_INT_BUFFER_SIZE, "VESK2_ERR_BIG_INT_BUFFER_SIZE")       \
  X(18, VESK2_ERR_NOT_IMPLEMENTED, "VESK2_ERR_NOT_IMPLEMENTED")               \
  X(19, VESK2_ERR_OPEN_MANIFEST_FILE, "VESK2_ERR_OPEN_MANIFEST_FILE")         \
  X(20, VESK2_ERR_COMMAND_LINE_OPTION, "VESK2_ERR_COMMAND_LINE_OPTION")       \
  X(21, VESK2_ERR_SIGNATURE, "VESK2_ERR_SIGNATURE")                           \
  X(22, VESK2_ERR_HASH_MISMATCH, "VESK2_ERR_HASH_MISMATCH")                   \
  X(23, VESK2_ERR_PRIVATE_KEY_TYPE, "VESK2_ERR_PRIVATE_KEY_TYPE")             \
  X(24, VESK2_ERR_NOT_SUPPORTED, "VESK2_ERR_NOT_SUPPORTED")                   \
  X(25, VESK2_ERR_CREATE_DIR, "VESK2_ERR_CREATE_DIR")                         \
  X(26, VESK2_ERR_FIND_DIR, "VESK2_ERR_FIND_DIR")                             \
  X(27, VESK2_ERR_SUB_COMMAND, "VESK2_ERR_SUB_COMMAND")                       \
  X(28, VESK2_ERR_UNEXPECTED_CHAR, "VESK2_ERR_UNEXPECTED_CHAR")               \
  X(29, VESK2_ERR_INVALID_S_EXPRESSION, "VESK2_ERR_INVALID_S_EXPRESSION")     \
  X(30, VESK2_ERR_BUFFER_OVERFLOW, "VESK2_ERR_BUFFER_OVERFLOW")               \
  X(31, VESK2_ERR_NOT_AUTHORIZED, "VESK2_ERR_NOT_AUTHORIZED")                 \
  X(32, VESK2_ERR_HASH_MATCH, "VESK2_ERR_HASH_MATCH")                         \
  X(33, VESK2_ERR_RANDOM_TOKEN, "VESK2_ERR_RANDOM_TOKEN")                     \
  X(34, VESK2_ERR_TIME_STAMP, "VESK2_ERR_TIME_STAMP")                         \
  X(35, VESK2_ERR_AUTH_TAG_MISSING, "VESK2_ERR_AUTH_TAG_MISSING")             \
  X(36, VESK2_ERR_SIGNING_CERT_ORDER, "VESK2_ERR_SIGNING_CERT_ORDER")         \
  X(37, VESK2_ERR_CONTAINING_DIR, "VESK2_ERR_CONTAINING_DIR")                 \
  X(38, VESK2_ERR_PARAM_NULL, "VESK2_ERR_PARAM_NULL")                         \
  X(39, VESK2_ERR_PARAM_NOT_NULL, "VESK2_ERR_PARAM_NOT_NULL")                 \
  X(40, VESK2_ERR_ALL_USERS_DIR, "VESK2_ERR_ALL_USERS_DIR")                   \
  X(41, VESK2_ERROR_SUBJECT_FOUND, "VESK2_ERROR_SUBJECT_FOUND")               \
  X(42, VESK2_ERROR_FINDING_ISSUER, "VESK2_ERROR_FINDING_ISSUER")             \
  X(43, VESK2_ERR_LOG_FILE_OPEN, "VESK2_ERR_LOG_FILE_OPEN")                   \
  X(44, VESK2_ERR_ZERO_AUTH_MATCH, "VESK2_ERR_ZERO_AUTH_MATCH")               \
  X(45, VESK2_ERR_MULTI_AUTH_MATCH, "VESK2_ERR_MULTI_AUTH_MATCH")             \
  X(46, VESK2_ERR_ISSUER_SIGNER_MATCH, "VESK2_ERR_ISSUER_SIGNER_MATCH")       \
  X(47, VESK2_ERR_ISSUER_MISMATCH, "VESK2_ERR_ISSUER_MISMATCH")               \
  X(48, VESK2_ERR_PROPAGATE, "VESK2_ERR_PROPAGATE")                           \
  X(49, VESK2_ERR_NO_ISSUER_FOUND, "VESK2_ERR_NO_ISSUER_FOUND")               \
  X(50, VESK2_ERR_SIGNER_AUTH_NARROWER, "VESK2_ERR_SIGNER_AUTH_NARROWER")     \
  X(51, VESK2_ERR_NOT_BEFORE, "VESK2_ERR_NOT_BEFORE")                         \
  X(52, VESK2_ERR_NOT_AFTER, "VESK2_ERR_NOT_AFTER")                           \
  X(53, VESK2_ERR_NEEDS_MORE_SIGNING, "VESK2_ERR_NEEDS_MORE_SIGNING")         \
  X(54, VESK2_ERR_ACL_ENTRY_NOT_FOUND, "VESK2_ERR_ACL_ENTRY_NOT_FOUND")       \
  X(55, VESK2_ERR_AUTH_NOT_SUBSET, "VESK2_ERR_AUTH_NOT_SUBSET")               \
  X(56, VESK2_ERR_MANIFEST_VERSION, "VESK2_ERR_MANIFEST_VERSION")             \
  X(57, VESK2_ERR_MANIFEST_TYPE, "VESK2_ERR_MANIFEST_TYPE")                   \
  X(58, VESK2_ERR_NOT_BEFORE_AFTER, "VESK2_ERR_NOT_BEFORE_AFTER")             \
  X(59, VESK2_ERR_NO_REVOCATION_ACL, "VESK2_ERR_NO_REVOCATION_ACL")           \
  X(60, VESK2_ERR_USER_INTERRUPT, "VESK2_ERR_USER_INTERRUPT")                 \
  X(61, VESK2_ERR_NO_REVOCATION_SPEC, "VESK2_ERR_NO_REVOCATION_SPEC")         \
  X(62, VESK2_ERR_ACL_KEY_NOT_FOUND, "VESK2_ERR_ACL_KEY_NOT_FOUND")           \
  X(63, VESK2_ERR_AUTH_TAGS_ARE_EQUAL, "VESK2_ERR_AUTH_TAGS_ARE_EQUAL")       \
  X(64, VESK2_ERR_INVALID_SEQUENCE, "VESK2_ERR_INVALID_SEQUENCE")             \
  X(65, VESK2_ERR_ALREADY_ISSUED_BY_KEY, "VESK2_ERR_ALREADY_ISSUED_BY_KEY")   \
  X(66, VESK2_ERR_CERT_REVOKED, "VESK2_ERR_CERT_REVOKED")                     \
  X(67, VESK2_ERR_PACKAGE_NOT_GRANTED,                                        \
    "The specified package is not granted the specified authorization")       \
  X(68, VESK2_ERR_KEY_REVOKED, "VESK2_ERR_KEY_REVOKED")                       \
  X(69, VESK2_ERR_NOT_IN_LIST, "VESK2_ERR_NOT_IN_LIST")                       \
  X(70, VESK2_ERR_INVALID_REVOCATION_TAG, "VESK2_ERR_INVALID_REVOCATION_TAG") \
  X(71, VESK2_ERR_NOT_OBJECT_CERT, "VESK2_ERR_NOT_OBJECT_CERT")               \
  X(72, VESK2_ERR_INVALID_PASSPHRASE, "VESK2_ERR_INVALID_PASSPHRASE")         \
  X(73, VESK2_ERR_CRL_NOT_FOUND, "VESK2_ERR_CRL_NOT_FOUND")                   \
  X(74, VESK2_ERR_EXTRA_FILES, "VESK2_ERR_EXTRA_FILES")                       \
  X(75, VESK2_ERR_FAILURE, "VESK2_ERR_FAILURE")                               \
  X(76, VESK2_ERR_WRITE_FILE, "VESK2_ERR_WRITE_FILE")                         \
  X(77, VESK2_MAX_ERROR, "VESK2_MAX_ERROR")

/* One row a code of the reduction engine, in the order in which ZvVesk2::V2SpkiError searches. */
#define VESK2_SPKI_ERROR_TABLE(X)                                                              \
  X(-126, SPKI_ERR_NULL_PARAM, "SPKI_ERR_NULL_PARAM")                                          \
  X(-129, SPKI_ERR_NO_MEM, "SPKI_ERR_NO_MEM")                                                  \
  X(-130, SPKI_ERR_BAD_SEXP, "SPKI_ERR_BAD_SEXP")                                              \
  X(-132, SPKI_ERR_LTH_TOO_BIG, "SPKI_ERR_LTH_TOO_BIG")                                        \
  X(-135, SPKI_ERR_BAD_LTH_FORMAT, "SPKI_ERR_BAD_LTH_FORMAT")                                  \
  X(-136, SPKI_ERR_COLON_EXPECTED, "SPKI_ERR_COLON_EXPECTED")                                  \
  X(-137, SPKI_ERR_DISP_HINT_NOT_CLOSED, "SPKI_ERR_DISP_HINT_NOT_CLOSED")                      \
  X(-138, SPKI_ERR_DISP_HINT_TOO_LONG, "SPKI_ERR_DISP_HINT_TOO_LONG")                          \
  X(-139, SPKI_ERR_STRING_TOO_LONG, "SPKI_ERR_STRING_TOO_LONG")                                \
  X(-140, SPKI_ERR_BAD_SEXP_START, "SPKI_ERR_BAD_SEXP_START")                                  \
  X(-142, SPKI_ERR_BAD_SEXP_FORMAT, "SPKI_ERR_BAD_SEXP_FORMAT")                                \
  X(-143, SPKI_ERR_SEXP_NOT_CLOSED, "SPKI_ERR_SEXP_NOT_CLOSED")                                \
  X(-145, SPKI_ERR_NOT_HASH_SEXP, "S-exp isn't a (hash...)")                                   \
  X(-146, SPKI_ERR_UNKNOWN_HASH_ALG, "Unknown hash algorithm")                                 \
  X(-147, SPKI_ERR_BAD_HASH_FORMAT, "Bad format for (hash...)")                                \
  X(-149, SPKI_ERR_HASH_LTH_DIFFER, "Hash value lengths differ")                               \
  X(-150, SPKI_ERR_NO_ACL,                                                                     \
    "No ACL was provided for reduction without an ACL, there can be no results")               \
  X(-151, SPKI_ERR_ACL_HAS_ISSUER, "An ACL entry should have no issuer field")                 \
  X(-152, SPKI_ERR_NEED_ISSUER, "A non-ACL needs an issuer")                                   \
  X(-153, SPKI_ERR_ISSUER_NAME_AND_AUTH, "Credential with both issuer name and authorization") \
  X(-155, SPKI_ERR_ISSUER_SYNTAX, "Syntax error in (issuer ..)")                               \
  X(-156, SPKI_ERR_SUBJECT_SYNTAX, "Syntax error in (subject ..)")                             \
  X(-157, SPKI_ERR_KOFN_SYNTAX, "Bad k-of-n syntax")                                           \
  X(-158, SPKI_ERR_ISSUER_UNRESOLVED,                                                          \
    "Issuer could not be resolved to a public key -- so could not have been validated.  "      \
    "Rejected during processing.")                                                             \
  X(-159, SPKI_ERR_TOO_MANY_NOT_BEFORE, "Too many not-before dates")                           \
  X(-160, SPKI_ERR_TOO_MANY_NOT_AFTER, "Too many not-after dates")                             \
  X(-161, SPKI_ERR_TOO_MANY_ISSUERS, "Too many issuers")                                       \
  X(-162, SPKI_ERR_TOO_MANY_SUBJECTS, "Too many subjects")                                     \
  X(-163, SPKI_ERR_TOO_MANY_PROPAGATE, "Too many propagate fields")                            \
  X(-164, SPKI_ERR_TOO_MANY_TAGS, "Too many tag fields")                                       \
  X(-165, SPKI_ERR_KEY_OR_HASH_EXPECTED, "Public key or hash expected")                        \
  X(-166, SPKI_ERR_THRESHOLD, "Error processing a threshold block")                            \
  X(-167, SPKI_ERR_BAD_NAME_SYNTAX, "Bad name syntax -- not a list of byte strings")           \
  X(-168, SPKI_ERR_DATE_INTERSECTION, "Date intersection failed")                              \
  X(-200, SPKI_ERR_UNKNOWN, "Unknown SPKI problem")

#define VESK2_ENUM_ROW(number, name, text) name = number,
/* Results of the library, 0 to 76; VESK2_MAX_ERROR is never returned. */
enum Vesk2Error { VESK2_ERROR_TABLE(VESK2_ENUM_ROW) };
/* Results of the reduction engine; all negative. */
enum Vesk2SpkiError { VESK2_SPKI_ERROR_TABLE(VESK2_ENUM_ROW) };
#undef VESK2_ENUM_ROW

/* ---- Records ------------------------------------------------------------------------------- */

/* The context: made by Vesk2Init, handed to the calls that take one, freed with Vesk2FreeContext
 * after every object made with it is gone. A null context is accepted everywhere. */
typedef struct Vesk2ContextStruct {
  uint32_t cryptoHandle; /* the value given to Vesk2Init; passed on to every crypto call */
} Vesk2ContextStruct;

/* One file or directory name in a chain: results of a manifest comparison, names to ignore, names
 * found in a store. */
typedef struct FileItem {
  char* name;   /* the name, platform form; owned */
  char* name2;  /* null in every record that the library makes */
  char* nameA;  /* the name, ASCII form; owned, and may be the same array as `name` */
  char* name2A; /* null in every record that the library makes */
  struct FileItem* next;
  uint32_t size;       /* 28 in every record that the library makes: a format mark, not a sizeof */
  int32_t isDirectory; /* 1 for a directory, else 0 */
} FileItem;

/* What a caller wants to hear while files are read and hashed (SetFileCallbacks). Each function may
 * be null. They are called on the thread that called the library, between its reads: what they
 * take, the verification takes longer. They must return (no exception, no longjmp), and leave the
 * manifest that is being verified and the store roots alone; any other call is theirs. */
typedef struct Vesk2FileCallbacks {
  uint32_t size; /* sizeof(Vesk2FileCallbacks) */
  void* user;    /* handed to every call */
  /* A file was opened; it holds `bytes` bytes. Files that cannot be opened are not told. The path
   * comes from the manifest: whoever signed it chose its bytes. */
  int (*fileStart)(void* user, const char* path, uint64_t bytes);
  /* `bytes` more bytes of that file were hashed: 1 to 65536. */
  int (*fileBytes)(void* user, uint64_t bytes);
  /* The file is done with, completely or not; `code` is 0 or why its digest is not known. */
  void (*fileEnd)(void* user, const char* path, int code);
} Vesk2FileCallbacks;

/* Objects that C holds by pointer only: the classes of these names in vesk2.hpp. */
#ifdef __cplusplus
namespace ZvVesk2 {
class CertSequence;
class CrlSequence;
class Manifest;
}  // namespace ZvVesk2
using ZvVesk2::CertSequence;
using ZvVesk2::CrlSequence;
using ZvVesk2::Manifest;
#else
typedef struct CertSequence CertSequence;
typedef struct CrlSequence CrlSequence;
typedef struct Manifest Manifest;
#endif

/* One certificate of a sequence, in a chain in the sequence's order (the end entity first). */
typedef struct Vesk2CertInfoStruct {
  uint32_t size;          /* 44: a format mark, not a sizeof */
  CertSequence* sequence; /* the same in every record; the chain holds one reference */
  time_t notBefore;       /* 0 when the certificate has none */
  time_t notAfter;        /* 0 when the certificate has none */
  char* tag;              /* body of the tag as text, or null */
  char* owner;            /* body of the (owner ...) that follows the signature, or null */
  unsigned char* keyData; /* the subject's key, DER SubjectPublicKeyInfo; null for other subjects */
  uint32_t keyLength;
  char* hashText; /* the signature's hash as text; its digest is raw bytes, so use the length */
  uint32_t hashTextLength;
  struct Vesk2CertInfoStruct* next;
} Vesk2CertInfoStruct;

/* One revocation list with the certificate that vouches for it. */
typedef struct Vesk2CrlInfoStruct {
  uint32_t size;    /* 20: a format mark, not a sizeof */
  CrlSequence* crl; /* the record holds one reference */
  time_t notBefore; /* of the certificate; 0 when it has none */
  time_t notAfter;  /* of the certificate; 0 when it has none */
  char* tag;        /* body of the certificate's tag as text, or null */
} Vesk2CrlInfoStruct;

/* One reason why an answer is no. Texts are safe for a terminal, whoever wrote what they name. */
typedef struct Vesk2ReasonStruct {
  const char* kind;          /* a stable word, static: see Vesk2ExplanationStruct */
  char* text;                /* the reason in words */
  uint32_t certificate;      /* its number in the chain, counted from 1; 0: about none */
  uint32_t otherCertificate; /* the one whose period it does not meet, else 0 */
  char* entry;  /* the ACL entry: the name of its file in the store, or its path; or null */
  char* source; /* the tag of the revocation lists that were asked, or null */
  struct Vesk2ReasonStruct* next;
} Vesk2ReasonStruct;

/* Why an answer is what it is, and what was found on the way to it. The record, its texts and its
 * reasons are the caller's, to be freed together with Vesk2FreeExplanation. The kinds of reasons:
 *   signature, order, content, unreadable      of what was read
 *   revoked, key-revoked, undetermined         by the revocation lists, or for want of one
 *   period, tag, link, propagate               of a certificate or an ACL entry
 *   no-entry, threshold, combination           of the ACL store */
typedef struct Vesk2ExplanationStruct {
  uint32_t size;              /* sizeof the library's record; members may be added at its end */
  int32_t code;               /* the answer */
  int32_t isComplete;         /* 0 when looking for reasons was stopped, for what it cost */
  Vesk2ReasonStruct* reasons; /* in a chain, the first place where authority was lost first */
  /* Of a manifest. The numbers are 0 unless the tree was compared. */
  char* signer;     /* the fingerprint of the key that signed it; null unless its signature holds */
  time_t signedAt;  /* as the manifest says; 0 when that was not read */
  uint64_t listed;  /* files that the manifest lists */
  uint64_t valid;   /* files as they were signed */
  uint64_t changed; /* files that differ, and directories that could not be listed */
  uint64_t missing; /* files */
  uint64_t extra;   /* files and directories that are not listed */
  /* What authority rests on, when there is any. */
  char* entry;            /* the ACL entry, as above; null when several grant together */
  uint32_t* certificates; /* the numbers of those that are needed, from the root on */
  uint32_t certificateCount;
  time_t holdsUntil;   /* asked about a later moment, the answer would be no; 0: it has no end */
  const char* endedBy; /* what ends then, static: certificate, entry or list; or null */
  uint32_t endCertificate; /* that certificate, or the one that the list speaks for; else 0 */
} Vesk2ExplanationStruct;

#ifdef __cplusplus
extern "C" {
#endif

/* ---- Context and memory -------------------------------------------------------------------- */

/* Vesk2Init makes a context that carries `value` (the crypto library's handle; 0 is fine) and
 * stores it in *ctx. Returns 0 or VESK2_ERR_MEM_ALLOC (*ctx then null). A null `ctx` is not an
 * error: nothing is made and 0 returned. */
VESK2_API int Vesk2Init(Vesk2ContextStruct** ctx, uint32_t value);

/* Vesk2FreeContext deletes a context; null is allowed. Always 0. */
VESK2_API int Vesk2FreeContext(Vesk2ContextStruct* ctx);

/* Vesk2Free releases a string or byte array that the library handed out; null is allowed. */
VESK2_API void Vesk2Free(void* array);

/* Vesk2DoNothing does nothing. Hosts call it to see that the library is loaded. */
VESK2_API void Vesk2DoNothing(void);

/* ---- Store roots --------------------------------------------------------------------------- */

/* Vesk2HomeDirectory and Vesk2GlobalDirectory set the per-user and the machine-wide store root. The
 * text is copied, cut after 4096 bytes; null sets the empty root, with which no store is found. The
 * directory is not checked. Set both before any other call uses a store. */
VESK2_API void Vesk2HomeDirectory(const char* directory);
VESK2_API void Vesk2GlobalDirectory(const char* directory);
VESK2_API void Vesk2HomeDirectoryA(const char* directory);
VESK2_API void Vesk2GlobalDirectoryA(const char* directory);

/* ---- Text ---------------------------------------------------------------------------------- */

/* Vesk2WideToAscii copies at most `length` bytes of the file-name string `text` as ASCII text, and
 * Vesk2AsciiToWide the other way. The copy stops at a 0 byte and is terminated. If `outLength` is
 * not null it receives the copy's length. Returns the copy, to be released with Vesk2Free, or null
 * (length 0) for a null text or when memory runs out. */
VESK2_API char* Vesk2WideToAscii(const char* text, uint32_t length, unsigned int* outLength);
VESK2_API char* Vesk2AsciiToWide(const char* text, uint32_t length, unsigned int* outLength);

/* ---- Version and error texts; all texts are static ------------------------------------------ */

/* Vesk2VersionNumber returns 10100. */
VESK2_API int Vesk2VersionNumber(void);
/* Vesk2VersionExtra and Vesk2VersionExtraA return the version tag "r2441". */
VESK2_API const char* Vesk2VersionExtra(void);
VESK2_API const char* Vesk2VersionExtraA(void);
/* Vesk2ErrorMessage returns the text of a code from 0 to 76, for any other (77 included)
 * "VESK_UNKNOWN_ERROR". */
VESK2_API const char* Vesk2ErrorMessage(int code);
/* Vesk2ErrorName returns the constant's name of a code of either table; for a number that is none
 * "VESK_UNKNOWN_ERROR". */
VESK2_API const char* Vesk2ErrorName(int code);
/* Vesk2ErrorWords says in words what a code of either table means: what a program shows to people,
 * the codes of the reduction included. A code without words gives its name. */
VESK2_API const char* Vesk2ErrorWords(int code);

/* Vesk2Escape returns a copy of `length` bytes that is safe to be shown, to be released with
 * Vesk2Free: control bytes, invalid UTF-8 and characters that turn or break lines are \xNN, and a
 * backslash is doubled. Null for null, and when memory runs out. */
VESK2_API char* Vesk2Escape(const void* bytes, size_t length);

/* ---- Name records -------------------------------------------------------------------------- */

/* FreeFileItemList frees a chain that the library handed to the caller and returns the number of
 * records freed (0 for null). The lists of a manifest context are not the caller's to free. */
VESK2_API unsigned int FreeFileItemList(FileItem* chain);

/* ---- Manifests ----------------------------------------------------------------------------- */

/* CreateManifestContext makes a context that checks `directory` against the manifest file
 * `manifestPath` for the authorization `tagText` (the body of a tag in advanced form, such as
 * "(install (app calc))"). All texts are copied. On success *out receives the context, to be
 * released with DeleteManifestContext.
 *   VESK2_ERR_INVALID_PARAM  *out is not null (and is left alone), or an argument is null
 *   VESK2_ERR_MEM_ALLOC, and what the parser of the tag text reports. */
VESK2_API int CreateManifestContext(Manifest** out, const char* directory, const char* manifestPath,
                                    const char* tagText);
VESK2_API int CreateManifestContextA(Manifest** out, const char* directory,
                                     const char* manifestPath, const char* tagText);

/* DeleteManifestContext destroys a context and its result lists; null is allowed. */
VESK2_API void DeleteManifestContext(Manifest* manifest);

/* The setters below must be called before the verification that they are to affect. None of the
 * setters and getters tests its manifest pointer. */

/* FailOnExtraEntries makes VerifyManifest answer VESK2_ERR_EXTRA_FILES when nothing worse than
 * unlisted entries was found; without it such a directory passes and only the extra list tells. */
VESK2_API void FailOnExtraEntries(Manifest* manifest);

/* SetExtraAclDirectory names a directory of ACL entries that are trusted beside the store's. The
 * text is copied; null takes the setting back. Every "*.acl" file there becomes a trust root:
 * protect it as you protect the store. */
VESK2_API void SetExtraAclDirectory(Manifest* manifest, const char* directory);
VESK2_API void SetExtraAclDirectoryA(Manifest* manifest, const char* directory);

/* SetIgnoredEntries replaces the names (paths relative to the directory) that a comparison leaves
 * out. Records are copied, in reverse order; those with neither name nor nameA are skipped. Null
 * clears the list. The caller keeps `list`. */
VESK2_API void SetIgnoredEntries(Manifest* manifest, const FileItem* list);

/* SetFileCallbacks has VerifyManifest tell about the files that it hashes. The record is copied;
 * null takes the setting back. Anything but 0 from fileStart or fileBytes ends the verification,
 * which then answers VESK2_ERR_USER_INTERRUPT and has no results. CompareManifest hashes no files.
 * VESK2_ERR_INVALID_PARAM for a record of another size. */
VESK2_API int SetFileCallbacks(Manifest* manifest, const Vesk2FileCallbacks* callbacks);

/* SetStoreUpdate with 0 keeps VerifyManifest from offering the revocation lists that the manifest
 * carries to the store, which it does otherwise: nothing is written then. The lists count in the
 * verification all the same. */
VESK2_API void SetStoreUpdate(Manifest* manifest, int update);

/* VerifyManifest proves the manifest's signatures, that its chain grants the tag for a period that
 * meets the one from `notBefore` to `notAfter` (both times 0: that grants it at the moment of
 * signing), that the body is the one that was signed, and compares the directory with it. Unlisted
 * entries are looked for below the root only, not in `directory` itself. Fills the four result
 * lists.
 *
 * About the tree, told by the lists (with four empty lists none of these is about the tree):
 *   0                             the directory is as signed, by an authorized signer
 *   VESK2_ERR_HASH_MISMATCH       an entry differs; VESK2_ERR_FILE_NOT_FOUND one is missing;
 *   VESK2_ERR_EXTRA_FILES         one is unlisted (see FailOnExtraEntries); in this priority
 * About the signatures and the content:
 *   VESK2_ERR_HASH_MISMATCH       (22) a signature is over another certificate: the lists are empty
 *   VESK2_ERR_SIGNATURE           one does not hold, or is not its certificate's issuer's
 *   VESK2_ERR_SIGNATURE_ID        by an unknown algorithm; VESK2_ERR_HASH_ID an unknown hash
 *   VESK2_ERR_NOT_IMPLEMENTED     the signer's key is of a kind that cannot be verified
 *   VESK2_ERR_NOT_OBJECT_CERT     the first certificate is not for a digest
 *   VESK2_ERR_HASH_MATCH          the content is not the one that was signed
 * About the signer's authority:
 *   VESK2_ERR_FILE_NOT_FOUND      (5) there is no ACL entry to go by: the lists are empty
 *   VESK2_ERR_NOT_AUTHORIZED      nothing is granted; VESK2_ERR_PACKAGE_NOT_GRANTED not the tag
 *   VESK2_ERR_CERT_REVOKED        the signer certificate is revoked; VESK2_ERR_CRL_NOT_FOUND no
 *                                 current list tells whether it is
 *   VESK2_ERR_SIGNING_CERT_ORDER  the second certificate that is left is not the signer's own
 *   SPKI_ERR_*                    an entry or certificate that the reduction cannot read, or a
 *                                 spent budget
 * About the manifest file:
 *   VESK2_ERR_OPEN_MANIFEST_FILE; VESK2_ERR_MANIFEST_VERSION, VESK2_ERR_MANIFEST_TYPE;
 *   VESK2_ERR_TIME_STAMP          the time of signing, or one that was asked about, is none
 *   VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_PRINCIPAL, VESK2_ERR_INVALID_HASH,
 *   VESK2_ERR_BUFFER_OVERFLOW, VESK2_ERR_BIG_INT_BUFFER_SIZE of its readers;
 *   VESK2_ERR_RANDOM_TOKEN, VESK2_ERR_UNKNOWN_HASH_ID of its listing's
 * Otherwise:
 *   VESK2_ERR_USER_INTERRUPT      a callback ended it (SetFileCallbacks)
 *   VESK2_ERR_READ_FILE           another process held a file of a store for a minute
 *   VESK2_ERR_MEM_ALLOC           memory or descriptors ran out; nothing was decided then */
VESK2_VERDICT int VerifyManifest(Manifest* manifest, time_t notBefore, time_t notAfter);

/* VerifyManifestExplained is VerifyManifest and tells why: *out receives the explanation, of a yes,
 * of a no and of a file that cannot be read alike. After a refusal the rest of the manifest is read
 * for it; the answer stays the same. *out is null when memory ran out: the answer stands. Keeps
 * nothing of its own. VESK2_ERR_PARAM_NULL for a null `out`. */
VESK2_VERDICT int VerifyManifestExplained(Manifest* manifest, time_t notBefore, time_t notAfter,
                                          Vesk2ExplanationStruct** out);

/* CompareManifest compares this manifest's body (the reference) with that of another manifest.
 * Signatures and digests of both are proved, authority is not. Results as in VerifyManifest. */
VESK2_VERDICT int CompareManifest(Manifest* manifest, const char* otherManifestPath);
VESK2_VERDICT int CompareManifestA(Manifest* manifest, const char* otherManifestPath);

/* GetTimeOfSigning returns the signing time of the last successful read, or 0. */
VESK2_API time_t GetTimeOfSigning(Manifest* manifest);

/* The result lists of the last comparison, or null. They belong to the manifest, which frees them
 * at the next verification and with itself. */
VESK2_API FileItem* GetValidEntries(Manifest* manifest);
VESK2_API FileItem* GetInvalidEntries(Manifest* manifest);
VESK2_API FileItem* GetMissingEntries(Manifest* manifest);
VESK2_API FileItem* GetExtraEntries(Manifest* manifest);

/* ---- Certificates -------------------------------------------------------------------------- */

/* Vesk2CertReadCtx reads a certificate sequence file (".cert" appended unless it is there) into a
 * chain of records, to be freed with Vesk2CertFree. *out is written on success only; a sequence
 * without certificates gives 0 and a null *out. Nothing is verified.
 *   VESK2_ERR_PARAM_NULL, VESK2_ERR_FILE_OPEN, VESK2_ERR_MEM_ALLOC, codes of the readers. */
VESK2_API int Vesk2CertReadCtx(Vesk2CertInfoStruct** out, const char* path,
                               Vesk2ContextStruct* context);
VESK2_API int Vesk2CertReadCtxA(Vesk2CertInfoStruct** out, const char* path,
                                Vesk2ContextStruct* context);
/* The same without a context. */
VESK2_API int Vesk2CertRead(Vesk2CertInfoStruct** out, const char* path);
VESK2_API int Vesk2CertReadA(Vesk2CertInfoStruct** out, const char* path);

/* Vesk2CertFree frees a chain and its sequence. VESK2_ERR_PARAM_NULL for null, else 0. */
VESK2_API int Vesk2CertFree(Vesk2CertInfoStruct* chain);

/* Vesk2CertVerify proves that a chain grants the authorization `tagText` (the body of a tag, as in
 * CreateManifestContext) to the subject of its first certificate, on this machine's word. The
 * chain's period must meet the one from `notBefore` to `notAfter`; give one moment twice to ask
 * about that moment. 0 is not given: with neither, a chain that has run out passes. May be called
 * any number of times.
 *   0                              granted
 *   VESK2_ERR_PARAM_NULL           a null chain
 *   VESK2_ERR_INVALID_SEQUENCE     not whole triples; VESK2_ERR_SIGNATURE and its kin
 *   VESK2_ERR_CERT_REVOKED         a certificate, or its key, is on a revocation list
 *   VESK2_ERR_CRL_NOT_FOUND        a revocation state could not be determined
 *   VESK2_ERR_ACL_ENTRY_NOT_FOUND  there is no ACL store
 *   VESK2_ERR_NOT_AUTHORIZED       nothing is granted; VESK2_ERR_PACKAGE_NOT_GRANTED not the tag
 *   VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE   as in VerifyManifest
 *   VESK2_ERR_TIME_STAMP           a time that has no text; the codes of the tag's parser;
 * SPKI_ERR_* */
VESK2_VERDICT int Vesk2CertVerify(Vesk2CertInfoStruct* chain, const char* tagText, time_t notBefore,
                                  time_t notAfter);
/* Vesk2CertVerifyFile does the same for a sequence file. VESK2_ERR_PARAM_NULL for a null path. */
VESK2_VERDICT int Vesk2CertVerifyFile(const char* path, const char* tagText, time_t notBefore,
                                      time_t notAfter);
VESK2_VERDICT int Vesk2CertVerifyFileA(const char* path, const char* tagText, time_t notBefore,
                                       time_t notAfter);

/* The same, telling why: *out receives the explanation of a yes or a no. It is null when the
 * question could not be asked (the codes of the readers and of the tag's parser), and when memory
 * ran out: the answer stands. VESK2_ERR_PARAM_NULL for a null `out`, too. */
VESK2_VERDICT int Vesk2CertVerifyExplained(Vesk2CertInfoStruct* chain, const char* tagText,
                                           time_t notBefore, time_t notAfter,
                                           Vesk2ExplanationStruct** out);
VESK2_VERDICT int Vesk2CertVerifyFileExplained(const char* path, const char* tagText,
                                               time_t notBefore, time_t notAfter,
                                               Vesk2ExplanationStruct** out);
VESK2_VERDICT int Vesk2CertVerifyFileExplainedA(const char* path, const char* tagText,
                                                time_t notBefore, time_t notAfter,
                                                Vesk2ExplanationStruct** out);

/* Vesk2FreeExplanation frees an explanation with all that belongs to it; null is allowed. */
VESK2_API void Vesk2FreeExplanation(Vesk2ExplanationStruct* explanation);

/* CertFind lists the "*.cert" files of a directory (null: the home store's) as bare names, in byte
 * order, or null when there are none or no such directory. Free with FreeFileItemList. */
VESK2_API FileItem* CertFind(const char* directory);
VESK2_API FileItem* CertFindA(const char* directory);

/* ---- Revocation lists ---------------------------------------------------------------------- */

/* Vesk2CrlImport offers every "*.crl" file of a directory to the store, which keeps, for each
 * revocation source that an ACL entry names, the newest list that verifies. 0 whether any was kept
 * or not; VESK2_ERR_FILE_NOT_FOUND (no ACL store, no directory), VESK2_ERR_CRL_NOT_FOUND (no list
 * that can be read), VESK2_ERR_MEM_ALLOC. */
VESK2_API int Vesk2CrlImport(const char* directory, Vesk2ContextStruct* context);
VESK2_API int Vesk2CrlImportA(const char* directory, Vesk2ContextStruct* context);
/* The same without a context. */
VESK2_API int Vesk2ImportCrls(const char* directory);
VESK2_API int Vesk2ImportCrlsA(const char* directory);

/* Vesk2CrlRead reads a list (".crl" appended unless it is there) into a record, to be freed with
 * Vesk2CrlFree. Nothing is verified. VESK2_ERR_FILE_NOT_FOUND, VESK2_ERR_MEM_ALLOC, codes of the
 * readers; *out is then null. */
VESK2_API int Vesk2CrlRead(Vesk2CrlInfoStruct** out, const char* path, Vesk2ContextStruct* context);
VESK2_API int Vesk2CrlReadA(Vesk2CrlInfoStruct** out, const char* path,
                            Vesk2ContextStruct* context);
/* Vesk2CrlFindA finds the stored list whose certificate has the tag `tagText`.
 * VESK2_ERR_CRL_NOT_FOUND (an empty store), VESK2_ERR_ACL_ENTRY_NOT_FOUND (no such list),
 * VESK2_ERR_FIND_DIR (no store), codes of the tag's parser; *out is then null. */
VESK2_API int Vesk2CrlFindA(Vesk2CrlInfoStruct** out, const char* tagText,
                            Vesk2ContextStruct* context);
/* Vesk2CrlFree frees a record; null is allowed. Always 0. */
VESK2_API int Vesk2CrlFree(Vesk2CrlInfoStruct* record);

/* Vesk2CrlVerify proves a list against the ACL store. With a `tagText` the record's tag must be
 * that text: VESK2_ERR_AUTH_TAG_MISSING, VESK2_ERR_NOT_AUTHORIZED. With both `from` and `to` (not
 * 0) its period must meet theirs: VESK2_ERR_NOT_AFTER when it starts after `to`,
 * VESK2_ERR_NOT_BEFORE when it ends before `from`. VESK2_ERR_PARAM_NULL, the codes of loading the
 * store, and VESK2_ERR_ACL_ENTRY_NOT_FOUND, VESK2_ERR_HASH_ID, VESK2_ERR_SIGNATURE for one that
 * does not hold. */
VESK2_VERDICT int Vesk2CrlVerify(Vesk2CrlInfoStruct* record, const char* tagText, time_t from,
                                 time_t to);
VESK2_VERDICT int Vesk2CrlVerifyFile(const char* path, const char* tagText, time_t from, time_t to,
                                     Vesk2ContextStruct* context);
VESK2_VERDICT int Vesk2CrlVerifyFileA(const char* path, const char* tagText, time_t from, time_t to,
                                      Vesk2ContextStruct* context);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif /* VESK2_H */
