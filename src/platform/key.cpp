// SPDX-License-Identifier: Apache-2.0
// Key records and keys. Both kinds go the same road: a record is a row of numbers behind two marks.
// The records are an old interface: marks in the place of sizes, numbers in an order of their own.
// All of it ends here; the library works with ZVCLMPublicKeyData.
#include "src/platform/key.h"

#include <openssl/core_names.h>
#include <openssl/crypto.h>
#include <openssl/params.h>
#include <algorithm>
#include <array>
#include <bit>
#include <memory>
#include <new>
#include <span>

using namespace ZVsysutil;

namespace {

// The marks that callers put into, and expect in, the size words of the records.
constexpr uint32_t kRsaMark = 20;
constexpr uint32_t kDsaMark = 60;
constexpr uint32_t kDsaParameterMark = 48;

// The changeable fields of a record, in the order of a key's numbers. A row of pointers, so that
// both kinds are filled, copied and freed by one loop.
struct Fields {
  std::span<ZVCLMBigInt** const> used() const { return {numbers.data(), count}; }

  int type = -1;
  size_t count = 0;
  uint32_t* keyLength = nullptr;
  std::array<ZVCLMBigInt**, ZVCLMPublicKeyData::kMaxNumbers> numbers{};
};

Fields FieldsOf(ZVCLMRSAKeyData* record) {
  return {ZVCLM_KEY_RSA, 2, &record->keyLength, {&record->n, &record->e}};
}

Fields FieldsOf(ZVCLMDSSKeyData* record) {
  return {ZVCLM_KEY_DSA, 4, &record->keyLength, {&record->p, &record->q, &record->g, &record->y}};
}

// The fields of an initialised record of `id`; no fields for anything else. The marks are what
// tells an initialised record from any memory: without them nothing is read behind it.
Fields FieldsOf(int id, void* record) {
  if (id == ZVCLM_DATA_RSA) {
    auto* rsa = static_cast<ZVCLMRSAKeyData*>(record);
    if (rsa->size == kRsaMark) return FieldsOf(rsa);
  }
  if (id == ZVCLM_DATA_DSA) {
    auto* dsa = static_cast<ZVCLMDSSKeyData*>(record);
    if (dsa->size == kDsaMark && dsa->parameterSize == kDsaParameterMark) return FieldsOf(dsa);
  }
  return {};
}

// Safe to call twice, as numbers become null.
[[nodiscard]] int Zeroize(int id, void* record) {
  if (record == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const Fields fields = FieldsOf(id, record);
  if (fields.count == 0) return ZVCLM_ERR_KEY_TYPE;
  for (ZVCLMBigInt** number : fields.used()) {
    delete *number;
    *number = nullptr;
  }
  OPENSSL_cleanse(fields.keyLength, sizeof *fields.keyLength);
  return 0;
}

// A key's numbers in the order of ZVCLMPublicKeyData, as libcrypto takes them: each in the order of
// the machine, one behind the other.
class Parameters {
 public:
  // False without memory.
  bool Set(const ZVCLMPublicKeyData& key) {
    static constexpr const char* kRsaNames[] = {OSSL_PKEY_PARAM_RSA_N, OSSL_PKEY_PARAM_RSA_E};
    static constexpr const char* kDsaNames[] = {OSSL_PKEY_PARAM_FFC_P, OSSL_PKEY_PARAM_FFC_Q,
                                                OSSL_PKEY_PARAM_FFC_G, OSSL_PKEY_PARAM_PUB_KEY};
    const std::span<const char* const> names =
        key.type == ZVCLM_KEY_RSA ? std::span<const char* const>(kRsaNames) : kDsaNames;
    size_t size = 0;
    for (size_t i = 0; i < names.size(); ++i) size += SizeOf(key.numbers[i]);
    bytes_.reset(new (std::nothrow) unsigned char[size]);
    if (bytes_ == nullptr) return false;
    unsigned char* at = bytes_.get();
    for (size_t i = 0; i < names.size(); ++i) {
      const size_t length = SizeOf(key.numbers[i]);
      // NOLINTNEXTLINE(clang-analyzer-cplusplus.NewDelete): each number has a byte
      *at = 0;
      if constexpr (std::endian::native == std::endian::little) {
        std::ranges::reverse_copy(key.numbers[i], at);
      } else {
        std::ranges::copy(key.numbers[i], at);
      }
      parameters_[i] = OSSL_PARAM_construct_BN(names[i], at, length);
      at += length;
    }
    parameters_[names.size()] = OSSL_PARAM_construct_end();
    return true;
  }
  OSSL_PARAM* get() { return parameters_.data(); }

 private:
  static size_t SizeOf(ZvBytes number) { return std::max<size_t>(1, number.size()); }

  std::unique_ptr<unsigned char[]> bytes_;
  std::array<OSSL_PARAM, ZVCLMPublicKeyData::kMaxNumbers + 1> parameters_;
};

}  // namespace

namespace ZVsysutil {

// Made for each use and not kept: a key is verified with seldom, and held often. libcrypto takes
// any numbers, so that null is a lack of memory.
PkeyOwner MakePkey(const ZVCLMPublicKeyData& key) {
  Parameters numbers;
  if (!numbers.Set(key)) return nullptr;
  const char* name = key.type == ZVCLM_KEY_RSA ? "RSA" : "DSA";
  const Evp<EVP_PKEY_CTX, EVP_PKEY_CTX_free> context(
      EVP_PKEY_CTX_new_from_name(nullptr, name, nullptr));
  if (context == nullptr) return nullptr;
  EVP_PKEY* made = nullptr;
  if (EVP_PKEY_fromdata_init(context.get()) != 1 ||
      EVP_PKEY_fromdata(context.get(), &made, EVP_PKEY_PUBLIC_KEY, numbers.get()) != 1) {
    return nullptr;
  }
  return PkeyOwner(made);
}

}  // namespace ZVsysutil

// What was in the record is overwritten: it may be fresh memory.
int zvclm_RSAKeyStructInit(int id, ZVCLMRSAKeyData* record) {
  if (record == nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (id != ZVCLM_DATA_RSA) return ZVCLM_ERR_KEY_TYPE;
  *record = {};
  record->size = kRsaMark;
  return 0;
}

int zvclm_DSSKeyStructInit(int id, ZVCLMDSSKeyData* record, uint32_t parameterSize) {
  if (record == nullptr) return ZVCLM_ERR_NULL_PARAM;
  if (id != ZVCLM_DATA_DSA || parameterSize != kDsaParameterMark) return ZVCLM_ERR_KEY_TYPE;
  *record = {};
  record->size = kDsaMark;
  record->parameterSize = kDsaParameterMark;
  return 0;
}

int zvclm_RSAKeyStructZeroize(int id, ZVCLMRSAKeyData* record) {
  return id == ZVCLM_DATA_RSA ? Zeroize(id, record) : ZVCLM_ERR_KEY_TYPE;
}

int zvclm_DSSKeyStructZeroize(int id, ZVCLMDSSKeyData* record) {
  return id == ZVCLM_DATA_DSA ? Zeroize(id, record) : ZVCLM_ERR_KEY_TYPE;
}

int zvclm_PublicKeyOfNumbers(ZVCLMPublicKeyData** key, int type, std::span<const ZvBytes> numbers) {
  std::unique_ptr<ZVCLMPublicKeyData> made(new (std::nothrow) ZVCLMPublicKeyData);
  if (made == nullptr) return ZVCLM_ERR_NO_MEM;
  size_t size = 0;
  for (const ZvBytes number : numbers) size += number.size();
  made->type = type;
  made->bytes.reset(new (std::nothrow) unsigned char[size]);
  if (made->bytes == nullptr) return ZVCLM_ERR_NO_MEM;
  unsigned char* at = made->bytes.get();
  for (size_t i = 0; i < numbers.size(); ++i) {
    const ZvBytes number = WithoutZeros(numbers[i]);
    made->numbers[i] = {at, number.size()};
    at = std::ranges::copy(number, at).out;
  }
  *key = made.release();
  return 0;
}

// Copied, so that the caller's record can go at once.
int zvclm_PublicKeyDefine(ZVCLMPublicKeyData** key, int type, int id, const void* record,
                          uint32_t /*parameters*/, uint32_t /*handle*/) {
  if (key == nullptr || *key != nullptr || record == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const Fields fields = FieldsOf(id, const_cast<void*>(record));
  if (fields.count == 0 || fields.type != type) return ZVCLM_ERR_KEY_TYPE;
  std::array<ZvBytes, ZVCLMPublicKeyData::kMaxNumbers> numbers;
  for (size_t i = 0; i < fields.count; ++i) {
    const ZVCLMBigInt* number = *fields.numbers[i];
    if (number == nullptr) return ZVCLM_ERR_NULL_PARAM;
    numbers[i] = number->get();
  }
  return zvclm_PublicKeyOfNumbers(key, type, std::span(numbers).first(fields.count));
}

// All copies are made before a number is replaced: the record changes whole or not at all.
int zvclm_PublicKeyGetData(const ZVCLMPublicKeyData* key, int id, void* record,
                           uint32_t /*handle*/) {
  if (key == nullptr || record == nullptr) return ZVCLM_ERR_NULL_PARAM;
  const Fields fields = FieldsOf(id, record);
  if (fields.count == 0 || fields.type != key->type) return ZVCLM_ERR_KEY_TYPE;
  std::array<std::unique_ptr<ZVCLMBigInt>, ZVCLMPublicKeyData::kMaxNumbers> copies;
  for (size_t i = 0; i < fields.count; ++i) {
    const ZvBytes number = key->numbers[i];
    ZVCLMBigInt* copy = nullptr;
    const int code =
        zvclm_BigIntFromBuffer(&copy, number.data(), static_cast<uint32_t>(number.size()));
    if (code) return code;
    copies[i].reset(copy);
  }
  for (size_t i = 0; i < fields.count; ++i) {
    delete *fields.numbers[i];
    *fields.numbers[i] = copies[i].release();
  }
  // The length of n or of p, each the first of its key's numbers.
  *fields.keyLength = static_cast<uint32_t>(CountBits(key->numbers[0]));
  return 0;
}

void zvclm_PublicKeyFree(ZVCLMPublicKeyData* key, uint32_t /*handle*/) { delete key; }
