// SPDX-License-Identifier: Apache-2.0
// edits.cpp: single changes that may mend a refusal.
#include "tools/vesk2/explain/edits.h"

#include <algorithm>
#include <cctype>

#include "tools/vesk2/explain/mend_period.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/grant_terms.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/say/shell_words.h"
#include "tools/vesk2/stores/grant.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::ThresholdSubject;

using Words = std::vector<std::string>;

constexpr const char* kExtension = ".acl";

void Append(Words& words, const Words& more) {
  words.insert(words.end(), more.begin(), more.end());
}

std::string Digits(DExpression& key, size_t count) {
  return Fingerprint(key).substr(std::string("sha256:").size(), count);
}

std::string Bytes(const ByteString& text) { return std::string(BytesOf(text)); }

// "with the tag X, valid until Y"; empty when nothing is different.
std::string Differences(const std::string& tag, bool propagate, const Limits& limits) {
  std::string text;
  const auto add = [&](const std::string& more) { text += (text.empty() ? "" : ", ") + more; };
  if (!tag.empty()) add("with the tag " + Escape(tag));
  if (propagate) add("with --propagate");
  if (limits.changed) {
    const Period period = limits.Parse();
    add("valid " + PeriodText(period.notBefore.get(), period.notAfter.get()));
  }
  return text;
}

// A certificate for a hypothesis, signed by nobody.
Ref<Cert> Certify(PublicKey& issuer, const Grant& grant) {
  Ref<Cert> cert(new Cert(nullptr));
  Check(cert->Set(&issuer, grant.subject, grant.propagate, grant.tag, grant.period.notBefore.get(),
                  grant.period.notAfter.get(), grant.comment, grant.revocation),
        "building a certificate");
  return cert;
}

}  // namespace

std::string KeyWord(DExpression& key) { return "KEY-OF-" + Digits(key, 16); }

std::string PathWord(const std::string& path) {
  return path.size() > 1 && path[0] == '-' ? "./" + path : path;
}

void NoteName(Remedy& remedy, const std::string& path) {
  if (ShellWord(path) != path) remedy.foreign.push_back(path);
}

void Apply(const Edit& edit, Hypothesis& hypothesis) {
  if (edit.cert) hypothesis.certs[edit.index] = edit.cert.get();
  for (const auto& key : edit.coSigners) hypothesis.coSigners.emplace(edit.index, key.get());
  for (const auto& key : edit.approvers) hypothesis.approvers.push_back(key.get());
  if (edit.entry) hypothesis.entries[edit.file] = edit.entry.get();
  if (edit.fresh) hypothesis.freshLists.push_back(edit.fresh.get());
}

std::string EditMaker::At(size_t index) const {
  return PathWord(question_.file) + ":" + std::to_string(index + 1);
}

void EditMaker::Add(std::vector<Edit>& edits, Edit edit) const {
  NoteName(edit.remedy, question_.file);
  edits.push_back(std::move(edit));
}

bool EditMaker::Covers(SExpression* tag) const {
  const auto& members = question_.request->members;
  return tag == nullptr || std::all_of(members.begin(), members.end(), [&](const auto& member) {
           return member.tag->IsSubset(tag);
         });
}

// Whether the asked tag is one that the commands issue.
bool EditMaker::CanIssue() const {
  try {
    (void)ParseIssuedTag(question_.request->text);
  } catch (const Trouble&) {
    return false;
  }
  return true;
}

void EditMaker::Renew(std::vector<Edit>& edits, size_t index, Reach reach) const {
  const Cert& old = *evidence_.certs[index].cert;
  auto* issuer = dynamic_cast<PublicKey*>(old.GetIssuer());
  if (issuer == nullptr || policy_.IsRevoked(issuer) || policy_.IsRevoked(old.GetSubject())) return;
  const bool asItIs = reach == Reach::kAsItIs;
  const bool whole = reach == Reach::kWholePeriod;
  const bool retag = !asItIs && !Covers(old.GetTag());
  const bool pass = !asItIs && index > (question_.manifest ? 1U : 0U) && !old.GetPropagate();
  Limits limits;
  if (!asItIs) {
    limits =
        MendPeriod(old.GetNotBefore(), old.GetNotAfter(), evidence_.first, evidence_.last, whole);
  }
  if (!limits.writable || !(asItIs || retag || pass || limits.changed)) return;
  if (retag && !CanIssue()) return;

  Renewal renewal;
  Words options;
  if (retag) {
    renewal.tag = ParseTag(question_.request->text);
    Append(options, {"--tag", question_.request->text});
  }
  if (pass) options.push_back("--propagate");
  renewal.propagate = pass;
  if (limits.changed) {
    renewal.newPeriod = true;
    renewal.period = limits.Parse();
    Append(options, limits.Options());
  }
  Edit edit;
  edit.target = "certificate " + std::to_string(index + 1);
  edit.index = index;
  edit.cert = Certify(*issuer, Renewed(old, renewal));
  // A certificate for something else takes away what this one was for.
  const bool other = retag && !old.GetTag()->IsSubset(question_.request->tag.get());
  edit.cost = other ? 9 : whole ? 6 : 2;
  const std::string what = Differences(retag ? question_.request->text : "", pass, limits);
  edit.remedy = {"renew-certificate", "renew certificate " + std::to_string(index + 1) + " (by " +
                                          Fingerprint(*issuer) + ")" +
                                          (what.empty() ? "" : " " + what)};
  Words command = {"vesk2", "cert", "renew", At(index), "--key", KeyWord(*issuer)};
  Append(command, options);
  Append(command, {"-o", PathWord(question_.file), "--force"});
  edit.remedy.commands = {command};
  edit.remedy.keys = {Fingerprint(*issuer)};
  Add(edits, std::move(edit));
}

