// manifest_sign.cpp: vesk2 manifest sign.
//
// A manifest is one line of canonical text; the signer certificate's subject is the SHA-256 of its
// version, type and time elements and the body.
#include <filesystem>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/issue.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/objects/tag_bounds.h"
#include "tools/vesk2/say/progress.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/grant.h"
#include "tools/vesk2/tree/tree.h"
#include "tools/vesk2/verify/self_check.h"

#include <vesk2/hash.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;
using ZvVesk2::Hash;

struct Options {
  std::string directory;
  SignerOptions signer;
  std::string cert;
  std::string tag;
  std::string at = "now";
  std::vector<std::string> ignored;
  bool allowLinks = false;
  std::vector<std::string> crls;
  bool allowEmpty = false;
  std::string grant;
  std::string output;
  bool force = false;
  bool dryRun = false;
  bool strict = false;
};

// The signed elements that stand before the signature block, and the one inside it.
struct Head {
  std::string version;
  std::string type = "(" + Atom("type") + Atom("plain") + ")";
  std::string time;
};

Head MakeHead(const Options& options) {
  Head head;
  head.version = "(" + Atom("version") + Atom("1") + Atom("libvesk2 " + LibraryVersion()) + ")";
  const Ref<TimeStamp> time = ParseTime(options.at, false);
  head.time = "(" + Atom("time-of-signing") + Canonical(*time) + ")";
  return head;
}

Ref<Hash> Digest(const Head& head, const std::string& body) {
  Ref<Hash> hash(new Hash(nullptr));
  Check(hash->Init(ZVCLM_HASH_SHA256), "hashing");
  for (const std::string* text : {&head.version, &head.type, &head.time, &body}) {
    const auto* bytes = reinterpret_cast<const unsigned char*>(text->data());
    Check(hash->Update(bytes, static_cast<unsigned>(text->size())), "hashing");
  }
  Check(hash->Finalize(), "hashing");
  return hash;
}

std::string Pair(const SignedCert& each) {
  return Canonical(*each.cert) + Canonical(*each.signature);
}

// The certificates behind a manifest's first, which is for its content.
std::string ChainOf(const std::string& manifest, PublicKey& signer) {
  const std::vector<SignedCert> certs = ReadCerts(manifest);
  RequireCert(certs, 2, manifest);
  if (!certs[1].cert->GetSubject()->IsEqual(&signer)) {
    throw Trouble(Escape(manifest) + ": signed by " + Fingerprint(*certs[1].cert->GetSubject()) +
                  ", not by the signing key " + Fingerprint(signer));
  }
  std::string text;
  for (size_t i = 1; i < certs.size(); ++i) text += Pair(certs[i]);
  return text;
}

// The certificates that speak for the signer: those of the --cert file, or else one that the signer
// issues to itself, which is worth what the ACL store grants its key.
std::string SignersCerts(const Options& options, const SigningKey& key) {
  const Ref<PublicKey> signer = key.Public();
  if (options.cert.empty()) {
    return Pair(IssueCert(key, {signer.get(), true}, options.signer.algorithm));
  }
  if (OpenBuffer(options.cert)->LooksAt("(8:manifest")) return ChainOf(options.cert, *signer);
  const CertChain chain = ReadCertChain(options.cert);
  RequireCertFor(chain, options.cert, *signer);
  std::string text;
  auto item = chain->Begin();
  item.Next();  // the keyword
  for (; item; item.Next()) {
    const bool wanted = dynamic_cast<Cert*>(item.Value()) != nullptr ||
                        dynamic_cast<ZvVesk2::Signature*>(item.Value()) != nullptr;
    if (wanted) text += Canonical(*item.Value());
  }
  return text;
}

// Warns of what nobody will believe: certificates that do not lead to the signer, or not to what is
// signed, now and at the time of signing.
void CheckAuthority(const Options& options, const SigningKey& key, SExpression* tag) {
  SelfCheck check;
  const Ref<TimeStamp> at = ParseTime(options.at, false);
  if (at->IsAfter(ParseTime("now", false).get())) {
    check.Add("the time of signing, " + StampText(*at) + ", is yet to come");
  }
  if (!options.cert.empty()) {
    SelfCheck::Chain chain{options.cert, ReadCerts(options.cert)};
    chain.signers.push_back(key.Public());
    chain.tag = tag;
    chain.at = at.get();
    chain.passing = 1;  // the first may pass on to the content what it was granted
    check.CheckChain(chain);
  }
  check.Tell(options.strict);
}

std::set<std::string> Ignored(const Options& options) {
  std::set<std::string> ignored;
  for (const std::string& name : options.ignored) ignored.insert(PlainRelative(name));
  return ignored;
}

// Lists the tree, with everything that is to be said of it before it is signed.
Listing ListOrExplain(const Options& options) {
  const std::set<std::string> ignored = Ignored(options);
  const std::string output = options.output == kStandard ? "" : options.output;
  const ProgressLine progress("hashing", options.directory);
  Listing listing =
      ListTree(options.directory, {ignored, options.allowLinks, output, progress.Callbacks()});
  for (const std::string& problem : listing.problems) Note(problem);
  if (!listing.problems.empty()) {
    throw Trouble(std::to_string(listing.problems.size()) +
                      " entries could not be verified later; nothing was signed (--ignore leaves "
                      "an entry out)",
                  "tree-unverifiable");
  }
  NoteRemarks(listing.remarks);
  for (const std::string& name : ignored) {
    if (listing.ignored.count(name) == 0) Note("warning: --ignore " + Escape(name) + ": not there");
  }
  if (listing.files == 0 && !options.allowEmpty) {
    const char* why = listing.ignored.empty() ? "holds no file" : "holds no file but ignored ones";
    throw FileTrouble(options.directory, std::string(why) + " (--allow-empty signs it)",
                      "nothing-to-sign");
  }
  return listing;
}

