// SPDX-License-Identifier: Apache-2.0
// self_check.cpp: looking at one's own work.
#include "tools/vesk2/verify/self_check.h"

#include <algorithm>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_source.h"
#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/objects/request.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/verify.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;

// Whether a tag lies within another: of a set, each member. What cannot be taken apart gives no
// warning.
bool IsWithin(SExpression& asked, SExpression* granted) {
  if (granted == nullptr || asked.IsSubset(granted)) return true;
  const std::string text = ReadableTag(&asked);
  if (text.empty()) return true;
  Request request;
  try {
    request = ParseRequest(text);
  } catch (const Trouble&) {
    return true;
  }
  return std::all_of(request.members.begin(), request.members.end(),
                     [&](const Request::Member& each) { return each.tag->IsSubset(granted); });
}

// Whether an entry for a certificate's issuer grants its subject anything at all.
bool GrantsAnything(SExpression* tag, const SignedCert& signedCert) {
  Cert& cert = *signedCert.cert;
  const Ref<AclEntry> entry = BuildEntry(
      {Ref<ZvVesk2::Subject>::Share(cert.GetIssuer()), true, Ref<SExpression>::Share(tag)});
  Ref<SExpression> granted;
  Ref<SExpression> notBefore;
  Ref<SExpression> notAfter;
  const int code = ZvVesk2::Verify::ReductB(nullptr, ListOf({entry.get()}, "acl").get(),
                                            ListOf({&cert}, "sequence").get(), cert.GetSubject(),
                                            granted.Out(), notBefore.Out(), notAfter.Out());
  return code != 0 || granted;
}

// Whether a key signs something of the chain, or below it; subjects that are no keys may.
bool Leads(const SelfCheck::Chain& chain, size_t index) {
  auto* key = dynamic_cast<PublicKey*>(chain.certs[index].cert->GetSubject());
  if (key == nullptr || chain.signers.empty()) return true;
  const auto signs = [&](const Ref<PublicKey>& signer) { return signer->IsEqual(key); };
  const auto issues = [&](const SignedCert& each) {
    return &each != &chain.certs[index] && each.cert->GetIssuer()->IsEqual(key);
  };
  return std::any_of(chain.signers.begin(), chain.signers.end(), signs) ||
         std::any_of(chain.certs.begin(), chain.certs.end(), issues);
}

// Whether a certificate is for the same content as a manifest's first.
bool ApprovesContent(const SelfCheck::Chain& chain, size_t index) {
  ZvVesk2::Subject& content = *chain.certs[0].cert->GetSubject();
  return content.IsHash() && chain.certs[index].cert->GetSubject()->IsEqual(&content);
}

}  // namespace

void AddStrictFlag(OptionList& list, bool& strict) {
  list.Add("--strict", strict, "Write nothing that this command warns of");
}

SelfCheck::SelfCheck() : now_(ParseTime("now", false)) {}

void SelfCheck::End(const std::string& what, const TimeStamp* notAfter) {
  if (notAfter == nullptr || !notAfter->IsBefore(now_.get())) return;
  Add(what + " ended at " + StampText(*notAfter));
}

void SelfCheck::CheckPeriod(const std::string& name, const Cert& cert, const TimeStamp* at) {
  const TimeStamp* const end = cert.GetNotAfter();
  const TimeStamp* const begin = cert.GetNotBefore();
  if (end != nullptr && at != nullptr && end->IsBefore(at)) {
    return Add(name + " ended at " + StampText(*end));
  }
  End(name, end);
  if (begin == nullptr || !begin->IsAfter(at != nullptr ? at : now_.get())) return;
  Add(name + " begins only at " + StampText(*begin));
}

void SelfCheck::CheckChain(const Chain& chain) {
  for (size_t i = 0; i < chain.certs.size(); ++i) {
    const SignedCert& each = chain.certs[i];
    Cert& cert = *each.cert;
    const std::string name =
        "certificate " + std::to_string(i + 1) + " of " + InputName(chain.path);
    const int code = each.signature->Verify(&cert);
    if (code != 0) Add(name + ": " + Reason(code));
    CheckPeriod(name, cert, chain.at);
    if (chain.tag != nullptr && !IsWithin(*chain.tag, cert.GetTag())) {
      Add(name + " grants " + TagText(cert.GetTag()) + ", which does not hold " +
          TagText(chain.tag));
    }
    if (!Leads(chain, i)) {
      Add(name + " is for " + SubjectText(*cert.GetSubject()) +
          ", which signs nothing of this chain");
    } else if (i >= chain.passing && !cert.GetPropagate() && !ApprovesContent(chain, i)) {
      Add(name + " does not let its subject pass it on (no --propagate)");
    }
  }
}

void SelfCheck::Tell(bool strict) const {
  for (const std::string& warning : warnings_) Note("warning: " + warning);
  if (!strict || warnings_.empty()) return;
  throw Trouble(
      "warnings: " + std::to_string(warnings_.size()) + "; nothing was written (--strict)",
      "self-check");
}

void CheckGrant(AclEntry& entry, const std::string& place, bool issuer, bool strict) {
  SelfCheck check;
  check.End("the grant", entry.GetNotAfter());
  if (!place.empty()) {
    const Place at = ParsePlace(place);
    SelfCheck::Chain chain{at.path, ReadCerts(at.path)};
    const bool isManifest = chain.certs[0].cert->GetSubject()->IsHash();
    const size_t number = at.number != 0 ? at.number : issuer ? chain.certs.size() : 1;
    chain.certs.resize(std::min(chain.certs.size(), issuer ? number : number - 1));
    chain.passing = isManifest ? 2 : 1;
    check.CheckChain(chain);
    for (size_t i = 0; i < chain.certs.size(); ++i) {
      if (GrantsAnything(entry.GetTag(), chain.certs[i])) continue;
      check.Add("certificate " + std::to_string(i + 1) + " of " + InputName(at.path) + " grants " +
                TagText(chain.certs[i].cert->GetTag()) + ", nothing of " + TagText(entry.GetTag()));
    }
  }
  check.Tell(strict);
}

}  // namespace vesk2_command
