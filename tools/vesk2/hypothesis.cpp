// hypothesis.cpp: asking the library about a world that differs in a few objects.
#include "tools/vesk2/hypothesis.h"

#include <algorithm>

#include <vesk2/verify.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;

// A chain or manifest with the hypothesis in place.
class World {
 public:
  World(const Evidence& evidence, const Hypothesis& hypothesis)
      : evidence_(evidence), hypothesis_(hypothesis) {
    if (!evidence.certs.empty()) subject_ = evidence.certs[0].cert->GetSubject();
    if (!hypothesis.signedAgain.empty()) {
      for (Cert* cert : hypothesis.signedAgain) certs_.push_back({cert, 0, nullptr});
    } else {
      AddCerts();
    }
    AddEntries();
    statuses_ = States();
  }

  const std::vector<int32_t>& statuses() const { return statuses_; }

  int Judge(bool manifest, const std::vector<SExpression*>& tags) const {
    Ref<SExpression> chain = Empty("sequence");
    const int code = manifest ? BuildManifestChain(*chain) : BuildChain(*chain);
    return code != 0 ? code : Reduce(*chain, tags, MakePeriod().get());
  }

  Granted Grants(bool manifest) const {
    Granted granted;
    Ref<SExpression> chain = Empty("sequence");
    if ((manifest ? BuildManifestChain(*chain) : BuildChain(*chain)) != 0) return granted;
    (void)ZvVesk2::Verify::ReductB(nullptr, granting_.get(), chain.get(), subject_,
                                   granted.tag.Out(), granted.notBefore.Out(),
                                   granted.notAfter.Out());
    return granted;
  }

 private:
  struct Link {
    Cert* cert;
    int code;
    SExpression* source;
  };

  static Ref<SExpression> Empty(const char* head) {
    Ref<SExpression> list;
    Check(SExpression::Create(list.Out(), head, nullptr), "building a list");
    return list;
  }

  static int StatusCode(int32_t status) {
    if (status == Cert::Undetermined) return VESK2_ERR_CRL_NOT_FOUND;
    return status == Cert::NotRevoked ? 0 : VESK2_ERR_CERT_REVOKED;
  }

  static Ref<Cert> Reissued(const Cert& old, PublicKey& issuer) {
    Ref<Cert> cert(new Cert(nullptr));
    Check(cert->Set(&issuer, old.GetSubject(), old.GetPropagate(), old.GetTag(), old.GetNotBefore(),
                    old.GetNotAfter(), old.GetComment(), old.GetRevocationElement()),
          "building a certificate");
    return cert;
  }

  void AddCerts() {
    for (size_t i = 0; i < evidence_.certs.size(); ++i) {
      if (hypothesis_.withoutCerts.count(i) != 0) continue;
      const CertEvidence& each = evidence_.certs[i];
      const auto other = hypothesis_.certs.find(i);
      const bool replaced = other != hypothesis_.certs.end();
      Cert* cert = replaced ? other->second : each.cert.get();
      // Each stands before the one that was there, as `cert cosign` writes it.
      const auto [first, last] = hypothesis_.coSigners.equal_range(i);
      for (auto it = last; it != first;) {
        coSigned_.push_back(Reissued(*cert, *(--it)->second));
        certs_.push_back({coSigned_.back().get(), 0, each.source.get()});
      }
      certs_.push_back({cert, replaced ? 0 : each.code, each.source.get()});
    }
  }

  // The store's entries in byte order of their files' names, as the library reads them, and those
  // of the other directory.
  void AddEntries() {
    std::map<std::string, AclEntry*> store;
    std::vector<AclEntry*> others;
    for (const EntryEvidence& each : evidence_.entries) {
      if (each.inStore) store[each.file] = each.entry.get();
      if (!each.inStore) others.push_back(each.entry.get());
    }
    for (const auto& [file, entry] : hypothesis_.entries) store[file] = entry;
    std::vector<AclEntry*> entries;
    for (const auto& [file, entry] : store) entries.push_back(entry);
    entries.insert(entries.end(), others.begin(), others.end());
    all_ = EntryList(entries);
    if (hypothesis_.only != nullptr) {
      std::erase_if(entries, [&](const AclEntry* each) { return each != hypothesis_.only; });
    }
    granting_ = EntryList(entries);
  }

  bool IsFresh(SExpression* source) const {
    const std::vector<SExpression*>& fresh = hypothesis_.freshLists;
    return source != nullptr && std::any_of(fresh.begin(), fresh.end(), [&](SExpression* each) {
             return each->IsEqual(source);
           });
  }

  std::vector<int32_t> States() const {
    std::vector<int32_t> states;
    const Ref<SExpression> lists = LoadLists(evidence_, all_.get());
    for (const Link& link : certs_) {
      bool revoked = false;
      (void)link.cert->IsRevoked(revoked, all_.get(), lists.get(), RevocationStart(),
                                 RevocationEnd());
      int32_t state = link.cert->GetRevocationStatus();
      if (state == Cert::Undetermined && IsFresh(link.source)) state = Cert::NotRevoked;
      states.push_back(state);
    }
    return states;
  }

