// SPDX-License-Identifier: Apache-2.0
// describe.cpp: what each kind of object says.
#include "tools/vesk2/commands/describe.h"

#include "tools/vesk2/objects/shapes.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::Crl;
using ZvVesk2::Hash;
using ZvVesk2::Signature;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

// What a certificate and an ACL entry both say.
template <typename Granting>
void AddGrantRows(Sheet& sheet, const Granting& grant) {
  Subject& subject = *grant.GetSubject();
  sheet.AddRow("subject", SubjectText(subject) + (subject.IsHash() ? " (a digest)" : ""));
  sheet.AddRow("tag", TagText(grant.GetTag()));
  sheet.AddRow("propagate", grant.GetPropagate() ? "yes" : "no");
  sheet.AddRow("valid", PeriodText(grant.GetNotBefore(), grant.GetNotAfter()));
  if (grant.GetComment() != nullptr) sheet.AddRow("comment", Escape(BytesOf(*grant.GetComment())));
}

// The third item of a triple, unless it is the (comment) that stands for nothing.
void AddOwner(Sheet& sheet, SExpression* extra) {
  const std::string text = extra != nullptr ? AdvancedText(*extra) : "(comment)";
  if (text.starts_with("(owner ")) return sheet.Add("owner", AdvancedText(*extra, "owner"));
  if (text != "(comment)") sheet.Add("extra", text);
}

Sheet DescribeLink(const ChainLink& link) {
  const Cert& cert = *link.cert;
  Sheet sheet("certificate");
  sheet.SetMembers(CertJson(cert));
  sheet.AddRow("issuer", SubjectText(*cert.GetIssuer()));
  AddGrantRows(sheet, cert);
  AddOwner(sheet, link.extra);
  SExpression* source = cert.GetRevocationElement();
  sheet.AddRow("revocation", source != nullptr ? SourceText(*source) : "by key only");
  if (link.signature != nullptr) AddSignature(sheet, link.signature->Verify(link.cert));
  return sheet;
}

// The items of a list, each (item HASH DATE); without any item there is no list.
void AddItemRows(Sheet& sheet, const SExpression& list, const std::string& name) {
  const Json items = ItemsJson(list);
  for (const Json& item : items) {
    sheet.AddRow(name,
                 item["digest"].get<std::string>() + " from " + item["from"].get<std::string>());
  }
  if (items.empty() && list.Count() > 1) sheet.AddRow(name, "none");
}

void AddListRows(Sheet& sheet, const Crl& list) {
  AddItemRows(sheet, *list.GetList1(), "certificate");
  AddItemRows(sheet, *list.GetList2(), "key");
}

}  // namespace

void AddSignature(Sheet& sheet, int code) {
  sheet.AddRow("signature", code == 0 ? "holds" : Reason(code));
  sheet.AddMember("signature", SignatureJson(code));
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
  Json keys = Json::array();
  for (Subject* const member : MembersOf(*threshold)) {
    keys.push_back(Fingerprint(*member));
    sheet.AddRow("member", keys.back());
  }
  sheet.AddMember("members", std::move(keys));
  return sheet;
}

Sheet DescribeEntry(AclEntry& entry, const std::string& file) {
  Sheet sheet("acl-entry");
  sheet.SetMembers(EntryJson(entry, file.empty() ? Json() : Json(Escape(file))));
  AddGrantRows(sheet, entry);
  if (entry.GetGeneration() != 0) {
    sheet.AddRow("generation", std::to_string(entry.GetGeneration()));
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
    Sheet part = DescribeLink(links[i]);
    part.AddMember("certificate", i + 1);
    sheet.AddPart("certificates", "certificate", i, links.size(), std::move(part));
  }
  return sheet;
}

Sheet DescribeCrl(const Crl& list) {
  Sheet sheet("revocation-list");
  sheet.AddMember("certificates", ItemsJson(*list.GetList1()));
  sheet.AddMember("keys", ItemsJson(*list.GetList2()));
  AddListRows(sheet, list);
  return sheet;
}

Sheet DescribeCrl(CrlSequence& list) {
  const Cert& cert = *list.GetCert();
  Sheet sheet("revocation-list");
  sheet.SetMembers(CrlJson(list));
  sheet.AddRow("issuer", SubjectText(*cert.GetIssuer()));
  sheet.AddRow("tag", TagText(cert.GetTag()));
  sheet.AddRow("valid", PeriodText(cert.GetNotBefore(), cert.GetNotAfter()));
  AddListRows(sheet, *list.GetCrl());
  AddSignature(sheet, CheckIssuerWord(list));
  return sheet;
}

void Present(const Sheet& sheet) {
  for (const std::string& row : sheet.rows()) Say(row);
  Result() = sheet.members();
}

}  // namespace vesk2_command
