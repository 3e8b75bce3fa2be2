/* SPDX-License-Identifier: Apache-2.0 */
/* vesk2.h: the flat interface of libvesk2.
 *
 * libvesk2 answers, offline, whether signed objects are to be trusted: is this directory exactly
 * what its signed manifest says, and was its signer authorized for it? This header is all that a
 * C or C++ program needs; the exported C++ classes are in vesk2.hpp.
 *
 * A program that wants the careful answer about a directory:
 *
 *   Vesk2GlobalDirectory("/etc/vesk2");          once, before the first thread starts
 *   Manifest* m = NULL;
 *   int code = CreateManifestContext(&m, "app", "app.manifest", "(install (app calc))");
 *   if (code == 0) {
 *     FailOnExtraEntries(m);
 *     SetStoreUpdate(m, 0);
 *     code = VerifyManifest(m, now, now);        now: time(NULL), taken once
 *   }
 *   DeleteManifestContext(m);                    0 is yes; every other code is no
 *
 * and about a chain of certificates:
 *
 *   code = Vesk2CertVerifyFile("calc.cert", "(install (app calc))", now, now);
 *
 * Conventions
 *   - Functions return an int: 0 is success, a positive value is a VESK2_ERR_* code, a negative
 *     one an SPKI_ERR_* code of the reduction engine, from the functions that verify a chain or
 *     a manifest only. Treat every answer but 0 as a refusal. A few calls also hand on a code of
 *     the crypto layer (1001 to 1070); Vesk2ErrorMessage has no text for those.
 *   - Times are seconds since 1970-01-01 00:00:00 UTC; 0 means "not given". Lengths are bytes.
 *   - Text is 0-terminated bytes. A function whose name ends in A takes 8-bit ASCII text where
 *     its base function takes the platform's file-name string; on Linux both are bytes. The A
 *     form makes a copy for the call: VESK2_ERR_MEM_ALLOC, or null, when there is no memory for
 *     it.
 *   - Arguments are borrowed for the length of the call unless a function says that it copies or
 *     keeps them. An output pointer must point to a variable; nothing else may be null unless a
 *     function says so.
 *   - Arrays and strings handed out are released with Vesk2Free, records with the function named
 *     beside them. Outputs are null after a failure unless a function says otherwise.
 *   - The library starts no thread, and takes no lock that a caller could see. The store roots
 *     are process-wide; everything else belongs to the objects a caller makes, which must not be
 *     shared between threads. Separate objects on separate threads need no care, whatever other
 *     processes write into the stores meanwhile.
 *   - Nothing is cached: every verification reads the stores and the files afresh, and its
 *     answer speaks of the moment of reading only.
 *   - Names and texts in results are bytes that strangers chose. Pass them through Vesk2Escape
 *     before a terminal or a log sees them, unless a function says that they are safe. */
#ifndef VESK2_H
#define VESK2_H

#include <stddef.h>
#include <stdint.h>
#include <time.h>

#if defined(__GNUC__)
/* What programs link against: these functions, and the classes of vesk2.hpp. */
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
 * spelled ERROR: what searches logs for these texts finds them so. A program may expand the
 * table for tables of its own. */
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

