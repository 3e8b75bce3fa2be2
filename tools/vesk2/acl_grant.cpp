// acl_grant.cpp: vesk2 acl grant.
#include <filesystem>

#include "tools/vesk2/command.h"
#include "tools/vesk2/files.h"
#include "tools/vesk2/keys.h"
#include "tools/vesk2/report.h"
#include "tools/vesk2/stores.h"
#include "tools/vesk2/times.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;

struct Options {
  std::string subject;
  std::string tag;
  bool propagate = false;
  PeriodOptions period;
  std::string comment;
  std::string name;
  bool force = false;
};

Ref<AclEntry> MakeEntry(const Options& options) {
  Ref<PublicKey> subject = ReadPublicKey(options.subject);
  Ref<SExpression> tag = ParseTag(options.tag);
  Period period = ParsePeriod(options.period);
  Ref<ByteString> comment = MakeText(options.comment);
  Ref<AclEntry> entry;
  Check(AclEntry::Create(entry.Out(), subject.get(), options.propagate, tag.get(),
                         period.notBefore.get(), period.notAfter.get(), 0, comment.get()),
        "building an ACL entry");
  // The entry holds the references now.
  (void)subject.Release();
  (void)tag.Release();
  (void)period.notBefore.Release();
  (void)period.notAfter.Release();
  (void)comment.Release();
  return entry;
}

// The file of an entry: NAME.acl in the store. The library would drop directories from a name.
std::string EntryPath(const Options& options) {
  const std::string name =
      options.name.empty() ? std::filesystem::path(options.subject).stem().string() : options.name;
  if (name.find('/') != std::string::npos) {
    throw Trouble("--name " + Escape(name) + ": a name, not a path");
  }
  std::error_code error;
  std::filesystem::create_directories(AclDirectory(), error);
  if (error) throw Trouble(Escape(AclDirectory()) + ": " + error.message());
  const Text path(AclEntry::CalcPath(name.c_str(), ZvVesk2::StorageGlobal));
  if (!path) throw Trouble("--name " + Escape(name) + ": cannot name an entry");
  return path.get();
}

ExitCode Run(const Options& options) {
  const Ref<AclEntry> entry = MakeEntry(options);
  const std::string path = EntryPath(options);
  // One entry that cannot be read back would stop the whole store from loading.
  const auto readBack = [](const std::string& temporary) {
    const Ref<AclEntry> again(new AclEntry(nullptr));
    Check(again->Import(temporary.c_str()), "checking the new entry");
  };
  WriteFile(path, Canonical(*entry), {0666, options.force, readBack});
  Note("wrote " + Escape(path));
  if (!options.propagate) {
    Note(
        "note: without --propagate this key may use the grant but not pass it on: certificates "
        "that it issues, and manifests that it signs, are refused");
  }
  return kYes;
}

}  // namespace

Action DefineAclGrant(CLI::App& app) {
  auto options = std::make_shared<Options>();
  app.add_option("--subject", options->subject, "The public key that is trusted")->required();
  app.add_option("--tag", options->tag, "What for: \"(install (app calc))\"")->required();
  app.add_flag("--propagate", options->propagate,
               "The key may pass the grant on: it can certify others and sign manifests");
  AddPeriodOptions(app, options->period);
  app.add_option("--comment", options->comment, "A text for people");
  app.add_option("--name", options->name, "Name of the entry [the key file's name]");
  app.add_flag("-f,--force", options->force, "Replace an entry of that name");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
