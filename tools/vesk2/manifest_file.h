// manifest_file.h: manifest files as the command sees them: reading one back without judging its
// authority, and taking it apart to explain a refusal.
#ifndef VESK2_TOOLS_MANIFEST_FILE_H
#define VESK2_TOOLS_MANIFEST_FILE_H

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/issue.h"

#include <vesk2/crl.h>
#include <vesk2/manifest.h>
#include <vesk2/manifest_body.h>

namespace vesk2_command {

// ReadListing checks a manifest file's form, its signatures and its signed digest, and returns the
// tree that it lists, its root named `directory`. Malformed text is Trouble that names the byte.
std::unique_ptr<ZvVesk2::BodyDirectory> ReadListing(const std::string& path,
                                                    const std::string& directory);

// Has a manifest leave out the entries of these names.
void IgnoreEntries(ZvVesk2::Manifest& manifest, const std::set<std::string>& names);

// CheckSigned checks that a manifest can be verified, but for the authority of its signer: its
// form, its signatures, its digest, and that the tree is as it says. Trouble says what is not so.
void CheckSigned(const std::string& path, const std::string& directory,
                 const std::set<std::string>& ignored);

// The parts of a manifest file that authority comes from. Nothing of it has been checked.
struct SignatureBlock {
  Ref<TimeStamp> signedAt;
  std::vector<SignedCert> certs;  // the signer certificate first
  std::vector<Ref<ZvVesk2::CrlSequence>> crls;
  std::string damage;  // where the listing stops making sense, and why; empty for a whole one
};
// ReadSignatureBlock reads as far as it can; what could not be read is missing.
SignatureBlock ReadSignatureBlock(const std::string& path);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_MANIFEST_FILE_H
