// edits.cpp: single changes that may mend a refusal.
#include "tools/vesk2/edits.h"

#include <algorithm>
#include <cctype>
#include <filesystem>

#include "tools/vesk2/crl_file.h"
#include "tools/vesk2/grant.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/stores.h"

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

std::string Bytes(const ByteString& text) {
  return {reinterpret_cast<const char*>(text.GetData()), text.GetLength()};
}

// A stamp as a command line takes it; empty for what is no time.
std::string Typed(const TimeStamp& stamp) {
  const std::string text = Bytes(stamp);
  try {
    return Bytes(*ParseTime(text, false)) == text ? text : "";
  } catch (const Trouble&) {
    return "";
  }
}

// The year after a moment, in whose end a renewed period ends; empty past what can be written.
std::string YearAfter(const TimeStamp& stamp) {
  const std::string text = Typed(stamp);
  if (text.empty()) return "";
  const int year = std::stoi(text.substr(0, 4)) + 1;
  return year > 3900 ? "" : std::to_string(year);
}

// A period on a command line. An option is empty where there is no limit.
struct Limits {
  std::string notBefore;
  std::string notAfter;
  bool changed = false;
  bool writable = true;

  Period Parse() const { return ParsePeriod({notBefore, notAfter}); }
  Words Options() const {
    Words words;
    if (!notBefore.empty()) Append(words, {"--not-before", notBefore});
    if (!notAfter.empty()) Append(words, {"--not-after", notAfter});
    return words;
  }
};

// The period of something that is to hold for `first` to `last` (null: open), or at some moment of
// it: what is given and long enough stays.
Limits Mend(const TimeStamp* notBefore, const TimeStamp* notAfter, const TimeStamp* first,
            const TimeStamp* last, bool whole) {
  Limits limits;
  const TimeStamp* reached = whole || last == nullptr ? last : first;
  const bool ended = notAfter != nullptr && (whole ? last == nullptr || notAfter->IsBefore(last)
                                                   : notAfter->IsBefore(first));
  const bool late = notBefore != nullptr && (whole ? first == nullptr || notBefore->IsAfter(first)
                                                   : notBefore->IsAfter(last));
  limits.changed = ended || late;
  if (!ended && notAfter != nullptr) {
    limits.notAfter = Typed(*notAfter);
    limits.writable = !limits.notAfter.empty();
  } else if (ended) {
    reached = last != nullptr ? last : whole ? nullptr : first;
    limits.notAfter = reached != nullptr ? YearAfter(*reached) : "";
    limits.writable = reached == nullptr || !limits.notAfter.empty();
  }
  if (!late && notBefore != nullptr) {
    limits.notBefore = Typed(*notBefore);
    limits.writable &= !limits.notBefore.empty();
  } else if (late) {
    const TimeStamp* begin = first != nullptr ? first : whole ? nullptr : last;
    limits.notBefore = begin != nullptr ? Typed(*begin) : "";
    limits.writable &= begin == nullptr || !limits.notBefore.empty();
  }
  // A period without limits cannot be asked for.
  if (limits.changed && limits.Options().empty()) {
    if (first != nullptr) limits.notBefore = Typed(*first);
    if (last != nullptr) limits.notAfter = YearAfter(*last);
    limits.writable &= !limits.Options().empty();
  }
  // What was never valid is not mended by one end.
  limits.writable &= limits.notBefore.empty() || limits.notAfter.empty() ||
                     limits.notBefore.substr(0, 4) <= limits.notAfter.substr(0, 4);
  return limits;
}

// The stored list of a source, if it can be read.
Ref<CrlSequence> StoredList(SExpression* source) {
  Ref<CrlSequence> stored;
  if (CrlSequence::Find(stored.Out(), source) != 0) stored.Reset();
  return stored;
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

}  // namespace

std::string KeyWord(DExpression& key) { return "KEY-OF-" + Digits(key, 16); }

void Apply(const Edit& edit, Hypothesis& hypothesis) {
  if (edit.cert) hypothesis.certs[edit.index] = edit.cert.get();
  if (edit.entry) hypothesis.entries[edit.file] = edit.entry.get();
  if (edit.fresh) hypothesis.freshLists.push_back(edit.fresh.get());
}

std::string EditMaker::At(size_t index) const {
  return question_.file + ":" + std::to_string(index + 1);
}

bool EditMaker::Covers(SExpression* tag) const {
  const auto& members = question_.request->members;
  return tag == nullptr || std::all_of(members.begin(), members.end(), [&](const auto& member) {
           return member.tag->IsSubset(tag);
         });
}