/* One row a code of the reduction engine, in the order in which ZvVesk2::V2SpkiError searches:
 * number, constant, text. */
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
/* Results of the library, 0 to 76; VESK2_MAX_ERROR is never returned. What each means, wherever
 * a function does not say more; Vesk2ErrorWords has words for people.
 *
 * About the call:
 *   VESK2_SUCCESS              (0) yes, or done
 *   VESK2_ERR_INVALID_PARAM    (2) an argument is null that must not be, is not null that must
 *                              be, or is outside what the call takes; or an object is in use
 *                              already
 *   VESK2_ERR_MEM_ALLOC        (3) memory or descriptors ran out. It never means that there is
 *                              no such file or store: nothing was decided
 *   VESK2_ERR_PARAM_NULL       (38) an argument is null that must not be
 *   VESK2_ERR_PARAM_NOT_NULL   (39) an output holds something already
 *   VESK2_ERR_NOT_IMPLEMENTED  (18) this kind of principal cannot check a signature; names
 *                              cannot be read
 *   VESK2_ERR_USER_INTERRUPT   (60) a callback of the caller ended the work
 * About files and directories:
 *   VESK2_ERR_FILE_NOT_FOUND      (5) no such file or directory, no entry in the ACL store; from
 *                                 VerifyManifest with results, a listed file is missing
 *   VESK2_ERR_FILE_OPEN           (7) it cannot be opened, or is no regular file, or its name is
 *                                 none
 *   VESK2_ERR_READ_FILE           (10) it could not be read to its end, changed meanwhile, or
 *                                 another process held it for the whole wait: it is there
 *   VESK2_ERR_OPEN_MANIFEST_FILE  (19) the same of a manifest
 *   VESK2_ERR_CREATE_DIR          (25) a directory of a store cannot be made
 *   VESK2_ERR_FIND_DIR            (26) no such directory, or its entries cannot be listed; no
 *                                 root is set
 *   VESK2_ERR_WRITE_FILE          (76) what was written could not be kept
 *   VESK2_ERR_CRL_NOT_FOUND       (73) no list to read; in a verification, no current list tells
 *                                 whether a certificate is revoked
 * About the form of what was read:
 *   VESK2_ERR_PARSE_FILE              (9) not in the expected form, or ends too early
 *   VESK2_ERR_PRINCIPAL               (11) neither a key nor a hash (nor a k-of-n) where one
 *                                     must be
 *   VESK2_ERR_INVALID_HASH            (12) a digest of the wrong length
 *   VESK2_ERR_UNKNOWN_HASH_ID         (13) a manifest lists a digest that is not of 32 bytes
 *   VESK2_ERR_MAX_BYTE_STRING         (14) a byte string of more than 8192 bytes
 *   VESK2_ERR_SIGNATURE_ID            (15) an unknown signature algorithm
 *   VESK2_ERR_HASH_ID                 (16) an unknown hash algorithm
 *   VESK2_ERR_BIG_INT_BUFFER_SIZE     (17) a number of a key is missing
 *   VESK2_ERR_UNEXPECTED_CHAR         (28) a character that cannot stand there
 *   VESK2_ERR_INVALID_S_EXPRESSION    (29) a list that is not closed, or nested too deeply
 *   VESK2_ERR_BUFFER_OVERFLOW         (30) no room, a text that ends too early, or lists nested
 *                                     too deeply to be written
 *   VESK2_ERR_RANDOM_TOKEN            (33) a manifest's random token is not of 4 bytes
 *   VESK2_ERR_TIME_STAMP              (34) not a time, one without a text, or no clock
 *   VESK2_ERR_AUTH_TAG_MISSING        (35) there is no tag to compare
 *   VESK2_ERR_MANIFEST_VERSION        (56) a manifest version other than 1
 *   VESK2_ERR_MANIFEST_TYPE           (57) a manifest type other than plain
 *   VESK2_ERR_INVALID_SEQUENCE        (64) a chain without certificates, or not of whole triples
 *   VESK2_ERR_INVALID_REVOCATION_TAG  (70) a tag that does not end in (revoke ...)
 *   VESK2_ERR_NOT_OBJECT_CERT         (71) the first certificate of a manifest is not for a
 *                                     digest
 * About signatures and authority:
 *   VESK2_ERR_SIGNATURE            (21) a signature does not hold, or is not the issuer's
 *   VESK2_ERR_HASH_MISMATCH        (22) a signature is over something else; from VerifyManifest
 *                                  with results, an entry of the tree differs
 *   VESK2_ERR_NOT_AUTHORIZED       (31) nothing is granted
 *   VESK2_ERR_HASH_MATCH           (32) the content of a manifest is not the one that was signed
 *   VESK2_ERR_SIGNING_CERT_ORDER   (36) no certificate is left for the signer of a manifest, or
 *                                  the next is another's
 *   VESK2_ERR_NOT_BEFORE           (51) a revocation list ends before the asked period
 *   VESK2_ERR_NOT_AFTER            (52) a revocation list begins after the asked period, or
 *                                  (CrlSequence) has ended
 *   VESK2_ERR_ACL_ENTRY_NOT_FOUND  (54) no entry of the ACL store does; from a chain, there is
 *                                  no store
 *   VESK2_ERR_ACL_KEY_NOT_FOUND    (62) no entry of the ACL store names the key
 *   VESK2_ERR_AUTH_TAGS_ARE_EQUAL  (63) a success: the entry that was found has exactly the tag
 *   VESK2_ERR_CERT_REVOKED         (66) a certificate, or the key that it is for, is revoked
 *   VESK2_ERR_PACKAGE_NOT_GRANTED  (67) less than what was asked is granted
 *   VESK2_ERR_KEY_REVOKED          (68) a key is on a revocation list
 *   VESK2_ERR_NOT_IN_LIST          (69) the value is no element of the list
 *   VESK2_ERR_MULTI_AUTH_MATCH     (45) several stored chains carry the tag
 *   VESK2_ERR_EXTRA_FILES          (74) the tree holds entries that are not listed
 * The other numbers are never returned; they keep their places for logs and programs that know
 * them. */
enum Vesk2Error { VESK2_ERROR_TABLE(VESK2_ENUM_ROW) };
/* Results of the reduction engine; all negative, and each a refusal. One entry of the ACL store
 * or one certificate that the engine cannot read gives such a code for every question that it is
 * part of: an Explanation names the one.
 *   SPKI_ERR_NO_MEM                memory ran out, or the budget of work, tuples or results
 *                                  (limits.h): what was asked costs more than a verification may
 *   SPKI_ERR_THRESHOLD             a k-of-n took too long to search
 *   SPKI_ERR_KOFN_SYNTAX           a k-of-n with k = 0, with k above n, or with another number
 *                                  of members than n
 *   SPKI_ERR_KEY_OR_HASH_EXPECTED  neither a key nor a hash where one must be, such as a k-of-n
 *                                  as the subject that was asked about
 *   SPKI_ERR_UNKNOWN_HASH_ALG      a key is named by a hash other than sha1 and sha256
 *   SPKI_ERR_HASH_LTH_DIFFER       a digest that is not as long as its algorithm makes them
 * The others tell which element of which list has another form than its kind wants. */
enum Vesk2SpkiError { VESK2_SPKI_ERROR_TABLE(VESK2_ENUM_ROW) };
#undef VESK2_ENUM_ROW

/* ---- Records ------------------------------------------------------------------------------- */

/* The context: made by Vesk2Init, handed to the calls that take one, freed with Vesk2FreeContext
 * after every object made with it is gone. Objects hold the pointer and do not count it. A null
 * context is accepted everywhere, and stands for the handle 0. A program needs one only to hand
 * a value on to the crypto layer; nothing in a context changes an answer. */
typedef struct Vesk2ContextStruct {
  uint32_t cryptoHandle; /* the value given to Vesk2Init; passed on to every crypto call */
} Vesk2ContextStruct;

