// explain.cpp: why a manifest was refused, in words.
#include "tools/vesk2/explain.h"

#include <algorithm>
#include <filesystem>

#include "tools/vesk2/manifest_file.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/stores.h"

#include <vesk2/acl_entry.h>
#include <vesk2/hash.h>
#include <vesk2/verify.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::CrlSequence;
using ZvVesk2::Hash;
using ZvVesk2::Principal;
using ZvVesk2::Subject;
using ZvVesk2::ThresholdSubject;

bool IsDigestOf(const Hash& hash, DExpression& key) {
  unsigned char* digest = nullptr;
  unsigned int length = 0;
  if (key.ComputeHash(digest, length, hash.GetAlgorithm(), true) != 0) return false;
  const std::unique_ptr<unsigned char[]> owner(digest);
  const ByteString* named = hash.GetDigest();
  return named != nullptr && named->GetLength() == length &&
         std::equal(digest, digest + length, named->GetData());
}

// Whether a subject is a key, names it by its digest or counts it among its k-of-n.
bool Names(Subject* subject, Principal* key) {
  if (subject->IsEqual(key)) return true;
  if (const auto* hash = dynamic_cast<Hash*>(subject)) return IsDigestOf(*hash, *key);
  auto* threshold = dynamic_cast<ThresholdSubject*>(subject);
  return threshold != nullptr && threshold->HasMember(key);
}

std::string FileOf(AclEntry& entry) {
  const Text name(entry.BaseName());
  return "ACL entry " + (name ? Escape(name.get()) : "without a name");
}

class Explanation {
 public:
  explicit Explanation(const Question& question)
      : question_(question), block_(ReadSignatureBlock(question.manifest)) {
    const std::string& extra = question.aclDirectory;
    const int code =
        AclEntry::Import(acls_.Out(), nullptr, extra.empty() ? nullptr : extra.c_str());
    if (code != 0) acls_.Reset();
    const bool asked = question.period.notBefore || question.period.notAfter;
    first_ = asked ? question.period.notBefore.get() : block_.signedAt.get();
    last_ = asked ? question.period.notAfter.get() : block_.signedAt.get();
  }

  void Signatures() {
    for (size_t i = 0; i < block_.certs.size(); ++i) {
      const int code = block_.certs[i].signature->Verify(block_.certs[i].cert.get());
      if (code != 0) Add(CertName(i) + ": " + Reason(code));
    }
  }

  void Order() {
    if (block_.certs.empty()) return;
    Subject* first = block_.certs[0].cert->GetSubject();
    if (!first->IsHash()) return Add(CertName(0) + " is not for the digest of a manifest");
    if (block_.certs.size() < 2) return;
    Principal* signer = block_.certs[0].cert->GetIssuer();
    if (block_.certs[1].cert->GetSubject()->IsEqual(signer)) return;
    Add(CertName(1) + " is for " + Fingerprint(*block_.certs[1].cert->GetSubject()) +
        ", not for the signer " + Fingerprint(*signer));
  }

  void Content() {
    if (!block_.damage.empty()) Add(Escape(question_.manifest) + ": " + block_.damage);
    if (!block_.certs.empty()) Add(CertName(0) + " is for another version, time or listing");
  }

  void Revocations() {
    Ref<SExpression> lists;
    if (!acls_ || CrlSequence::ImportStore(lists.Out(), acls_.get(), nullptr) != 0) return;
    for (const auto& carried : block_.crls) {
      auto shared = Ref<CrlSequence>::Share(carried.get());
      if (lists->Insert(shared.get()) == 0) (void)shared.Release();
    }
    TimeStamp* from = first_ != nullptr ? first_ : block_.signedAt.get();
    TimeStamp* to = last_ != nullptr ? last_ : block_.signedAt.get();
    for (size_t i = 0; i < block_.certs.size(); ++i) {
      Cert& cert = *block_.certs[i].cert;
      bool revoked = false;
      const int code = cert.IsRevoked(revoked, acls_.get(), lists.get(), from, to);
      const int32_t status = cert.GetRevocationStatus();
      if (status == Cert::RevokedByCrl) Add(CertName(i) + " is revoked");
      if (status == Cert::KeyRevoked) {
        Add(CertName(i) + " is for a revoked key, " + Fingerprint(*cert.GetSubject()));
      }
      if (status == Cert::Undetermined) {
        Add(CertName(i) + ": no current revocation list tells whether it is revoked (" +
            CodeName(code) + ")");
      }
    }
  }

