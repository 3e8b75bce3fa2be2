// SPDX-License-Identifier: Apache-2.0
// today.cpp: judging a manifest by what is revoked now.
#include "tools/vesk2/verify/today.h"

#include "tools/vesk2/say/report.h"

namespace vesk2_command {

using ZvVesk2::Cert;

Today::Today(const ZvVesk2::Evidence& proved, TimeStamp& now) : proved_(proved), today_(nullptr) {
  Check(today_.Copy(proved), "judging revocation");
  today_.SetRevocationTime(&now);
  if (today_.GetEntries() != nullptr) Check(today_.MarkRevoked(), "judging revocation");
}

int Today::Judge(SExpression* tag) const {
  ZvVesk2::Evidence judged(nullptr);
  Check(judged.Copy(today_), "judging revocation");
  const int code = judged.Judge(tag);
  if (code == VESK2_ERR_MEM_ALLOC) Check(code, "judging revocation");
  return code;
}

ExitCode Today::Refuse(const Question& question, int code) const {
  const Evidence evidence = GatherEvidence(question);
  const std::string signedAt = StampText(*proved_.GetSigningTime());
  std::string unknown;
  for (size_t i = 0; i < today_.CountCerts(); ++i) {
    const int32_t status = today_.GetRevocationStatus(i);
    if (status == Cert::NotRevoked || proved_.GetRevocationStatus(i) != Cert::NotRevoked) continue;
    if (status != Cert::Undetermined) {
      const bool key = status == Cert::KeyRevoked;
      const TimeStamp* since = today_.GetRevokedSince(i);
      return No(VESK2_ERR_CERT_REVOKED,
                CertName(evidence, i) + (key ? ", its key," : "") + " is revoked" +
                    (since != nullptr ? " since " + StampText(*since) : "") +
                    "; the manifest says it was signed at " + signedAt);
    }
    const CrlSequence* list = today_.GetRevocationList(i);
    if (!unknown.empty() || list == nullptr) continue;
    unknown = "revocation unknown since " + StampText(*list->GetCert()->GetNotAfter()) +
              ": then ended the list that tells of " + CertName(evidence, i);
  }
  if (unknown.empty()) return No(code, CodeWords(code));
  const ExitCode verdict = No(VESK2_ERR_CRL_NOT_FOUND, unknown);
  Note("to accept what was known at the time of signing: --at signing");
  return verdict;
}

bool IsSignedInFuture(const ZvVesk2::Evidence& proved, const TimeStamp& now) {
  const TimeStamp* signedAt = proved.GetSigningTime();
  const Ref<TimeStamp> latest(new TimeStamp(nullptr));
  Check(latest->Set(now.ToTime() + kClockDifference), "the clock");
  return signedAt != nullptr && signedAt->IsAfter(latest.get());
}

std::string EndedSince(const ZvVesk2::Evidence& proved, const TimeStamp& now) {
  std::string text;
  for (size_t i = 0; i < proved.CountCerts(); ++i) {
    const TimeStamp* end = proved.GetCert(i)->GetNotAfter();
    if (end == nullptr || !end->IsBefore(&now)) continue;
    text += "; certificate " + std::to_string(i + 1) + " ended at " + StampText(*end);
  }
  return text;
}

}  // namespace vesk2_command