void EditMaker::Widen(std::vector<Edit>& edits, const EntryEvidence& each) const {
  const AclEntry& old = *each.entry;
  const bool threshold = dynamic_cast<ThresholdSubject*>(old.GetSubject()) != nullptr;
  if (!each.inStore || threshold || old.GetGeneration() != 0 || policy_.WantsSeveral()) return;
  // The key has to be named by where it stands in the file.
  PublicKey* key = nullptr;
  Words who;
  for (size_t i = evidence_.certs.size(); i-- > 0 && key == nullptr;) {
    auto* issuer = dynamic_cast<PublicKey*>(evidence_.certs[i].cert->GetIssuer());
    if (issuer == nullptr || !Names(old.GetSubject(), issuer)) continue;
    key = issuer;
    who = {"--issuer-of", At(i)};
  }
  if (key == nullptr || !policy_.IsOutermost(key) || policy_.IsRevoked(key)) return;

  const bool retag = !Covers(old.GetTag());
  if (retag && (!CanIssue() || !old.GetTag()->IsSubset(question_.request->tag.get()))) return;
  const std::string tag = retag ? question_.request->text : IssuableTag(old.GetTag());
  const Limits limits =
      MendPeriod(old.GetNotBefore(), old.GetNotAfter(), evidence_.first, evidence_.last, false);
  const bool changed = retag || limits.changed || !old.GetPropagate();
  if (!changed || tag.empty() || !limits.writable) return;

  Edit edit;
  edit.target = edit.file = each.file;
  try {
    edit.entry =
        MakeEntry({Ref<ZvVesk2::Subject>::Share(key), true, ParseIssuedTag(tag), limits.Parse()});
  } catch (const Trouble&) {
    return;  // the old tag is none that is issued
  }
  edit.cost = retag ? 12 : 11;
  edit.remedy = {"acl-entry", "replace " + EntryName(each) +
                                  ", only if you mean to trust this key so: " +
                                  Differences(retag ? tag : "", !old.GetPropagate(), limits)};
  Words command = {"vesk2", "acl", "grant"};
  Append(command, who);
  Append(command, {"--tag", tag, "--propagate"});
  Append(command, limits.Options());
  const std::string comment = old.GetComment() != nullptr ? Bytes(*old.GetComment()) : "";
  if (!comment.empty() && Escape(comment) == comment) Append(command, {"--comment", comment});
  const std::string name = each.file.substr(0, each.file.size() - std::string(kExtension).size());
  Append(command, {"--name", name, "--force"});
  edit.remedy.commands = {command};
  Add(edits, std::move(edit));
}

void EditMaker::NewRoot(std::vector<Edit>& edits, size_t index) const {
  auto* issuer = dynamic_cast<PublicKey*>(evidence_.certs[index].cert->GetIssuer());
  if (issuer == nullptr || !CanIssue() || policy_.WantsSeveral() || !policy_.IsOutermost(issuer) ||
      policy_.IsRevoked(issuer)) {
    return;
  }
  for (size_t i = index + 1; i < evidence_.certs.size(); ++i) {
    if (evidence_.certs[i].cert->GetIssuer()->IsEqual(issuer)) return;  // it was named before
  }
  const std::string& tag = question_.request->text;
  Edit edit;
  edit.newRoot = true;
  edit.cost = 20 + static_cast<int>(evidence_.certs.size() - index);
  edit.entry = MakeEntry({Ref<ZvVesk2::Subject>::Share(issuer), true, ParseTag(tag)});
  const std::string name = FreeEntryName(*edit.entry, "grant-" + Digits(*issuer, 8));
  edit.target = edit.file = name + kExtension;
  edit.remedy = {"new-root",
                 "only if you mean to trust this key: trust the issuer of certificate " +
                     std::to_string(index + 1) + ", " + Fingerprint(*issuer) + ", for " +
                     TagText(question_.request->tag.get())};
  edit.remedy.commands = {{"vesk2", "acl", "grant", "--issuer-of", At(index), "--tag", tag,
                           "--propagate", "--name", name}};
  Add(edits, std::move(edit));
}

}  // namespace vesk2_command
