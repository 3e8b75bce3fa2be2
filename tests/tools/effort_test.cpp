// SPDX-License-Identifier: Apache-2.0
// An explanation ends by itself, however long what it explains is made.
#include "tools/vesk2/explain/effort.h"

#include <gtest/gtest.h>

#include "tools/vesk2/explain/hypothesis.h"

namespace vesk2_command {
namespace {

Ref<ZvVesk2::Cert> LongCert() {
  const std::string hash = "(4:hash6:sha25632:" + std::string(32, 'h') + ")";
  const Buffer buffer = WrapBytes("(4:cert(6:issuer" + hash + ")(7:subject" + hash + ")(7:comment" +
                                  "8000:" + std::string(8000, 'c') + "))");
  Ref<ZvVesk2::Cert> cert(new ZvVesk2::Cert(nullptr));
  EXPECT_EQ(cert->Import(buffer.get()), 0);
  return cert;
}

// How often a change is judged before the explanation stops; `most` when it does not.
int Judgements(size_t certs, int most) {
  const Ref<ZvVesk2::Cert> cert = LongCert();
  ZvVesk2::Evidence proved(nullptr);
  for (size_t i = 0; i < certs; ++i) EXPECT_EQ(proved.AddCert(cert.get(), nullptr, 0), 0);
  const Ref<SExpression> entries = ListOf({}, "acl");
  proved.SetEntries(entries.get());
  const Request request = ParseRequest("(a)");
  Question question;
  question.request = &request;
  question.proved = &proved;
  StartAnswer();
  const Evidence evidence = GatherEvidence(question);
  (void)Judge(question, evidence);  // the answer
  StartEffort();
  for (int count = 0; count < most; ++count) {
    try {
      (void)Judge(question, evidence);
    } catch (const Trouble&) {
      return count;
    }
  }
  return most;
}

TEST(Effort, EndsAnExplanationByWhatItCosts) {
  EXPECT_EQ(Judgements(2, 600), 600);
  const int few = Judgements(500, 600);  // 4 MB each
  EXPECT_GT(few, 2);
  EXPECT_LT(few, 20);
}

}  // namespace
}  // namespace vesk2_command
