// SPDX-License-Identifier: Apache-2.0
// fresh_list.cpp: the change that ends "nothing is known": a current revocation list.
#include <algorithm>
#include <cctype>

#include "tools/vesk2/explain/edits.h"
#include "tools/vesk2/explain/mend_period.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

// The stored list of a source, as the verification loaded it.
Ref<CrlSequence> StoredList(const Evidence& evidence, SExpression* source) {
  for (auto* const list : ItemsOf<CrlSequence>(evidence.proved->GetStoredLists())) {
    SExpression* const tag = list->GetCert()->GetTag();
    if (tag != nullptr && tag->IsEqual(source)) return Ref<CrlSequence>::Share(list);
  }
  return {};
}

// The words of a tag as a file name.
std::string FileNameOf(const std::string& text) {
  std::string name;
  for (const char c : text) {
    const bool plain = std::isalnum(static_cast<unsigned char>(c)) != 0;
    if (plain) name += c;
    if (!plain && !name.empty() && name.back() != '-') name += '-';
  }
  while (!name.empty() && name.back() == '-') name.pop_back();
  return (name.empty() ? "fresh" : name) + ".crl";
}

// A year in which a list that is issued now covers `from` and replaces the stored one; empty when
// none can.
std::string LastYearOf(const TimeStamp* from, const CrlSequence* stored) {
  const Ref<TimeStamp> now = ParseTime("now", false);
  std::string year = YearAfter(*now);
  if (from != nullptr) year = std::max(year, YearAfter(*from));
  if (stored == nullptr) return year;
  const TimeStamp* end = stored->GetCert()->GetNotAfter();
  const std::string after = end != nullptr ? YearAfter(*end) : "";
  return after.empty() ? "" : std::max(year, after);
}

}  // namespace

void EditMaker::FreshList(std::vector<Edit>& edits, size_t index) const {
  SExpression* source = evidence_.certs[index].source.get();
  const std::string text = ReadableTag(source);
  if (text.empty() || !IsRevocationTag(source)) return;
  // Whose lists count has been decided in the store, or it is not for a refusal to decide.
  const EntryEvidence* voucher = Voucher(evidence_, source);
  if (voucher == nullptr || !voucher->inStore) return;  // the store would not take its lists
  auto* revoker = dynamic_cast<PublicKey*>(voucher->entry->GetSubject());
  const Ref<CrlSequence> stored = StoredList(evidence_, source);
  const std::string until = LastYearOf(evidence_.RevocationStart(), stored.get());
  if (revoker == nullptr || until.empty() || policy_.IsRevoked(revoker)) return;

  Edit edit;
  edit.target = text;
  edit.cost = 1;
  edit.fresh = Ref<SExpression>::Share(source);
  edit.remedy = {"revocation-list", "import a current revocation list for " + Escape(text) +
                                        " issued by " + Fingerprint(*revoker)};
  const std::string file = FileNameOf(text);
  std::vector<std::string> issue = {"vesk2",           "crl",   "issue", "--key",
                                    KeyWord(*revoker), "--tag", text};
  const Ref<SExpression> entries = AllEntries(evidence_);
  if (stored && stored->VerifySelf(entries.get()) == 0) {
    issue.insert(issue.end(), {"--items-of", stored->GetFileName()});
  }
  issue.insert(issue.end(), {"--not-after", until, "-o", file, "--force"});
  edit.remedy.commands = {issue, {"vesk2", "crl", "import", file}};
  edit.remedy.keys = {Fingerprint(*revoker)};
  edit.remedy.foreign = {text};
  edits.push_back(std::move(edit));
}

}  // namespace vesk2_command