  int SignatureCode() const {
    for (const Link& link : certs_) {
      if (link.code != 0) return link.code;
    }
    return 0;
  }

  // A copy that says nothing of revocation, or lets its subject pass the grant on.
  static void InsertCopy(SExpression& chain, Cert& cert, bool propagate, SExpression* revocation) {
    SExpression* own = cert.GetRevocationElement();
    const bool passes = cert.GetPropagate();
    const Ref<Cert> copy(new Cert(nullptr));
    cert.SetRevocationElement(revocation);
    cert.SetPropagate(propagate);
    const int code = copy->Clone(&cert);
    cert.SetRevocationElement(own);
    cert.SetPropagate(passes);
    Check(code, "copying a certificate");
    InsertShared(chain, copy.get());
  }

  int BuildChain(SExpression& chain) const {
    if (subject_ == nullptr) return VESK2_ERR_INVALID_SEQUENCE;
    if (const int code = SignatureCode()) return code;
    for (const int32_t status : statuses_) {
      if (const int code = StatusCode(status)) return code;
    }
    for (const Link& link : certs_) {
      InsertCopy(chain, *link.cert, link.cert->GetPropagate(), nullptr);
    }
    return 0;
  }

  // Certificates that are not known to be good are left out, and what is then the second must be
  // the signer's own, which need not let it pass on what it names: content.
  int BuildManifestChain(SExpression& chain) const {
    if (certs_.size() < 2) return VESK2_ERR_SIGNING_CERT_ORDER;
    if (!certs_[0].cert->GetSubject()->IsHash()) return VESK2_ERR_NOT_OBJECT_CERT;
    if (const int code = SignatureCode()) return code;
    if (const int code = StatusCode(statuses_[0])) return code;
    size_t place = 0;
    for (size_t i = 0; i < certs_.size(); ++i) {
      Cert& cert = *certs_[i].cert;
      if (statuses_[i] != Cert::NotRevoked) continue;
      if (place++ == 1) {
        if (!cert.GetSubject()->IsEqual(certs_[0].cert->GetIssuer())) {
          return VESK2_ERR_SIGNING_CERT_ORDER;
        }
        InsertCopy(chain, cert, true, cert.GetRevocationElement());
      } else {
        InsertShared(chain, &cert);
      }
    }
    return place > 1 ? 0 : VESK2_ERR_SIGNING_CERT_ORDER;
  }

  bool AskedAboutSigning() const {
    return evidence_.first != nullptr && evidence_.first == evidence_.signedAt.get();
  }
  TimeStamp* Moved(TimeStamp* own) const {
    return hypothesis_.at != nullptr && AskedAboutSigning() ? hypothesis_.at : own;
  }
  TimeStamp* RevocationStart() const { return Moved(evidence_.RevocationStart()); }
  TimeStamp* RevocationEnd() const { return Moved(evidence_.RevocationEnd()); }

  // (valid ...); null for no period.
  Ref<SExpression> MakePeriod() const {
    TimeStamp* first = Moved(evidence_.first);
    TimeStamp* last = Moved(evidence_.last);
    if (first == nullptr && last == nullptr) return {};
    Ref<SExpression> valid = Empty("valid");
    if (first != nullptr) AddLimit(*valid, "not-before", first);
    if (last != nullptr) AddLimit(*valid, "not-after", last);
    return valid;
  }
  static void AddLimit(SExpression& valid, const char* name, TimeStamp* stamp) {
    const Ref<SExpression> limit = Empty(name);
    InsertShared(*limit, stamp);
    InsertShared(valid, limit.get());
  }

  int Reduce(SExpression& chain, const std::vector<SExpression*>& tags, SExpression* period) const {
    for (SExpression* tag : tags) {
      const int code =
          ZvVesk2::Verify::ReductA(nullptr, granting_.get(), &chain, subject_, tag, period);
      if (code != 0) return code;
    }
    return 0;
  }

  const Evidence& evidence_;
  const Hypothesis& hypothesis_;
  ZvVesk2::Subject* subject_ = nullptr;  // for whom authority is asked
  std::vector<Link> certs_;
  std::vector<Ref<Cert>> coSigned_;
  Ref<SExpression> all_;
  Ref<SExpression> granting_;  // all of them, or the one that is asked about
  std::vector<int32_t> statuses_;
};

}  // namespace

int Judge(const Question& question, const Evidence& evidence, const Hypothesis& hypothesis) {
  std::vector<SExpression*> tags;
  for (const auto& member : question.request->members) tags.push_back(member.tag.get());
  return World(evidence, hypothesis).Judge(question.manifest, tags);
}

Granted WhatIsGranted(const Question& question, const Evidence& evidence) {
  const Hypothesis asItIs;
  return World(evidence, asItIs).Grants(question.manifest);
}

std::vector<int32_t> RevocationStates(const Evidence& evidence, const Hypothesis& hypothesis) {
  return World(evidence, hypothesis).statuses();
}

}  // namespace vesk2_command
