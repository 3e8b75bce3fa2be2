// inspect.cpp: looking at certificates and revocation lists.
#include "tools/vesk2/inspect.h"

#include "tools/vesk2/explain.h"
#include "tools/vesk2/report.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::Hash;
using ZvVesk2::Signature;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

std::vector<ChainLink> ChainLinks(const CertChain& chain, const std::string& path) {
  std::vector<ChainLink> links;
  auto item = chain->Begin();
  item.Next();  // the keyword
  // The reader of chains accepts whole triples of these kinds only.
  while (item) {
    ChainLink link = {};
    link.cert = dynamic_cast<Cert*>(item.Value());
    item.Next();
    link.signature = dynamic_cast<Signature*>(item.Value());
    item.Next();
    link.extra = dynamic_cast<SExpression*>(item.Value());
    item.Next();
    links.push_back(link);
  }
  if (links.empty()) throw Trouble(Escape(path) + ": holds no certificate");
  return links;
}

std::string SubjectText(Subject& subject) {
  if (const auto* hash = dynamic_cast<Hash*>(&subject)) {
    const char* name = hash->GetAlgorithm() == ZVCLM_HASH_SHA256 ? "sha256:"
                       : hash->GetAlgorithm() == ZVCLM_HASH_SHA1 ? "sha1:"
                                                                 : "rmd160:";
    return name + Hex(BytesOf(*hash->GetDigest()));
  }
  auto* threshold = dynamic_cast<ThresholdSubject*>(&subject);
  if (threshold == nullptr) return Fingerprint(subject);
  std::string text = std::to_string(threshold->GetK()) + " of";
  Ref<SExpression> members;
  Check(threshold->GetSubjects(members.Out()), "reading a subject");
  for (auto it = members->Begin(); it; it.Next()) text += " " + Fingerprint(*it.Value());
  return text;
}

std::string PeriodText(const TimeStamp* notBefore, const TimeStamp* notAfter) {
  if (notBefore == nullptr && notAfter == nullptr) return "always";
  if (notBefore != nullptr && notAfter != nullptr && !notBefore->IsBefore(notAfter) &&
      !notBefore->IsAfter(notAfter)) {
    return "at " + StampText(*notBefore);
  }
  const std::string from = notBefore != nullptr ? "from " + StampText(*notBefore) : "";
  const std::string until = notAfter != nullptr ? "until " + StampText(*notAfter) : "";
  return from + (from.empty() || until.empty() ? "" : " ") + until;
}

std::string SourceText(SExpression& element) {
  const Ref<SExpression> source(element.Rest());
  if (!source) throw std::bad_alloc();
  const std::string text = AdvancedText(*source);
  return text.substr(1, text.size() - 2);
}

Ref<SExpression> LoadAcls() {
  Ref<SExpression> acls;
  const int code = AclEntry::Import(acls.Out(), nullptr, nullptr);
  if (code == 0) return acls;
  ThrowNoStore(code);
}

}  // namespace vesk2_command
