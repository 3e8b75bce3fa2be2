// SPDX-License-Identifier: Apache-2.0
// Keys in two formats that other programs read: DER SubjectPublicKeyInfo, and the binary SSH blob
//   string "ssh-rsa", mpint e, mpint n
//   string "ssh-dss", mpint p, mpint q, mpint g, mpint y
// where a string is four bytes of length (big-endian) and its bytes, and an mpint is a string with
// the fewest bytes that show the number as positive.
#include <openssl/x509.h>
#include <algorithm>
#include <cstring>
#include <new>
#include <span>
#include <string_view>

#include "src/platform/crypto.h"
#include "src/platform/key.h"

using namespace ZVsysutil;

namespace {

struct Encoding {
  std::unique_ptr<unsigned char[]> bytes;
  uint32_t length = 0;
};

// Both forms know their length before they write.
[[nodiscard]] int Allocate(Encoding* out, size_t length) {
  out->bytes.reset(new (std::nothrow) unsigned char[length]);
  out->length = static_cast<uint32_t>(length);
  return out->bytes != nullptr ? 0 : ZVCLM_ERR_NO_MEM;
}

// Any numbers can be encoded: what fails is a lack of memory, whatever libcrypto calls it.
[[nodiscard]] int EncodeDer(const ZVCLMPublicKeyData& key, Encoding* out) {
  const PkeyOwner pkey = MakePkey(key);
  if (pkey == nullptr) return ZVCLM_ERR_NO_MEM;
  const int length = i2d_PUBKEY(pkey.get(), nullptr);
  if (length <= 0) return ZVCLM_ERR_NO_MEM;
  if (const int code = Allocate(out, static_cast<size_t>(length))) return code;
  unsigned char* at = out->bytes.get();
  return i2d_PUBKEY(pkey.get(), &at) == length ? 0 : ZVCLM_ERR_NO_MEM;
}

constexpr size_t kLengthBytes = 4;

// Zero has no bytes at all in this form.
size_t MpintLength(ZvBytes number) {
  return number.empty() ? 0 : CountBits(number) / 8 + 1;  // room for a sign bit of 0
}

unsigned char* WriteLength(unsigned char* at, size_t length) {
  for (const int shift : {24, 16, 8, 0}) *at++ = static_cast<unsigned char>(length >> shift);
  return at;
}

// By hand: libcrypto does not write it.
[[nodiscard]] int EncodeSsh(const ZVCLMPublicKeyData& key, Encoding* out) {
  static constexpr size_t kRsaOrder[] = {kRsaE, kRsaN};
  static constexpr size_t kDsaOrder[] = {kDsaP, kDsaQ, kDsaG, kDsaY};
  const bool rsa = key.type == ZVCLM_KEY_RSA;
  const std::string_view name = rsa ? "ssh-rsa" : "ssh-dss";
  const std::span<const size_t> order = rsa ? std::span<const size_t>(kRsaOrder) : kDsaOrder;

  size_t total = kLengthBytes + name.size();
  for (const size_t index : order) total += kLengthBytes + MpintLength(key.numbers[index]);
  if (const int code = Allocate(out, total)) return code;

  unsigned char* at = WriteLength(out->bytes.get(), name.size());
  std::memcpy(at, name.data(), name.size());
  at += name.size();
  for (const size_t index : order) {
    const size_t length = MpintLength(key.numbers[index]);
    at = WriteLength(at, length);
    if (length > key.numbers[index].size()) *at++ = 0;
    at = std::ranges::copy(key.numbers[index], at).out;
  }
  return 0;
}

// The formats of this interface have numbers with gaps, and the others are refused.
[[nodiscard]] int Encode(const ZVCLMPublicKeyData& key, int format, Encoding* out) {
  switch (format) {
    case ZVCLM_FORMAT_X509:
      return EncodeDer(key, out);
    case ZVCLM_FORMAT_SSH:
      return EncodeSsh(key, out);
    default:
      return ZVCLM_ERR_FORMAT;
  }
}

}  // namespace

// Encoded anew for each call, also for the one that asks for the length: it is called seldom.
int zvclm_PublicKeyExport(const ZVCLMPublicKeyData* key, int format, uint32_t /*parameters*/,
                          unsigned char* out, uint32_t* length, uint32_t /*handle*/) {
  if (key == nullptr || length == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const ErrorMark mark;
  Encoding encoding;
  if (const int code = Encode(*key, format, &encoding)) return code;
  if (out == nullptr) {
    *length = encoding.length;
    return ZVCLM_ERR_BUFFER_TOO_SMALL;
  }
  if (*length < encoding.length) return ZVCLM_ERR_BUFFER_TOO_SMALL;
  std::memcpy(out, encoding.bytes.get(), encoding.length);
  *length = encoding.length;
  return 0;
}
