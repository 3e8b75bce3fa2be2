// describe.cpp: what each kind of object says.
#include "tools/vesk2/commands/describe.h"

#include <algorithm>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::Crl;
using ZvVesk2::Hash;
using ZvVesk2::Signature;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

const char* SubjectKind(const Subject& subject) {
  if (subject.IsThresholdSubject()) return "k-of-n";
  return subject.IsHash() ? "hash" : "key";
}

void AddSubject(Sheet& sheet, Subject& subject) {
  const std::string text = SubjectText(subject);
  sheet.Add("subject", text, text + (subject.IsHash() ? " (a digest)" : ""));
  sheet.AddMember("subject_kind", SubjectKind(subject));
  if (subject.IsThresholdSubject())
    sheet.AddMember("threshold", DescribeSubject(subject).members());
}

void AddTag(Sheet& sheet, SExpression* tag) {
  sheet.AddRow("tag", TagText(tag));
  if (tag != nullptr) sheet.AddMember("tag", TagText(tag));
}

void AddPeriod(Sheet& sheet, const TimeStamp* notBefore, const TimeStamp* notAfter) {
  sheet.AddRow("valid", PeriodText(notBefore, notAfter));
  if (notBefore != nullptr) sheet.AddMember("not_before", StampText(*notBefore));
  if (notAfter != nullptr) sheet.AddMember("not_after", StampText(*notAfter));
}

void AddComment(Sheet& sheet, const ByteString* comment) {
  if (comment != nullptr) sheet.Add("comment", Escape(BytesOf(*comment)));
}

// What a certificate and an ACL entry both say.
template <typename Granting>
void AddGrant(Sheet& sheet, const Granting& grant) {
  AddSubject(sheet, *grant.GetSubject());
  AddTag(sheet, grant.GetTag());
  sheet.Add("propagate", grant.GetPropagate(), grant.GetPropagate() ? "yes" : "no");
  AddPeriod(sheet, grant.GetNotBefore(), grant.GetNotAfter());
  AddComment(sheet, grant.GetComment());
}

// The third item of a triple, unless it is the (comment) that stands for nothing.
void AddOwner(Sheet& sheet, SExpression* extra) {
  const std::string text = extra != nullptr ? AdvancedText(*extra) : "(comment)";
  if (text.starts_with("(owner ")) return sheet.Add("owner", AdvancedText(*extra, "owner"));
  if (text != "(comment)") sheet.Add("extra", text);
}

void AddRevocation(Sheet& sheet, const Cert& cert) {
  SExpression* source = cert.GetRevocationElement();
  if (source == nullptr) return sheet.AddRow("revocation", "by key only");
  sheet.Add("revocation", SourceText(*source));
}

Sheet DescribeLink(const ChainLink& link) {
  Sheet sheet("certificate");
  sheet.Add("issuer", SubjectText(*link.cert->GetIssuer()));
  AddGrant(sheet, *link.cert);
  AddOwner(sheet, link.extra);
  AddRevocation(sheet, *link.cert);
  if (link.signature != nullptr) AddSignature(sheet, link.signature->Verify(link.cert));
  return sheet;
}

bool IsDummy(const Hash& hash) {
  const ByteString& digest = *hash.GetDigest();
  return std::all_of(digest.GetData(), digest.GetData() + digest.GetLength(),
                     [](unsigned char byte) { return byte == 0; });
}

// The items of a list, each (item HASH DATE). A digest of nothing makes the list count although it
// revokes nothing; without any item there is no list.
void AddItems(Sheet& sheet, const SExpression& list, const std::string& name,
              const std::string& member) {
  Json items = Json::array();
  auto it = list.Begin();
  it.Next();
  if (!it) return;
  for (; it; it.Next()) {
    const auto* item = static_cast<SExpression*>(it.Value());
    auto at = item->Begin();
    at.Next();
    auto* hash = dynamic_cast<Hash*>(at.Value());
    const std::string from = StampText(*dynamic_cast<TimeStamp*>(item->Last()));
    if (IsDummy(*hash)) {
      sheet.AddRow(name, "none");
      continue;
    }
    const std::string digest = SubjectText(*hash);
    sheet.AddRow(name, digest + " from " + from);
    items.push_back({{"digest", digest}, {"from", from}});
  }
  sheet.AddMember(member, std::move(items));
}