  void Certificates() {
    for (size_t i = 0; i < block_.certs.size(); ++i) {
      const Cert& cert = *block_.certs[i].cert;
      Period(CertName(i), cert.GetNotBefore(), cert.GetNotAfter());
      Tag(CertName(i), cert.GetTag());
      // The first speaks for the content, and the second is used as if it could be passed on.
      if (i > 1 && !cert.GetPropagate()) {
        Add(CertName(i) + " does not let its subject pass the grant on (no --propagate)");
      }
    }
  }

  // ACL entries that name a key of the chain and do not help; none of it when one does.
  void Roots() {
    if (!acls_) return;
    const std::vector<std::string> before = reasons_;
    bool named = false;
    for (auto it = acls_->Begin(); it; it.Next()) {
      auto* entry = dynamic_cast<AclEntry*>(it.Value());
      if (entry == nullptr || !NamesIssuer(*entry)) continue;
      named = true;
      const size_t count = reasons_.size();
      const std::string name = FileOf(*entry);
      if (!entry->GetPropagate()) Add(name + " does not let its key pass the grant on");
      Period(name, entry->GetNotBefore(), entry->GetNotAfter());
      Tag(name, entry->GetTag());
      if (reasons_.size() == count) {
        reasons_ = before;
        return;
      }
    }
    if (!named) Add("no ACL entry in " + Stores() + " names a key of this chain:" + Issuers());
  }

  // Credentials that the reduction cannot read; one of them is enough to stop it.
  void Unreadable() {
    for (size_t i = 0; i < block_.certs.size(); ++i) {
      const int code = TryReduction("sequence", block_.certs[i].cert.get());
      if (code < 0) Add(CertName(i) + ": " + Reason(code));
    }
    if (!acls_) return;
    for (auto it = acls_->Begin(); it; it.Next()) {
      auto* entry = dynamic_cast<AclEntry*>(it.Value());
      const int code = entry != nullptr ? TryReduction("acl", entry) : 0;
      if (code < 0) Add(FileOf(*entry) + ": " + Reason(code));
    }
  }

  std::vector<std::string> Take() { return std::move(reasons_); }

 private:
  void Add(const std::string& reason) { reasons_.push_back(reason); }

  std::string CertName(size_t index) const {
    return "certificate " + std::to_string(index + 1) + " (issuer " +
           Fingerprint(*block_.certs[index].cert->GetIssuer()) + ")";
  }

  std::string Stores() const {
    const std::string& extra = question_.aclDirectory;
    return Escape(AclDirectory()) + (extra.empty() ? "" : " or " + Escape(extra));
  }

  std::string Asked() const {
    if (first_ == block_.signedAt.get()) return "the manifest was signed at " + StampText(*first_);
    const std::string from = first_ != nullptr ? " from " + StampText(*first_) : "";
    const std::string to = last_ != nullptr ? " until " + StampText(*last_) : "";
    return "asked was" + from + to;
  }

  void Period(const std::string& name, const TimeStamp* notBefore, const TimeStamp* notAfter) {
    if (notAfter != nullptr && notAfter->IsBefore(first_)) {
      Add(name + " was valid until " + StampText(*notAfter) + ", " + Asked());
    }
    if (notBefore != nullptr && notBefore->IsAfter(last_)) {
      Add(name + " is not valid before " + StampText(*notBefore) + ", " + Asked());
    }
  }

  void Tag(const std::string& name, SExpression* tag) {
    if (tag == nullptr || question_.tag->IsSubset(tag)) return;
    Add(name + " grants " + TagText(tag) + ", asked was " + TagText(question_.tag));
  }

  bool NamesIssuer(const AclEntry& entry) const {
    return std::any_of(block_.certs.begin(), block_.certs.end(), [&](const SignedCert& each) {
      return Names(entry.GetSubject(), each.cert->GetIssuer());
    });
  }

