// SPDX-License-Identifier: Apache-2.0
// who_oracle COUNT [SEED [FROM]]: who may sign, and until when, in random small stores: what the
// command searches beside a plain fixpoint that tries everything.
//
// The model knows keys, tags and periods (grant_model.h); here is what a manifest and revocation
// add to it. Time goes in ticks: 2 d is the first second of the d-th year, 2 d + 1 the next second,
// at which what ended with it is over.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <random>

#include "fuzz/oracle/grant_model.h"
#include "tests/support/test_key.h"
#include "tests/support/test_text.h"
#include "tools/vesk2/authority/search.h"

#include <vesk2/crl.h>

namespace vesk2test {
namespace {

using namespace vesk2_command;  // NOLINT(google-build-using-namespace): most names are from there
using vesk2fuzz::Choices;
using vesk2fuzz::Credential;
using vesk2fuzz::Grantee;
using vesk2fuzz::TagTree;

constexpr int kSigners = 4;
constexpr int kContent = kSigners;  // what a manifest is about, as one more key of the model
constexpr int kTicks = 2 * vesk2fuzz::kDates + 2;
constexpr unsigned kRevoker = kSigners;
constexpr const char* kSources[] = {"(a (revoke all))", "(b (revoke all))"};

const TestKey& Key(int index) { return TestKey::Rsa(static_cast<unsigned>(index)); }

std::string Stamp(int tick) {
  return "200" + std::to_string(1 + tick / 2) + "-01-01_00:00:0" + std::to_string(tick % 2);
}
long Second(int tick) {
  const Ref<TimeStamp> stamp(new TimeStamp(nullptr));
  if (stamp->Set(Stamp(tick).c_str(), false) != 0) std::abort();
  return stamp->ToTime();
}

// ---- A store ----

struct List {
  int source = 0;
  int end = -1;                                    // a tick; -1: none
  std::vector<std::pair<size_t, int>> certs = {};  // since a tick
  std::vector<int> keys = {};
};

struct Store {
  vesk2fuzz::World world;   // whose first `entries` credentials are entries
  std::vector<int> source;  // of each credential; -1: none
  std::vector<List> lists = {};
  bool vouched[2] = {};                // whether an entry vouches for the lists of a source
  std::vector<TagTree> requests = {};  // all must be granted
  std::vector<int> supposed = {};      // keys that are revoked by supposition
  std::vector<size_t> supposedCerts = {};
};

std::string KeyForm(int key, unsigned form) {
  const std::string text = Key(key).Public();
  return form == 0 ? text : HashOf(text, form == 1 ? "sha256" : "sha1");
}

std::string SubjectForm(const Grantee& grantee) {
  if (grantee.k == 0) return KeyForm(grantee.key, grantee.form);
  std::string text = "(6:k-of-n1:" + std::string(1, static_cast<char>(grantee.k)) +
                     "1:" + std::string(1, static_cast<char>(grantee.members.size()));
  for (const Grantee& member : grantee.members) text += KeyForm(member.key, 0);
  return text + ")";
}

std::string StampOrNone(int tick) { return tick < 0 ? "" : Stamp(tick); }

std::string TextOf(const Store& store, size_t number) {
  const Credential& made = store.world.credentials[number];
  const std::string tag =
      made.tag < 0 ? "" : Canonical(store.world.tags[static_cast<size_t>(made.tag)]);
  const std::string subject = SubjectForm(made.subject);
  if (made.issuer < 0) {
    return AclEntryText(subject, tag, made.propagate, StampOrNone(made.from),
                        StampOrNone(made.until));
  }
  CertText cert;
  cert.issuer = KeyForm(made.issuer, 0);
  cert.subject = subject;
  cert.tag = tag;
  cert.propagate = made.propagate;
  cert.notBefore = StampOrNone(made.from);
  cert.notAfter = StampOrNone(made.until);
  if (store.source[number] >= 0) {
    const std::string source = Tag(kSources[store.source[number]]);
    cert.revocation = "(15:revocation-list" + source.substr(std::string("(3:tag").size());
  }
  return Cert(cert);
}

Grantee MakeSubject(Choices& choices) {
  Grantee subject;
  if (choices.Chance(5)) {
    const unsigned first = choices.Below(kSigners);
    const unsigned n = 2 + choices.Below(3);
    for (unsigned i = 0; i < n; ++i) {
      Grantee member;
      member.key = static_cast<int>((first + i) % kSigners);
      subject.members.push_back(member);
    }
    subject.k = 1 + choices.Below(n);
    return subject;
  }
  subject.key = static_cast<int>(choices.Below(kSigners));
  if (choices.Chance(4)) subject.form = 1 + choices.Below(2);
  return subject;
}

int MaybeYear(Choices& choices) {
  return 2 * (static_cast<int>(choices.Below(vesk2fuzz::kDates + 1)) - 1);
}

Store MakeStore(Choices& choices) {
  Store store;
  vesk2fuzz::World& world = store.world;
  world.keys = kContent + 1;
  for (unsigned n = 1 + choices.Below(3); n > 0; --n) {
    world.tags.push_back(vesk2fuzz::MakeWholeTag(choices, 2));
  }
  const unsigned entries = 1 + choices.Below(3);
  const unsigned certs = choices.Below(6);
  for (unsigned i = 0; i < entries + certs; ++i) {
    Credential made;
    if (i >= entries) made.issuer = static_cast<int>(choices.Below(kSigners));
    made.subject = MakeSubject(choices);
    made.propagate = !choices.Chance(3);
    made.tag = static_cast<int>(choices.Below(static_cast<unsigned>(world.tags.size())));
    if (i >= entries && choices.Chance(4)) made.tag = -1;
    if (choices.Chance(2)) {
      made.from = std::max(MaybeYear(choices), -1);
      made.until = std::max(MaybeYear(choices), -1);
    }
    world.credentials.push_back(made);
    store.source.push_back(i >= entries && choices.Chance(3) ? static_cast<int>(choices.Below(2))
                                                             : -1);
  }
  for (bool& vouched : store.vouched) vouched = !choices.Chance(5);
  for (unsigned n = choices.Below(3); n > 0; --n) {
    List list{static_cast<int>(choices.Below(2)), std::max(MaybeYear(choices), -1)};
    for (unsigned i = 0; i < certs; ++i) {
      if (choices.Chance(5)) list.certs.emplace_back(entries + i, std::max(0, MaybeYear(choices)));
    }
    if (choices.Chance(4)) list.keys.push_back(static_cast<int>(choices.Below(kSigners)));
    store.lists.push_back(list);
  }
  if (choices.Chance(6)) store.supposed.push_back(static_cast<int>(choices.Below(kSigners)));
  if (certs > 0 && choices.Chance(6)) store.supposedCerts.push_back(entries + choices.Below(certs));
  for (unsigned n = 1 + (choices.Chance(4) ? 1U : 0U); n > 0; --n) {
    const TagTree& tag = world.tags[choices.Below(static_cast<unsigned>(world.tags.size()))];
    store.requests.push_back(Lengthened(MakeRequest(choices, tag)));
  }
  return store;
}

// ---- What the model says ----

class Model {
 public:
  explicit Model(const Store& store) : store_(store) {}

