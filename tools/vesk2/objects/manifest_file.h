// SPDX-License-Identifier: Apache-2.0
// manifest_file.h: manifest files as the command sees them: reading one back without judging its
// authority, and taking it apart to show it.
#ifndef VESK2_TOOLS_MANIFEST_FILE_H
#define VESK2_TOOLS_MANIFEST_FILE_H

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/times.h"

#include <vesk2/crl.h>
#include <vesk2/evidence.h>
#include <vesk2/manifest.h>
#include <vesk2/manifest_body.h>

namespace vesk2_command {

// Has a manifest leave out the entries of these names.
void IgnoreEntries(ZvVesk2::Manifest& manifest, const std::set<std::string>& names);

// CheckSigned checks that a manifest can be verified, but for the authority of its signer and the
// tree: its form, its signatures, its digest, its listing. Trouble says what is not so.
void CheckSigned(const std::string& path, const std::string& directory);

// What a manifest file says, as the library read it: proved but for the authority of its signer, or
// refused. What could not be read is missing.
struct SignatureBlock {
  int code = 0;  // 0 when its signatures and its digest hold, else the refusal
  Ref<ByteString> version;
  Ref<ByteString> creator;  // what made the file, in its own words
  Ref<ByteString> type;
  Ref<TimeStamp> signedAt;
  std::vector<SignedCert> certs;  // the signer certificate first
  std::vector<Ref<ZvVesk2::CrlSequence>> crls;
  ZvVesk2::BodyDirectory* listing = nullptr;  // its root has no name; null: not a whole manifest
  size_t position = 0;  // the byte behind the manifest, or where it stops making sense

  std::unique_ptr<ZvVesk2::Manifest> owner;   // of the listing
  std::unique_ptr<ZvVesk2::Evidence> proved;  // what was read, without any store
};
// ReadSignatureBlock reads a manifest; Trouble when the file cannot be opened.
SignatureBlock ReadSignatureBlock(const std::string& path);

// ReadSigned reads a manifest and its body, and returns 0 when its signatures and its digest hold,
// whoever its signer is, and else the code of the refusal. Trouble for what is no manifest.
int ReadSigned(const std::string& path, ZvVesk2::Manifest& manifest, Buffer& body);

// Whether a code of the library is a no: the question was understood, and the answer is not yes.
bool IsRefusal(int code);
// Throws the Trouble for any other code of reading a manifest.
[[noreturn]] void ThrowUnreadable(const std::string& path, const ZvVesk2::Manifest& manifest,
                                  int code);

// The names of a result list of a comparison, sorted. Directories are recorded for what is inside
// them too: those with a recorded entry below them, `parents`, are left out.
std::vector<std::string> FoundNames(const FileItem* list, const std::set<std::string>& parents);
// Every directory that has a difference below it.
std::set<std::string> FoundParents(const ZvVesk2::Manifest& manifest);
// The number of entries of a result list that are files.
size_t CountFiles(const FileItem* list);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_MANIFEST_FILE_H
