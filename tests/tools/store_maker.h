// SPDX-License-Identifier: Apache-2.0
// store_maker.h: random small stores with one chain or manifest each, most of them refused.
#ifndef VESK2_TESTS_TOOLS_STORE_MAKER_H
#define VESK2_TESTS_TOOLS_STORE_MAKER_H

#include <random>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "tests/support/temp_dir.h"
#include "tests/support/test_key.h"
#include "tests/support/test_text.h"

namespace vesk2test {

// One question about one store.
struct StoreCase {
  bool manifest = false;
  std::string tag;
  std::string at;  // a stamp; empty for a manifest's own time
  // Keys that a list of the store's revoker names, or the certificate of which it does, and keys
  // that an entry trusts together with others only.
  std::set<unsigned> revoked = {};
  std::set<unsigned> members = {};
};

// StoreMaker writes, below one directory: global/acl, global/cert, chain.cert or tree.manifest, and
// once the tree "tree", the private keys, and for each key a probe: a certificate for another one.
class StoreMaker {
 public:
  StoreMaker(const TempDir& directory, unsigned seed);
  // Replaces the store and the file that is asked about.
  StoreCase Make();
  // The private key file whose public key's fingerprint begins with these digits.
  std::string KeyFile(std::string_view digits) const;
  // All that is ever asked.
  static std::vector<std::string> Requests();

 private:
  static constexpr unsigned kKeys = 6;

  bool Chance(unsigned percent) { return random_() % 100 < percent; }
  unsigned Pick(unsigned count) { return static_cast<unsigned>(random_() % count); }
  const TestKey& Key(unsigned index) const { return TestKey::Rsa(index); }
  std::string Grant(const std::string& asked);
  void Period(std::string& notBefore, std::string& notAfter);
  std::string EntrySubject(const std::vector<unsigned>& holders);
  void WriteEntries(const std::string& asked, const std::vector<unsigned>& holders);
  std::string WriteChain(const std::string& asked, const std::vector<unsigned>& holders);
  std::string List(const TestKey& signer, const std::string& notAfter,
                   const std::vector<std::string>& certs, const std::string& key) const;
  void WriteLists();
  void WriteManifest(const std::vector<unsigned>& holders, const std::string& chain,
                     const std::string& asked);

  const TempDir& directory_;
  std::mt19937 random_;
  std::vector<std::string> fingerprints_;
  std::vector<std::string> certs_;  // of the current case
  std::vector<unsigned> subjects_;  // of those
  bool revocable_ = false;
  StoreCase made_;
};

}  // namespace vesk2test

#endif  // VESK2_TESTS_TOOLS_STORE_MAKER_H
