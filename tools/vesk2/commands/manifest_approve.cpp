// SPDX-License-Identifier: Apache-2.0
// manifest_approve.cpp: vesk2 manifest approve: a further key certifies the content of a manifest,
// which its signer need not know of. Where several keys must agree, each of them can do so on a
// machine of its own.
#include <algorithm>
#include <set>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/signer_chains.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/issue.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/splice.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/tree/tree.h"
#include "tools/vesk2/tree/tree_findings.h"

#include <vesk2/evidence.h>

namespace vesk2_command {
namespace {

struct Options {
  std::string manifest;
  SignerOptions signer;
  std::vector<std::string> certs;
  std::string tag;
  std::string tree;
  std::string output;
  bool strict = false;
  WriteFlags flags;
};

// A manifest that does not hold must not look better for one more name under it.
SignatureBlock ReadWhole(const std::string& path) {
  SignatureBlock block = ReadSignatureBlock(path);
  if (block.listing == nullptr) Malformed(path, block.position, "manifest", block.code);
  if (block.code != 0) throw FileTrouble(path, Reason(block.code), ReasonWord(block.code));
  return block;
}

void RefuseSecond(const Options& options, const SignatureBlock& block, PublicKey& approver) {
  const bool done =
      std::any_of(block.certs.begin(), block.certs.end(), [&](const SignedCert& each) {
        return IsForContent(block, *each.cert) && each.cert->GetIssuer()->IsEqual(&approver);
      });
  if (!done) return;
  throw Trouble(Escape(options.manifest) + ": " + Fingerprint(approver) + " approves it already");
}

// Trouble unless the directory is as the manifest lists it.
void RequireTree(const Options& options) {
  RealDirectory(options.tree);
  ZvVesk2::Manifest manifest(nullptr);
  Buffer body;
  ZvVesk2::Evidence evidence(nullptr);
  manifest.SetEvidence(&evidence);
  ReadSigned(options.manifest, manifest, body);
  const int code = manifest.Verify(body.get(), options.tree.c_str());
  if (manifest.GetListing() == nullptr) Check(code, "comparing the tree");
  const TreeQuestion question{options.tree, options.manifest, {}, false, false, false};
  const std::vector<Finding> findings = FindInTree(manifest, question);
  const std::string summary = Summary(findings);
  if (summary.empty()) return Check(code, "comparing the tree");
  TellFindings(findings, question, manifest);
  throw FileTrouble(options.tree, summary + "; not approved", "tree-changed");
}

// The approval, and what speaks for its key, as far as the manifest does not carry that already.
std::vector<SignedCert> Additions(const Options& options, const SignatureBlock& block,
                                  const SigningKey& key) {
  const Ref<PublicKey> approver = key.Public();
  const ZvVesk2::Cert& content = *block.certs.front().cert;
  const Ref<SExpression> tag =
      options.tag.empty() ? Ref<SExpression>::Share(content.GetTag()) : ParseIssuedTag(options.tag);
  std::vector<SignedCert> added;
  added.push_back(
      IssueCert(key, {content.GetSubject(), false, tag.get()}, options.signer.algorithm));
  std::set<std::string> carried;
  for (const SignedCert& each : block.certs) carried.insert(Canonical(*each.cert));
  for (SignedCert& each : ReadSignerChains(options.certs, *approver)) {
    if (carried.insert(Canonical(*each.cert)).second) added.push_back(std::move(each));
  }
  SelfCheck check;
  CheckSignerChains(check, options.certs, approver, tag.get(), block.signedAt.get());
  check.Tell(options.strict);
  return added;
}

void Write(const Options& options, const SignatureBlock& block,
           const std::vector<SignedCert>& added, const std::string& approver) {
  const Buffer buffer = OpenBuffer(options.manifest);
  std::string text(reinterpret_cast<const char*>(buffer->Data()), buffer->Remaining());
  const Extent last = FindPair(text, block.certs, block.certs.size(), options.manifest);
  std::string more;
  for (const SignedCert& each : added) more += PairText(each);
  text.insert(last.at + last.length, more);

  const auto readBack = [&](const std::string& temporary) {
    const SignatureBlock again = ReadSignatureBlock(temporary);
    Check(again.code, "checking the approved manifest");
    RequireCert(again.certs, block.certs.size() + added.size(), temporary);
  };
  const bool inPlace = options.output.empty();
  const WriteFlags flags{options.flags.force || inPlace, options.flags.dryRun};
  WriteFile(inPlace ? options.manifest : options.output, text,
            {flags, readBack, ": approved by " + approver});
}

ExitCode Run(const Options& options) {
  if (options.output.empty() && options.manifest == kStandard) {
    throw Trouble("standard input cannot be changed: --output says where to write", "usage");
  }
  if (!options.output.empty()) RefuseExisting(options.output, options.flags.force);
  const SignatureBlock block = ReadWhole(options.manifest);
  const std::unique_ptr<SigningKey> key = OpenSigner(options.signer);
  RefuseSecond(options, block, *key->Public());
  if (!options.tree.empty()) RequireTree(options);
  const std::string approver = Fingerprint(*key->Public());
  Write(options, block, Additions(options, block, *key), approver);
  Result()["approver"] = approver;
  return kYes;
}

}  // namespace

Action DefineManifestApprove(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("manifest", options->manifest, "The manifest file").Required();
  AddSignerOptions(list, options->signer);
  list.Add("--cert", options->certs,
           "Certificate file of the approving key; several are joined [none: the key speaks "
           "for itself]");
  list.Add("--tag", options->tag, "Approve for this tag only [as it is signed]");
  list.Add("--tree", options->tree, "Approve only if this tree is as the manifest lists it");
  list.Add("-o,--output", options->output, "The approved manifest [in place of the other]");
  AddStrictFlag(list, options->strict);
  AddWriteFlags(list, options->flags);
  list.Footer(
      "The approval is for this content and no other. It is worth what its key may pass on, alone "
      "or as\none of several that must agree.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
