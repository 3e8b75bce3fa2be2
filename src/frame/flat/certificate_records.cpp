// SPDX-License-Identifier: Apache-2.0
// Flat functions: reading a certificate sequence into a chain of records, and freeing it. Records
// are shown and never judged: a verification goes back to the sequence, so that no text of a
// record, changed by a program or not, enters a verdict.
#include <vesk2/cert_sequence.h>
#include <vesk2/public_key.h>

#include <memory>

#include "src/frame/check.h"
#include "src/frame/flat/ascii_text.h"
#include "src/frame/flat/tag_text.h"

using namespace ZvVesk2;

namespace {

constexpr uint32_t kRecordMark = 44;  // what callers test; not the size of the record here

struct ChainFree {
  void operator()(Vesk2CertInfoStruct* chain) const { Vesk2CertFree(chain); }
};
using ChainOwner = std::unique_ptr<Vesk2CertInfoStruct, ChainFree>;

// 0 where there is none, and for a text that is no stamp: the record has no other word for either.
time_t TimeOf(const TimeStamp* stamp) { return stamp != nullptr ? stamp->ToTime() : 0; }

// With the digest as raw bytes, so that it has a length of its own beside the text.
[[nodiscard]] int ReadHash(Vesk2CertInfoStruct& record, Hash* hash) {
  const unsigned int size = hash->AdvancedLength();
  record.hashText = TryNewArray<char>(size_t{size} + 1);
  VESK2_REQUIRE(record.hashText != nullptr, VESK2_ERR_MEM_ALLOC);
  return hash->ExportAdvanced(reinterpret_cast<unsigned char*>(record.hashText),
                              record.hashTextLength, size);
}

// What was filled in before a failure goes with the record.
[[nodiscard]] int ReadRecord(Vesk2CertInfoStruct& record, Cert* cert, Signature* signature,
                             SExpression* extra) {
  // Each record has the mark, as programs test it one by one.
  record.size = kRecordMark;
  record.notBefore = TimeOf(cert->GetNotBefore());
  record.notAfter = TimeOf(cert->GetNotAfter());
  VESK2_TRY(TagText(record.tag, cert->GetTag(), "tag"));
  VESK2_TRY(TagText(record.owner, extra, "owner"));
  VESK2_TRY(ReadHash(record, signature->GetHash()));
  // A hash or a group of keys has no key data, and is a good subject all the same.
  auto* const key = dynamic_cast<PublicKey*>(cert->GetSubject());
  return key != nullptr ? InOwnWords(key->X509Export(record.keyData, record.keyLength)) : 0;
}

// The records of all triples behind the keyword. None holds the sequence yet: a chain that is freed
// half-made frees no sequence.
[[nodiscard]] int ReadRecords(ChainOwner& chain, CertSequence* sequence) {
  Vesk2CertInfoStruct* last = nullptr;
  auto item = sequence->Begin();
  for (item.Next(); item;) {
    // The reader of sequences lets whole triples of these kinds pass, and nothing else.
    auto* const cert = static_cast<Cert*>(item.Value());
    item.Next();
    auto* const signature = static_cast<Signature*>(item.Value());
    item.Next();
    auto* const extra = static_cast<SExpression*>(item.Value());
    item.Next();
    ChainOwner record(TryNew<Vesk2CertInfoStruct>());
    VESK2_REQUIRE(record, VESK2_ERR_MEM_ALLOC);
    VESK2_TRY(ReadRecord(*record, cert, signature, extra));
    Vesk2CertInfoStruct* const read = record.release();
    if (last == nullptr) {
      chain.reset(read);
    } else {
      last->next = read;
    }
    last = read;
  }
  return 0;
}

}  // namespace

int Vesk2CertReadCtx(Vesk2CertInfoStruct** out, const char* path, Vesk2ContextStruct* context) {
  VESK2_REQUIRE(out != nullptr && path != nullptr, VESK2_ERR_PARAM_NULL);
  Ref<CertSequence> sequence;
  VESK2_TRY(CertSequence::Import(sequence.Out(), path, true, context));
  ChainOwner chain;
  VESK2_TRY(ReadRecords(chain, sequence.get()));
  for (auto* record = chain.get(); record != nullptr; record = record->next) {
    record->sequence = sequence.get();
  }
  // A sequence without certificates has no record to hold it, and goes here.
  if (chain) static_cast<void>(sequence.Release());  // the chain's reference now
  *out = chain.release();
  return 0;
}

int Vesk2CertReadCtxA(Vesk2CertInfoStruct** out, const char* path, Vesk2ContextStruct* context) {
  const AsciiText name(path);
  VESK2_REQUIRE(!name.OutOfMemory(), VESK2_ERR_MEM_ALLOC);
  return Vesk2CertReadCtx(out, name.get(), context);
}

int Vesk2CertRead(Vesk2CertInfoStruct** out, const char* path) {
  return Vesk2CertReadCtx(out, path, nullptr);
}

int Vesk2CertReadA(Vesk2CertInfoStruct** out, const char* path) {
  return Vesk2CertReadCtxA(out, path, nullptr);
}

// All records hold one sequence, which has one reference of the chain's.
int Vesk2CertFree(Vesk2CertInfoStruct* chain) {
  // Callers tell a read that gave nothing by this; the record of a list is freed without a word.
  VESK2_REQUIRE(chain != nullptr, VESK2_ERR_PARAM_NULL);
  const Ref<CertSequence> sequence(chain->sequence);
  while (chain != nullptr) {
    const std::unique_ptr<Vesk2CertInfoStruct> record(chain);
    chain = record->next;
    for (char* text : {record->tag, record->owner, record->hashText}) delete[] text;
    delete[] record->keyData;
  }
  return 0;
}
