// SPDX-License-Identifier: Apache-2.0
// shapes.cpp: objects for machines.
#include "tools/vesk2/objects/shapes.h"

#include <algorithm>

#include "tools/vesk2/objects/texts.h"

namespace vesk2_command {

using ZvVesk2::Cert;
using ZvVesk2::Hash;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

namespace {

// What a certificate and an ACL entry both say.
template <typename Granting>
Json GrantJson(const char* kind, const Granting& grant) {
  Subject& subject = *grant.GetSubject();
  return {{"kind", kind},
          {"subject", SubjectText(subject)},
          {"subject_kind", SubjectKind(subject)},
          {"threshold", ThresholdJson(subject)},
          {"tag", TagJson(grant.GetTag())},
          {"propagate", grant.GetPropagate()},
          {"not_before", StampJson(grant.GetNotBefore())},
          {"not_after", StampJson(grant.GetNotAfter())},
          {"comment", TextJson(grant.GetComment())}};
}

}  // namespace

Json StampJson(const TimeStamp* stamp) {
  return stamp != nullptr ? Json(StampText(*stamp)) : Json();
}
Json PeriodJson(const Period& period) {
  return {{"not_before", StampJson(period.notBefore.get())},
          {"not_after", StampJson(period.notAfter.get())}};
}
Json TagJson(SExpression* tag) { return tag != nullptr ? Json(TagText(tag)) : Json(); }
Json TextJson(const ByteString* text) {
  return text != nullptr ? Json(Escape(BytesOf(*text))) : Json();
}

const char* SubjectKind(const Subject& subject) {
  if (subject.IsThresholdSubject()) return "k-of-n";
  return subject.IsHash() ? "hash" : "key";
}

Json ThresholdJson(Subject& subject) {
  auto* threshold = dynamic_cast<ThresholdSubject*>(&subject);
  if (threshold == nullptr) return {};
  Json keys = Json::array();
  for (Subject* const member : MembersOf(*threshold)) keys.push_back(Fingerprint(*member));
  return {{"k", threshold->GetK()}, {"n", threshold->GetN()}, {"members", keys}};
}

Json SignatureJson(int code) {
  return {{"holds", code == 0}, {"reason", ReasonWord(code)}, {"code", code}};
}

Json RevocationJson(const Cert& cert) {
  SExpression* source = cert.GetRevocationElement();
  return {{"source", source != nullptr ? Json(SourceText(*source)) : Json()},
          {"state", Json()},
          {"since", Json()},
          {"list", Json()}};
}

Json CertJson(const Cert& cert) {
  Json json = GrantJson("certificate", cert);
  json["certificate"] = Json();
  json["issuer"] = SubjectText(*cert.GetIssuer());
  json["owner"] = Json();
  json["extra"] = Json();
  json["signature"] = Json();
  json["revocation"] = RevocationJson(cert);
  return json;
}

Json EntryJson(const ZvVesk2::AclEntry& entry, const Json& file) {
  Json json = GrantJson("acl-entry", entry);
  json["entry"] = file;
  json["generation"] = entry.GetGeneration();
  return json;
}

bool IsDummy(const Hash& hash) {
  const std::string_view digest = BytesOf(*hash.GetDigest());
  return std::all_of(digest.begin(), digest.end(), [](char byte) { return byte == 0; });
}

Json ItemsJson(const SExpression& items) {
  Json json = Json::array();
  auto it = items.Begin();
  for (it.Next(); it; it.Next()) {
    const auto* item = static_cast<SExpression*>(it.Value());
    auto at = item->Begin();
    at.Next();
    auto* hash = dynamic_cast<Hash*>(at.Value());
    if (IsDummy(*hash)) continue;
    json.push_back({{"digest", SubjectText(*hash)},
                    {"from", StampText(*dynamic_cast<TimeStamp*>(item->Last()))}});
  }
  return json;
}

Json CrlJson(CrlSequence& list) {
  const Cert& cert = *list.GetCert();
  return {{"kind", "revocation-list"},
          {"issuer", SubjectText(*cert.GetIssuer())},
          {"tag", TagJson(cert.GetTag())},
          {"not_before", StampJson(cert.GetNotBefore())},
          {"not_after", StampJson(cert.GetNotAfter())},
          {"certificates", ItemsJson(*list.GetCrl()->GetList1())},
          {"keys", ItemsJson(*list.GetCrl()->GetList2())},
          {"signature", SignatureJson(CheckIssuerWord(list))}};
}

}  // namespace vesk2_command
