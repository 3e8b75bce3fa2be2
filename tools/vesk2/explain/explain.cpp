// explain.cpp: the explanation of an answer, as lines and as JSON.
#include "tools/vesk2/explain/explain.h"

#include <algorithm>
#include <ctime>
#include <filesystem>

#include "tools/vesk2/explain/authority.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/explain/find_remedies.h"
#include "tools/vesk2/explain/hypothesis.h"
#include "tools/vesk2/explain/revocation.h"
#include "tools/vesk2/explain/tell_remedies.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/shapes.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;

// Enough of a fingerprint to tell keys apart by eye.
std::string Short(const std::string& fingerprints) {
  constexpr size_t kDigits = 16;
  std::string text;
  size_t digits = 0;
  for (const char c : fingerprints) {
    const bool hex = std::isxdigit(static_cast<unsigned char>(c)) != 0;
    digits = hex ? digits + 1 : 0;
    if (digits <= kDigits) text += c;
  }
  return text;
}

std::string CommentOf(const ByteString* comment) {
  return comment == nullptr
             ? ""
             : Escape({reinterpret_cast<const char*>(comment->GetData()), comment->GetLength()});
}

// ---- Revocation ----

// When a list was made, as far as it tells: its beginning, or the newest date in it.
const TimeStamp* MadeAt(const CrlSequence& list, const TimeStamp& now) {
  const TimeStamp* made = list.GetCert()->GetNotBefore();
  for (const SExpression* items : {list.GetCrl()->GetList1(), list.GetCrl()->GetList2()}) {
    for (auto it = items->Begin(); it; it.Next()) {
      const auto* item = dynamic_cast<SExpression*>(it.Value());
      const auto* date = item != nullptr ? dynamic_cast<TimeStamp*>(item->Last()) : nullptr;
      if (date == nullptr || date->IsAfter(&now)) continue;
      if (made == nullptr || date->IsAfter(made)) made = date;
    }
  }
  return made;
}

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
    text += days == 0 ? ", made today" : ", " + std::to_string(days) + " days old";
  }
  return text;
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

Json AskedRevocation(const Evidence& evidence, const RevocationLists& lists, size_t index,
                     int32_t state) {
  SExpression* source = evidence.certs[index].source.get();
  Json json = RevocationJson(*evidence.certs[index].cert);
  json["state"] = StateWord(state);
  if (const CrlSequence* list = lists.Deciding(source)) json["list"] = ListJson(*list);
  return json;
}

// ---- Facts ----

Json ToldCert(const Evidence& evidence, const RevocationLists& lists, size_t index, int32_t state) {
  const CertEvidence& each = evidence.certs[index];
  Json json = CertJson(*each.cert);
  json["certificate"] = index + 1;
  json["signature"] = SignatureJson(each.code);
  json["revocation"] = AskedRevocation(evidence, lists, index, state);
  return json;
}

// "SUBJECT (COMMENT) may TAG, PERIOD, and pass it on".
template <typename Grant>
std::string GrantText(Grant& grant) {
  const std::string comment = CommentOf(grant.GetComment());
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

// The certificates, and the entries that name one of their keys.
void TellFacts(const Evidence& evidence, const RevocationLists& lists) {
  const std::vector<int32_t> states = RevocationStates(evidence);
  Json& chain = Result()["chain"] = Json::array();
  for (size_t i = 0; i < evidence.certs.size(); ++i) {
    chain.push_back(ToldCert(evidence, lists, i, states[i]));
    Note(CertText(evidence, i, chain.back()));
  }
  Json& acl = Result()["acl"] = Json::array();
  for (const EntryEvidence& each : evidence.entries) {
    if (!IsRelevant(each, evidence)) continue;
    acl.push_back(EntryJson(*each.entry, Escape(each.file)));
    Note(EntryName(each) + ": trusts " + GrantText(*each.entry));
  }
}

void TellLosses(const std::vector<Loss>& losses) {
  Json& lost = Result()["lost"] = Json::array();
  for (const Loss& loss : losses) {
    Note(loss.text);
    lost.push_back({{"kind", loss.kind}, {"text", loss.text}});
  }
}

// ---- The path of a yes ----

void TellPath(const Question& question, const Evidence& evidence, const RevocationLists& lists) {
  Json json = {{"path", Json::array()}, {"ends", Json()}, {"lists", Json::array()}};
  const std::optional<AuthorityPath> path = FindPath(question, evidence);
  if (!path) {
    Note("authority comes by several ACL entries together");
    Result()["authority"] = json;
    return;
  }
  std::string text = EntryName(*path->entry);
  json["path"].push_back(Escape(path->entry->file));
  for (const size_t index : path->certs) {
    text += " -> certificate " + std::to_string(index + 1);
    json["path"].push_back(index + 1);
  }
  json["ends"] = StampJson(path->ends);
  Note("authority: " + text + " -> " + SubjectText(*evidence.certs[0].cert->GetSubject()));
  Note(path->ends != nullptr ? "it ends at " + StampText(*path->ends) : "it has no end");
  for (const size_t index : path->certs) {
    SExpression* source = evidence.certs[index].source.get();
    const CrlSequence* list = lists.Deciding(source);
    if (list == nullptr) continue;
    Json used = {{"source", TagText(source)}};
    used.update(ListJson(*list));
    json["lists"].push_back(used);
    Note("it rests on " + TagText(source) + ": " + ListText(used));
  }
  if (json["lists"].empty()) Note("no certificate of it asks for a revocation list");
  Result()["authority"] = json;
}

// An explanation that cannot be had must not stand in for the answer.
template <typename Tell>
void Explain(Tell&& tell) {
  StartEffort();
  try {
    tell();
  } catch (const Trouble& trouble) {
    Note(std::string("the explanation stops here: ") + trouble.what());
  }
}

}  // namespace

void ExplainRefusal(const Question& question, int code) {
  Explain([&] {
    const Evidence evidence = GatherEvidence(question);
    TellFacts(evidence, RevocationLists(evidence));
    TellLosses(FindLosses(question, evidence, code));
    TellRemedies(FindRemedies(question, evidence, code));
  });
}

void ExplainTree(const Question& question) {
  Explain([&] { TellRemedies(MendTree(question, GatherEvidence(question))); });
}

void ExplainGrant(const Question& question) {
  Explain([&] {
    const Evidence evidence = GatherEvidence(question);
    const RevocationLists lists(evidence);
    TellFacts(evidence, lists);
    TellPath(question, evidence, lists);
  });
}

void ExplainTrouble(const Question& question, int code) {
  Explain([&] {
    const Evidence evidence = GatherEvidence(question);
    if (GetStyle().json && !evidence.certs.empty()) TellFacts(evidence, RevocationLists(evidence));
    if (code < 0) TellLosses(FindLosses(question, evidence, code));
  });
}

void StartExplanation() {
  for (const char* member : {"members", "chain", "acl", "lost", "remedies", "authority"}) {
    Result()[member] = Json();
  }
}

}  // namespace vesk2_command
