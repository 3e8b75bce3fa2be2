// SPDX-License-Identifier: Apache-2.0
// holdings.cpp: loading what a question about authority is answered from.
#include "tools/vesk2/authority/holdings.h"

#include <set>

#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/acl_store.h"

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>
#include <vesk2/verify.h>

namespace vesk2_command {
namespace {

// What a reduction says of these alone: one that it cannot read stops all of it.
int TryReduction(SExpression& entries, const std::vector<DExpression*>& certs) {
  const Ref<SExpression> chain = ListOf(certs, "sequence");
  const Ref<ZvVesk2::Hash> anybody = MakeHash(ZVCLM_HASH_SHA256, std::string(32, '\0'));
  Ref<SExpression> tag;
  Ref<SExpression> notBefore;
  Ref<SExpression> notAfter;
  const int code = ZvVesk2::Verify::ReductB(nullptr, &entries, chain.get(), anybody.get(),
                                            tag.Out(), notBefore.Out(), notAfter.Out());
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  return code;
}

void RequireReadable(SExpression& entries) {
  const int code = TryReduction(entries, {});
  if (code < 0) Check(code, "the ACL store");
}

class Loader {
 public:
  explicit Loader(Holdings& holdings) : holdings_(holdings) {}

  void AddUsersStore() {
    const Text directory(ZvVesk2::CertSequence::CalcDir(ZvVesk2::StorageHome));
    if (!directory) return;
    for (const std::string& path :
         StoreFilesOf(directory.get(), ZvVesk2::CertSequence::ExtensionName(true))) {
      try {
        AddFile(path);
      } catch (const Trouble& trouble) {
        Note(std::string("note: ") + trouble.what() + "; passed over");
      }
    }
  }

  void AddFile(const std::string& path) {
    const std::vector<SignedCert> certs = ReadCerts(path);
    for (size_t i = 0; i < certs.size(); ++i) {
      Add({Ref<ZvVesk2::Cert>::Share(certs[i].cert.get()),
           Ref<ZvVesk2::Signature>::Share(certs[i].signature.get()), Escape(path), i + 1});
    }
  }

 private:
  void Add(HeldCert each) {
    // A digest signs nothing and passes nothing on: such a certificate is for a manifest's content.
    if (each.cert->GetSubject()->IsHash() && !each.cert->GetPropagate()) return;
    if (!seen_.insert(Canonical(*each.cert)).second) return;
    int code = each.signature->Verify(each.cert.get());
    if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
    if (code == 0) code = TryReduction(*ListOf({}, "acl"), {each.cert.get()});
    if (code != 0) return Note("note: " + each.Place() + ": " + Reason(code) + "; passed over");
    holdings_.certs.push_back(std::move(each));
  }

  Holdings& holdings_;
  std::set<std::string> seen_;
};

}  // namespace

void AddHoldingsOptions(OptionList& list, HoldingsOptions& options) {
  list.Add(
      "--cert", options.certs,
      "Certificates that are at hand beside those of the user's store: a chain, or a manifest");
  list.Add("--acl-dir", options.aclDirectory, "Trust the entries of this directory too");
  AddStoreCheckOptions(list, options.stores);
}

void LoadStores(ZvVesk2::Evidence& evidence, const std::string& aclDirectory) {
  const char* const more = aclDirectory.empty() ? nullptr : aclDirectory.c_str();
  Ref<SExpression> entries;
  const int code = ZvVesk2::AclEntry::Import(entries.Out(), nullptr, more);
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  if (code != 0) entries = NoEntries(aclDirectory, code);
  Ref<SExpression> stored;
  Check(ZvVesk2::CrlSequence::ImportStore(stored.Out(), entries.get(), nullptr),
        "the store of revocation lists");
  const Ref<SExpression> carried = Ref<SExpression>::Share(evidence.GetCarriedLists());
  evidence.SetEntries(entries.get());
  evidence.SetLists(stored.get(), carried.get());
}

Holdings LoadHoldings(const HoldingsOptions& options) {
  ZvVesk2::Evidence stores(nullptr);
  LoadStores(stores, options.aclDirectory);
  Question question;
  question.aclDirectory = options.aclDirectory;
  question.proved = &stores;
  (void)CheckStores(question, options.stores);
  Holdings holdings;
  holdings.entries = Ref<SExpression>::Share(stores.GetEntries());
  holdings.lists = Ref<SExpression>::Share(stores.GetStoredLists());
  RequireReadable(*holdings.entries);
  Loader loader(holdings);
  for (const std::string& path : options.certs) loader.AddFile(path);
  loader.AddUsersStore();
  return holdings;
}

}  // namespace vesk2_command
