// SPDX-License-Identifier: Apache-2.0
// crl_file.cpp: revocation lists in files.
#include "tools/vesk2/objects/crl_file.h"

#include "tools/vesk2/objects/acl_file.h"
#include "tools/vesk2/objects/texts.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;

bool IsRevocationTag(const SExpression* tag) {
  const auto* last = tag != nullptr ? dynamic_cast<SExpression*>(tag->Last()) : nullptr;
  const auto* word = last != nullptr ? dynamic_cast<ByteString*>(last->First()) : nullptr;
  return word != nullptr && word->IsEqual("revoke");
}

Ref<SExpression> ParseRevocationTag(const std::string& text, const char* keyword) {
  Ref<SExpression> tag = ParseTag(text, keyword);
  if (!IsRevocationTag(tag.get())) {
    throw Trouble("revocation tag \"" + Escape(text) + "\": must end in (revoke ...)");
  }
  return tag;
}

Ref<CrlSequence> ReadCrl(const std::string& path) {
  const Buffer buffer = OpenBuffer(path);
  Ref<CrlSequence> list(new CrlSequence(nullptr));
  int code = list->Import(buffer.get());
  if (code == 0 && buffer->Remaining() != 0) code = VESK2_ERR_PARSE_FILE;
  if (code != 0) Malformed(path, buffer->Position(), "revocation list", code);
  return list;
}

int CheckIssuerWord(CrlSequence& list) {
  const Cert& cert = *list.GetCert();
  if (cert.GetTag() == nullptr) return VESK2_ERR_AUTH_TAG_MISSING;
  // A trust root made for the occasion: the issuer, for this tag.
  const Ref<AclEntry> entry = BuildEntry({Ref<ZvVesk2::Subject>::Share(cert.GetIssuer()), false,
                                          Ref<SExpression>::Share(cert.GetTag())});
  return list.VerifySelf(ListOf({entry.get()}, "acl").get());
}

std::string WhyNotVouched(CrlSequence& list, int code) {
  if (code != VESK2_ERR_ACL_ENTRY_NOT_FOUND) return CodeWords(code);
  const Cert& cert = *list.GetCert();
  return "no ACL entry of exactly the tag " + TagText(cert.GetTag()) + " is for its issuer " +
         SubjectText(*cert.GetIssuer());
}

std::string CrlText(CrlSequence& list) {
  const Cert& cert = *list.GetCert();
  return TagText(cert.GetTag()) + " by " + SubjectText(*cert.GetIssuer()) + ", " +
         PeriodText(cert.GetNotBefore(), cert.GetNotAfter());
}

}  // namespace vesk2_command