void EditMaker::Renew(std::vector<Edit>& edits, size_t index, Reach reach) const {
  const Cert& old = *evidence_.certs[index].cert;
  auto* issuer = dynamic_cast<PublicKey*>(old.GetIssuer());
  if (issuer == nullptr) return;
  const bool asItIs = reach == Reach::kAsItIs;
  const bool whole = reach == Reach::kWholePeriod;
  const bool retag = !asItIs && !Covers(old.GetTag());
  const bool pass = !asItIs && index > (question_.manifest ? 1U : 0U) && !old.GetPropagate();
  Limits limits;
  if (!asItIs) {
    limits = Mend(old.GetNotBefore(), old.GetNotAfter(), evidence_.first, evidence_.last, whole);
  }
  const bool listed = old.GetRevocationStatus() == Cert::RevokedByCrl;
  if (!limits.writable || !(asItIs || retag || pass || limits.changed)) return;

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
  if (listed) {  // the same text would be on the same list
    const std::string comment = "issued again at " + StampText(*ParseTime("now", false));
    renewal.comment = MakeText(comment);
    Append(options, {"--comment", comment});
  }
  const Grant grant = Renewed(old, renewal);
  Edit edit;
  edit.target = "certificate " + std::to_string(index + 1);
  edit.index = index;
  edit.cert = Ref<Cert>(new Cert(nullptr));
  Check(edit.cert->Set(issuer, grant.subject, grant.propagate, grant.tag,
                       grant.period.notBefore.get(), grant.period.notAfter.get(), grant.comment,
                       grant.revocation),
        "building a certificate");
  // A certificate for something else takes away what this one was for.
  const bool other = retag && !old.GetTag()->IsSubset(question_.request->tag.get());
  edit.cost = other ? 9 : whole ? 6 : 2;
  const std::string what = Differences(retag ? question_.request->text : "", pass, limits);
  edit.remedy = {"renew-certificate", "renew certificate " + std::to_string(index + 1) + " (by " +
                                          Fingerprint(*issuer) + ")" +
                                          (what.empty() ? "" : " " + what)};
  Words command = {"vesk2", "cert", "renew", At(index), "--key", KeyWord(*issuer)};
  Append(command, options);
  Append(command, {"-o", question_.file, "--force"});
  edit.remedy.commands = {command};
  edit.remedy.keys = {Fingerprint(*issuer)};
  edits.push_back(std::move(edit));
}

void EditMaker::Widen(std::vector<Edit>& edits, const EntryEvidence& each) const {
  const AclEntry& old = *each.entry;
  const bool threshold = dynamic_cast<ThresholdSubject*>(old.GetSubject()) != nullptr;
  if (!each.inStore || threshold || old.GetGeneration() != 0) return;
  // The key has to be named by where it stands in the file.
  PublicKey* key = nullptr;
  Words who;
  for (size_t i = evidence_.certs.size(); i-- > 0 && key == nullptr;) {
    auto* issuer = dynamic_cast<PublicKey*>(evidence_.certs[i].cert->GetIssuer());
    if (issuer == nullptr || !Names(old.GetSubject(), issuer)) continue;
    key = issuer;
    who = {"--issuer-of", At(i)};
  }
  const bool pass = key != nullptr;  // an issuer's grant is passed on
  if (key == nullptr && !question_.manifest) {
    auto* subject = dynamic_cast<PublicKey*>(evidence_.certs[0].cert->GetSubject());
    if (subject == nullptr || !Names(old.GetSubject(), subject)) return;
    key = subject;
    who = {"--subject-of", At(0)};
  }
  if (key == nullptr) return;

  const bool retag = !Covers(old.GetTag());
  if (retag && !old.GetTag()->IsSubset(question_.request->tag.get())) return;  // would take away
  const std::string tag = retag ? question_.request->text : ReadableTag(old.GetTag());
  const Limits limits =
      Mend(old.GetNotBefore(), old.GetNotAfter(), evidence_.first, evidence_.last, false);
  const bool changed = retag || limits.changed || (pass && !old.GetPropagate());
  if (!changed || tag.empty() || !limits.writable) return;

  Edit edit;
  edit.target = edit.file = each.file;
  edit.entry = MakeEntry({Ref<ZvVesk2::Subject>::Share(key), pass || old.GetPropagate(),
                          ParseTag(tag), limits.Parse()});
  edit.cost = retag ? 3 : 1;
  edit.remedy = {"acl-entry",
                 "replace " + EntryName(each) + ": " +
                     Differences(retag ? tag : "", pass && !old.GetPropagate(), limits)};
  Words command = {"vesk2", "acl", "grant"};
  Append(command, who);
  Append(command, {"--tag", tag});
  if (pass || old.GetPropagate()) command.push_back("--propagate");
  Append(command, limits.Options());
  const std::string comment = old.GetComment() != nullptr ? Bytes(*old.GetComment()) : "";
  if (!comment.empty() && Escape(comment) == comment) Append(command, {"--comment", comment});
  const std::string name = each.file.substr(0, each.file.size() - std::string(kExtension).size());
  Append(command, {"--name", name, "--force"});
  edit.remedy.commands = {command};
  edits.push_back(std::move(edit));
}

