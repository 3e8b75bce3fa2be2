// SPDX-License-Identifier: Apache-2.0
// CertSequence: whether a chain proves that a subject holds a tag. The first failure is the answer.
//
// Each stage works on an Evidence, which judges; the stages load into it what they need, afresh.
// Stages are exported one by one, so each loads the stores itself: what a caller did in between to
// the stores counts, as it always has. The signatures come first, so that nobody is told of
// revocation or grants about a text that was never signed.
#include <vesk2/cert_sequence.h>
#include <vesk2/crl.h>
#include <vesk2/evidence.h>

#include "src/platform/wait.h"
#include "src/trust/chain.h"
#include "src/trust/lists.h"

namespace ZvVesk2 {
namespace {

// Takes the certificates of a sequence. With `verify`, their signatures are verified: up to the
// first failure, or all of them for `wholly`. Each signature costs an exponentiation with numbers
// that the chain brings (bounded: limits.h), so that a chain's verification is linear in its
// certificates. After a failure only an explanation wants the rest.
[[nodiscard]] int TakeCerts(const CertSequence& sequence, Evidence& evidence, bool verify,
                            bool wholly) {
  auto at = FirstItem(&sequence);
  VESK2_REQUIRE(at, VESK2_ERR_INVALID_SEQUENCE);
  int failure = 0;
  while (at) {
    ChainLink link;
    // An answer that a signature gave first stays the answer, also when the chain turns out to be
    // cut off behind it.
    const int whole = ReadWholeLink(link, at);
    VESK2_REQUIRE(whole == 0, failure != 0 ? failure : whole);
    const int code = verify ? link.signature->Verify(link.cert) : 0;
    // That there was no memory says nothing about the signature.
    VESK2_REQUIRE(!LacksMemory(code), code);
    VESK2_TRY(evidence.AddCert(link.cert, link.signature, code));
    if (failure == 0) failure = code;
    if (failure != 0 && !wholly) return failure;
  }
  return failure;
}

// The roots of this moment.
[[nodiscard]] int LoadEntries(Evidence& evidence, Vesk2ContextStruct* ctx) {
  Ref<SExpression> acls;
  VESK2_TRY(LoadRoots(acls, ctx));
  evidence.SetEntries(acls.get());
  return 0;
}

// Which lists there are, the roots say: a list of a source that no entry names is not even opened.
[[nodiscard]] int LoadLists(Evidence& evidence, Vesk2ContextStruct* ctx) {
  VESK2_TRY(LoadEntries(evidence, ctx));
  Ref<SExpression> lists;
  VESK2_TRY(CrlSequence::ImportStore(lists.Out(), evidence.GetEntries(), ctx));
  evidence.SetLists(lists.get(), nullptr);
  return 0;
}

[[nodiscard]] int AskStores(Evidence& evidence, Vesk2ContextStruct* ctx) {
  VESK2_TRY(LoadLists(evidence, ctx));
  return evidence.MarkRevoked();
}

}  // namespace

// The form for files that callers hold by name. The wait for files that others hold is one for all
// of it (ZvCall).
int CertSequence::Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                         TimeStamp* notAfter, const char* name, bool usePath,
                         Vesk2ContextStruct* ctx) {
  VESK2_REQUIRE(name != nullptr, VESK2_ERR_PARAM_NULL);
  const ZVsysutil::ZvCall call;
  Ref<CertSequence> sequence;
  VESK2_TRY(Import(sequence.Out(), name, usePath, ctx));
  return sequence->Verify(subject, tag, notBefore, notAfter);
}

int CertSequence::Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                         TimeStamp* notAfter) {
  const ZVsysutil::ZvCall call;
  VESK2_TRY(VerifySignatures());
  VESK2_TRY(VerifyRevocations(notBefore, notAfter));
  return VerifyChain(subject, tag, notBefore, notAfter);
}

int CertSequence::Verify(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                         TimeStamp* notAfter, Evidence& evidence) {
  const ZVsysutil::ZvCall call;
  evidence.Clear(Evidence::Chain);
  evidence.SetSubject(subject);
  evidence.SetPeriod(notBefore, notAfter);
  // All of it is taken before an answer is given: an explanation tells of every signature, also of
  // a chain whose first one fails.
  const int signatures = TakeCerts(*this, evidence, true, true);
  VESK2_REQUIRE(!LacksMemory(signatures), signatures);
  const int stores = AskStores(evidence, GetContext());
  VESK2_REQUIRE(!LacksMemory(stores), stores);
  // What the stores say was asked for the evidence only when a signature does not hold.
  VESK2_TRY(signatures);
  VESK2_TRY(stores);
  VESK2_TRY(evidence.CheckRevoked());
  // Read again, as the stage of that name does: both verifications must answer alike when the store
  // changes in between.
  VESK2_TRY(LoadEntries(evidence, GetContext()));
  return evidence.Prove(tag);
}

int CertSequence::VerifySignatures() {
  Evidence evidence(GetContext());
  return TakeCerts(*this, evidence, true, false);
}

// Also of certificates that nothing vouches for yet: this stage alone grants nothing.
int CertSequence::VerifyRevocations(TimeStamp* notBefore, TimeStamp* notAfter) {
  const ZVsysutil::ZvCall call;
  Evidence evidence(GetContext());
  VESK2_TRY(TakeCerts(*this, evidence, false, false));
  evidence.SetPeriod(notBefore, notAfter);
  VESK2_TRY(AskStores(evidence, GetContext()));
  return evidence.CheckRevoked();
}

// The reduction alone. It believes that signatures were checked and knows of no revocation.
int CertSequence::VerifyChain(Subject* subject, SExpression* tag, TimeStamp* notBefore,
                              TimeStamp* notAfter) {
  Evidence evidence(GetContext());
  VESK2_TRY(TakeCerts(*this, evidence, false, false));
  evidence.SetSubject(subject);
  evidence.SetPeriod(notBefore, notAfter);
  VESK2_TRY(LoadEntries(evidence, GetContext()));
  return evidence.Reduce(tag);
}

}  // namespace ZvVesk2
