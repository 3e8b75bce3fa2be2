// SPDX-License-Identifier: Apache-2.0
// manifest_sign.cpp: vesk2 manifest sign.
#include <filesystem>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/signer_chains.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/issue.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/progress.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/grant.h"
#include "tools/vesk2/tree/tree.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Hash;
using ZvVesk2::ManifestWriter;

constexpr const char* kWriting = "writing the manifest";

struct Options {
  std::string directory;
  SignerOptions signer;
  std::vector<std::string> certs;
  std::string tag;
  std::string at = "now";
  IgnoreOptions ignore;
  bool allowLinks = false;
  std::vector<std::string> crls;
  bool allowEmpty = false;
  std::string grant;
  std::string output;
  bool strict = false;
  WriteFlags flags;
};

// The certificates that speak for the signer: those of the --cert files, or else one that the
// signer issues to itself, which is worth what the ACL store grants its key.
std::vector<SignedCert> SignersCerts(const Options& options, const SigningKey& key) {
  const Ref<PublicKey> signer = key.Public();
  std::vector<SignedCert> certs = ReadSignerChains(options.certs, *signer);
  if (certs.empty()) {
    certs.push_back(IssueCert(key, {signer.get(), true}, options.signer.algorithm));
  }
  return certs;
}

// Warns of what nobody will believe: certificates that do not lead to the signer, or not to what is
// signed, now and at the time of signing.
void CheckAuthority(const Options& options, const SigningKey& key, SExpression* tag) {
  SelfCheck check;
  const Ref<TimeStamp> at = ParseTime(options.at, false);
  if (at->IsAfter(ParseTime("now", false).get())) {
    check.Add("the time of signing, " + StampText(*at) + ", is yet to come");
  }
  CheckSignerChains(check, options.certs, key.Public(), tag, at.get());
  check.Tell(options.strict);
}

ListingOptions HowToList(const Options& options, const IgnoreRules& rules) {
  const std::string output = options.output == kStandard ? "" : options.output;
  return {rules, options.allowLinks, output};
}

// Lists the tree, with everything that is to be said of it before it is signed.
Listing ListOrExplain(const Options& options, const IgnoreRules& rules, ManifestWriter& writer) {
  const ProgressLine progress("hashing");
  ListingOptions how = HowToList(options, rules);
  how.callbacks = progress.Callbacks();
  Listing listing = ListTree(options.directory, how, writer);
  for (const std::string& problem : listing.problems) Note(problem);
  if (!listing.problems.empty()) {
    throw Trouble(Plural(listing.problems.size(), "entry") +
                      " could not be verified later; nothing was signed (--ignore leaves "
                      "an entry out)",
                  "tree-unverifiable");
  }
  NoteRemarks(listing.remarks);
  NoteUnused(rules);
  if (listing.files == 0 && !options.allowEmpty) {
    const char* why = listing.ignored.empty() ? "holds no file" : "holds no file but ignored ones";
    throw FileTrouble(options.directory, std::string(why) + " (--allow-empty signs it)",
                      "nothing-to-sign");
  }
  return listing;
}

// Has the manifest carry the lists. One that is not as its issuer signed it helps nobody.
void AddLists(const Options& options, ManifestWriter& writer) {
  for (const std::string& path : options.crls) {
    const Ref<CrlSequence> list = ReadCrl(path);
    if (const int code = CheckIssuerWord(*list); code != 0) {
      throw FileTrouble(path, Reason(code), ReasonWord(code));
    }
    Check(writer.AddList(list.get()), kWriting);
  }
}

// A manifest that lies below the root of its own tree would be an unlisted entry of it.
void RefuseInside(const std::string& output, const std::string& directory) {
  if (output == kStandard) return;
  std::error_code error;
  const auto parent = std::filesystem::path(output).parent_path();
  const std::string real =
      std::filesystem::canonical(parent.empty() ? "." : parent, error).string();
  const std::string root = RealDirectory(directory);
  if (!error && real.starts_with(root + "/")) {
    throw Trouble(Escape(output) + ": lies in a directory of the tree that it would describe");
  }
}

void ShowListing(const Listing& listing) {
  const std::string noDigest(64, '-');
  Json entries = Json::array();
  for (const ListedEntry& entry : listing.entries) {
    const std::string path = Escape(entry.path);
    if (entry.digest.empty()) {
      Say(noDigest + "  -  " + path);
      entries.push_back({{"path", path}, {"kind", "directory"}});
      continue;
    }
    Say(entry.digest + "  " + std::to_string(entry.stamp.bytes) + "  " + path);
    entries.push_back(
        {{"path", path}, {"kind", "file"}, {"bytes", entry.stamp.bytes}, {"sha256", entry.digest}});
  }
  Result()["entries"] = entries;
}

std::string Totals(const Listing& listing) {
  const size_t ignored = listing.ignored.size();
  return Plural(listing.files, "file") + ", " + Plural(listing.bytes, "byte") +
         (ignored > 0 ? ", ignored: " + std::to_string(ignored) : "");
}

