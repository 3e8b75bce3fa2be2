// SPDX-License-Identifier: Apache-2.0
// limits.h: every bound that the library puts on its input, each with the attack that it stops.
//
// All limits are on by default and none can be switched off: the bytes that they guard against come
// from whoever wrote the manifest, certificate or list that is being judged. What exceeds one is
// refused, with the code that is named beside it. docs/threat-model.md says what is promised with
// them, and `scripts/bench --worst` lists the worst inputs known.
//
// They are compiled into the library: a program sees those of the version that it was built with.
#ifndef VESK2_LIMITS_H
#define VESK2_LIMITS_H

#include <cstddef>
#include <cstdint>

namespace ZvVesk2::Limits {

// Nesting of lists, in every reader and in every walk that recurses: "((((..." must not spend the
// stack. The outermost list is level 1; a list at level kMaxDepth + 1 is refused:
// VESK2_ERR_PARSE_FILE from a buffer, VESK2_ERR_INVALID_S_EXPRESSION from memory and text,
// VESK2_ERR_BUFFER_OVERFLOW of an object.
inline constexpr unsigned kMaxDepth = 256;

// Bytes of one byte string, on reading from a buffer and in ByteString::Set:
// VESK2_ERR_MAX_BYTE_STRING.
inline constexpr uint32_t kMaxByteString = 8192;
// Digits of a byte string's length, on reading from a buffer: leading zeros have no end otherwise.
// VESK2_ERR_MAX_BYTE_STRING.
inline constexpr unsigned kMaxLengthDigits = 4;
// Characters of a display hint between "[" and "]": VESK2_ERR_PARSE_FILE.
inline constexpr size_t kMaxHint = 10;

// Bytes of a file read whole into memory: everything that is parsed is. A larger one counts as one
// that cannot be opened.
inline constexpr uint64_t kMaxFile = uint64_t{256} << 20;
// Bytes of one exported expression; keeps the 32-bit lengths from wrapping.
// VESK2_ERR_BUFFER_OVERFLOW.
inline constexpr uint64_t kMaxExport = uint64_t{1} << 31;

// A path, with its terminator. A path that had to be cut is never used: it would be another file's.
inline constexpr size_t kPathBuffer = 4097;
// Milliseconds that one call waits, in all, for files that other processes hold by leases: they
// must not read as absent, and hundreds of them must not stop a verification for hours. The kernel
// takes a lease that is not given back away, after 45 seconds unless it was told otherwise.
inline constexpr uint32_t kMaxHeldWait = 60'000;

// A path inside a manifest body, counted from the body's root; deep trees cost their square.
// VESK2_ERR_PARSE_FILE.
inline constexpr size_t kMaxBodyPath = 4096;
// The name of a stored list, its "/" escaped, without extension: a file name holds 255 bytes. A
// source whose name would be longer has no file.
inline constexpr size_t kMaxStoreName = 250;

// Work that one reduction (or one tag comparison) may do. Certificates that an attacker signs for
// keys of his own multiply tuples and set members exponentially, and long strings are compared with
// many others; a spent budget is a refusal, SPKI_ERR_NO_MEM or for a k-of-n SPKI_ERR_THRESHOLD.
inline constexpr uint32_t kMaxTuples = 100'000;
inline constexpr uint32_t kMaxCombinations = 1'000'000;
// In units of a short comparison, by which all work is paid: under a second. An entry or a
// certificate of a large installation costs some 500.
inline constexpr uint32_t kMaxComparisons = 30'000'000;
// In units of 64 bytes: what a reduction holds at once.
inline constexpr uint32_t kMaxRecords = 4'000'000;
// Bytes of all that one reduction says to be granted: grants share their parts, so that 700 KB of
// certificates can grant 800 MB, which would then be read into objects.
inline constexpr uint64_t kMaxResult = uint64_t{8} << 20;
// Members of one accumulated (* set ...).
inline constexpr uint32_t kMaxSetMembers = 4096;
// Names still to resolve below one subject: (name K N N N ...) definitions can feed themselves.
inline constexpr uint32_t kMaxNameRest = 64;

// Reasons that one explanation names: periods of certificates that miss one another can be as many
// as the square of the certificates. What is more makes the explanation incomplete.
inline constexpr size_t kMaxReasons = 1000;

// Keys and signatures, tested when a signature is checked and not when a key is read: a key is an
// identity first. Outside these a signature is simply not valid.
inline constexpr int kMaxRsaModulusBits = 16384;
inline constexpr int kMaxRsaExponentBits = 64;
inline constexpr int kMaxDsaPrimeBits = 10000;

}  // namespace ZvVesk2::Limits

#endif  // VESK2_LIMITS_H