  // Whether these keys together may sign at a tick, any of them being the signer.
  bool MaySign(const std::vector<int>& keys, int tick) const {
    return std::any_of(keys.begin(), keys.end(),
                       [&](int signer) { return SignsFor(signer, keys, tick); });
  }

  // Any k of the keys that are not revoked.
  bool MayAgree(const Grantee& group, int tick) const {
    std::vector<int> asked;
    for (const Grantee& member : group.members) {
      if (!IsKeyRevoked(member.key)) asked.push_back(member.key);
    }
    for (unsigned chosen = 0; chosen < 1U << asked.size(); ++chosen) {
      std::vector<int> keys;
      for (size_t i = 0; i < asked.size(); ++i) {
        if ((chosen >> i & 1) != 0) keys.push_back(asked[i]);
      }
      if (keys.size() == group.k && MaySign(keys, tick)) return true;
    }
    return false;
  }

 private:
  // The certificate that names the signer need not let it pass on what it grants.
  bool SignsFor(int signer, const std::vector<int>& approvers, int tick) const {
    if (IsKeyRevoked(signer)) return false;
    const std::vector<Credential>& all = store_.world.credentials;
    for (size_t own = 0; own <= all.size(); ++own) {
      const bool self = own == all.size();
      if (!self && !IsOwn(own, signer, tick)) continue;
      vesk2fuzz::World world = store_.world;
      world.credentials.clear();
      for (size_t i = 0; i < all.size(); ++i) {
        if (IsRevoked(i, tick)) continue;
        world.credentials.push_back(all[i]);
        if (i == own) world.credentials.back().propagate = true;
      }
      if (self) Add(world, signer, signer, true);
      for (const int key : approvers) Add(world, key, kContent, false);
      world.requester = kContent;
      if (std::all_of(store_.requests.begin(), store_.requests.end(),
                      [&](const TagTree& request) { return IsGranted(world, request, tick); })) {
        return true;
      }
    }
    return false;
  }

