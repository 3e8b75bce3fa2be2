// SPDX-License-Identifier: Apache-2.0
// PublicKey: a key as an expression and as a key object of the crypto layer; reading and building
// it. Both forms are made at once, from the same numbers, and never again: what is exported, hashed
// and verified with is one key, and const functions need not make anything (several threads may
// call them).
#include <vesk2/public_key.h>

#include <array>

#include "src/objects/build.h"
#include "src/objects/key_forms.h"
#include "src/platform/crypto.h"
#include "src/sexpr/storage.h"

namespace ZvVesk2 {
namespace {

// A number of the crypto layer as a byte string, without leading zeros. Hinted as bytes, so that
// nobody prints it.
[[nodiscard]] int NumberText(Ref<ByteString>& out, const ZVCLMBigInt* number,
                             Vesk2ContextStruct* context) {
  const int size = zvclm_BigIntGetBufferSize(number);
  VESK2_REQUIRE(size >= 0, VESK2_ERR_BIG_INT_BUFFER_SIZE);
  auto length = static_cast<uint32_t>(size);
  std::unique_ptr<unsigned char[]> bytes(TryNewArray<unsigned char>(length));
  VESK2_REQUIRE(bytes, VESK2_ERR_MEM_ALLOC);
  VESK2_TRY(zvclm_BigIntToBuffer(number, bytes.get(), &length));
  out.Reset(TryNew<ByteString>(bytes.get(), length, ByteString::BsBin, context));
  VESK2_REQUIRE(out, VESK2_ERR_MEM_ALLOC);
  (void)bytes.release();
  return 0;
}

}  // namespace

PublicKey::PublicKey(Vesk2ContextStruct* ctx) : Principal(ctx) {}

PublicKey::~PublicKey() {
  if (key != nullptr) zvclm_PublicKeyFree(key, CryptoHandle());
}

const char* PublicKey::DirectoryName() const { return ""; }

const char* PublicKey::ExtensionName() const { return ".pub"; }

int PublicKey::IsRevoked(bool&) { return 0; }

// "(10:public-key(3:" and, by the next character, the RSA or the DSA half, "))". "(3:" is part of
// the opening: both kinds have a name of three letters.
int PublicKey::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && IsEmpty(), VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(buffer->Expect("(10:public-key(3:"));
  switch (buffer->Peek()) {
    case 'r':
      VESK2_TRY(ImportRSA(buffer));
      break;
    case 'd':
      VESK2_TRY(ImportDSA(buffer));
      break;
    default:
      return VESK2_ERR_PARSE_FILE;
  }
  return buffer->Expect("))");
}

// A key has no store, so that every name is a path.
int PublicKey::Import(const char* name) {
  VESK2_REQUIRE(name != nullptr, VESK2_ERR_INVALID_PARAM);
  std::unique_ptr<char[]> path;
  VESK2_TRY(FilePath(path, DirectoryName(), ExtensionName(), name, StoragePath));
  BufferOwner buffer;
  VESK2_TRY(WrapFile(buffer, path.get(), VESK2_ERR_FILE_OPEN));
  VESK2_TRY(Import(buffer.get()));
  return SetFilePath(path.get());
}

// "rsa(1:e" <e> ")(1:n" <n> ")"
int PublicKey::ImportRSA(ZvBuffer* buffer) { return ImportNumbers<RsaForm>(buffer); }

// "dsa(1:p" <p> ")(1:g" <g> ")(1:q" <q> ")(1:y" <y> ")"
int PublicKey::ImportDSA(ZvBuffer* buffer) { return ImportNumbers<DsaForm>(buffer); }

int PublicKey::SetRSA(ZVCLMPublicKeyData* newKey) { return SetNumbers<RsaForm>(newKey); }

int PublicKey::SetDSA(ZVCLMPublicKeyData* newKey) { return SetNumbers<DsaForm>(newKey); }

bool PublicKey::IsEmpty() const { return key == nullptr && First() == nullptr; }

// Numbers are read in the one order of the form. Whether they make a key libcrypto is not asked: a
// list with an odd key in it must stay readable, and nothing verifies with it.
template <typename Form>
int PublicKey::ImportNumbers(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && IsEmpty(), VESK2_ERR_INVALID_PARAM);
  algorithmName = Form::kName;
  keyType = Form::kType;
  VESK2_TRY(buffer->Expect(Form::kName));
  constexpr size_t kNumbers = Form::kNumbers.size();
  ValueBlocks blocks(GetContext(), 1 + kNumbers, 2 + 2 * kNumbers);
  VESK2_TRY(blocks.Insert(*this, "public-key"));
  SExpression* numbers = nullptr;
  VESK2_TRY(AppendHead(blocks, this, Form::kName, numbers));
  std::array<ZVsysutil::ZvBytes, kNumbers> bytes;  // of the texts in the list
  for (const auto& number : Form::kNumbers) {
    VESK2_TRY(buffer->Expect("(1:"));
    VESK2_TRY(buffer->Expect(number.name));
    Ref<ByteString> text(blocks.NewString());
    VESK2_REQUIRE(text, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(text->Import(buffer));
    VESK2_TRY(buffer->Expect(")"));
    bytes[number.place] = {text->GetData(), text->GetLength()};
    SExpression* pair = nullptr;
    VESK2_TRY(AppendHead(blocks, numbers, number.name, pair));
    VESK2_TRY(Append(pair, std::move(text)));
  }
  // Set with the last number: a key that is half read has no length. The texts may have leading
  // zeros: they make another principal and the same length.
  keyLength = static_cast<uint32_t>(ZVsysutil::CountBits(ZVsysutil::WithoutZeros(bytes[0])));
  return InOwnWords(zvclm_PublicKeyOfNumbers(&key, Form::kType, bytes));
}

ZVCLMPublicKeyData* PublicKey::GetKey() const { return key; }

// Adopted first: from here on the object frees it, whatever happens.
template <typename Form>
int PublicKey::SetNumbers(ZVCLMPublicKeyData* newKey) {
  VESK2_REQUIRE(newKey != nullptr && IsEmpty(), VESK2_ERR_INVALID_PARAM);
  key = newKey;
  KeyRecord<Form> record;
  VESK2_TRY(record.Init());
  VESK2_TRY(zvclm_PublicKeyGetData(key, Form::kDataId, record.get(), CryptoHandle()));
  keyType = Form::kType;
  algorithmName = Form::kName;
  keyLength = record->keyLength;
  VESK2_TRY(Insert("public-key"));
  SExpression* numbers = nullptr;
  VESK2_TRY(AppendHead(this, Form::kName, numbers));
  for (const auto& number : Form::kNumbers) {
    Ref<ByteString> text;
    VESK2_TRY(NumberText(text, record.Number(number), GetContext()));
    VESK2_TRY(AppendPair(numbers, number.name, std::move(text)));
  }
  return 0;
}

int32_t PublicKey::GetType() const { return keyType; }
const char* PublicKey::GetAlgorithm() const { return algorithmName; }
uint32_t PublicKey::GetLength() const { return keyLength; }

}  // namespace ZvVesk2
