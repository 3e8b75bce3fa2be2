// manifest_sign.cpp: vesk2 manifest sign.
//
// A manifest is one line of canonical text; the signer certificate's subject is the SHA-256 of its
// version, type and time elements and the body.
#include <filesystem>

#include "tools/vesk2/command.h"
#include "tools/vesk2/files.h"
#include "tools/vesk2/issue.h"
#include "tools/vesk2/manifest_file.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/tree.h"

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
  std::string output;
  bool force = false;
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

// The certificates that speak for the signer: those of the --cert file, or else one that the signer
// issues to itself, which is worth what the ACL store grants its key.
std::string SignersCerts(const Options& options, const PrivateKey& key) {
  const Ref<PublicKey> signer = key.Public();
  if (options.cert.empty()) {
    return Pair(IssueCert(key, {signer.get(), true}, options.signer.algorithm));
  }
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

Listing ListOrExplain(const Options& options, std::set<std::string> ignored) {
  Listing listing =
      ListTree(options.directory, {std::move(ignored), options.allowLinks, options.output});
  for (const std::string& problem : listing.problems) Note(problem);
  if (!listing.problems.empty()) {
    throw Trouble(std::to_string(listing.problems.size()) +
                  " entries could not be verified later; nothing was signed (--ignore leaves an "
                  "entry out)");
  }
  return listing;
}

// A manifest that lies below the root of its own tree would be an unlisted entry of it.
void RefuseInside(const std::string& output, const std::string& directory) {
  std::error_code error;
  const auto parent = std::filesystem::path(output).parent_path();
  const std::string real =
      std::filesystem::canonical(parent.empty() ? "." : parent, error).string();
  const std::string root = RealDirectory(directory);
  if (!error && real.starts_with(root + "/")) {
    throw Trouble(Escape(output) + ": lies in a directory of the tree that it would describe");
  }
}

ExitCode Run(const Options& options) {
  RefuseExisting(options.output, options.force);
  RefuseInside(options.output, options.directory);
  const PrivateKey key = PrivateKey::Read(options.signer.key, options.signer.passphrase);
  const Ref<SExpression> tag = options.tag.empty() ? Ref<SExpression>() : ParseTag(options.tag);
  const std::string signers = SignersCerts(options, key);
  const Head head = MakeHead(options);
  std::set<std::string> ignored;
  for (const std::string& name : options.ignored) ignored.insert(PlainRelative(name));
  const Listing listing = ListOrExplain(options, std::move(ignored));

  const Ref<Hash> digest = Digest(head, listing.body);
  const SignedCert signer =
      IssueCert(key, {digest.get(), false, tag.get()}, options.signer.algorithm);
  const std::string manifest = "(8:manifest" + head.version + head.type + "(15:signature-block" +
                               head.time + Pair(signer) + signers + ")(3:crl)" + listing.body + ")";
  // What cannot be read back is not handed out.
  const auto readBack = [&](const std::string& temporary) {
    ReadListing(temporary, options.directory);
  };
  WriteFile(options.output, manifest, {0666, options.force, readBack});
  Note("wrote " + Escape(options.output) + ": " + std::to_string(listing.files) + " files, " +
       std::to_string(listing.bytes) + " bytes, signed by " + Fingerprint(*key.Public()));
  return kYes;
}

}  // namespace

Action DefineManifestSign(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("directory", options->directory, "The tree to sign")->required();
  AddSignerOptions(app, options->signer);
  app.add_option("--cert", options->cert,
                 "Certificate file of the signing key [none: the key speaks for itself]");
  app.add_option("--tag", options->tag, "Sign for this tag only [all that the signer is granted]");
  app.add_option("--at", options->at, "Time of signing, UTC")->capture_default_str();
  app.add_option("--ignore", options->ignored, "Leave this entry out (a path below the directory)")
      ->allow_extra_args(false);
  app.add_flag("--allow-links", options->allowLinks, "Follow links that lead out of the tree");
  app.add_option("-o,--output", options->output, "The manifest file")->required();
  app.add_flag("-f,--force", options->force, "Replace an existing file");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
