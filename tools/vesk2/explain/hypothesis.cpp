// SPDX-License-Identifier: Apache-2.0
// hypothesis.cpp: asking the library about a world that differs in a few objects.
#include "tools/vesk2/explain/hypothesis.h"

#include "tools/vesk2/explain/effort.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;

// What was proved, with the hypothesis in place.
class World {
 public:
  World(const Evidence& evidence, const Hypothesis& hypothesis)
      : evidence_(evidence), hypothesis_(hypothesis), changed_(nullptr) {
    if (evidence.proved == nullptr) throw Trouble("nothing was verified");
    SpendEffort(*evidence.proved);
    Check(changed_.Copy(*evidence.proved), "judging a change");
    ChangeCerts();
    ChangeEntries();
    for (SExpression* source : hypothesis.freshLists) {
      Check(changed_.AssumeList(source), "judging a change");
    }
    if (hypothesis.at != nullptr) changed_.SetSigningTime(hypothesis.at);
  }

  int Judge(const std::vector<SExpression*>& tags) {
    int code = changed_.Judge(tags.at(0));
    for (size_t i = 1; i < tags.size() && code == 0; ++i) code = changed_.Prove(tags[i]);
    if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
    return code;
  }

 private:
  void Add(Cert& cert, ZvVesk2::Signature* signature, int code) {
    Check(changed_.AddCert(&cert, signature, code), "judging a change");
  }

  void ChangeCerts() {
    if (hypothesis_.signedAgain.empty() && hypothesis_.certs.empty() &&
        hypothesis_.coSigners.empty() && hypothesis_.approvers.empty()) {
      return;
    }
    changed_.RemoveCerts();
    for (Cert* cert : hypothesis_.signedAgain) Add(*cert, nullptr, 0);
    const bool again = !hypothesis_.signedAgain.empty();
    for (size_t i = 0; i < evidence_.certs.size() && !again; ++i) {
      const CertEvidence& each = evidence_.certs[i];
      const auto other = hypothesis_.certs.find(i);
      const bool replaced = other != hypothesis_.certs.end();
      AddCoSigned(i, replaced ? *other->second : *each.cert);
      if (replaced) Add(*other->second, nullptr, 0);
      if (!replaced) Add(*each.cert, each.signature.get(), each.code);
    }
    for (PublicKey* key : hypothesis_.approvers) Add(*Approval(*key), nullptr, 0);
  }

  // As `manifest approve` writes it.
  Ref<Cert> Approval(PublicKey& issuer) const {
    const Cert& content = *evidence_.certs.at(0).cert;
    Ref<Cert> cert(new Cert(nullptr));
    Check(cert->Set(&issuer, content.GetSubject(), false, content.GetTag(), nullptr, nullptr,
                    nullptr, nullptr),
          "building a certificate");
    return cert;
  }

  // Each stands before the one that was there, as `cert cosign` writes it.
  void AddCoSigned(size_t index, Cert& cert) {
    const auto [first, last] = hypothesis_.coSigners.equal_range(index);
    for (auto it = last; it != first;) Add(*Reissued(cert, *(--it)->second), nullptr, 0);
  }

  static Ref<Cert> Reissued(const Cert& old, PublicKey& issuer) {
    Ref<Cert> cert(new Cert(nullptr));
    Check(cert->Set(&issuer, old.GetSubject(), old.GetPropagate(), old.GetTag(), old.GetNotBefore(),
                    old.GetNotAfter(), old.GetComment(), old.GetRevocationElement()),
          "building a certificate");
    return cert;
  }

  // The store's entries in byte order of their files' names, as the library reads them, and those
  // of the other directory.
  void ChangeEntries() {
    if (hypothesis_.entries.empty() && changed_.GetEntries() != nullptr) return;
    std::map<std::string, AclEntry*> store;
    std::vector<AclEntry*> others;
    for (const EntryEvidence& each : evidence_.entries) {
      if (each.inStore) store[each.file] = each.entry.get();
      if (!each.inStore) others.push_back(each.entry.get());
    }
    for (const auto& [file, entry] : hypothesis_.entries) store[file] = entry;
    std::vector<DExpression*> entries;
    for (const auto& [file, entry] : store) entries.push_back(entry);
    entries.insert(entries.end(), others.begin(), others.end());
    changed_.SetEntries(ListOf(entries, "acl").get());
  }

  const Evidence& evidence_;
  const Hypothesis& hypothesis_;
  ZvVesk2::Evidence changed_;
};

}  // namespace

int Judge(const Question& question, const Evidence& evidence, const Hypothesis& hypothesis) {
  std::vector<SExpression*> tags;
  for (const auto& member : question.request->members) tags.push_back(member.tag.get());
  return World(evidence, hypothesis).Judge(tags);
}

}  // namespace vesk2_command
