// main.cpp: the table of subcommands, and the one place that turns failures into exit codes.
#include <fcntl.h>
#include <unistd.h>

#include <csignal>
#include <string>

#include "tools/vesk2/command.h"
#include "tools/vesk2/report.h"

#include <vesk2.h>

namespace vesk2_command {
namespace {

constexpr struct {
  const char* name;
  const char* about;
} kNouns[] = {
    {"key", "Make and show keys"},
    {"acl", "Decide what this machine trusts"},
    {"cert", "Pass authority on to another key, and check how it came"},
    {"crl", "Take authority back"},
    {"manifest", "Sign a directory, and check one"},
};

constexpr Command kCommands[] = {
    {"key", "new", "Make a key pair: NAME.pem (private) and NAME.pub", DefineKeyNew},
    {"key", "show", "Show type, size and fingerprint of a key", DefineKeyShow},
    {"acl", "grant", "Write an entry into the ACL store: a root of trust", DefineAclGrant},
    {"cert", "issue", "Certify a key for a tag", DefineCertIssue},
    {"cert", "show", "Show the certificates of a chain", DefineCertShow},
    {"cert", "verify", "Is the first subject of a chain authorized?", DefineCertVerify},
    {"cert", "find", "Find stored chains for a tag", DefineCertFind},
    {"crl", "issue", "Sign a list of what is revoked", DefineCrlIssue},
    {"crl", "import", "Offer lists to the store", DefineCrlImport},
    {"crl", "show", "Show what a list revokes", DefineCrlShow},
    {"crl", "verify", "Is a list current, and vouched for?", DefineCrlVerify},
    {"manifest", "sign", "Sign what a directory holds", DefineManifestSign},
    {"manifest", "verify", "Is a directory as signed, by someone authorized?",
     DefineManifestVerify},
};

// Keeps the three standard descriptors taken: a file opened in place of a closed standard output
// would receive the verdict. The stand-in cannot be written to, so the loss is noticed.
void HoldStandardDescriptors() {
  int descriptor = open("/dev/null", O_RDONLY);
  while (descriptor >= 0 && descriptor <= STDERR_FILENO) descriptor = open("/dev/null", O_RDONLY);
  if (descriptor >= 0) close(descriptor);
}

void Define(CLI::App& app, Action& chosen) {
  app.set_version_flag("--version", "vesk2 " + LibraryVersion() + " (" + Vesk2VersionExtra() + ")");
  app.require_subcommand(1);
  for (const auto& noun : kNouns) {
    CLI::App* group = app.add_subcommand(noun.name, noun.about);
    group->require_subcommand(1);
    for (const Command& command : kCommands) {
      if (std::string(command.noun) != noun.name) continue;
      CLI::App* verb = group->add_subcommand(command.verb, command.about);
      Action action = command.define(*verb);
      verb->callback([&chosen, action] { chosen = action; });
    }
  }
  app.footer(
      "Exit status: 0 yes, 1 a clean no, 2 usage or trouble. The verdict is on standard output,\n"
      "everything else on standard error.");
}

// Help and version end the parsing with an exception too; they are no failure.
ExitCode EndParsing(const CLI::App& app, const CLI::ParseError& error) {
  if (error.get_exit_code() == 0) return app.exit(error) == 0 ? Finish(kYes) : kTrouble;
  Note("vesk2: " + Escape(error.what()));
  Note("vesk2: --help after any subcommand shows its options");
  return kTrouble;
}

ExitCode Run(int argc, char** argv) {
  CLI::App app{"Signed manifests and SPKI certificates, checked offline.", "vesk2"};
  Action chosen;
  try {
    Define(app, chosen);
    app.parse(argc, argv);
    return Finish(chosen());
  } catch (const CLI::ParseError& error) {
    return EndParsing(app, error);
  } catch (const std::exception& error) {
    Note(std::string("vesk2: ") + error.what());
    return kTrouble;
  }
}

}  // namespace
}  // namespace vesk2_command

int main(int argc, char** argv) {
  vesk2_command::HoldStandardDescriptors();
  std::signal(SIGXFSZ, SIG_IGN);  // a file that grows too large is a failed write, cleaned up after
  return vesk2_command::Run(argc, argv);
}
