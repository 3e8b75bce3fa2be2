// SPDX-License-Identifier: Apache-2.0
// The two kinds of key, as tables: which numbers a key has, how they are called and ordered in
// expressions, and where the crypto layer's records hold them. What is done with a key is written
// once, over these tables: a new kind is a table.
#ifndef VESK2_SRC_OBJECTS_KEY_FORMS_H
#define VESK2_SRC_OBJECTS_KEY_FORMS_H

#include <array>

#include <vesk2/platform.h>

namespace ZvVesk2 {

// A number by its name in expressions and its place in records.
template <typename Record>
struct KeyNumber {
  const char* name;
  ZVCLMBigInt* Record::*field;
  size_t place;  // among the numbers of a record; the first one's bits are the length of the key
};

// e before n in expressions, n before e in records: the table says both.
struct RsaForm {
  using Record = ZVCLMRSAKeyData;
  static constexpr const char* kName = "rsa";
  static constexpr int kType = ZVCLM_KEY_RSA;
  static constexpr int kDataId = ZVCLM_DATA_RSA;
  static constexpr std::array<KeyNumber<Record>, 2> kNumbers{
      {{"e", &Record::e, 1}, {"n", &Record::n, 0}}};
  [[nodiscard]] static int Init(Record* record) { return zvclm_RSAKeyStructInit(kDataId, record); }
  static void Wipe(Record* record) {
    static_cast<void>(zvclm_RSAKeyStructZeroize(kDataId, record));
  }
};

struct DsaForm {
  using Record = ZVCLMDSSKeyData;
  static constexpr const char* kName = "dsa";
  static constexpr int kType = ZVCLM_KEY_DSA;
  static constexpr int kDataId = ZVCLM_DATA_DSA;
  // g before q: stored keys and their digests rely on this order.
  static constexpr std::array<KeyNumber<Record>, 4> kNumbers{
      {{"p", &Record::p, 0}, {"g", &Record::g, 2}, {"q", &Record::q, 1}, {"y", &Record::y, 3}}};
  // The mark that the record of this kind has.
  static constexpr uint32_t kParameterSize = 48;
  [[nodiscard]] static int Init(Record* record) {
    return zvclm_DSSKeyStructInit(kDataId, record, kParameterSize);
  }
  static void Wipe(Record* record) {
    static_cast<void>(zvclm_DSSKeyStructZeroize(kDataId, record));
  }
};

// A record whose numbers are wiped and freed when it goes, on every path. Numbers of public keys
// are no secret; wiping is how records give them back.
template <typename Form>
class KeyRecord {
 public:
  KeyRecord() = default;
  ~KeyRecord() { Form::Wipe(&data_); }
  KeyRecord(const KeyRecord&) = delete;
  KeyRecord& operator=(const KeyRecord&) = delete;

  [[nodiscard]] int Init() { return Form::Init(&data_); }
  typename Form::Record* get() { return &data_; }
  typename Form::Record* operator->() { return &data_; }
  ZVCLMBigInt*& Number(const KeyNumber<typename Form::Record>& number) {
    return data_.*number.field;
  }

 private:
  typename Form::Record data_{};
};

}  // namespace ZvVesk2

#endif  // VESK2_SRC_OBJECTS_KEY_FORMS_H
