// SPDX-License-Identifier: Apache-2.0
// stored.cpp: reading both stores.
#include "tools/vesk2/audit/stored.h"

#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/stores/crl_store.h"

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;

template <typename Object, typename Read>
void ReadAll(std::vector<Stored<Object>>& all, Findings& findings, const std::string& directory,
             const std::string& extension, const Read& read) {
  findings.ReadDirectory([&] {
    for (const std::string& path : StoreFilesOf(directory, extension)) {
      findings.Read(path, [&] { all.push_back({path, read(path)}); });
    }
  });
}

// What the library's own verifications would have. Memory that ran out, or a file that another
// process holds, leaves no answer.
void LoadBelieved(Stores& stores) {
  int code = AclEntry::Import(stores.acls.Out(), nullptr, nullptr);
  if (code != 0 && code != VESK2_ERR_FILE_NOT_FOUND) Check(code, "loading the ACL store");
  if (!stores.acls) stores.acls = ListOf({}, "acl");
  code = CrlSequence::ImportStore(stores.believed.Out(), stores.acls.get(), nullptr);
  Check(code, "loading the revocation lists");
}

}  // namespace

Stores ReadStores(Findings& findings) {
  Stores stores;
  ReadAll(stores.entries, findings, AclDirectory(), ".acl", ReadEntry);
  ReadAll(stores.lists, findings, ListDirectory(), ".crl", ReadCrl);
  const std::string home = HomeRoot(GetStoreOptions()).path;
  if (!home.empty()) {
    ReadAll(stores.chains, findings, home + "/cert", ".cert", [](const std::string& path) {
      CertChain chain = ReadCertChain(path);
      (void)ChainLinks(chain, path);
      return chain;
    });
  }
  LoadBelieved(stores);
  return stores;
}

}  // namespace vesk2_command
