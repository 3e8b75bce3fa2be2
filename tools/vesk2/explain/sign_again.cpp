// SPDX-License-Identifier: Apache-2.0
// sign_again.cpp: a manifest signed anew.
#include "tools/vesk2/explain/sign_again.h"

#include "tools/vesk2/explain/edits.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;

// The certificates that the signer's chain would have, its own first: not the approvals of what is
// not signed any more. Empty when one of them is not worth carrying.
std::vector<Cert*> CarriedChain(const Evidence& evidence) {
  std::vector<Cert*> chain;
  for (size_t i = 1; i < evidence.certs.size(); ++i) {
    if (evidence.certs[i].code != 0) return {};
    if (evidence.certs[i].cert->GetSubject()->IsEqual(evidence.certs[0].cert->GetSubject()))
      continue;
    chain.push_back(evidence.certs[i].cert.get());
  }
  const Cert& content = *evidence.certs[0].cert;
  if (!chain.empty() && !chain[0]->GetSubject()->IsEqual(content.GetIssuer())) return {};
  return chain;
}

// Who approved the old content beside its signer.
std::vector<Ref<PublicKey>> Approvers(const Evidence& evidence) {
  std::vector<Ref<PublicKey>> approvers;
  for (size_t i = 1; i < evidence.certs.size(); ++i) {
    Cert& cert = *evidence.certs[i].cert;
    auto* key = dynamic_cast<PublicKey*>(cert.GetIssuer());
    if (key == nullptr || !cert.GetSubject()->IsEqual(evidence.certs[0].cert->GetSubject()))
      continue;
    approvers.push_back(Ref<PublicKey>::Share(key));
  }
  return approvers;
}

// The first certificate of the new manifest, as far as authority goes.
Ref<Cert> ForContent(const Cert& old, PublicKey& signer) {
  Ref<Cert> cert(new Cert(nullptr));
  Check(
      cert->Set(&signer, old.GetSubject(), false, old.GetTag(), nullptr, nullptr, nullptr, nullptr),
      "building a certificate");
  return cert;
}

}  // namespace

std::vector<Remedy> SignAgain(const Question& question, const Evidence& evidence) {
  if (evidence.certs.empty() || question.signing.empty()) return {};
  const Cert& old = *evidence.certs[0].cert;
  auto* signer = dynamic_cast<PublicKey*>(old.GetIssuer());
  const std::vector<Cert*> chain = CarriedChain(evidence);
  const std::string tag = IssuableTag(old.GetTag());
  if (signer == nullptr || !old.GetSubject()->IsHash() || chain.empty()) return {};
  if (old.GetTag() != nullptr && tag.empty()) return {};
  const Policy policy(question, evidence);
  if (policy.IsRevoked(signer)) return {};
  const std::vector<Ref<PublicKey>> approvers = Approvers(evidence);

  const Ref<Cert> content = ForContent(old, *signer);
  const Ref<TimeStamp> now = ParseTime("now", false);
  Hypothesis again;
  again.signedAgain = {content.get()};
  again.signedAgain.insert(again.signedAgain.end(), chain.begin(), chain.end());
  again.at = now.get();
  for (const auto& key : approvers) {
    if (policy.IsRevoked(key.get())) return {};
    again.approvers.push_back(key.get());
  }
  if (Judge(question, evidence, again) != 0) return {};

  Remedy remedy{"sign-again", "if the change is meant, have " + Fingerprint(*signer) +
                                  " sign the manifest again"};
  if (!evidence.carried.empty()) remedy.text += ", with the lists that it carries (--crl)";
  const std::string file = PathWord(question.file);
  std::vector<std::string> command = {"vesk2", "manifest", "sign"};
  command.insert(command.end(), question.signing.begin(), question.signing.end());
  command[3] = PathWord(command[3]);
  command.insert(command.end(), {"--key", KeyWord(*signer), "--cert", file});
  if (!tag.empty()) {
    command.insert(command.end(), {"--tag", tag});
    remedy.foreign.push_back(tag);
  }
  command.insert(command.end(), {"-o", file, "--force"});
  remedy.commands = {command};
  remedy.keys = {Fingerprint(*signer)};
  for (const auto& key : approvers) {
    remedy.text += remedy.keys.size() == 1 ? ", to be approved by " : ", ";
    remedy.keys.push_back(Fingerprint(*key));
    remedy.text += remedy.keys.back();
    remedy.commands.push_back({"vesk2", "manifest", "approve", file, "--key", KeyWord(*key)});
  }
  NoteName(remedy, question.file);
  return {remedy};
}

}  // namespace vesk2_command