  static void Add(vesk2fuzz::World& world, int issuer, int subject, bool propagate) {
    Credential made;
    made.issuer = issuer;
    made.subject.key = subject;
    made.propagate = propagate;
    world.credentials.push_back(made);
  }

  bool IsOwn(size_t number, int signer, int tick) const {
    const Credential& made = store_.world.credentials[number];
    const Grantee& subject = made.subject;
    return made.issuer >= 0 && subject.k == 0 && subject.form == 0 && subject.key == signer &&
           !IsRevoked(number, tick);
  }

  bool IsKeyRevoked(int key, unsigned form = 0) const {
    if (form == 2) return false;  // items are digests by SHA-256
    const auto names = [&](const std::vector<int>& keys) {
      return std::find(keys.begin(), keys.end(), key) != keys.end();
    };
    return names(store_.supposed) ||
           std::any_of(store_.lists.begin(), store_.lists.end(), [&](const List& list) {
             return store_.vouched[list.source] && names(list.keys);
           });
  }

  // By its key, by a list of its source, or because no such list is current.
  bool IsRevoked(size_t number, int tick) const {
    const Credential& made = store_.world.credentials[number];
    if (made.issuer < 0) return false;
    if (made.subject.k == 0 && IsKeyRevoked(made.subject.key, made.subject.form)) return true;
    const int source = store_.source[number];
    if (source < 0) return false;
    const auto& supposed = store_.supposedCerts;
    // A text, and not a place, is what is listed.
    const auto same = [&](size_t other) { return TextOf(store_, other) == TextOf(store_, number); };
    if (std::any_of(supposed.begin(), supposed.end(), same)) return true;
    int latest = -1;
    for (const List& list : store_.lists) {
      if (list.source != source || !store_.vouched[source]) continue;
      for (const auto& [cert, since] : list.certs) {
        if (since <= tick && same(cert)) return true;
      }
      latest = std::max(latest, list.end);
    }
    return latest < tick;
  }