// The lists that the manifest carries. One that is not as its issuer signed it helps nobody.
std::string CarriedLists(const Options& options) {
  std::string text;
  for (const std::string& path : options.crls) {
    const Ref<CrlSequence> list = ReadCrl(path);
    if (const int code = CheckIssuerWord(*list); code != 0) {
      throw FileTrouble(path, Reason(code), ReasonWord(code));
    }
    text += Canonical(*list);
  }
  return text;
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
  Json entries = Json::array();
  for (const ListedEntry& entry : listing.entries) {
    const std::string path = Escape(entry.path);
    if (entry.digest.empty()) {
      Say(std::string(64, '-') + "  -  " + path);
      entries.push_back({{"path", path}, {"kind", "directory"}});
      continue;
    }
    Say(entry.digest + "  " + std::to_string(entry.bytes) + "  " + path);
    entries.push_back(
        {{"path", path}, {"kind", "file"}, {"bytes", entry.bytes}, {"sha256", entry.digest}});
  }
  Result()["entries"] = entries;
}

std::string Totals(const Listing& listing) {
  return std::to_string(listing.files) + " files, " + std::to_string(listing.bytes) + " bytes";
}

// All that goes into the manifest beside the tree; read before the tree, which may take long.
struct Parts {
  Head head;
  Ref<SExpression> tag;
  std::string signers;
  std::string lists;
};

Parts Prepare(const Options& options, const SigningKey& key) {
  if (!options.grant.empty()) RequirePlainBounds(ParseTag(options.grant).get());
  return {MakeHead(options), options.tag.empty() ? Ref<SExpression>() : ParseTag(options.tag),
          SignersCerts(options, key), CarriedLists(options)};
}

std::string MakeManifest(const Parts& parts, const Listing& listing, const SigningKey& key,
                         const std::string& algorithm) {
  const Head& head = parts.head;
  const Ref<Hash> digest = Digest(head, listing.body);
  const SignedCert signer = IssueCert(key, {digest.get(), false, parts.tag.get()}, algorithm);
  return "(8:manifest" + head.version + head.type + "(15:signature-block" + head.time +
         Pair(signer) + parts.signers + ")(3:crl" + parts.lists + ")" + listing.body + ")";
}

// The machine trusts the signing key for a tag from now on, as with acl grant.
void WriteGrant(const Options& options, const SigningKey& key) {
  const Ref<ZvVesk2::AclEntry> entry =
      MakeEntry({Ref<ZvVesk2::Subject>(key.Public().Release()), true, ParseTag(options.grant)});
  const std::string name = std::filesystem::path(options.signer.keys[0]).stem().string();
  GrantEntry(*entry, {FreeEntryName(*entry, name), false, options.dryRun});
}

ExitCode Run(const Options& options) {
  RefuseExisting(options.output, options.force);
  RequireDirectory(options.output);
  RefuseInside(options.output, options.directory);
  const std::unique_ptr<SigningKey> signing = OpenSigner(options.signer);
  const SigningKey& key = *signing;
  const Parts parts = Prepare(options, key);
  CheckAuthority(options, key, parts.tag.get());
  const Listing listing = ListOrExplain(options);
  if (options.dryRun) ShowListing(listing);

  const std::string manifest = MakeManifest(parts, listing, key, options.signer.algorithm);
  // What cannot be verified is not handed out.
  const auto check = [&](const std::string& unnamed) {
    CheckSigned(unnamed, options.directory, Ignored(options));
  };
  const std::string signer = Fingerprint(*key.Public());
  if (WriteFile(options.output, manifest, {0666, options.force, check, options.dryRun})) {
    Note("wrote " + Escape(options.output) + ": " + Totals(listing) + ", signed by " + signer);
  } else {
    Say(Totals(listing) + ", to be signed by " + signer);
  }
  if (!parts.tag) Note("note: signed without --tag: good for all that its signer was granted");
  Result()["files"] = listing.files;
  Result()["bytes"] = listing.bytes;
  Result()["signer"] = signer;
  if (!options.grant.empty()) WriteGrant(options, key);
  return kYes;
}

}  // namespace

Action DefineManifestSign(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("directory", options->directory, "The tree to sign")->required();
  AddSignerOptions(app, options->signer);
  app.add_option(
      "--cert", options->cert,
      "Certificate file of the signing key, or a manifest that it signed [none: the key speaks "
      "for itself]");
  app.add_option("--tag", options->tag, "Sign for this tag only [all that the signer is granted]");
  app.add_option("--at", options->at, "Time of signing, UTC")->capture_default_str();
  app.add_option("--ignore", options->ignored, "Leave this entry out (a path below the directory)")
      ->allow_extra_args(false);
  app.add_flag("--allow-links", options->allowLinks, "Follow links that lead out of the tree");
  app.add_option("--crl", options->crls, "Carry this revocation list (may be repeated)")
      ->allow_extra_args(false);
  app.add_flag("--allow-empty", options->allowEmpty, "Sign a tree without files");
  app.add_option("--grant", options->grant,
                 "Trust the signing key for this tag on this machine, as acl grant --propagate");
  app.add_option("-o,--output", options->output, "The manifest file")->required();
  AddStrictFlag(app, options->strict);
  app.add_flag("-f,--force", options->force, "Replace an existing file");
  app.add_flag("-n,--dry-run", options->dryRun, "Show what would be signed; write nothing");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
