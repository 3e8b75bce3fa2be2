// store_maker.h: random small stores with one chain or manifest each, most of them refused.
#ifndef VESK2_TESTS_TOOLS_STORE_MAKER_H
#define VESK2_TESTS_TOOLS_STORE_MAKER_H

#include <random>
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
};

// StoreMaker writes, below one directory: global/acl, global/cert, chain.cert or tree.manifest, and
// once the tree "tree" and the private keys.
class StoreMaker {
 public:
  StoreMaker(const TempDir& directory, unsigned seed);
  // Replaces the store and the file that is asked about.
  StoreCase Make();
  // The private key file whose public key's fingerprint begins with these digits.
  std::string KeyFile(std::string_view digits) const;

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
  bool revocable_ = false;
};

}  // namespace vesk2test

#endif  // VESK2_TESTS_TOOLS_STORE_MAKER_H