/* One file or directory name in a chain: results of a manifest comparison, names to ignore,
 * names found in a store. A program may make records of its own for SetIgnoredEntries, with any
 * allocator: they are copied. Chains that the library hands out are freed with FreeFileItemList;
 * those of a manifest context stay its own, and so do their names. Names are bytes that strangers
 * chose: see Vesk2Escape. */
typedef struct FileItem {
  char* name;   /* the name, platform form; owned */
  char* name2;  /* null in every record that the library makes */
  char* nameA;  /* the name, ASCII form; owned, and may be the same array as `name` */
  char* name2A; /* null in every record that the library makes */
  struct FileItem* next;
  uint32_t size;       /* 28 in every record that the library makes: a format mark, not a sizeof */
  int32_t isDirectory; /* 1 for a directory, else 0 */
} FileItem;

/* What a caller wants to hear while files are read and hashed (SetFileCallbacks). Each function
 * may be null. They are called on the thread that called the library, between its reads: what
 * they take, the verification takes longer. They must return (no exception, no longjmp), and
 * leave the manifest that is being verified and the store roots alone; any other call is theirs.
 * (A C++ program that lends threads with Manifest::SetTaskRunner has them called on all of
 * those.)
 *
 * The order is fileStart, fileBytes any number of times, fileEnd, for one file after the other.
 * fileStart and fileBytes go on with 0; anything else ends the verification, after fileEnd for
 * the file that was begun. */