// All that goes into the manifest beside the tree; read before the tree, which may take long.
struct Parts {
  Ref<SExpression> tag;
  std::vector<SignedCert> signers;
};

Parts Prepare(const Options& options, const SigningKey& key, ManifestWriter& writer) {
  if (!options.grant.empty()) (void)ParseIssuedTag(options.grant);
  const std::string creator = "libvesk2 " + LibraryVersion();
  Check(writer.SetHead(creator.c_str(), ParseTime(options.at, false).get()), kWriting);
  Parts parts{options.tag.empty() ? Ref<SExpression>() : ParseIssuedTag(options.tag),
              SignersCerts(options, key)};
  AddLists(options, writer);
  return parts;
}

std::string MakeManifest(ManifestWriter& writer, const Parts& parts, const SigningKey& key,
                         const std::string& algorithm) {
  Ref<Hash> digest;
  Check(writer.SignedDigest(digest.Out(), ZVCLM_HASH_SHA256), kWriting);
  const SignedCert signer = IssueCert(key, {digest.get(), false, parts.tag.get()}, algorithm);
  Check(writer.AddCertificate(signer.cert.get(), signer.signature.get()), kWriting);
  for (const SignedCert& each : parts.signers) {
    Check(writer.AddCertificate(each.cert.get(), each.signature.get()), kWriting);
  }
  return Written([&](FILE* stream) { return writer.Write(stream); });
}

// What cannot be verified is not handed out.
void CheckWritten(const std::string& unnamed, const Options& options, const IgnoreRules& rules,
                  const Listing& listing) {
  CheckSigned(unnamed, options.directory);
  const auto changed = ChangedSince(options.directory, listing, HowToList(options, rules));
  for (const std::string& path : changed) Note("changed meanwhile: " + Escape(path));
  if (changed.empty()) return;
  throw FileTrouble(options.directory, "changed while it was signed; nothing was signed",
                    "tree-changed");
}

// The machine trusts the signing key for a tag from now on, as with acl grant.
void WriteGrant(const Options& options, const SigningKey& key) {
  const Ref<ZvVesk2::AclEntry> entry = MakeEntry(
      {Ref<ZvVesk2::Subject>(key.Public().Release()), true, ParseIssuedTag(options.grant)});
  const std::string name = KeyNickname(options.signer.keys[0]);
  GrantEntry(*entry, {FreeEntryName(*entry, name), {false, options.flags.dryRun}});
}

ExitCode Run(const Options& options) {
  RefuseExisting(options.output, options.flags.force);
  RequireDirectory(options.output);
  RefuseInside(options.output, options.directory);
  const std::unique_ptr<SigningKey> signing = OpenSigner(options.signer);
  const SigningKey& key = *signing;
  ManifestWriter writer(nullptr);
  const Parts parts = Prepare(options, key, writer);
  CheckAuthority(options, key, parts.tag.get());
  const IgnoreRules rules(options.ignore, options.directory);
  const Listing listing = ListOrExplain(options, rules, writer);
  if (options.flags.dryRun) ShowListing(listing);

  const std::string manifest = MakeManifest(writer, parts, key, options.signer.algorithm);
  const auto check = [&](const std::string& unnamed) {
    CheckWritten(unnamed, options, rules, listing);
  };
  const std::string signer = Fingerprint(*key.Public());
  const std::string said = ": " + Totals(listing) + ", signed by " + signer;
  if (!WriteFile(options.output, manifest, {options.flags, check, said})) {
    Say(Totals(listing) + ", to be signed by " + signer);
  }
  if (!parts.tag) Note("note: signed without --tag: good for all that its signer was granted");
  Result()["files"] = listing.files;
  Result()["bytes"] = listing.bytes;
  Result()["ignored"] = IgnoredJson(listing.ignored);
  Result()["signer"] = signer;
  if (!options.grant.empty()) WriteGrant(options, key);
  return kYes;
}

}  // namespace

Action DefineManifestSign(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("directory", options->directory, "The tree to sign").Required();
  AddSignerOptions(list, options->signer);
  list.Add("--cert", options->certs,
           "Certificate file of the signing key, or a manifest that it signed; several are joined "
           "[none: the key speaks for itself]");
  list.Add("--tag", options->tag, "Sign for this tag only [all that the signer is granted]");
  list.Add("--at", options->at, "Time of signing, UTC").ShowPreset();
  AddIgnoreOptions(list, options->ignore);
  list.Add("--allow-links", options->allowLinks, "Follow links that lead out of the tree");
  list.Add("--crl", options->crls, "Carry this revocation list (may be repeated)");
  list.Add("--allow-empty", options->allowEmpty, "Sign a tree without files");
  list.Add("--grant", options->grant,
           "Trust the signing key for this tag on this machine, as acl grant --propagate");
  list.Add("-o,--output", options->output, "The manifest file").Required();
  AddStrictFlag(list, options->strict);
  AddWriteFlags(list, options->flags, "Show what would be signed; write nothing");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
