// SPDX-License-Identifier: Apache-2.0
#include "fuzz/oracle/grant_model.h"

#include <array>
#include <map>

#include <openssl/evp.h>

namespace vesk2fuzz {
namespace {

// ---- Texts ----

std::string DigestText(const std::string& key, const EVP_MD* hash, const char* name) {
  std::string digest(32, '\0');
  unsigned int length = 0;
  FUZZ_CHECK(EVP_Digest(key.data(), key.size(), reinterpret_cast<unsigned char*>(digest.data()),
                        &length, hash, nullptr) == 1);
  digest.resize(length);
  return "(4:hash" + Token(name) + Token(digest) + ")";
}

std::array<std::string, 3> KeyForms(int key) {
  const std::string text = "(10:public-key1:" + std::string(1, static_cast<char>('A' + key)) + ")";
  return {text, DigestText(text, EVP_sha256(), "sha256"), DigestText(text, EVP_sha1(), "sha1")};
}

std::string NameText(int name) { return Token(name == 0 ? "ann" : "bob"); }

std::string GranteeText(const Grantee& grantee) {
  if (grantee.k > 0) {
    std::string out = "(6:k-of-n1:" + std::string(1, static_cast<char>(grantee.k)) +
                      "1:" + std::string(1, static_cast<char>(grantee.members.size()));
    for (const Grantee& member : grantee.members) out += GranteeText(member);
    return out + ")";
  }
  const std::string key = grantee.key < 0 ? "" : KeyText(grantee.key, grantee.form);
  if (grantee.names.empty()) return key;
  std::string out = "(4:name" + key;
  for (const int name : grantee.names) out += NameText(name);
  return out + ")";
}

std::string CredentialText(const World& world, const Credential& credential) {
  std::string out = credential.issuer < 0 ? "(5:entry" : "(4:cert";
  if (credential.issuer >= 0) {
    std::string issuer = KeyText(credential.issuer, credential.form);
    if (credential.issuer_name >= 0) {
      issuer = "(4:name" + issuer + NameText(credential.issuer_name) + ")";
    }
    out += "(6:issuer" + issuer + ")";
  }
  out += "(7:subject" + GranteeText(credential.subject) + ")";
  if (credential.propagate) out += "(9:propagate)";
  if (credential.tag >= 0) out += Canonical(world.tags[static_cast<size_t>(credential.tag)]);
  if (credential.from >= 0 || credential.until >= 0) {
    out += "(5:valid";
    if (credential.from >= 0) out += "(10:not-before" + Token(DateText(credential.from)) + ")";
    if (credential.until >= 0) out += "(9:not-after" + Token(DateText(credential.until)) + ")";
    out += ")";
  }
  return out + ")";
}

// ---- Choices ----

int AnyOf(Choices& choices, int limit) {
  return static_cast<int>(choices.Below(static_cast<unsigned>(limit)));
}

// One in four is left out.
int MaybeOf(Choices& choices, int limit) { return AnyOf(choices, limit + 1) - 1; }

Grantee MakeGrantee(Choices& choices, bool has_issuer, int depth) {
  Grantee grantee;
  const unsigned kind = choices.Below(depth > 0 ? 6 : 5);
  if (kind == 5) {
    for (unsigned n = 1 + choices.Below(3); n > 0; --n) {
      grantee.members.push_back(MakeGrantee(choices, has_issuer, depth - 1));
    }
    grantee.k = 1 + choices.Below(static_cast<unsigned>(grantee.members.size()));
    return grantee;
  }
  grantee.key = AnyOf(choices, kKeys);
  grantee.form = choices.Below(3);
  if (kind < 3) return grantee;
  if (has_issuer && choices.Chance(2)) grantee.key = -1;
  for (unsigned n = 1 + choices.Below(2); n > 0; --n) {
    grantee.names.push_back(AnyOf(choices, 2));
  }
  return grantee;
}

Credential MakeCredential(Choices& choices, const World& world, bool entry) {
  Credential made;
  if (!entry) {
    made.issuer = AnyOf(choices, kKeys);
    made.form = choices.Below(3);
    if (choices.Chance(4)) made.issuer_name = AnyOf(choices, 2);
  }
  made.subject = MakeGrantee(choices, !entry, 2);
  made.propagate = !choices.Chance(3);
  if (made.issuer_name < 0) made.tag = MaybeOf(choices, static_cast<int>(world.tags.size()));
  if (choices.Chance(3)) {
    made.from = MaybeOf(choices, kDates);
    made.until = MaybeOf(choices, kDates);
  }
  return made;
}

// ---- Who is granted what ----

// A principal that a grant has come to, and whether it may pass it on.
using Fact = std::pair<int, bool>;
using Facts = std::set<Fact>;

class Fixpoint {
 public:
  Fixpoint(const World& world, const TagTree& request, int date)
      : world_(world), request_(request), date_(date) {}
  bool Run();

 private:
  bool Counts(const Credential& credential) const;
  std::set<int> Meaning(const Grantee& grantee, int issuer) const;
  bool Define(const Credential& credential);
  bool Reach(const Grantee& grantee, const Credential& of);
  bool PassOn(Facts& facts);

