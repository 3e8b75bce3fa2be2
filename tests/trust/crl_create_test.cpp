// SPDX-License-Identifier: Apache-2.0
// Lists that are built are the ones that are read.
#include "tests/trust/trust_test.h"

using namespace vesk2test;

namespace {

class CrlCreateTest : public TrustTest {};

TEST_F(CrlCreateTest, WritesWhatItsReaderReads) {
  const Ref<Hash> cert = Read<Hash>(HashOf("a certificate"));
  const Ref<Hash> key = Read<Hash>(HashOf("a key", "sha1"));
  const Ref<TimeStamp> date = Stamp(kMiddle);
  const std::string old = CrlText(Item(HashOf("old"), kPast), Item(HashOf("older")));

  Ref<Crl> list;
  ASSERT_EQ(Crl::Create(list.Out(), nullptr), 0);
  EXPECT_EQ(Canonical(list), CrlText("", ""));
  EXPECT_EQ(list->RevokeCertificate(cert.get(), date.get()), 0);
  EXPECT_EQ(list->RevokeKey(key.get(), date.get()), 0);
  EXPECT_EQ(list->RevokeAllOf(Read<Crl>(old).get()), 0);
  const std::string text = CrlText(Item(HashOf("a certificate")) + Item(HashOf("old"), kPast),
                                   Item(HashOf("a key", "sha1")) + Item(HashOf("older")));
  EXPECT_EQ(Canonical(list), text);
  ExpectRead<Crl>(text);

  const std::string sequence = CrlSequenceText(0, Tag("(rev (revoke))"), text);
  const Ref<CrlSequence> read = Read<CrlSequence>(sequence);
  Ref<CrlSequence> made;
  ASSERT_EQ(
      CrlSequence::Create(made.Out(), list.get(), read->GetCert(), read->GetSignature(), nullptr),
      0);
  EXPECT_EQ(Canonical(made), sequence);
  const auto entries = Acls({AclEntryText(KeyText(0), Tag("(rev (revoke))"))});
  EXPECT_EQ(made->VerifySelf(entries.get()), 0);
}

// A list that was changed is nobody's word any more, although it was verified before.
TEST_F(CrlCreateTest, ForgetsItsVoucherWithEveryChange) {
  const Ref<Hash> hash = Read<Hash>(HashOf(KeyText(3)));
  const Ref<TimeStamp> date = Stamp(kMiddle);
  const Ref<Crl> more = Read<Crl>(CrlText("", Item(HashOf(KeyText(3)))));
  const auto entries = Acls({AclEntryText(KeyText(0), Tag("(rev (revoke))"))});
  const std::string text =
      CrlSequenceText(0, Tag("(rev (revoke))"), CrlText("", Item(HashOf("x"))));
  for (int way = 0; way < 3; ++way) {
    const Ref<CrlSequence> list = Read<CrlSequence>(text);
    ASSERT_EQ(list->VerifySelf(entries.get()), 0);
    Crl* const crl = list->GetCrl();
    EXPECT_NE(crl->GetIssuerTag(), nullptr);
    EXPECT_EQ(way == 0   ? crl->RevokeKey(hash.get(), date.get())
              : way == 1 ? crl->RevokeCertificate(hash.get(), date.get())
                         : crl->RevokeAllOf(more.get()),
              0);
    EXPECT_EQ(crl->GetIssuerTag(), nullptr);
    EXPECT_EQ(list->VerifySelf(entries.get()), VESK2_ERR_SIGNATURE);
  }
}

TEST_F(CrlCreateTest, RefusesWhatIsNotThere) {
  Ref<Crl> list;
  ASSERT_EQ(Crl::Create(list.Out(), nullptr), 0);
  Crl* taken = list.get();
  EXPECT_EQ(Crl::Create(taken, nullptr), kInvalid);
  const Ref<Hash> empty(new Hash(nullptr));
  const Ref<Hash> hash = Read<Hash>(HashOf("x"));
  const Ref<TimeStamp> date = Stamp(kMiddle);
  EXPECT_EQ(list->RevokeKey(nullptr, date.get()), kInvalid);
  EXPECT_EQ(list->RevokeKey(hash.get(), nullptr), kInvalid);
  EXPECT_EQ(list->RevokeKey(empty.get(), date.get()), kInvalid);
  EXPECT_EQ(list->RevokeAllOf(nullptr), kInvalid);
  EXPECT_EQ(list->RevokeAllOf(list.get()), kInvalid);
  const Ref<Crl> blank(new Crl(nullptr));
  EXPECT_EQ(blank->RevokeCertificate(hash.get(), date.get()), kInvalid);
  EXPECT_EQ(list->RevokeAllOf(blank.get()), kInvalid);
  Ref<CrlSequence> made;
  EXPECT_EQ(CrlSequence::Create(made.Out(), list.get(), nullptr, nullptr, nullptr), kInvalid);
  EXPECT_EQ(made.get(), nullptr);
}

}  // namespace
