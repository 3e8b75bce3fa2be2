// SPDX-License-Identifier: Apache-2.0
// Version and error texts. The tables in vesk2.h hold number, name and text of every code; this
// file only looks things up in them. Three kinds of text for three readers: the stable one
// (V2Error), the constant's name, and words for people, which only say what is true whoever
// answered the code.
#include <vesk2/context.h>

#include <iterator>

namespace ZvVesk2 {
namespace {

// Both tables are expanded from vesk2.h, so that a code has one place where it is made.
struct Row {
  int code;
  const char* text;
  const char* name;
};

#define VESK2_ROW(number, name, text) {number, text, #name},
constexpr Row kErrors[] = {VESK2_ERROR_TABLE(VESK2_ROW)};
constexpr Row kSpkiErrors[] = {VESK2_SPKI_ERROR_TABLE(VESK2_ROW)};
#undef VESK2_ROW

// The rows are found by index.
static_assert(kErrors[VESK2_MAX_ERROR].code == VESK2_MAX_ERROR);
static_assert(std::size(kErrors) == VESK2_MAX_ERROR + 1);
static_assert(std::size(kSpkiErrors) == 35);

struct Words {
  int code;
  const char* words;
};
// A code that means one thing to one caller and another to the next has no words here: the caller
// knows better.
constexpr Words kWords[] = {
    {VESK2_ERR_MEM_ALLOC, "out of memory"},
    {VESK2_ERR_FILE_OPEN, "cannot be opened"},
    {VESK2_ERR_FIND_DIR, "no such directory"},
    {VESK2_ERR_READ_FILE, "a file of a store is held by another process"},
    {VESK2_ERR_PARSE_FILE, "not in the expected form"},
    {VESK2_ERR_PRINCIPAL, "neither a key nor a hash where one must be"},
    {VESK2_ERR_INVALID_HASH, "a digest of the wrong length"},
    {VESK2_ERR_UNKNOWN_HASH_ID, "a file's digest is not a SHA-256"},
    {VESK2_ERR_HASH_ID, "an unknown hash algorithm"},
    {VESK2_ERR_MAX_BYTE_STRING, "a byte string longer than 8192 bytes"},
    {VESK2_ERR_SIGNATURE_ID, "an unknown signature algorithm"},
    {VESK2_ERR_NOT_IMPLEMENTED, "the signer is not a key"},
    {VESK2_ERR_OPEN_MANIFEST_FILE, "cannot be opened"},
    {VESK2_ERR_SIGNATURE, "the signature does not verify"},
    {VESK2_ERR_HASH_MISMATCH, "not what was signed"},
    {VESK2_ERR_UNEXPECTED_CHAR, "an unexpected character"},
    {VESK2_ERR_INVALID_S_EXPRESSION, "a list that is not closed, or nested too deeply"},
    {VESK2_ERR_NOT_AUTHORIZED, "nothing is granted"},
    {VESK2_ERR_HASH_MATCH, "the listing is not the one that was signed"},
    {VESK2_ERR_RANDOM_TOKEN, "the random token is not of 4 bytes"},
    {VESK2_ERR_TIME_STAMP, "not a time"},
    {VESK2_ERR_SIGNING_CERT_ORDER, "the second certificate is revoked, or not the signer's own"},
    {VESK2_ERR_MANIFEST_VERSION, "a manifest version other than 1"},
    {VESK2_ERR_MANIFEST_TYPE, "a manifest type other than plain"},
    {VESK2_ERR_CERT_REVOKED, "a certificate that is needed is revoked"},
    {VESK2_ERR_PACKAGE_NOT_GRANTED, "less than the asked tag is granted"},
    {VESK2_ERR_NOT_OBJECT_CERT, "the first certificate is not for a digest"},
    {VESK2_ERR_CRL_NOT_FOUND, "no current list tells whether a certificate is revoked"},
    {SPKI_ERR_NO_MEM, "the reduction ran out of memory or of its work budget"},
};

// By a walk: the codes of the engine are no row of numbers, and texts are asked for once an answer.
const Row* FindRow(int code) {
  for (const Row& row : kErrors) {
    if (row.code == code) return &row;
  }
  for (const Row& row : kSpkiErrors) {
    if (row.code == code) return &row;
  }
  return nullptr;
}

}  // namespace

int V2Version() { return VESK2_VERSION_NUMBER; }

const char* V2VersionExtra() { return "r2441"; }

const char* V2VersionExtraA() { return V2VersionExtra(); }

const char* V2Error(int code) {
  // The table has a text for VESK2_MAX_ERROR too, but the range ends before it: callers compare the
  // answer for 77 with the fallback.
  if (code < 0 || code >= VESK2_MAX_ERROR) return "VESK_UNKNOWN_ERROR";
  return kErrors[code].text;
}

const char* V2SpkiError(int code) {
  for (const Row& row : kSpkiErrors) {
    if (row.code == code) return row.text;
  }
  return "VESK_UNKNOWN_SPKI_ERROR";
}

const char* V2CodeName(int code) {
  const Row* const row = FindRow(code);
  return row != nullptr ? row->name : nullptr;
}

// What the reduction cannot read has many codes and one meaning for people. Its own texts say more
// where they are more than a name: whoever shows those asks for them first.
const char* V2CodeWords(int code) {
  for (const Words& row : kWords) {
    if (row.code == code) return row.words;
  }
  return code < 0 ? "an ACL entry or certificate that the reduction cannot read" : "";
}

}  // namespace ZvVesk2
