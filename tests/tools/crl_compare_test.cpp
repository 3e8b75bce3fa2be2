// SPDX-License-Identifier: Apache-2.0
// What a list lets go of another one: too little said here un-revokes in silence.
#include "tools/vesk2/stores/crl_compare.h"

#include <gtest/gtest.h>

#include <sstream>

#include "tools/vesk2/objects/objects.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Crl;

// Items by letters, each the digest of 32 times that byte: "a2020" is a certificate revoked since
// then, "a?" one with a date that says nothing, "A" a key.
Ref<Crl> MakeList(const std::string& words, ZvclmHashID id = ZVCLM_HASH_SHA256) {
  Ref<Crl> list;
  EXPECT_EQ(Crl::Create(list.Out(), nullptr), 0);
  std::istringstream text(words);
  for (std::string word; text >> word;) {
    const bool isKey = word[0] >= 'A' && word[0] <= 'Z';
    const std::string digest(id == ZVCLM_HASH_SHA1 ? 20 : 32, word[0] == '0' ? '\0' : word[0]);
    const std::string date = isKey                 ? "2020-01-01_00:00:00"
                             : word.ends_with('?') ? "2020-01-01 00:00:00"
                                                   : word.substr(1) + "-01-01_00:00:00";
    const Ref<ZvVesk2::TimeStamp> from(new ZvVesk2::TimeStamp(nullptr));
    EXPECT_EQ(from->ByteString::Set(date.c_str(), ByteString::BsNone), 0);
    const Ref<ZvVesk2::Hash> named = MakeHash(id, digest);
    EXPECT_EQ(isKey ? list->RevokeKey(named.get(), from.get())
                    : list->RevokeCertificate(named.get(), from.get()),
              0);
  }
  return list;
}

std::string LetGo(const Ref<Crl>& before, const Ref<Crl>& after) {
  std::string text;
  for (const Revoked& item : WhatIsLetGo(*before, *after)) {
    text += (text.empty() ? "" : " ") +
            std::string(BytesOf(*item.named->GetDigest()).substr(0, 1)) +
            (item.isKey || item.since.empty() ? "" : item.since.substr(0, 4));
  }
  return text;
}

TEST(CrlCompare, NamesWhatIsLetGo) {
  const struct {
    const char* before;
    const char* after;
    const char* gone;
  } rows[] = {
      {"a2020 A", "a2020 A", ""},
      {"a2020 b2021 A B", "b2021 B c2020", "a2020 A"},
      {"a2020 A", "", "a2020 A"},
      {"", "a2020 A", ""},
      {"a2020", "A", "a2020"},             // a key is not a certificate
      {"a2020", "a2019", ""},              // revoked for longer
      {"a2020", "a2021", "a2020"},         // revoked for less long
      {"a2020", "a2021 a2020 a2022", ""},  // the earliest counts
      {"a2020", "a?", ""},                 // a date that says nothing counts from ever on
      {"a?", "a2020", "a"},
      {"a2020 a2018", "a2019", "a2018"},
      {"02020", "", ""},  // zeros name nothing
  };
  for (const auto& row : rows) {
    EXPECT_EQ(LetGo(MakeList(row.before), MakeList(row.after)), row.gone)
        << row.before << " -> " << row.after;
  }
  EXPECT_EQ(LetGo(MakeList("A", ZVCLM_HASH_SHA1), MakeList("A")), "A");
}

}  // namespace
}  // namespace vesk2_command
