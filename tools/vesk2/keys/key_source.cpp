// SPDX-License-Identifier: Apache-2.0
// key_source.cpp: public keys named by where they stand.
#include "tools/vesk2/keys/key_source.h"

#include <algorithm>
#include <vector>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/crl_file.h"
#include "tools/vesk2/objects/manifest_file.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Cert;

SignedCert Share(Cert* cert, ZvVesk2::Signature* signature) {
  return {Ref<Cert>::Share(cert), Ref<ZvVesk2::Signature>::Share(signature)};
}

}  // namespace

std::vector<SignedCert> ReadCerts(const std::string& path) {
  const Buffer buffer = OpenBuffer(path);
  std::vector<SignedCert> certs;
  if (buffer->LooksAt("(8:manifest")) {
    certs = ReadSignatureBlock(path).certs;
  } else if (buffer->LooksAt("(8:sequence(3:crl")) {
    const Ref<CrlSequence> list = ReadCrl(path);
    certs.push_back(Share(list->GetCert(), list->GetSignature()));
  } else {
    const CertChain chain = ReadCertChain(path);
    for (const ChainLink& link : ChainLinks(chain, path)) {
      certs.push_back(Share(link.cert, link.signature));
    }
  }
  if (certs.empty()) throw Trouble(InputName(path) + ": holds no certificate");
  return certs;
}

void RequireCert(const std::vector<SignedCert>& certs, size_t number, const std::string& path) {
  if (number >= 1 && number <= certs.size()) return;
  throw Trouble(InputName(path) + ": holds " + Plural(certs.size(), "certificate") +
                ", no number " + std::to_string(number));
}

Place ParsePlace(const std::string& argument) {
  const size_t colon = argument.rfind(':');
  const std::string digits = colon != std::string::npos ? argument.substr(colon + 1) : "";
  const bool numbered =
      !digits.empty() && digits.size() < 6 &&
      std::all_of(digits.begin(), digits.end(), [](char c) { return c >= '0' && c <= '9'; });
  if (!numbered) return {argument};
  const size_t number = std::stoul(digits);
  if (number == 0) throw Trouble(Escape(argument) + ": certificates are counted from 1");
  return {argument.substr(0, colon), number};
}

Ref<PublicKey> ReadKeyOf(const std::string& argument, bool issuer) {
  const Place place = ParsePlace(argument);
  const std::vector<SignedCert> certs = ReadCerts(place.path);
  // The first certificate of a manifest is the signer's, for its content.
  const bool signer =
      !issuer && place.number == 0 && OpenBuffer(place.path)->LooksAt("(8:manifest");
  if (signer) issuer = true;
  const size_t number = signer || (!issuer && place.number == 0) ? 1
                        : place.number != 0                      ? place.number
                                                                 : certs.size();
  RequireCert(certs, number, place.path);
  const Cert& cert = *certs[number - 1].cert;
  auto* key = dynamic_cast<PublicKey*>(issuer ? cert.GetIssuer() : cert.GetSubject());
  if (key != nullptr) return Ref<PublicKey>::Share(key);
  throw Trouble(InputName(place.path) + ": the " + (issuer ? "issuer" : "subject") +
                " of certificate " + std::to_string(number) + " is not a key");
}

}  // namespace vesk2_command