typedef struct Vesk2FileCallbacks {
  uint32_t size; /* sizeof(Vesk2FileCallbacks) */
  void* user;    /* handed to every call */
  /* A file was opened; it holds `bytes` bytes. Files that cannot be opened are not told. The
   * path comes from the manifest: whoever signed it chose its bytes. It is the directory that is
   * verified joined with the listed names, borrowed for the call. */
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

/* One certificate of a sequence, in a chain in the sequence's order (the end entity first). The
 * records and their texts are freed together with Vesk2CertFree.
 *
 * Nothing in a record is proved: all of it is text that anyone may have written, and the owner
 * is not even signed. Show it as hearsay, and decide by Vesk2CertVerify; `vesk2 cert show` says
 * of each certificate whether its signature holds. */
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

/* One revocation list with the certificate that vouches for it. The record is freed with
 * Vesk2CrlFree. Nothing in it is proved until Vesk2CrlVerify has answered 0. */
typedef struct Vesk2CrlInfoStruct {
  uint32_t size;    /* 20: a format mark, not a sizeof */
  CrlSequence* crl; /* the record holds one reference */
  time_t notBefore; /* of the certificate; 0 when it has none */
  time_t notAfter;  /* of the certificate; 0 when it has none */
  char* tag;        /* body of the certificate's tag as text, or null */
} Vesk2CrlInfoStruct;

/* One reason why an answer is no. Texts are safe for a terminal, whoever wrote what they name:
 * control bytes, invalid UTF-8 and what turns or breaks lines are written as \xNN. A text is for
 * people and may be worded anew in another version; a program goes by `kind` and the numbers. */
typedef struct Vesk2ReasonStruct {
  const char* kind;          /* a stable word, static: see Vesk2ExplanationStruct */
  char* text;                /* the reason in words */
  uint32_t certificate;      /* its number in the chain, counted from 1; 0: about none */
  uint32_t otherCertificate; /* the one whose period it does not meet, else 0 */
  char* entry;  /* the ACL entry: the name of its file in the store, or its path; or null */
  char* source; /* the tag of the revocation lists that were asked, or null */
  struct Vesk2ReasonStruct* next;
} Vesk2ReasonStruct;

/* Why an answer is what it is, and what was found on the way to it. The record, its texts and
 * its reasons are the caller's, to be freed together with Vesk2FreeExplanation. An explanation
 * looks at what the verification read and changes no answer. What would turn a no is not yet
 * what should be done: it may be the trust in another key. The kinds of reasons:
 *   signature, order, content, unreadable
 *                                     of what was read
 *   revoked, key-revoked, undetermined
 *                                     by the revocation lists, or for want of one
 *   period, tag, link, propagate      of a certificate or an ACL entry
 *   no-entry, threshold, combination  of the ACL store
 * A code may come without a reason, about a file that cannot be read for one. The counts are
 * about the tree: they are files, and of `extra` and of what could not be listed directories
 * too. */
typedef struct Vesk2ExplanationStruct {
  uint32_t size;              /* sizeof the library's record; members may be added at its end */
  int32_t code;               /* the answer */
  int32_t isComplete;         /* 0 when looking was stopped, for what it cost or lacked */
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
 * stores it in *ctx. What *ctx held is overwritten, not freed. The caller frees the context with
 * Vesk2FreeContext.
 *   0                    made; also for a null `ctx`, with nothing made
 *   VESK2_ERR_MEM_ALLOC  *ctx is then null */
VESK2_API int Vesk2Init(Vesk2ContextStruct** ctx, uint32_t value);

/* Vesk2FreeContext deletes a context; null is allowed. No object made with it may be left:
 * objects keep the pointer. Always 0. */
VESK2_API int Vesk2FreeContext(Vesk2ContextStruct* ctx);

/* Vesk2Free releases a string or byte array that the library handed out; null is allowed. Not
 * for records, contexts or objects: each of those has a function of its own. free() of the C
 * library must not be given such an array. */
VESK2_API void Vesk2Free(void* array);

/* Vesk2DoNothing does nothing. Hosts call it to see that the library is loaded. */
VESK2_API void Vesk2DoNothing(void);

/* ---- Store roots --------------------------------------------------------------------------- */

/* Vesk2HomeDirectory and Vesk2GlobalDirectory set the per-user and the machine-wide store root.
 * What lies there:
 *   "*.cert" in HOME/cert   chains of certificates (CertFind)
 *   "*.acl" in GLOBAL/acl   what this machine trusts: every such file is a trust root
 *   "*.crl" in GLOBAL/cert  the newest revocation list of each source
 * The text is copied, cut after 4096 bytes (a cut path is never used: no store is found); null
 * sets the empty root, with which no store is found either, and which both are from the start.
 * There is one pair of roots for the process. Set both before the first thread starts, and
 * before any other call uses a store: nothing guards them.
 *
 * A root is not checked: not whether it exists, who owns it, nor who may write it. Whoever can
 * write the global root decides what is trusted, and whoever can delete from it lets go what is
 * revoked. Check owner and mode first. The command is no more careful; `vesk2 store show` tells
 * which stores are used. */
VESK2_API void Vesk2HomeDirectory(const char* directory);
VESK2_API void Vesk2GlobalDirectory(const char* directory);
/* The same of ASCII text. Without memory for its conversion the root becomes empty: no store is
 * better than the wrong one. */
VESK2_API void Vesk2HomeDirectoryA(const char* directory);
VESK2_API void Vesk2GlobalDirectoryA(const char* directory);

/* ---- Text ---------------------------------------------------------------------------------- */

/* Vesk2WideToAscii copies at most `length` bytes of the file-name string `text` as ASCII text,
 * and Vesk2AsciiToWide the other way. The copy stops at a 0 byte and is terminated; `text`
 * itself need not be. If `outLength` is not null it receives the copy's length. Returns the
 * copy, to be released with Vesk2Free, or null (length 0) for a null text or when memory runs
 * out. */
VESK2_API char* Vesk2WideToAscii(const char* text, uint32_t length, unsigned int* outLength);
VESK2_API char* Vesk2AsciiToWide(const char* text, uint32_t length, unsigned int* outLength);

/* ---- Version and error texts; all texts are static ------------------------------------------ */

/* Vesk2VersionNumber returns 10100: 1.1.0, each number with two digits. */
VESK2_API int Vesk2VersionNumber(void);
/* Vesk2VersionExtra and Vesk2VersionExtraA return the version tag "r2441". */
VESK2_API const char* Vesk2VersionExtra(void);
VESK2_API const char* Vesk2VersionExtraA(void);
/* Vesk2ErrorMessage returns the text of a code from 0 to 76, for any other (77 and the negative
 * ones included) "VESK_UNKNOWN_ERROR". Never null. These texts are for logs. */
VESK2_API const char* Vesk2ErrorMessage(int code);
/* Vesk2ErrorName returns the constant's name of a code of either table, such as
 * "SPKI_ERR_NO_MEM"; for a number that is none "VESK_UNKNOWN_ERROR". Never null. */
VESK2_API const char* Vesk2ErrorName(int code);
/* Vesk2ErrorWords says in words what a code of either table means: what a program shows to
 * people, the codes of the reduction included. A code without words, as one whose meaning
 * depends on who answered it, gives its name. Never null. */
VESK2_API const char* Vesk2ErrorWords(int code);

/* Vesk2Escape returns a copy of `length` bytes that is safe to be shown, to be released with
 * Vesk2Free: control bytes, invalid UTF-8 and characters that turn or break lines are \xNN, and
 * a backslash is doubled, so that the copy is unambiguous. The bytes may hold 0 bytes. Null for
 * null, and when memory runs out. The copy is safe for a terminal, not for a shell: quote it
 * last. */
VESK2_API char* Vesk2Escape(const void* bytes, size_t length);

/* ---- Name records -------------------------------------------------------------------------- */

/* FreeFileItemList frees a chain that the library handed to the caller and returns the number of
 * records freed (0 for null). The lists of a manifest context are not the caller's to free, and
 * neither is a record that a program made itself, unless by FileItemCreate. */
VESK2_API unsigned int FreeFileItemList(FileItem* chain);

/* ---- Manifests ----------------------------------------------------------------------------- */

/* CreateManifestContext makes a context that checks `directory` against the manifest file
 * `manifestPath` for the authorization `tagText`: the body of a tag in advanced form, such as
 * "(install (app calc))". The text "" asks for everything. All texts are copied, and nothing is
 * opened yet: the files need not exist. Either path may be relative, and is looked up anew by
 * each verification. On success *out receives the context, to be released with
 * DeleteManifestContext; one context serves any number of verifications, one after the other.
 *   VESK2_ERR_INVALID_PARAM         *out is not null (and is left alone), or an argument is null
 *   VESK2_ERR_UNEXPECTED_CHAR       the tag text has a ")" that closes nothing
 *   VESK2_ERR_INVALID_S_EXPRESSION  it has a list that is not closed, or nested over 255 levels
 *                                   deep
 *   VESK2_ERR_MEM_ALLOC             memory or descriptors ran out */
VESK2_API int CreateManifestContext(Manifest** out, const char* directory, const char* manifestPath,
                                    const char* tagText);
VESK2_API int CreateManifestContextA(Manifest** out, const char* directory,
                                     const char* manifestPath, const char* tagText);

/* DeleteManifestContext destroys a context and its result lists; null is allowed. Names that
 * were read from the lists are gone with them. */
VESK2_API void DeleteManifestContext(Manifest* manifest);

/* The setters below must be called before the verification that they are to affect. None of the
 * setters and getters tests its manifest pointer. */

/* FailOnExtraEntries makes VerifyManifest answer VESK2_ERR_EXTRA_FILES when nothing worse than
 * unlisted entries was found; without it such a directory passes and only the extra list tells.
 * It cannot be taken back. CompareManifest tells of unlisted entries whatever the setting. A
 * careful caller sets it; the command refuses unlisted entries, until `--allow-extra`. */
VESK2_API void FailOnExtraEntries(Manifest* manifest);

/* SetExtraAclDirectory names a directory of ACL entries that are trusted beside the store's. The
 * text is copied; null takes the setting back. Every "*.acl" file there becomes a trust root:
 * protect it as you protect the store. When there is no memory for the copy, every verification
 * answers VESK2_ERR_MEM_ALLOC until the setting is made again: without the directory it would
 * answer another question. */
VESK2_API void SetExtraAclDirectory(Manifest* manifest, const char* directory);
VESK2_API void SetExtraAclDirectoryA(Manifest* manifest, const char* directory);

/* SetIgnoredEntries replaces the names (paths relative to the directory, such as "lib/cache")
 * that a comparison leaves out. Records are copied, in reverse order; those with neither name
 * nor nameA are skipped. Null clears the list. The caller keeps `list`. Without memory for a
 * copy nothing is ignored, and the verification can only find more.
 *
 * An ignored name is not looked at at all: a listed file or a whole listed directory of that
 * name may be changed, missing or new, and the answer is yes. Ignore what nobody runs or reads.
 * The command ignores nothing unless `--ignore` says so, and `--json` lists what was ignored. */
VESK2_API void SetIgnoredEntries(Manifest* manifest, const FileItem* list);

/* SetFileCallbacks has VerifyManifest tell about the files that it hashes. The record is copied,
 * and what its `user` points to must outlive the verifications; null takes the setting back.
 * Anything but 0 from fileStart or fileBytes ends the verification, which then answers
 * VESK2_ERR_USER_INTERRUPT and has no results. CompareManifest hashes no files.
 * VESK2_ERR_INVALID_PARAM for a record of another size. */
VESK2_API int SetFileCallbacks(Manifest* manifest, const Vesk2FileCallbacks* callbacks);

/* SetStoreUpdate with 0 keeps VerifyManifest from offering the revocation lists that the
 * manifest carries to the store, which it does otherwise, also when its answer is then no:
 * nothing is written with 0. The lists count in the verification all the same. A careful caller
 * sets 0 and imports lists by Vesk2CrlImport, from where it knows them. The command judges
 * first: after a no it stores a list only when that lets nothing go and ends no earlier. */
VESK2_API void SetStoreUpdate(Manifest* manifest, int update);

/* VerifyManifest proves the manifest's signatures, that its chain grants the tag for a period
 * that meets the one from `notBefore` to `notAfter` (both times 0: that grants it at the moment
 * of signing), that the body is the one that was signed, and compares the directory with it.
 * Fills the four result lists, after a yes and after a no about the tree; they are empty after
 * every other no.
 *
 * About the tree, told by the lists (with four empty lists none of these is about the tree):
 *   0                         the directory is as signed, by an authorized signer
 *   VESK2_ERR_HASH_MISMATCH   an entry differs or could not be read, or a listed directory is
 *                             not there;
 *   VESK2_ERR_FILE_NOT_FOUND  a file is missing;
 *   VESK2_ERR_EXTRA_FILES     one is unlisted (see FailOnExtraEntries); in this priority
 * About the signatures and the content:
 *   VESK2_ERR_HASH_MISMATCH    (22) a signature is over another certificate: the lists are empty
 *   VESK2_ERR_SIGNATURE        one does not hold, or is not its certificate's issuer's
 *   VESK2_ERR_SIGNATURE_ID     by an unknown algorithm
 *   VESK2_ERR_HASH_ID          an unknown hash
 *   VESK2_ERR_NOT_IMPLEMENTED  the signer's key is of a kind that cannot be verified
 *   VESK2_ERR_NOT_OBJECT_CERT  the first certificate is not for a digest
 *   VESK2_ERR_HASH_MATCH       the content is not the one that was signed
 * About the signer's authority:
 *   VESK2_ERR_FILE_NOT_FOUND       (5) there is no ACL entry to go by: the lists are empty
 *   VESK2_ERR_NOT_AUTHORIZED       nothing is granted
 *   VESK2_ERR_PACKAGE_NOT_GRANTED  something is, but not the tag
 *   VESK2_ERR_CERT_REVOKED         the signer certificate is revoked
 *   VESK2_ERR_CRL_NOT_FOUND        no current list tells whether it is
 *   VESK2_ERR_SIGNING_CERT_ORDER   the second certificate that is left is not the signer's own
 *   SPKI_ERR_*                     an entry or certificate that the reduction cannot read, or a
 *                                  spent budget
 * About the manifest file:
 *   VESK2_ERR_OPEN_MANIFEST_FILE  it cannot be opened or read, is over 256 MiB
 *                                 (Limits::kMaxFile), or was held by another process for the
 *                                 whole wait
 *   VESK2_ERR_MANIFEST_VERSION    its version is not 1
 *   VESK2_ERR_MANIFEST_TYPE       its type is not plain
 *   VESK2_ERR_TIME_STAMP          the time of signing, or one that was asked about, is none
 *   VESK2_ERR_PARSE_FILE, VESK2_ERR_MAX_BYTE_STRING, VESK2_ERR_PRINCIPAL,
 *     VESK2_ERR_INVALID_HASH, VESK2_ERR_BUFFER_OVERFLOW, VESK2_ERR_BIG_INT_BUFFER_SIZE
 *                                 of its readers
 *   VESK2_ERR_RANDOM_TOKEN, VESK2_ERR_UNKNOWN_HASH_ID
 *                                 of its listing's
 * Otherwise:
 *   VESK2_ERR_USER_INTERRUPT  a callback ended it (SetFileCallbacks)
 *   VESK2_ERR_READ_FILE       another process held a file of a store for a minute
 *   VESK2_ERR_MEM_ALLOC       memory or descriptors ran out; nothing was decided then
 *   VESK2_ERR_FILE_OPEN       the root is so long that a stored list can have no path; or there
 *                             was no memory for a copy of the listing
 *
 * What a caller should know before relying on a yes; docs/threat-model.md has more:
 *   - With both times 0 the moment is the one that the signer wrote. A date that lies back
 *     revives chains that have ended, and lies before their revocation: pass the present time
 *     twice. The command asks about periods at the time of signing and about revocation now.
 *   - A period needs to meet that of each certificate and entry only, not to lie within it; with
 *     `notAfter` alone whatever ended before it passes. Ask about one moment.
 *   - Unlisted entries are looked for below the root only, not in `directory` itself: the
 *     manifest may lie there. A manifest that lists nothing agrees with a directory that is not
 *     there. Look at the top directory yourself, as the command does.
 *   - Links are followed, and the contents that lie there count. The command refuses a listed
 *     link that leads out of the tree, until `--allow-links`.
 *   - The certificates and the revocation lists lie outside what is signed: anybody can take
 *     them out of a manifest or exchange them for others that verify. Keep current lists in the
 *     store.
 *   - The second certificate counts as if it might be passed on: a key that may not delegate can
 *     sign manifests. Grant a tag of its own for what is not to be signed by manifests.
 *   - Only the subjects of certificates are looked up in revocation lists, not the key of the
 *     ACL entry, an issuer that no certificate is for, or the members of a k-of-n: remove such
 *     an entry. A list that is missing, cannot be read or does not verify is passed over, and
 *     with it every key that it revokes; so is a malformed entry, with the source of lists that
 *     it names. The command tells of files of the store that it could not use.
 *   - A certificate or an entry without a tag, or whose tag has another keyword than "tag",
 *     grants whatever is asked, and so does (tag) alone: look at what is installed and issued.
 *     The command issues none without a tag.
 *   - It writes: lists that the manifest carries and that verify go to the store
 *     (SetStoreUpdate). */
VESK2_VERDICT int VerifyManifest(Manifest* manifest, time_t notBefore, time_t notAfter);

/* VerifyManifestExplained is VerifyManifest and tells why: *out receives the explanation, of a
 * yes, of a no and of a file that cannot be read alike, to be freed with Vesk2FreeExplanation.
 * What *out held is overwritten. After a refusal the rest of the manifest is read for it; the
 * answer stays the same. *out is null when memory ran out: the answer stands. Keeps nothing of
 * its own. VESK2_ERR_PARAM_NULL for a null `out`, with nothing verified. */
VESK2_VERDICT int VerifyManifestExplained(Manifest* manifest, time_t notBefore, time_t notAfter,
                                          Vesk2ExplanationStruct** out);

/* CompareManifest compares this manifest's body (the reference) with that of another manifest,
 * without the directory: what the reference lists alone is missing, what the other lists alone
 * is extra. Fills the four lists; results as in VerifyManifest. Names are relative to the body's
 * root. Ignored names are left out of both.
 *
 * Signatures and digests of both are proved, authority is not: no chain, no entry, no revocation
 * and no order of certificates is looked at, and any key made by anyone passes. Verify both
 * first; the command leaves that to its caller, too. */
VESK2_VERDICT int CompareManifest(Manifest* manifest, const char* otherManifestPath);
VESK2_VERDICT int CompareManifestA(Manifest* manifest, const char* otherManifestPath);

/* GetTimeOfSigning returns the signing time, in seconds, of the last read of the manifest that
 * succeeded, or 0. It is the signer's word. A read that was refused leaves 0. */
VESK2_API time_t GetTimeOfSigning(Manifest* manifest);

/* The result lists of the last comparison, or null. They belong to the manifest, which frees
 * them when the next verification begins, when the next CompareManifest has read both manifests,
 * and with itself: after a CompareManifest that could not compare they are still the earlier
 * ones. Records are in the reverse order of a walk through the tree, directories with them;
 * names begin with the directory as it was given. A listed directory that holds something
 * unlisted and nothing worse is itself in the extra list; one that could not be listed is twice
 * in the invalid list. */
VESK2_API FileItem* GetValidEntries(Manifest* manifest);
VESK2_API FileItem* GetInvalidEntries(Manifest* manifest);
VESK2_API FileItem* GetMissingEntries(Manifest* manifest);
VESK2_API FileItem* GetExtraEntries(Manifest* manifest);

/* ---- Certificates -------------------------------------------------------------------------- */

/* Vesk2CertReadCtx reads a certificate sequence file (".cert" appended unless it is there) into
 * a chain of records, to be freed with Vesk2CertFree. Nothing is verified. `context` may be
 * null, and must outlive the chain. *out is written on success only; a sequence without
 * certificates gives 0 and a null *out.
 *   VESK2_ERR_PARAM_NULL     `out` or `path` is null
 *   VESK2_ERR_INVALID_PARAM  the path is empty
 *   VESK2_ERR_FILE_OPEN      it cannot be opened, is no regular file, or is over 256 MiB
 *                            (Limits::kMaxFile)
 *   VESK2_ERR_READ_FILE      another process held it for a minute (Limits::kMaxHeldWait)
 *   VESK2_ERR_MEM_ALLOC      also: a path of over 4096 bytes
 *   VESK2_ERR_PARSE_FILE, VESK2_ERR_PRINCIPAL, VESK2_ERR_HASH_ID, VESK2_ERR_INVALID_HASH,
 *     VESK2_ERR_MAX_BYTE_STRING
 *                            of the readers of its items; bytes after its end are ignored */
VESK2_API int Vesk2CertReadCtx(Vesk2CertInfoStruct** out, const char* path,
                               Vesk2ContextStruct* context);
VESK2_API int Vesk2CertReadCtxA(Vesk2CertInfoStruct** out, const char* path,
                                Vesk2ContextStruct* context);
/* The same without a context. */
VESK2_API int Vesk2CertRead(Vesk2CertInfoStruct** out, const char* path);
VESK2_API int Vesk2CertReadA(Vesk2CertInfoStruct** out, const char* path);

/* Vesk2CertFree frees a chain, from its first record on, and its sequence. VESK2_ERR_PARAM_NULL
 * for null, else 0. */
VESK2_API int Vesk2CertFree(Vesk2CertInfoStruct* chain);

/* Vesk2CertVerify proves that a chain grants the authorization `tagText` (the body of a tag, as
 * in CreateManifestContext) to the subject of its first certificate, on this machine's word. The
 * chain's period must meet the one from `notBefore` to `notAfter`; give one moment twice to ask
 * about that moment. `chain` is the first record of Vesk2CertRead; it stays the caller's, and
 * may be asked any number of times.
 *
 * 0 is not given. With neither time the periods of the chain must meet one another and nothing
 * else is asked about time: certificates and entries that have ended pass, and every revocation
 * counts whatever its date. With one time, whatever meets the open period passes: with
 * `notAfter` alone also what ended before it. The command asks about now, or `--at`.
 *   0                              granted
 *   VESK2_ERR_PARAM_NULL           a null chain
 *   VESK2_ERR_INVALID_PARAM        a null tag text
 *   VESK2_ERR_INVALID_SEQUENCE     not whole triples
 *   VESK2_ERR_SIGNATURE            a signature does not hold, or is not its certificate's
 *                                  issuer's
 *   VESK2_ERR_HASH_MISMATCH        one is over another certificate
 *   VESK2_ERR_SIGNATURE_ID         one is by an unknown algorithm
 *   VESK2_ERR_NOT_IMPLEMENTED      an issuer is a hash, which cannot check a signature
 *   VESK2_ERR_CERT_REVOKED         a certificate, or the key that it is for, is on a revocation
 *                                  list
 *   VESK2_ERR_CRL_NOT_FOUND        a certificate names a source of lists, and no current list of
 *                                  it is there
 *   VESK2_ERR_ACL_ENTRY_NOT_FOUND  there is no ACL entry to go by, or the last file of the store
 *                                  cannot be read
 *   VESK2_ERR_NOT_AUTHORIZED       nothing is granted
 *   VESK2_ERR_PACKAGE_NOT_GRANTED  something is, but not the tag
 *   VESK2_ERR_MEM_ALLOC, VESK2_ERR_READ_FILE, VESK2_ERR_FILE_OPEN
 *                                  as in VerifyManifest
 *   VESK2_ERR_TIME_STAMP           a time that has no text
 *   VESK2_ERR_UNEXPECTED_CHAR, VESK2_ERR_INVALID_S_EXPRESSION
 *                                  of the tag's parser
 *   SPKI_ERR_*                     an entry or certificate that the reduction cannot read, or a
 *                                  spent budget; the first certificate is for a k-of-n
 * What is said of periods, revocation and entries at VerifyManifest holds here as well. */
VESK2_VERDICT int Vesk2CertVerify(Vesk2CertInfoStruct* chain, const char* tagText, time_t notBefore,
                                  time_t notAfter);
/* Vesk2CertVerifyFile does the same for a sequence file, ".cert" appended unless it is there.
 * VESK2_ERR_PARAM_NULL for a null path, the codes of Vesk2CertReadCtx for one that cannot be
 * read. */
VESK2_VERDICT int Vesk2CertVerifyFile(const char* path, const char* tagText, time_t notBefore,
                                      time_t notAfter);
VESK2_VERDICT int Vesk2CertVerifyFileA(const char* path, const char* tagText, time_t notBefore,
                                       time_t notAfter);

/* The same, telling why: *out receives the explanation of a yes or a no, to be freed with
 * Vesk2FreeExplanation. It is null when the question could not be asked (the codes of the
 * readers and of the tag's parser), and when memory ran out: the answer stands.
 * VESK2_ERR_PARAM_NULL for a null `out`, too. */
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

/* CertFind lists the "*.cert" files of a directory (null: the home store's) as bare names, in
 * byte order, or null when there are none, no such directory, or no memory: half a list is never
 * handed out. Nothing is opened: a name may be a directory's. Free with FreeFileItemList. */
VESK2_API FileItem* CertFind(const char* directory);
VESK2_API FileItem* CertFindA(const char* directory);

/* ---- Revocation lists ---------------------------------------------------------------------- */

/* Vesk2CrlImport offers every "*.crl" file of a directory to the store, which keeps, for each
 * revocation source that an ACL entry names, one list that verifies. Files that cannot be read
 * are passed over.
 *   0                         whether any was kept or not
 *   VESK2_ERR_FILE_NOT_FOUND  no ACL entry, no such directory (null included)
 *   VESK2_ERR_CRL_NOT_FOUND   no list that can be read
 *   VESK2_ERR_READ_FILE       another process held a file for a minute (Limits::kMaxHeldWait)
 *   VESK2_ERR_MEM_ALLOC       memory or descriptors ran out
 * A list that ends when the stored one ends replaces it, so that an older one can be played
 * back; a stored one that begins in the future is replaced by any that has begun, even by one
 * that has ended; where none is stored, the first is taken whatever its period. Read back what
 * is stored (Vesk2CrlFindA). `vesk2 crl import` says of each list whether it was stored, and
 * refuses one that ends no later and revokes less. */
VESK2_API int Vesk2CrlImport(const char* directory, Vesk2ContextStruct* context);
VESK2_API int Vesk2CrlImportA(const char* directory, Vesk2ContextStruct* context);
/* The same without a context. */
VESK2_API int Vesk2ImportCrls(const char* directory);
VESK2_API int Vesk2ImportCrlsA(const char* directory);

/* Vesk2CrlRead reads a list (".crl" appended unless it is there) into a record, to be freed with
 * Vesk2CrlFree. Nothing is verified. `out` must not be null; `context` may be, and must outlive
 * the record. *out is null after a failure.
 *   VESK2_ERR_FILE_NOT_FOUND           it cannot be opened, or its path is none (null included)
 *   VESK2_ERR_READ_FILE                another process held it for a minute
 *                                      (Limits::kMaxHeldWait)
 *   VESK2_ERR_MEM_ALLOC                memory or descriptors ran out
 *   VESK2_ERR_PARSE_FILE and the like  of the readers of its parts */
VESK2_API int Vesk2CrlRead(Vesk2CrlInfoStruct** out, const char* path, Vesk2ContextStruct* context);
VESK2_API int Vesk2CrlReadA(Vesk2CrlInfoStruct** out, const char* path,
                            Vesk2ContextStruct* context);
/* Vesk2CrlFindA finds the stored list whose certificate has the tag `tagText` (advanced form,
 * without the keyword). Nothing is verified. *out, to be freed with Vesk2CrlFree, is null after
 * a failure.
 *   VESK2_ERR_CRL_NOT_FOUND        an empty store
 *   VESK2_ERR_ACL_ENTRY_NOT_FOUND  no such list
 *   VESK2_ERR_FIND_DIR             no store
 *   VESK2_ERR_INVALID_PARAM        a null text
 *   VESK2_ERR_UNEXPECTED_CHAR, VESK2_ERR_INVALID_S_EXPRESSION
 *                                  of the tag's parser
 *   VESK2_ERR_READ_FILE, VESK2_ERR_MEM_ALLOC
 *                                  a list of the store could not be read for such a reason */
VESK2_API int Vesk2CrlFindA(Vesk2CrlInfoStruct** out, const char* tagText,
                            Vesk2ContextStruct* context);
/* Vesk2CrlFree frees a record; null is allowed. Always 0. */
VESK2_API int Vesk2CrlFree(Vesk2CrlInfoStruct* record);

/* Vesk2CrlVerify proves a list against the ACL store: an entry must vouch for its issuer under
 * its tag, its certificate must be for its hash, and the signature must hold. `record` stays the
 * caller's.
 *   0                              it is true; with both times, and in force then
 *   VESK2_ERR_PARAM_NULL           a null record
 *   VESK2_ERR_AUTH_TAG_MISSING     a `tagText` was given, and the record has no tag
 *   VESK2_ERR_NOT_AUTHORIZED       its tag is another text
 *   VESK2_ERR_NOT_AFTER            it starts after `to`
 *   VESK2_ERR_NOT_BEFORE           it ends before `from`, or has no end
 *   VESK2_ERR_FILE_NOT_FOUND, VESK2_ERR_READ_FILE
 *                                  of loading the ACL store
 *   VESK2_ERR_ACL_ENTRY_NOT_FOUND  no entry has its tag, or the last one that does is another
 *                                  key's
 *   VESK2_ERR_HASH_ID              its certificate is for no hash
 *   VESK2_ERR_SIGNATURE            the hash is another list's, or the signature does not hold
 *   VESK2_ERR_HASH_MISMATCH, VESK2_ERR_SIGNATURE_ID, VESK2_ERR_NOT_IMPLEMENTED
 *                                  of the signature, as in VerifyManifest
 *   VESK2_ERR_MEM_ALLOC            memory or descriptors ran out
 * The period is tested only when both `from` and `to` are given, not 0, and tags are compared as
 * text: pass the present time twice, and the text as the record's `tag` has it (null compares
 * none). Neither the entry's own period nor its propagate flag counts: remove entries that have
 * ended. The command asks about now, and compares tags as tags. */
VESK2_VERDICT int Vesk2CrlVerify(Vesk2CrlInfoStruct* record, const char* tagText, time_t from,
                                 time_t to);
/* The same for a file, ".crl" appended unless it is there; the codes of Vesk2CrlRead for one
 * that cannot be read. */
VESK2_VERDICT int Vesk2CrlVerifyFile(const char* path, const char* tagText, time_t from, time_t to,
                                     Vesk2ContextStruct* context);
VESK2_VERDICT int Vesk2CrlVerifyFileA(const char* path, const char* tagText, time_t from, time_t to,
                                      Vesk2ContextStruct* context);

#ifdef __cplusplus
} /* extern "C" */
#endif

#endif /* VESK2_H */
