// SPDX-License-Identifier: Apache-2.0
// commands.cpp: the table of subcommands.
#include "tools/vesk2/commands/command.h"

namespace vesk2_command {
namespace {

constexpr Noun kNouns[] = {
    {"key", "Make and show keys",
     "Keys are the principals of the system: a grant names a key, and a key signs. The private "
     "half is a PEM file (PKCS#8), if you wish under a passphrase; the public half is what others "
     "need, a canonical S-expression.\n"
     "Where a key is wanted, it may also be on a token, pkcs11:URI, or in an ssh-agent, "
     "ssh-agent:SHA256:FINGERPRINT as ssh-add -l prints it. A token's PIN is asked for like a "
     "passphrase, unless the URI says pin-source=FILE.\n"
     "A key is known by its fingerprint, the SHA-256 of its public half. File names and comments "
     "do not count."},
    {"acl", "Decide what this machine trusts",
     "Every answer starts in the access-control entries of the machine's store. An entry trusts a "
     "key for a tag, unsigned: whoever may write the store decides.\n"
     "An entry that propagates lets its key pass the grant on, by certificates to other keys "
     "and by signing to the files of a manifest."},
    {"cert", "Pass authority on to another key, and check how it came",
     "A certificate passes what its issuer was granted, or less, on to its subject, for a time. A "
     "certificate file holds a chain: the certificate of interest first, then those that lead up "
     "to a key that this machine trusts.\n"
     "Along a chain tags and periods only narrow, and every certificate but the first must let its "
     "subject pass the grant on."},
    {"crl", "Take authority back",
     "A revocation list names certificates and keys that are not to be honoured any more. The "
     "machine believes a list when an access-control entry of exactly its tag, which ends in "
     "(revoke ...), is for its signer.\n"
     "A revoked key is honoured nowhere. Certificates are looked up in the list that they name as "
     "their source, and without a current one they are refused."},
    {"manifest", "Sign a directory, and check one",
     "A manifest lists every file of a directory with its digest, and is signed. It carries the "
     "signer's certificates, so that whoever gets it needs nothing else. Verifying asks two "
     "things: is the directory as listed, and was the signer authorized?\n"
     "The second is asked about the time of signing, which is the signer's word, with what is "
     "revoked by now: a lost key can date back, so revoke it with --revoke-key. --at signing takes "
     "the signer's word for revocation too; --at asks about another moment.\n"
     "What was verified may be changed before it is used. install takes what is listed, and "
     "nothing "
     "else, into a directory of its own beside DEST, verifies that, and puts it in its place in "
     "one "
     "step: killed at any moment, DEST is what was there before or the whole new one.\n"
     "Patterns of what is left out are a part of those of .gitignore: * and ? stand for bytes of "
     "one "
     "name, ** as a whole name for any number of directories, \\ takes the next byte as it is. "
     "With "
     "/ before its end a pattern is about paths from the top, without one about names in every "
     "directory; / at the end means directories only, ! at the beginning what stays after all. The "
     "last pattern that matches decides, and nothing comes back of a directory that is left out. "
     "Files of patterns have one a line, # begins a comment, and they must not lie in the tree. "
     "[...] is refused."},
    {"who", "Show who may sign for a tag",
     "Tells the keys that may sign a manifest for a tag now, each with the way it comes to that: "
     "the "
     "ACL entry, then the certificates, and until when. They are those whose manifest manifest "
     "verify would accept, with these certificates. Of keys that must agree the group is told.\n"
     "Certificates are taken from the user's store and from the files of --cert: who signs "
     "elsewhere "
     "with others that are not at hand is not told.\n"
     "The options --if-... ask about a machine that differs in something: the answer says so, "
     "tells "
     "who may sign no longer or newly, and writes nothing."},
    {"until", "Show when an answer about authority changes by itself",
     "An answer changes when something that it rests on ends or begins: an ACL entry, a "
     "certificate, "
     "a revocation list, after which nobody knows what is revoked. A key is asked about as who "
     "does it, a certificate file as cert verify does, a manifest as manifest verify does: by "
     "its time of signing, with what is revoked. Its tree is not looked at.\n"
     "What somebody will decide is in no file: lists and entries to come can change it before."},
    {"floor", "Keep releases out that are older than what was accepted",
     "A release that was signed properly, and has faults that a newer one mended, is an attack "
     "when "
     "somebody brings it back. A floor is the newest time of signing that was accepted for a tag: "
     "manifest verify refuses what was signed before, and a yes raises the floor.\n"
     "The time is the signer's word. A floor does not bind those who may sign; it keeps others "
     "from "
     "playing back what they signed once. It is never raised past the present, and by no answer "
     "about another moment (--at)."},
    {"tag", "Compare tags",
     "A tag says what is granted, or asked. A longer list is narrower: who was granted (install) "
     "may also (install (app calc)), not the other way round."},
    {"show", "Show any object", "Reads what any file of the system holds, in both its forms."},
    {"store", "Look at the stores of this machine",
     "The machine's store holds what is trusted (acl) and the revocation lists; the user's store "
     "holds certificates. --global and --home name them, else VESK2_GLOBAL and VESK2_HOME, else "
     "/etc/vesk2 and $XDG_DATA_HOME/vesk2."},
    {"version", "Show the version of the command and the library", ""},
    {"completion", "Write a script that completes commands in a shell",
     "The scripts know what the command line knows: both come from one table."},
    {"manual", "Write a manual page", "Pages are in the language of man(7), as man -l - reads it."},
};

constexpr Command kCommands[] = {
    {"key", "new", "Make a key pair, or several: NAME.pem (private) and NAME.pub",
     "vesk2 key new vendor\nvesk2 key new --encrypt alice bob carol", DefineKeyNew},
    {"key", "show", "Show type, size and fingerprint of a key", "vesk2 key show vendor.pub",
     DefineKeyShow},
    {"key", "import",
     "Take a key that another program made: NAME.pub, and NAME.pem if it is private",
     "vesk2 key import ~/.ssh/id_rsa -o me\nvesk2 key import server.crt -o server",
     DefineKeyImport},
    {"key", "export", "Write a public key as other programs read it",
     "vesk2 key export vendor.pub --format x509\nvesk2 key export vendor.pem --format ssh -o v.ssh",
     DefineKeyExport},
    {"key", "name", "Give a key a name of your own, which answers show beside its fingerprint",
     "vesk2 key name vendor.pub 'The vendor'\nvesk2 key name", DefineKeyName},
    {"acl", "grant", "Write an entry into the ACL store: a root of trust",
     "vesk2 acl grant --subject vendor.pub --tag '(install)' --propagate\n"
     "vesk2 acl grant --threshold 2 --subject alice.pub --subject bob.pub --subject carol.pub "
     "--tag '(install)' --propagate",
     DefineAclGrant},
    {"acl", "list", "Show what this machine trusts", "vesk2 acl list", DefineAclList},
    {"acl", "install", "Copy entry files into the ACL store", "vesk2 acl install vendor.acl",
     DefineAclInstall},
    {"acl", "remove", "Trust an entry no longer", "vesk2 acl remove vendor", DefineAclRemove},
    {"cert", "request", "Ask to be certified",
     "vesk2 cert request --key signer.pem --tag '(install (app calc))' -o signer.req",
     DefineCertRequest},
    {"cert", "issue", "Certify a key for a tag",
     "vesk2 cert issue --key vendor.pem --subject signer.pub --tag '(install (app calc))' "
     "-o signer.cert\n"
     "vesk2 cert issue --key vendor.pem --request signer.req -o signer.cert\n"
     "vesk2 cert issue --key alice.pem --key bob.pem --subject signer.pub --tag '(install)' "
     "--propagate -o signer.cert",
     DefineCertIssue},
    {"cert", "renew", "Issue a certificate of a chain or manifest again",
     "vesk2 cert renew signer.cert:2 --key vendor.pem --not-after 2028 -o signer.cert --force",
     DefineCertRenew},
    {"cert", "cosign", "Certify the same as a certificate of a chain or manifest does",
     "vesk2 cert cosign signer.cert:2 --key bob.pem -o signer.cert --force", DefineCertCosign},
    {"cert", "join", "Put chains for the same key together",
     "vesk2 cert join by-alice.cert by-bob.cert -o signer.cert", DefineCertJoin},
    {"cert", "show", "Show the certificates of a chain", "vesk2 cert show signer.cert",
     DefineCertShow},
    {"cert", "verify", "Is the first subject of a chain authorized?",
     "vesk2 cert verify signer.cert --tag '(install (app calc))'", DefineCertVerify},
    {"cert", "find", "Find stored chains for a tag", "vesk2 cert find --tag '(install (app calc))'",
     DefineCertFind},
    {"cert", "install", "Keep a chain in the user's store, where it is found by its tag",
     "vesk2 cert install signer.cert", DefineCertInstall},
    {"crl", "issue", "Sign a list of what is revoked",
     "vesk2 crl issue --key vendor.pem --tag 'install (revoke all)' --revoke-key signer.pub "
     "--not-after 2027 -o vendor.crl\n"
     "vesk2 crl issue --key vendor.pem --tag 'install (revoke all)' --revoke-key signer.pub "
     "--not-after 2027 --grant --import",
     DefineCrlIssue},
    {"crl", "import", "Offer lists to the store", "vesk2 crl import vendor.crl", DefineCrlImport},
    {"crl", "show", "Show what a list revokes", "vesk2 crl show vendor.crl", DefineCrlShow},
    {"crl", "verify", "Is a list current, and vouched for?", "vesk2 crl verify vendor.crl",
     DefineCrlVerify},
    {"manifest", "sign", "Sign what a directory holds",
     "vesk2 manifest sign app --key signer.pem --cert signer.cert --tag '(install (app calc))' "
     "-o app.manifest",
     DefineManifestSign},
    {"manifest", "approve", "Add a further key's word for what a manifest lists",
     "vesk2 manifest approve app.manifest --key bob.pem --tree app", DefineManifestApprove},
    {"manifest", "verify", "Is a directory as signed, by someone authorized?",
     "vesk2 manifest verify app app.manifest --tag '(install (app calc))'", DefineManifestVerify},
    {"manifest", "install", "Install what a manifest lists, from a directory or an archive",
     "vesk2 manifest install app.tar.gz app.manifest /opt/app --tag '(install (app calc))'\n"
     "vesk2 manifest install app app.manifest /opt/app --tag '(install (app calc))' --replace",
     DefineManifestInstall},
    {"manifest", "show", "Show who signed a manifest, and what it lists",
     "vesk2 manifest show app.manifest --files", DefineManifestShow},
    {"manifest", "compare", "Do two manifests list the same?",
     "vesk2 manifest compare old.manifest new.manifest", DefineManifestCompare},
    {"who", "", "Who may sign for a tag, by which way, and until when?",
     "vesk2 who '(install (app calc))' --cert signer.cert\n"
     "vesk2 who '(install)' --if-revoked signer.pub",
     DefineWho},
    {"until", "", "When does the answer change by itself, and why?",
     "vesk2 until app.manifest --tag '(install (app calc))'\n"
     "vesk2 until signer.pub --cert signer.cert --tag '(install (app calc))'",
     DefineUntil},
    {"floor", "show", "Show the newest times of signing that were accepted",
     "vesk2 floor show --tag '(install (app calc))'", DefineFloorShow},
    {"floor", "set", "Refuse what was signed before a time",
     "vesk2 floor set --tag '(install (app calc))' 2026-11-23", DefineFloorSet},
    {"floor", "reset", "Forget a floor", "vesk2 floor reset --tag '(install (app calc))'",
     DefineFloorReset},
    {"tag", "check", "Does a tag lie within another, and where not?",
     "vesk2 tag check '(install (app calc))' '(install)'", DefineTagCheck},
    {"show", "", "Show any object: a key, a certificate, a list, a manifest, a tag",
     "vesk2 show signer.cert\nvesk2 show --json app.manifest\nvesk2 show --advanced -", DefineShow},
    {"store", "show", "Show where the stores are and what they hold", "vesk2 store show",
     DefineStoreShow},
    {"store", "check", "Say what is wrong with the stores, or will be",
     "vesk2 store check\nvesk2 store check --within 12w --json", DefineStoreCheck},
    {"version", "", "Show the version of the command and the library", "vesk2 version",
     DefineVersion},
    {"completion", "", "Write a script that completes commands in a shell",
     "source <(vesk2 completion bash)", DefineCompletion},
    {"manual", "", "Write a manual page: of the command, or of one group",
     "vesk2 manual cert | man -l -", DefineManual},
};

}  // namespace

std::span<const Command> Commands() { return kCommands; }
std::span<const Noun> Nouns() { return kNouns; }

std::string CommandName(const Command& command) {
  return *command.verb == '\0' ? command.noun : std::string(command.noun) + " " + command.verb;
}

}  // namespace vesk2_command