  const Store& store_;
};

// ---- What the command says ----

template <typename T>
Ref<T> Imported(const std::string& text) {
  Ref<T> object(new T(nullptr));
  Check(object->Import(WrapBytes(text).get()), "importing");
  return object;
}

std::string ListText(const Store& store, const List& list) {
  const auto item = [](const std::string& hash, int since) {
    return vesk2test::List({Str("item"), hash, Str(Stamp(since))});
  };
  std::string certs = item(HashOf("nothing"), 0);
  for (const auto& [cert, since] : list.certs) certs += item(HashOf(TextOf(store, cert)), since);
  std::string keys;
  for (const int key : list.keys) keys += item(HashOf(Key(key).Public()), 0);
  const std::string crl = vesk2test::List({Str("crl"), vesk2test::List({Str("version"), Str("1")}),
                                           vesk2test::List({Str("list1"), certs}),
                                           vesk2test::List({Str("list2"), keys})});
  CertText cert;
  cert.issuer = Key(kRevoker).Public();
  cert.subject = HashOf(crl);
  cert.tag = Tag(kSources[list.source]);
  cert.notAfter = StampOrNone(list.end);
  const std::string text = Cert(cert);
  return "(8:sequence" + crl + text + Key(kRevoker).Sign(text) + ")";
}

Holdings Load(const Store& store) {
  Holdings holdings;
  std::vector<Ref<ZvVesk2::AclEntry>> entries;
  std::vector<DExpression*> borrowed;
  std::set<std::string> seen;
  const auto add = [&](const std::string& text) {
    entries.push_back(Imported<ZvVesk2::AclEntry>(text));
    borrowed.push_back(entries.back().get());
  };
  for (size_t i = 0; i < store.world.credentials.size(); ++i) {
    const std::string text = TextOf(store, i);
    if (store.world.credentials[i].issuer < 0) {
      add(text);
    } else if (seen.insert(text).second) {
      holdings.certs.push_back({Imported<ZvVesk2::Cert>(text), {}, std::to_string(i)});
    }
  }
  for (int source = 0; source < 2; ++source) {
    if (store.vouched[source]) add(AclEntryText(Key(kRevoker).Public(), Tag(kSources[source])));
  }
  holdings.entries = ListOf(borrowed, "acl");
  holdings.lists = Ref<SExpression>(new SExpression(nullptr));
  for (const List& list : store.lists) {
    Append(*holdings.lists, *Imported<ZvVesk2::CrlSequence>(ListText(store, list)));
  }
  return holdings;
}

Request RequestOf(const Store& store) {
  Request request;
  for (const TagTree& asked : store.requests) {
    Ref<SExpression> tag;
    Check(SExpression::Import(tag.Out(), WrapBytes(Canonical(asked)).get(), nullptr), "importing");
    if (!request.tag) request.tag = Ref<SExpression>::Share(tag.get());
    request.members.push_back({std::move(tag), ""});
  }
  return request;
}

std::vector<Ref<ZvVesk2::Hash>> Supposed(const Store& store) {
  std::vector<Ref<ZvVesk2::Hash>> digests;
  for (const int key : store.supposed) {
    digests.push_back(MakeHash(ZVCLM_HASH_SHA256, Digest(Key(key).Public())));
  }
  for (const size_t cert : store.supposedCerts) {
    digests.push_back(MakeHash(ZVCLM_HASH_SHA256, Digest(TextOf(store, cert))));
  }
  return digests;
}

// ---- Beside each other ----

struct Counts {
  size_t yes = 0, no = 0, changes = 0;
};

class Comparison {
 public:
  Comparison(const Store& store, Counts& counts)
      : store_(store),
        counts_(counts),
        model_(store),
        holdings_(Load(store)),
        request_(RequestOf(store)),
        supposition_(Supposed(store)),
        search_(holdings_, request_, supposition_) {}

  // False when they differ, which has been told.
  bool Agrees(int tick) { return AgreeOnKeys(tick) && AgreeOnGroups(tick); }

 private:
  using Expect = std::function<bool(int)>;

  bool AgreeOnKeys(int tick) {
    for (int key = 0; key < kSigners; ++key) {
      const Ref<PublicKey> known = search_.keys().FindKey(Fingerprint(*PublicOf(key)));
      const Signers signers = known ? OneKey(known) : OneKey(PublicOf(key));
      if (!Compare("key " + std::to_string(key), signers, tick,
                   [&](int at) { return model_.MaySign({key}, at); })) {
        return false;
      }
    }
    return true;
  }

  bool AgreeOnGroups(int tick) {
    for (const Credential& made : store_.world.credentials) {
      if (made.subject.k < 2) continue;
      Signers signers{{}, made.subject.k};
      for (const Grantee& member : made.subject.members) {
        signers.keys.push_back(PublicOf(member.key));
      }
      std::string name = std::to_string(made.subject.k) + " of";
      for (const Grantee& member : made.subject.members) {
        name += " " + std::to_string(member.key);
      }
      if (!Compare(name, signers, tick,
                   [&](int at) { return model_.MayAgree(made.subject, at); })) {
        return false;
      }
    }
    return true;
  }