void EditMaker::FillGrant(Edit& edit, PublicKey* key, const Words& who, const std::string& tag,
                          bool propagate, const std::string& prefix) const {
  const std::string base = prefix + "-" + Digits(*key, 8);
  std::string name = base;
  const std::filesystem::path store(AclDirectory());
  for (int i = 2; std::filesystem::exists(store / (name + kExtension)); ++i) {
    name = base + "-" + std::to_string(i);
  }
  edit.file = name + kExtension;
  edit.entry = MakeEntry({Ref<ZvVesk2::Subject>::Share(key), propagate, ParseTag(tag)});
  Words command = {"vesk2", "acl", "grant"};
  Append(command, who);
  Append(command, {"--tag", tag});
  if (propagate) command.push_back("--propagate");
  Append(command, {"--name", name});
  edit.remedy.commands.push_back(command);
}

void EditMaker::GrantIssuer(std::vector<Edit>& edits, size_t index) const {
  auto* issuer = dynamic_cast<PublicKey*>(evidence_.certs[index].cert->GetIssuer());
  if (issuer == nullptr) return;
  for (size_t i = index + 1; i < evidence_.certs.size(); ++i) {
    if (evidence_.certs[i].cert->GetIssuer()->IsEqual(issuer)) return;  // it was named before
  }
  Edit edit;
  edit.cost = 3 + static_cast<int>(evidence_.certs.size() - index);
  edit.remedy = {"grant", "trust the issuer of certificate " + std::to_string(index + 1) + ", " +
                              Fingerprint(*issuer) + ", for " +
                              TagText(question_.request->tag.get())};
  FillGrant(edit, issuer, {"--issuer-of", At(index)}, question_.request->text, true, "grant");
  edit.target = edit.file;
  edits.push_back(std::move(edit));
}

void EditMaker::GrantSubject(std::vector<Edit>& edits) const {
  auto* subject = dynamic_cast<PublicKey*>(evidence_.certs[0].cert->GetSubject());
  if (subject == nullptr || question_.manifest) return;
  Edit edit;
  edit.cost = 4 + static_cast<int>(evidence_.certs.size());
  edit.remedy = {"grant", "trust the subject itself, " + Fingerprint(*subject) + ", for " +
                              TagText(question_.request->tag.get())};
  FillGrant(edit, subject, {"--subject-of", At(0)}, question_.request->text, false, "grant");
  edit.target = edit.file;
  edits.push_back(std::move(edit));
}

void EditMaker::FreshList(std::vector<Edit>& edits, size_t index) const {
  SExpression* source = evidence_.certs[index].source.get();
  const std::string text = ReadableTag(source);
  if (text.empty() || !IsRevocationTag(source)) return;
  const EntryEvidence* voucher = Voucher(evidence_, source);
  if (voucher != nullptr && !voucher->inStore) return;  // the store would not take its lists
  DExpression* named = voucher != nullptr ? static_cast<DExpression*>(voucher->entry->GetSubject())
                                          : evidence_.certs[index].cert->GetIssuer();
  auto* revoker = dynamic_cast<PublicKey*>(named);
  const Ref<CrlSequence> stored = StoredList(source);
  const std::string until = LastYearOf(evidence_.RevocationStart(), stored.get());
  if (revoker == nullptr || until.empty()) return;

  Edit edit;
  edit.target = text;
  edit.cost = voucher != nullptr ? 1 : 5;
  edit.fresh = Ref<SExpression>::Share(source);
  edit.remedy = {"revocation-list", "import a current revocation list for " + Escape(text) +
                                        " issued by " + Fingerprint(*revoker)};
  if (voucher == nullptr) {
    edit.remedy.text += ", and trust it for that: no ACL entry says whose lists count";
    FillGrant(edit, revoker, {"--issuer-of", At(index)}, text, false, "revoker");
  }
  const std::string file = FileNameOf(text);
  Words issue = {"vesk2", "crl", "issue", "--key", KeyWord(*revoker), "--tag", text};
  const Ref<SExpression> entries = EntryList(AllEntries(evidence_));
  if (stored && stored->VerifySelf(entries.get()) == 0) {
    Append(issue, {"--items-of", stored->GetFileName()});
  }
  Append(issue, {"--not-after", until, "-o", file, "--force"});
  edit.remedy.commands.push_back(issue);
  edit.remedy.commands.push_back({"vesk2", "crl", "import", file});
  edit.remedy.keys = {Fingerprint(*revoker)};
  edits.push_back(std::move(edit));
}

void EditMaker::TrustList(std::vector<Edit>& edits, size_t index) const {
  SExpression* source = evidence_.certs[index].source.get();
  const std::string text = ReadableTag(source);
  if (text.empty() || !IsRevocationTag(source) || Voucher(evidence_, source) != nullptr) return;
  const Ref<CrlSequence> stored = StoredList(source);
  auto* revoker = stored ? dynamic_cast<PublicKey*>(stored->GetCert()->GetIssuer()) : nullptr;
  if (revoker == nullptr) return;
  Edit edit;
  edit.target = text;
  edit.cost = 2;
  edit.remedy = {"grant", "trust " + Fingerprint(*revoker) + ", who signed the stored list, for " +
                              Escape(text)};
  FillGrant(edit, revoker, {"--issuer-of", stored->GetFileName()}, text, false, "revoker");
  edits.push_back(std::move(edit));
}

}  // namespace vesk2_command