void AddLists(Sheet& sheet, const Crl& list) {
  AddItems(sheet, *list.GetList1(), "certificate", "certificates");
  AddItems(sheet, *list.GetList2(), "key", "keys");
}

}  // namespace

void AddSignature(Sheet& sheet, int code) {
  sheet.AddRow("signature", code == 0 ? "holds" : Reason(code));
  sheet.AddMember("signature",
                  {{"holds", code == 0}, {"reason", ReasonWord(code)}, {"code", code}});
}

Sheet DescribeKey(PublicKey& key) {
  Sheet sheet("key");
  sheet.Add("type", key.GetType() == ZVCLM_KEY_RSA ? "rsa" : "dsa");
  sheet.Add("bits", key.GetLength(), std::to_string(key.GetLength()));
  sheet.Add("fingerprint", Fingerprint(key));
  return sheet;
}

Sheet DescribeSubject(Subject& subject) {
  Sheet sheet(SubjectKind(subject));
  auto* threshold = dynamic_cast<ThresholdSubject*>(&subject);
  if (threshold == nullptr) {
    sheet.Add("digest", SubjectText(subject));
    return sheet;
  }
  sheet.Add("k", threshold->GetK(), std::to_string(threshold->GetK()));
  sheet.Add("n", threshold->GetN(), std::to_string(threshold->GetN()));
  Ref<SExpression> members;
  Check(threshold->GetSubjects(members.Out()), "reading a subject");
  Json keys = Json::array();
  for (auto it = members->Begin(); it; it.Next()) {
    keys.push_back(Fingerprint(*it.Value()));
    sheet.AddRow("member", keys.back());
  }
  sheet.AddMember("members", std::move(keys));
  return sheet;
}

Sheet DescribeEntry(AclEntry& entry) {
  Sheet sheet("acl-entry");
  AddGrant(sheet, entry);
  if (entry.GetGeneration() != 0) {
    sheet.Add("generation", entry.GetGeneration(), std::to_string(entry.GetGeneration()));
  }
  return sheet;
}

Sheet DescribeCert(Cert& cert, Signature* signature) {
  return DescribeLink({&cert, signature, nullptr});
}

Sheet DescribeSignature(Signature& signature) {
  Sheet sheet("signature");
  sheet.Add("signer", SubjectText(*signature.GetPrincipal()));
  sheet.Add("of", SubjectText(*signature.GetHash()));
  sheet.Add("algorithm", Escape(BytesOf(*signature.GetAlgorithm())));
  const unsigned length = signature.GetValue()->GetLength();
  sheet.Add("bytes", length, std::to_string(length));
  sheet.AddRow("signature", "not checked: what it signs is not here");
  return sheet;
}

Sheet DescribeChain(const std::vector<ChainLink>& links) {
  const Cert& first = *links.front().cert;
  const bool request = links.size() == 1 && first.GetIssuer()->IsEqual(first.GetSubject());
  Sheet sheet(request ? "request" : "chain");
  for (size_t i = 0; i < links.size(); ++i) {
    sheet.AddPart("certificates", "certificate", i, links.size(), DescribeLink(links[i]));
  }
  return sheet;
}

Sheet DescribeCrl(const Crl& list) {
  Sheet sheet("revocation-list");
  AddLists(sheet, list);
  return sheet;
}

Sheet DescribeCrl(CrlSequence& list) {
  const Cert& cert = *list.GetCert();
  Sheet sheet("revocation-list");
  sheet.Add("issuer", SubjectText(*cert.GetIssuer()));
  AddTag(sheet, cert.GetTag());
  AddPeriod(sheet, cert.GetNotBefore(), cert.GetNotAfter());
  AddLists(sheet, *list.GetCrl());
  AddSignature(sheet, CheckIssuerWord(list));
  return sheet;
}

void Present(const Sheet& sheet) {
  for (const std::string& row : sheet.rows()) Say(row);
  Result() = sheet.members();
}

}  // namespace vesk2_command