  bool Compare(const std::string& what, const Signers& signers, int tick, const Expect& expect) {
    const Ref<TimeStamp> now = StampOf(Second(tick));
    const bool yes = !search_.FindWays(signers, now.get(), 4).empty();
    const bool expected = expect(tick);
    ++(yes ? counts_.yes : counts_.no);
    if (yes != expected) return Differ(what, tick, yes);
    std::vector<Way> known;
    const std::optional<long> change = search_.MomentsOf(signers).FirstChange(
        now->ToTime(), [&](TimeStamp* at) { return search_.MaySign(signers, at, known); });
    int at = tick + 1;
    while (at < kTicks && expect(at) == expected) ++at;
    const std::optional<long> wanted = at < kTicks ? std::optional<long>(Second(at)) : std::nullopt;
    if (change) ++counts_.changes;
    if (change == wanted) return true;
    const auto text = [](std::optional<long> second) {
      return second ? StampText(*StampOf(*second)) : "never";
    };
    return Differ(what + ": changes " + text(change) + ", not " + text(wanted), tick, yes);
  }

  bool Differ(const std::string& what, int tick, bool yes) const {
    std::printf("%s at tick %d: the search says %s\n", what.c_str(), tick, yes ? "yes" : "no");
    for (size_t i = 0; i < store_.world.credentials.size(); ++i) Show(i);
    for (const TagTree& asked : store_.requests)
      std::printf("asked %s\n", Canonical(asked).c_str());
    for (const int key : store_.supposed) std::printf("supposed: key %d\n", key);
    for (const size_t cert : store_.supposedCerts) std::printf("supposed: %zu\n", cert);
    for (const List& list : store_.lists) {
      std::printf("list of %d, end %d, certificates %zu, keys %zu\n", list.source, list.end,
                  list.certs.size(), list.keys.size());
    }
    return false;
  }

  void Show(size_t number) const {
    const Credential& made = store_.world.credentials[number];
    std::printf("%zu: %d -> %d (form %u, %u of", number, made.issuer, made.subject.key,
                made.subject.form, made.subject.k);
    for (const Grantee& member : made.subject.members) std::printf(" %d", member.key);
    const std::string tag =
        made.tag < 0 ? "" : Canonical(store_.world.tags[static_cast<size_t>(made.tag)]);
    std::printf(")%s from %d until %d, source %d, %s\n", made.propagate ? " propagates" : "",
                made.from, made.until, store_.source[number], tag.c_str());
  }

  static Ref<PublicKey> PublicOf(int key) { return Imported<PublicKey>(Key(key).Public()); }

  const Store& store_;
  Counts& counts_;
  Model model_;
  Holdings holdings_;
  Request request_;
  Supposition supposition_;
  Search search_;
};

bool Run(long count, unsigned seed, long from) {
  std::mt19937 random(seed);
  Counts counts;
  for (long i = 0; i < count; ++i) {
    std::string bytes(600, '\0');
    for (char& byte : bytes) byte = static_cast<char>(random());
    Choices choices(bytes);
    const Store store = MakeStore(choices);
    const int tick = static_cast<int>(random() % kTicks);
    if (i < from) continue;
    if (!Comparison(store, counts).Agrees(tick)) {
      std::printf("store %ld of seed %u\n", i, seed);
      return false;
    }
  }
  std::printf("%ld stores agree: %zu times yes, %zu no, %zu changes to come\n", count, counts.yes,
              counts.no, counts.changes);
  // A run that compares one answer only would agree with anything.
  return counts.yes * 20 > counts.no && counts.changes * 20 > counts.yes;
}

}  // namespace
}  // namespace vesk2test

int main(int argc, char** argv) {
  const long count = argc > 1 ? std::atol(argv[1]) : 500;
  const unsigned seed = argc > 2 ? static_cast<unsigned>(std::atol(argv[2])) : 20261123;
  const long from = argc > 3 ? std::atol(argv[3]) : 0;
  return vesk2test::Run(count, seed, from) ? 0 : 1;
}
