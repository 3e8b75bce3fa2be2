// SPDX-License-Identifier: Apache-2.0
// explain.cpp: the explanation of an answer, as lines and as JSON.
#include "tools/vesk2/explain/explain.h"

#include <algorithm>

#include "tools/vesk2/explain/approvals.h"
#include "tools/vesk2/explain/effort.h"
#include "tools/vesk2/explain/find_remedies.h"
#include "tools/vesk2/explain/tell_facts.h"
#include "tools/vesk2/explain/tell_remedies.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/shapes.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/explanation.h>
#include <vesk2/wording.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Explanation;

// ---- Why ----

// Has the library explain a code.
void Ask(Explanation& explanation, const Question& question, int code) {
  const std::string& directory = question.aclDirectory;
  Check(explanation.SetNames(question.file == kStandard ? "standard input" : question.file.c_str(),
                             directory.empty() ? nullptr : directory.c_str()),
        "explaining");
  const Request& request = *question.request;
  Check(explanation.Explain(*question.proved, code, request.tag.get(), MemberList(request).get()),
        "explaining");
}

void RequireComplete(const Explanation& explanation) {
  if (!explanation.IsComplete()) throw Trouble("it has cost several times as much as the answer");
}

Json NumberJson(size_t index) { return index != Explanation::kNone ? Json(index + 1) : Json(); }

Json ReasonJson(const Explanation::Reason& reason) {
  Json json = {{"kind", Explanation::Word(reason.kind)},
               {"text", reason.text},
               {"certificate", NumberJson(reason.cert)},
               {"other_certificate", NumberJson(reason.otherCert)},
               {"entry", Json()},
               {"source", Json()}};
  if (reason.entry != nullptr) json["entry"] = Owned(ZvVesk2::Wording::OfEntry(reason.entry));
  if (reason.source != nullptr) json["source"] = TagText(reason.source);
  return json;
}

void TellLosses(const Question& question, int code) {
  Json& lost = Result()["lost"] = Json::array();
  if (question.proved == nullptr) return;
  Explanation explanation(nullptr);
  Ask(explanation, question, code);
  for (size_t i = 0; i < explanation.CountReasons(); ++i) {
    const Explanation::Reason& reason = explanation.GetReason(i);
    Note(reason.text);
    lost.push_back(ReasonJson(reason));
  }
  RequireComplete(explanation);
}

// Where several keys must agree: who does.
void TellApprovals(const Question& question, const Evidence& evidence, int code) {
  Json& list = Result()["approvals"] = Json::array();
  if (code != VESK2_ERR_NOT_AUTHORIZED && code != VESK2_ERR_PACKAGE_NOT_GRANTED) return;
  for (const Approvals& each : FindApprovals(question, evidence)) {
    list.push_back(ApprovalsJson(each));
    if (each.Missing() > 0) Note(EntryName(*each.entry) + ": " + ApprovalsText(each));
  }
}

// ---- The path of a yes ----

Json EndWord(const Explanation& explanation) {
  constexpr const char* kWords[] = {nullptr, "certificate", "entry", "list"};
  const char* word = kWords[explanation.GetEndKind()];
  return word != nullptr ? Json(word) : Json();
}

std::string EndText(const Explanation& explanation) {
  if (explanation.GetEnd() == nullptr) return "it has no end";
  const std::string cert = "certificate " + std::to_string(explanation.GetEndCert() + 1);
  const auto kind = explanation.GetEndKind();
  const std::string what = kind == Explanation::EntryEnds  ? "the ACL entry"
                           : kind == Explanation::CertEnds ? cert
                                                           : "the list of " + cert;
  return "it ends at " + StampText(*explanation.GetEnd()) + ", with " + what;
}

void TellPath(const Question& question, const Evidence& evidence) {
  Explanation explanation(nullptr);
  Ask(explanation, question, 0);
  RequireComplete(explanation);
  Json& json = Result()["authority"] = {{"path", Json::array()},
                                        {"ends", StampJson(explanation.GetEnd())},
                                        {"ended_by", EndWord(explanation)},
                                        {"end_certificate", NumberJson(explanation.GetEndCert())},
                                        {"lists", Json::array()}};
  const AclEntry* entry = explanation.GetEntry();
  if (entry == nullptr) return Note("authority comes by several ACL entries together");
  const auto named = std::find_if(evidence.entries.begin(), evidence.entries.end(),
                                  [&](const auto& each) { return each.entry.get() == entry; });
  std::string text = EntryName(*named);
  json["path"].push_back(Escape(named->file));
  for (size_t i = 0; i < explanation.CountPath(); ++i) {
    const size_t number = explanation.GetPathCert(i) + 1;
    text += " -> certificate " + std::to_string(number);
    json["path"].push_back(number);
  }
  Note("authority: " + text + " -> " + SubjectText(*evidence.certs[0].cert->GetSubject()));
  Note(EndText(explanation));
  for (size_t i = 0; i < explanation.CountPath(); ++i) {
    const size_t index = explanation.GetPathCert(i);
    SExpression* source = evidence.certs[index].source.get();
    const CrlSequence* list = evidence.proved->GetRevocationList(index);
    if (source == nullptr || list == nullptr) continue;
    Json used = {{"source", TagText(source)}};
    used.update(ListJson(*list));
    json["lists"].push_back(used);
    Note("it rests on " + TagText(source) + ": " + ListText(used));
  }
  if (json["lists"].empty()) Note("no certificate of it asks for a revocation list");
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
  NoteMeantRequest(*question.request);
  Explain([&] {
    const Evidence evidence = GatherEvidence(question);
    TellFacts(evidence);
    TellLosses(question, code);
    TellApprovals(question, evidence, code);
    TellRemedies(FindRemedies(question, evidence, code));
  });
}

void ExplainTree(const Question& question) {
  Explain([&] { TellRemedies(MendTree(question, GatherEvidence(question))); });
}

void ExplainGrant(const Question& question) {
  Explain([&] {
    const Evidence evidence = GatherEvidence(question);
    TellFacts(evidence);
    TellPath(question, evidence);
  });
}

void ExplainTrouble(const Question& question, int code) {
  Explain([&] {
    const Evidence evidence = GatherEvidence(question);
    if (CollectsFacts() && !evidence.certs.empty()) {
      const UnshownNotes unshown;
      TellFacts(evidence);
    }
    if (code < 0) TellLosses(question, code);
  });
}

void StartExplanation() {
  for (const char* member :
       {"members", "chain", "acl", "lost", "approvals", "remedies", "authority"}) {
    Result()[member] = Json();
  }
}

}  // namespace vesk2_command
