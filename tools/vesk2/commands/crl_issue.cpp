// SPDX-License-Identifier: Apache-2.0
// crl_issue.cpp: vesk2 crl issue.
#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/stores/acl_store.h"
#include "tools/vesk2/stores/crl_compare.h"
#include "tools/vesk2/stores/crl_store.h"

#include <vesk2/acl_entry.h>
#include <vesk2/limits.h>

namespace vesk2_command {
namespace {

using ZvVesk2::Crl;
using ZvVesk2::Hash;

struct Options {
  SignerOptions signer;
  std::string tag;
  std::vector<std::string> certs;
  std::vector<std::string> keys;
  std::string itemsOf;
  std::vector<std::string> drops;
  std::string date = "now";
  PeriodOptions period;
  std::string hash = "sha256";
  std::string output;
  bool grant = false;
  bool import = false;
  WriteFlags flags;
};

ZvclmHashID HashId(const std::string& name) {
  return name == "sha1" ? ZVCLM_HASH_SHA1 : ZVCLM_HASH_SHA256;
}

// FILE or FILE:N: the hash of the first or N-th certificate of a file, as it stands there.
Ref<Hash> HashOfCert(const std::string& argument, ZvclmHashID id) {
  const Place place = ParsePlace(argument);
  const size_t number = place.number != 0 ? place.number : 1;
  const std::vector<SignedCert> certs = ReadCerts(place.path);
  RequireCert(certs, number, place.path);
  return HashOf(*certs[number - 1].cert, id);
}

Ref<Crl> MakeList(const Options& options, CrlSequence* old, const Drops& drops) {
  constexpr const char* kWhat = "building a revocation list";
  const ZvclmHashID id = HashId(options.hash);
  const Ref<TimeStamp> date = ParseTime(options.date, false);
  Ref<Crl> list;
  Check(Crl::Create(list.Out(), nullptr), kWhat);
  for (const std::string& argument : options.certs) {
    Check(list->RevokeCertificate(HashOfCert(argument, id).get(), date.get()), kWhat);
  }
  for (const std::string& path : options.keys) {
    Check(list->RevokeKey(HashOf(*ReadPublicKey(path), id, true).get(), date.get()), kWhat);
  }
  if (old != nullptr) drops.CarryOver(*old->GetCrl(), *list);
  // A list without items counts as absent, and every certificate that depends on it as
  // undetermined. This item is the digest of nothing.
  if (list->GetList1()->Count() < 2) {
    const std::string nothing(id == ZVCLM_HASH_SHA1 ? 20 : 32, '\0');
    Check(list->RevokeCertificate(MakeHash(id, nothing).get(), date.get()), kWhat);
  }
  return list;
}

// The list with the word of its issuer.
Ref<CrlSequence> SignList(Crl& list, SExpression* tag, const SigningKey& key,
                          const Options& options) {
  const Ref<Hash> subject = HashOf(list, HashId(options.hash));
  Grant grant{subject.get()};
  grant.tag = tag;
  grant.period = ParsePeriod(options.period);
  const SignedCert issued = IssueCert(key, grant, options.signer.algorithm);
  Ref<CrlSequence> sequence;
  Check(CrlSequence::Create(sequence.Out(), &list, issued.cert.get(), issued.signature.get(),
                            nullptr),
        "building a revocation list");
  return sequence;
}

// The stored list that the new one takes the place of, when it counts. One that does not revokes
// nothing; one that this user may not read is no reason to believe so.
Ref<CrlSequence> ListBefore(SExpression* tag, const Drops& drops) {
  Ref<SExpression> acls;
  const int code = ZvVesk2::AclEntry::Import(acls.Out(), nullptr, nullptr);
  if (code == VESK2_ERR_MEM_ALLOC) throw std::bad_alloc();
  StoredList stored = FindStored(tag, code == 0 ? acls.get() : nullptr);
  if (stored.problem.empty()) return std::move(stored.list);
  if (stored.unread && !drops.all()) {
    throw Trouble(stored.problem + "; it may revoke what this list lets go (--drop all)", "io");
  }
  Note("note: the stored list does not count: " + stored.problem);
  return {};
}

Ref<Crl> MakeSuccessor(const Options& options, SExpression* tag) {
  const Drops drops(options.drops);
  Ref<CrlSequence> old;
  if (!options.itemsOf.empty()) old = ReadCrl(options.itemsOf);
  const Ref<CrlSequence> stored = ListBefore(tag, drops);
  Ref<Crl> list = MakeList(options, old.get(), drops);
  std::vector<const Crl*> before;
  if (old) before.push_back(old->GetCrl());
  if (stored) before.push_back(stored->GetCrl());
  drops.Settle(before, *list);
  return list;
}

// Puts the list into this machine's store, or says that it would.
void Import(CrlSequence& list, const Options& options, const std::string& items) {
  if (options.flags.dryRun) return Note("would store " + CrlText(list));
  const std::string reason = StoreCrl(list, LoadAcls().get(), "the list");
  if (!reason.empty()) throw Trouble("the list was not stored: " + reason, "not-stored");
  Note("stored " + CrlText(list) + items);
  Result()["stored"] = true;
}

ExitCode Run(const Options& options) {
  if (options.output.empty() && !options.import) {
    throw Trouble("nowhere to put the list: --output or --import", "usage");
  }
  const Ref<SExpression> tag = ParseRevocationTag(options.tag);
  if (!NamesFile(tag.get())) {
    throw Trouble("--tag: too long; the store names the list's file by it", "usage");
  }
  const WriteFlags& flags = options.flags;
  if (!options.output.empty()) RefuseExisting(options.output, flags.force);
  const auto key = OpenSigner(options.signer);
  const Ref<Crl> list = MakeSuccessor(options, tag.get());
  const Ref<CrlSequence> signedList = SignList(*list, tag.get(), *key, options);
  const auto readBack = [](const std::string& temporary) {
    Check(CheckIssuerWord(*ReadCrl(temporary)), "checking the new list");
  };
  if (options.grant) {
    TrustSource(*key->Public(), tag.get(), KeyNickname(options.signer.keys[0]), flags.dryRun);
  }
  const std::string items = "; revoked certificates: " + std::to_string(options.certs.size()) +
                            ", keys: " + std::to_string(options.keys.size());
  if (options.import) Import(*signedList, options, items);
  if (!options.output.empty()) {
    WriteFile(options.output, Canonical(*signedList), {flags, readBack, items});
  }
  Result()["tag"] = TagText(tag.get());
  Result()["issuer"] = Fingerprint(*key->Public());
  Result()["revoked_certificates"] = options.certs.size();
  Result()["revoked_keys"] = options.keys.size();
  return kYes;
}

}  // namespace

Action DefineCrlIssue(OptionList& list) {
  auto options = std::make_shared<Options>();
  AddSignerOptions(list, options->signer);
  list.Add("--tag", options->tag, "The source of the list: \"calc (revoke all)\"").Required();
  list.Add("--revoke-cert", options->certs,
           "A certificate that is revoked: FILE, or FILE:N for the N-th of a chain. Whoever "
           "has its key can sign with an earlier date: for a leaked key, --revoke-key");
  list.Add("--revoke-key", options->keys,
           "A public key that is revoked, whatever the date: one that leaked");
  list.Add("--items-of", options->itemsOf,
           "Revoke what this list revokes, too: the one that is replaced");
  list.Add("--drop", options->drops,
           "Let this go, which the list before revokes (that of --items-of, and the stored "
           "one): a digest as crl show writes it, or \"all\"");
  list.Add("--date", options->date, "From when on the certificates are revoked").ShowPreset();
  AddPeriodOptions(list, options->period);
  // A list without an end answers nothing and replaces nothing.
  list.Get("--not-after").Required();
  list.Add("--hash", options->hash, "How the list and what it names are hashed")
      .Choices({"sha256", "sha1"})
      .ShowPreset();
  list.Add("-o,--output", options->output, "The revocation list file, .crl");
  list.Add("--import", options->import, "Put the list into this machine's store");
  list.Add("--grant", options->grant,
           "Let this machine believe the key's lists of this source: writes the ACL entry");
  AddWriteFlags(list, options->flags);
  list.Footer(
      "A list that revokes no certificate holds one dummy item, a digest of zeros: without any "
      "item\nit would count as absent.");
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