  const World& world_;
  const TagTree& request_;
  int date_;
  std::map<std::pair<int, int>, std::set<int>> names_;
  std::map<const Grantee*, Facts> reached_;
};

bool Fixpoint::Counts(const Credential& credential) const {
  if (credential.from > date_ || (credential.until >= 0 && credential.until < date_)) return false;
  return credential.tag < 0 || Allows(world_.tags[static_cast<size_t>(credential.tag)], request_);
}

std::set<int> Fixpoint::Meaning(const Grantee& grantee, int issuer) const {
  std::set<int> keys = {grantee.key < 0 ? issuer : grantee.key};
  for (const int name : grantee.names) {
    std::set<int> meant;
    for (const int key : keys) {
      const auto found = names_.find({key, name});
      if (found != names_.end()) meant.insert(found->second.begin(), found->second.end());
    }
    keys = meant;
  }
  return keys;
}

// A name for k of n subjects is none that one of them has.
bool Fixpoint::Define(const Credential& credential) {
  if (credential.subject.k > 0) return false;
  std::set<int>& name = names_[{credential.issuer, credential.issuer_name}];
  const size_t before = name.size();
  name.merge(Meaning(credential.subject, credential.issuer));
  return name.size() > before;
}

// What a grant to `grantee` comes to as far as it is known; whether that is more than before.
bool Fixpoint::Reach(const Grantee& grantee, const Credential& of) {
  bool more = false;
  Facts& facts = reached_[&grantee];
  const size_t before = facts.size();
  if (grantee.k == 0) {
    for (const int key : Meaning(grantee, of.issuer)) facts.insert({key, of.propagate});
  } else {
    std::map<Fact, unsigned> count;
    for (const Grantee& member : grantee.members) {
      more = Reach(member, of) || more;
      const Facts& member_facts = reached_[&member];
      for (int key = 0; key < world_.keys; ++key) {
        const bool may = member_facts.contains({key, true});
        count[{key, true}] += may;
        count[{key, false}] += may || member_facts.contains({key, false});
      }
    }
    for (const auto& [fact, positions] : count) {
      if (positions >= grantee.k) facts.insert(fact);
    }
  }
  PassOn(facts);
  return more || facts.size() > before;
}

bool Fixpoint::PassOn(Facts& facts) {
  const Facts known = facts;
  for (const Credential& cert : world_.credentials) {
    if (cert.issuer < 0 || cert.issuer_name >= 0 || !Counts(cert)) continue;
    if (!known.contains({cert.issuer, true})) continue;
    const Facts passed = reached_[&cert.subject];
    facts.insert(passed.begin(), passed.end());
  }
  return facts.size() > known.size();
}

bool Fixpoint::Run() {
  for (bool more = true; more;) {
    more = false;
    for (const Credential& credential : world_.credentials) {
      if (!Counts(credential)) continue;
      more = (credential.issuer_name >= 0 ? Define(credential)
                                          : Reach(credential.subject, credential)) ||
             more;
    }
  }
  for (const Credential& entry : world_.credentials) {
    if (entry.issuer >= 0 || !Counts(entry)) continue;
    const Facts& facts = reached_[&entry.subject];
    if (facts.contains({world_.requester, true}) || facts.contains({world_.requester, false})) {
      return true;
    }
  }
  return false;
}

}  // namespace

std::string KeyText(int key, unsigned form) {
  static const std::array<std::array<std::string, 3>, kKeys> texts = {KeyForms(0), KeyForms(1),
                                                                      KeyForms(2), KeyForms(3)};
  return texts[static_cast<size_t>(key)][form];
}

std::string DateText(int date) { return "200" + std::to_string(date) + "-01-01_00:00:00"; }

std::string AclText(const World& world) {
  std::string out = "(3:acl";
  for (const Credential& entry : world.credentials) {
    if (entry.issuer < 0) out += CredentialText(world, entry);
  }
  return out + ")";
}

std::string SequenceText(const World& world) {
  std::string out = "(8:sequence(4:keys";
  for (int key = 0; key < kKeys; ++key) out += KeyText(key, 0);
  out += ")";
  for (const Credential& cert : world.credentials) {
    if (cert.issuer >= 0) out += CredentialText(world, cert);
  }
  return out + ")";
}

World MakeWorld(Choices& choices) {
  World world;
  for (unsigned n = 1 + choices.Below(3); n > 0; --n)
    world.tags.push_back(MakeWholeTag(choices, 2));
  for (unsigned n = 1 + choices.Below(3); n > 0; --n) {
    world.credentials.push_back(MakeCredential(choices, world, true));
  }
  for (unsigned n = choices.Below(8); n > 0; --n) {
    world.credentials.push_back(MakeCredential(choices, world, false));
  }
  world.requester = AnyOf(choices, kKeys);
  return world;
}

bool IsGranted(const World& world, const TagTree& request, int date) {
  return Fixpoint(world, request, date).Run();
}

}  // namespace vesk2fuzz