  std::string Issuers() const {
    std::string text;
    for (const SignedCert& each : block_.certs) {
      const std::string issuer = " " + Fingerprint(*each.cert->GetIssuer());
      if (text.find(issuer) == std::string::npos) text += issuer;
    }
    return text;
  }

  // The engine's answer about one credential alone.
  int TryReduction(const char* head, DExpression* credential) {
    Ref<SExpression> lists[2];
    if (SExpression::Create(lists[0].Out(), "acl", nullptr) != 0) return 0;
    if (SExpression::Create(lists[1].Out(), "sequence", nullptr) != 0) return 0;
    auto shared = Ref<DExpression>::Share(credential);
    SExpression& list = *lists[std::string(head) == "acl" ? 0 : 1];
    if (list.Insert(shared.get()) == 0) (void)shared.Release();
    Ref<SExpression> tag;
    Ref<SExpression> notBefore;
    Ref<SExpression> notAfter;
    return ZvVesk2::Verify::ReductB(nullptr, lists[0].get(), lists[1].get(),
                                    block_.certs[0].cert->GetSubject(), tag.Out(), notBefore.Out(),
                                    notAfter.Out());
  }

  const Question& question_;
  SignatureBlock block_;
  Ref<SExpression> acls_;
  TimeStamp* first_;  // the period asked for; null where it is open
  TimeStamp* last_;
  std::vector<std::string> reasons_;
};

using Step = void (Explanation::*)();

// Which of the questions above can have led to a code.
constexpr struct {
  int code;
  Step steps[3];
} kSteps[] = {
    {VESK2_ERR_SIGNATURE, {&Explanation::Signatures}},
    {VESK2_ERR_SIGNATURE_ID, {&Explanation::Signatures}},
    {VESK2_ERR_HASH_MISMATCH, {&Explanation::Signatures}},
    {VESK2_ERR_NOT_IMPLEMENTED, {&Explanation::Signatures}},
    {VESK2_ERR_HASH_MATCH, {&Explanation::Content}},
    {VESK2_ERR_NOT_OBJECT_CERT, {&Explanation::Order}},
    {VESK2_ERR_SIGNING_CERT_ORDER, {&Explanation::Order, &Explanation::Revocations}},
    {VESK2_ERR_CERT_REVOKED, {&Explanation::Revocations}},
    {VESK2_ERR_CRL_NOT_FOUND, {&Explanation::Revocations}},
    {VESK2_ERR_NOT_AUTHORIZED,
     {&Explanation::Revocations, &Explanation::Certificates, &Explanation::Roots}},
    {VESK2_ERR_PACKAGE_NOT_GRANTED,
     {&Explanation::Revocations, &Explanation::Certificates, &Explanation::Roots}},
};

}  // namespace

std::vector<std::string> ExplainAuthority(const Question& question, int code) {
  Explanation explanation(question);
  for (const auto& row : kSteps) {
    if (row.code != code) continue;
    for (const Step step : row.steps) {
      if (step != nullptr) (explanation.*step)();
    }
  }
  if (code < 0) explanation.Unreadable();
  return explanation.Take();
}

std::vector<std::string> ExplainStore() {
  std::vector<std::string> reasons;
  std::error_code error;
  std::filesystem::directory_iterator files(AclDirectory(), error);
  if (error) return {Escape(AclDirectory()) + ": " + error.message()};
  bool any = false;
  for (const auto& file : files) {
    const std::string path = file.path().string();
    if (!path.ends_with(".acl")) continue;
    any = true;
    const Ref<AclEntry> entry(new AclEntry(nullptr));
    const int code = entry->Import(path.c_str());
    if (code != 0) reasons.push_back(Escape(path) + ": " + Reason(code));
  }
  if (!any) reasons.push_back(Escape(AclDirectory()) + ": holds no entry (*.acl)");
  return reasons;
}

void ThrowNoStore(int code) {
  for (const std::string& reason : ExplainStore()) Note(reason);
  Trouble trouble("the ACL store cannot be loaded; nothing is trusted (" + CodeName(code) + ")",
                  "no-acl-store");
  trouble.code = code;
  throw trouble;
}

}  // namespace vesk2_command
