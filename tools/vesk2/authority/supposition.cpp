// SPDX-License-Identifier: Apache-2.0
// supposition.cpp: reading what is supposed, and changing evidence by it.
#include "tools/vesk2/authority/supposition.h"

#include <algorithm>
#include <filesystem>

#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/keys/key_source.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Hash;

constexpr const char* kWhat = "judging what is supposed";
constexpr std::string_view kEntrySuffix = ".acl";

bool IsPublicKeyFile(const std::string& path) {
  const Buffer buffer = OpenBuffer(path);
  return !buffer->LooksAt("(8:sequence") && !buffer->LooksAt("(8:manifest");
}

// By the name that acl list shows, the file's, or its path.
bool IsCalled(const AclEntry& entry, const std::string& name) {
  const std::filesystem::path path(entry.GetFileName() != nullptr ? entry.GetFileName() : "");
  return path.string() == name || path.filename().string() == name ||
         path.filename().string() == name + std::string(kEntrySuffix);
}

int Digit(char c) {
  if (c >= '0' && c <= '9') return c - '0';
  if (c >= 'a' && c <= 'f') return c - 'a' + 10;
  return c >= 'A' && c <= 'F' ? c - 'A' + 10 : -1;
}

}  // namespace

void AddSuppositionOptions(OptionList& list, SuppositionOptions& options) {
  list.Add(
      "--if-revoked", options.revoked,
      "Answer as if this were revoked: a key (its file or fingerprint), or a certificate, FILE "
      "or FILE:N");
  list.Add("--if-without", options.without,
           "Answer as if this ACL entry were not there, named as acl list shows it");
  list.Add("--if-at", options.at, "Answer as if the clock showed this time");
  if (std::none_of(list.options().begin(), list.options().end(),
                   [](const Option& each) { return each.LongName() == "--at"; })) {
    return;
  }
  for (const char* other : {"--at", "--not-before", "--not-after"}) {
    list.Get("--if-at").Excludes(other);
  }
}

bool IsHypothetical(const SuppositionOptions& options) {
  return !options.revoked.empty() || !options.without.empty() || !options.at.empty();
}

Ref<Hash> ParseFingerprint(const std::string& text) {
  constexpr std::string_view kHead = "sha256:";
  constexpr size_t kDigits = 64;
  if (!text.starts_with(kHead) || text.size() != kHead.size() + kDigits) return {};
  std::string digest;
  for (size_t i = kHead.size(); i < text.size(); i += 2) {
    const int high = Digit(text[i]);
    const int low = Digit(text[i + 1]);
    if (high < 0 || low < 0) return {};
    digest += static_cast<char>(high << 4 | low);
  }
  return MakeHash(ZVCLM_HASH_SHA256, digest);
}

Supposition::Supposition(const SuppositionOptions& options)
    : any_(IsHypothetical(options)), without_(options.without) {
  Result()["hypothetical"] = Json();
  if (!any_) return;
  for (const std::string& argument : options.revoked) AddRevoked(argument);
  if (!options.at.empty()) at_ = ParseTime(options.at, false);
  Json& told = Result()["hypothetical"] = {
      {"revoked", Json::array()}, {"without", Json::array()}, {"at", Json()}};
  std::string words = "hypothetically";
  for (const std::string& argument : options.revoked) {
    words += ", with " + Escape(argument) + " revoked";
    told["revoked"].push_back(Escape(argument));
  }
  for (const std::string& name : without_) {
    words += ", without " + Escape(name);
    told["without"].push_back(Escape(name));
  }
  if (at_) {
    words += ", at " + StampText(*at_);
    told["at"] = StampText(*at_);
  }
  SetVerdictPrefix(words + ": ");
}

// As crl issue names it: a key without display hints, a certificate as it stands in its file.
void Supposition::AddRevoked(const std::string& argument) {
  Ref<Hash> named = ParseFingerprint(argument);
  const Place place = ParsePlace(argument);
  if (named) {
    revoked_.push_back(std::move(named));
  } else if (place.number == 0 && IsPublicKeyFile(argument)) {
    revoked_.push_back(HashOf(*ReadPublicKey(argument), ZVCLM_HASH_SHA256, true));
  } else {
    const std::vector<SignedCert> certs = ReadCerts(place.path);
    const size_t number = place.number != 0 ? place.number : 1;
    RequireCert(certs, number, place.path);
    ZvVesk2::Cert& cert = *certs[number - 1].cert;
    revoked_.push_back(HashOf(cert, ZVCLM_HASH_SHA256));
    if (cert.GetRevocationElement() != nullptr) return;
    Note("note: certificate " + std::to_string(number) + " of " + Escape(place.path) +
         " names no source of revocation lists: no list can take it back, only one that names its "
         "key");
  }
}

Ref<TimeStamp> Supposition::Now() const {
  return at_ ? Ref<TimeStamp>::Share(at_.get()) : ParseTime("now", false);
}

Ref<SExpression> Supposition::Entries(SExpression* entries) const {
  if (without_.empty() || entries == nullptr) return Ref<SExpression>::Share(entries);
  std::vector<DExpression*> left;
  std::vector<bool> found(without_.size());
  for (AclEntry* const entry : ItemsOf<AclEntry>(entries)) {
    bool gone = false;
    for (size_t i = 0; i < without_.size(); ++i) {
      if (!IsCalled(*entry, without_[i])) continue;
      found[i] = gone = true;
    }
    if (!gone) left.push_back(entry);
  }
  const auto missing = std::find(found.begin(), found.end(), false);
  if (missing != found.end()) {
    const auto index = static_cast<size_t>(missing - found.begin());
    throw Trouble("no ACL entry is called \"" + Escape(without_[index]) + "\" (acl list)", "usage");
  }
  return ListOf(left, "acl");
}

void Supposition::Revoke(ZvVesk2::Evidence& evidence) const {
  for (const Ref<Hash>& digest : revoked_) Check(evidence.AssumeRevoked(digest.get()), kWhat);
}

void Supposition::Change(ZvVesk2::Evidence& evidence) const {
  if (!any_) return;
  evidence.SetEntries(Entries(evidence.GetEntries()).get());
  Revoke(evidence);
}

void Supposition::TellAsItIs(int code) {
  TellAsItIs(code == 0, ReasonWord(code), code, Reason(code));
}

void Supposition::TellAsItIs(bool yes, const std::string& reason, int code,
                             const std::string& why) {
  Result()["as_it_is"] = {{"verdict", yes ? "yes" : "no"}, {"reason", reason}, {"code", code}};
  Note("the answer is hypothetical; as things are: " + (yes ? "yes" : "no: " + why));
}

}  // namespace vesk2_command
