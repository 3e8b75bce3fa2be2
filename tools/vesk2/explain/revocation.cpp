// revocation.cpp: looking at the revocation lists of an answer.
#include "tools/vesk2/explain/revocation.h"

#include <map>

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Hash;

// The digests of one object, each computed once.
class Digests {
 public:
  explicit Digests(DExpression& object) : object_(object) {}

  bool Match(const Hash& named) {
    const ByteString* digest = named.GetDigest();
    if (digest == nullptr) return false;
    const std::string_view wanted = BytesOf(*digest);
    return Of(named.GetAlgorithm(), true) == wanted || Of(named.GetAlgorithm(), false) == wanted;
  }

 private:
  const std::string& Of(ZvclmHashID id, bool ignoreHints) {
    const auto [at, isNew] = known_.try_emplace({id, ignoreHints});
    unsigned char* digest = nullptr;
    unsigned int length = 0;
    if (isNew && object_.ComputeHash(digest, length, id, ignoreHints) == 0) {
      const std::unique_ptr<unsigned char[]> owner(digest);
      at->second.assign(reinterpret_cast<char*>(digest), length);
    }
    return at->second;
  }

  DExpression& object_;
  std::map<std::pair<ZvclmHashID, bool>, std::string> known_;
};

// The earliest date of the items that name an object.
void FindSince(const SExpression& items, Digests& digests, std::string& since) {
  for (auto at = items.Begin(); at; at.Next()) {
    const auto* item = dynamic_cast<SExpression*>(at.Value());
    auto part = item != nullptr ? item->Begin() : SExpression::Iterator(nullptr);
    if (part) part.Next();  // the keyword
    const auto* named = part ? dynamic_cast<Hash*>(part.Value()) : nullptr;
    if (named == nullptr || !digests.Match(*named)) continue;
    const auto* date = dynamic_cast<ByteString*>(item->Last());
    const std::string text = date != nullptr ? std::string(BytesOf(*date)) : "";
    if (since.empty() || text < since) since = text;
  }
}

}  // namespace

RevocationLists::RevocationLists(const Evidence& evidence) {
  const Ref<SExpression> entries = EntryList(AllEntries(evidence));
  const Ref<SExpression> lists = LoadLists(evidence, entries.get());
  for (auto it = lists->Begin(); it; it.Next()) {
    auto* list = dynamic_cast<CrlSequence*>(it.Value());
    if (list->VerifySelf(entries.get()) == 0) proved_.push_back(Ref<CrlSequence>::Share(list));
  }
}

CrlSequence* RevocationLists::Deciding(SExpression* source) const {
  CrlSequence* deciding = nullptr;
  if (source == nullptr) return deciding;
  for (const Ref<CrlSequence>& list : proved_) {
    const ZvVesk2::Cert& cert = *list->GetCert();
    const TimeStamp* end = cert.GetNotAfter();
    if (end == nullptr || cert.GetTag() == nullptr || !cert.GetTag()->IsEqual(source)) continue;
    if (deciding == nullptr || end->IsAfter(deciding->GetCert()->GetNotAfter())) {
      deciding = list.get();
    }
  }
  return deciding;
}

std::string RevocationLists::RevokedSince(ZvVesk2::Cert& cert, SExpression* source,
                                          bool key) const {
  DExpression* object = &cert;
  if (key) object = cert.GetSubject();
  Digests digests(*object);
  std::string since;
  for (const Ref<CrlSequence>& list : proved_) {
    SExpression* tag = list->GetCert()->GetTag();
    if (!key && (source == nullptr || tag == nullptr || !tag->IsEqual(source))) continue;
    FindSince(key ? *list->GetCrl()->GetList2() : *list->GetCrl()->GetList1(), digests, since);
  }
  return since;
}

}  // namespace vesk2_command
