// SPDX-License-Identifier: Apache-2.0
// tell_facts.cpp: certificates, entries and what the lists say of them, as lines and as JSON.
#include "tools/vesk2/explain/tell_facts.h"

#include <algorithm>

#include "tools/vesk2/objects/shapes.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/names.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;

// Enough of a fingerprint to tell keys apart by eye, with the key's name: what is cut is not told
// by it later.
std::string Short(const std::string& fingerprints) {
  constexpr size_t kDigits = 16;
  std::string text;
  size_t digits = 0;
  for (const char c : WithNames(fingerprints)) {
    const bool hex = std::isxdigit(static_cast<unsigned char>(c)) != 0;
    digits = hex ? digits + 1 : 0;
    if (digits <= kDigits) text += c;
  }
  return text;
}

// When a list was made, as far as it tells: its beginning, or the newest date in it.
const TimeStamp* MadeAt(const CrlSequence& list, const TimeStamp& now) {
  const TimeStamp* made = list.GetCert()->GetNotBefore();
  for (const SExpression* items : {list.GetCrl()->GetList1(), list.GetCrl()->GetList2()}) {
    for (const SExpression* const item : ItemsOf<SExpression>(items)) {
      const auto* date = dynamic_cast<TimeStamp*>(item->Last());
      if (date == nullptr || date->IsAfter(&now)) continue;
      if (made == nullptr || date->IsAfter(made)) made = date;
    }
  }
  return made;
}

const char* StateWord(int32_t state) {
  switch (state) {
    case Cert::RevokedByCrl:
      return "revoked";
    case Cert::KeyRevoked:
      return "key-revoked";
    case Cert::Undetermined:
      return "undetermined";
    default:
      return "not-revoked";
  }
}

// "SUBJECT (COMMENT) may TAG, PERIOD, and pass it on".
template <typename Grant>
std::string GrantText(Grant& grant) {
  const ByteString* const said = grant.GetComment();
  const std::string comment = said != nullptr ? Escape(BytesOf(*said)) : "";
  return Short(SubjectText(*grant.GetSubject())) + (comment.empty() ? "" : " (" + comment + ")") +
         " for " + TagText(grant.GetTag()) + ", " +
         PeriodText(grant.GetNotBefore(), grant.GetNotAfter()) +
         (grant.GetPropagate() ? ", may pass it on" : "");
}

std::string CertText(const Evidence& evidence, size_t index, const Json& json) {
  const CertEvidence& each = evidence.certs[index];
  std::string text = "certificate " + std::to_string(index + 1) + ": " +
                     Short(SubjectText(*each.cert->GetIssuer())) + " certifies " +
                     GrantText(*each.cert);
  text += each.code == 0 ? "; signature holds" : "; signature: " + CodeWords(each.code);
  const Json& revocation = json["revocation"];
  std::string state = revocation["state"];
  std::replace(state.begin(), state.end(), '-', ' ');
  text += "; " + state;
  if (!revocation["source"].is_null()) text += " by " + revocation["source"].get<std::string>();
  if (!revocation["list"].is_null()) text += " (" + ListText(revocation["list"]) + ")";
  return text;
}

}  // namespace

Json ListJson(const CrlSequence& list) {
  Json json = {{"issuer", SubjectText(*list.GetCert()->GetIssuer())},
               {"not_before", StampJson(list.GetCert()->GetNotBefore())},
               {"not_after", StampJson(list.GetCert()->GetNotAfter())}};
  const Ref<TimeStamp> now = ParseTime("now", false);
  const TimeStamp* made = MadeAt(list, *now);
  constexpr long kDay = 24L * 60 * 60;
  json["made_at"] = StampJson(made);
  json["age_days"] = made != nullptr ? Json((now->ToTime() - made->ToTime()) / kDay) : Json();
  return json;
}

std::string ListText(const Json& list) {
  std::string text =
      "list by " + Short(list["issuer"]) + " until " + list["not_after"].get<std::string>();
  if (!list["age_days"].is_null()) {
    const long days = list["age_days"];
    if (days == 0) text += ", made today";
    if (days > 0) text += ", " + Plural(static_cast<size_t>(days), "day") + " old";
  }
  return text;
}

Json AskedRevocation(const ZvVesk2::Evidence& proved, size_t index) {
  Json json = RevocationJson(*proved.GetCert(index));
  json["state"] = StateWord(proved.GetRevocationStatus(index));
  json["since"] = StampJson(proved.GetRevokedSince(index));
  const CrlSequence* list = proved.GetRevocationList(index);
  if (list != nullptr) json["list"] = ListJson(*list);
  return json;
}

Json ToldCert(const Evidence& evidence, size_t index) {
  const CertEvidence& each = evidence.certs[index];
  Json json = CertJson(*each.cert);
  json["certificate"] = index + 1;
  json["signature"] = SignatureJson(each.code);
  json["revocation"] = AskedRevocation(*evidence.proved, index);
  return json;
}

void TellFacts(const Evidence& evidence) {
  Json& chain = Result()["chain"] = Json::array();
  for (size_t i = 0; i < evidence.certs.size(); ++i) {
    chain.push_back(ToldCert(evidence, i));
    Note(CertText(evidence, i, chain.back()));
  }
  Json& acl = Result()["acl"] = Json::array();
  for (const EntryEvidence& each : evidence.entries) {
    if (!each.relevant) continue;
    acl.push_back(EntryJson(*each.entry, Escape(each.file)));
    Note(EntryName(each) + ": trusts " + GrantText(*each.entry));
  }
}

}  // namespace vesk2_command
