// SPDX-License-Identifier: Apache-2.0
// Cert: reading an authorization certificate and building one from parts. The class only holds what
// a certificate says. What it is worth is asked by those above it: its signature by Signature, its
// place in a chain by the reduction, its revocation by src/trust.
#include <vesk2/cert.h>

#include "src/objects/build.h"

namespace ZvVesk2 {

Cert::Cert(Vesk2ContextStruct* ctx) : SExpression(ctx) {}

Cert::Cert(std::nullptr_t) : Cert(static_cast<Vesk2ContextStruct*>(nullptr)) {}

Cert::~Cert() = default;

// "(4:cert" ["(7:version1:1)"] "(6:issuer" <principal> ")" "(7:subject" <subject> ")"
//   ["(9:propagate)"] [<tag>]
//   ["(5:valid" ["(10:not-before" <stamp> ")"] ["(9:not-after" <stamp> ")"] ")"]
//   ["(7:comment" <text> ")"] [<revocation element>] ")"
//
// Each element is looked for once, at its place; what does not fit fails at the next required text.
// Certificates that are in use rest on each oddity here: on the tag's keyword, and on the "(1". A
// tag with another keyword is no tag to the reduction, and the certificate then grants whatever is
// asked: issuers look before they sign.
int Cert::Import(ZvBuffer* buffer) {
  VESK2_REQUIRE(buffer != nullptr && First() == nullptr, VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(buffer->Expect("(4:cert"));
  VESK2_TRY(Insert("cert"));
  VESK2_TRY(ImportParties(buffer));
  if (buffer->Accept("(9:propagate)")) VESK2_TRY(AppendPropagate());
  // Any keyword of three characters makes a tag.
  if (buffer->LooksAt("(3:")) VESK2_TRY(ImportElement(buffer, tag));
  if (buffer->Accept("(5:valid")) VESK2_TRY(ImportValidity(buffer));
  if (buffer->Accept("(7:comment")) {
    Ref<ByteString> text;
    VESK2_TRY(ImportNew(text, buffer, GetContext()));
    VESK2_TRY(AppendPair(this, "comment", std::move(text), comment));
    VESK2_TRY(buffer->Expect(")"));
  }
  // Meant for keywords of 10 to 19 characters; "(1" alone decides.
  if (buffer->LooksAt("(1")) VESK2_TRY(ImportElement(buffer, revocationElement));
  return buffer->Expect(")");
}

// Both are required, and in this order: without an issuer nobody could have signed it, without a
// subject nobody is granted anything.
int Cert::ImportParties(ZvBuffer* buffer) {
  if (buffer->Accept("(7:version1:1)")) VESK2_TRY(AppendVersion());
  VESK2_TRY(buffer->Expect("(6:issuer"));
  Ref<Principal> newIssuer;
  VESK2_TRY(Principal::Import(newIssuer.Out(), buffer, GetContext()));
  VESK2_TRY(AppendPair(this, "issuer", std::move(newIssuer), issuer));
  VESK2_TRY(buffer->Expect(")"));

  VESK2_TRY(buffer->Expect("(7:subject"));
  Ref<Subject> newSubject;
  VESK2_TRY(Subject::Import(newSubject.Out(), buffer, GetContext()));
  VESK2_TRY(AppendPair(this, "subject", std::move(newSubject), subject));
  return buffer->Expect(")");
}

// Either bound may be missing, and both. The stamps are read as byte strings and not judged. The
// reduction compares them as text. A wrong one is worth what it compares to, which its signer
// chose.
int Cert::ImportValidity(ZvBuffer* buffer) {
  SExpression* valid = nullptr;
  VESK2_TRY(AppendHead(this, "valid", valid));
  if (buffer->Accept("(10:not-before")) {
    Ref<TimeStamp> stamp;
    VESK2_TRY(ImportNew(stamp, buffer, GetContext()));
    VESK2_TRY(AppendPair(valid, "not-before", std::move(stamp), notBefore));
    VESK2_TRY(buffer->Expect(")"));
  }
  if (buffer->Accept("(9:not-after")) {
    Ref<TimeStamp> stamp;
    VESK2_TRY(ImportNew(stamp, buffer, GetContext()));
    VESK2_TRY(AppendPair(valid, "not-after", std::move(stamp), notAfter));
    VESK2_TRY(buffer->Expect(")"));
  }
  return buffer->Expect(")");
}

// Any list, with what is nested in it; depth and sizes are the reader's to bound.
int Cert::ImportElement(ZvBuffer* buffer, SExpression*& field) {
  Ref<SExpression> element;
  VESK2_TRY(SExpression::Import(element.Out(), buffer, GetContext()));
  return Append(this, std::move(element), field);
}

// Always with a version: what is built here is written in the present form. The order is Import's,
// as what is written must read back.
int Cert::Set(Principal* newIssuer, Subject* newSubject, bool newPropagate, SExpression* newTag,
              TimeStamp* newNotBefore, TimeStamp* newNotAfter, ByteString* newComment,
              SExpression* newRevocationElement) {
  VESK2_REQUIRE(newIssuer != nullptr && newSubject != nullptr && First() == nullptr,
                VESK2_ERR_INVALID_PARAM);
  VESK2_TRY(Insert("cert"));
  VESK2_TRY(AppendVersion());
  VESK2_TRY(AppendPair(this, "issuer", Ref<Principal>::Share(newIssuer), issuer));
  VESK2_TRY(AppendPair(this, "subject", Ref<Subject>::Share(newSubject), subject));
  if (newPropagate) VESK2_TRY(AppendPropagate());
  if (newTag != nullptr) VESK2_TRY(Append(this, Ref<SExpression>::Share(newTag), tag));
  VESK2_TRY(SetValidity(newNotBefore, newNotAfter));
  if (newComment != nullptr) {
    VESK2_TRY(AppendPair(this, "comment", Ref<ByteString>::Share(newComment), comment));
  }
  if (newRevocationElement != nullptr) {
    VESK2_TRY(Append(this, Ref<SExpression>::Share(newRevocationElement), revocationElement));
  }
  return 0;
}

int Cert::SetValidity(TimeStamp* newNotBefore, TimeStamp* newNotAfter) {
  if (newNotBefore == nullptr && newNotAfter == nullptr) return 0;
  SExpression* valid = nullptr;
  VESK2_TRY(AppendHead(this, "valid", valid));
  return AppendBounds(valid, Ref<TimeStamp>::Share(newNotBefore),
                      Ref<TimeStamp>::Share(newNotAfter), notBefore, notAfter);
}

// A clone of a certificate without a version has one, and so another digest: it is for the
// reduction, which asks no signature.
int Cert::Clone(Cert* other) {
  VESK2_REQUIRE(other != nullptr, VESK2_ERR_INVALID_PARAM);
  return Set(other->issuer, other->subject, other->propagate, other->tag, other->notBefore,
             other->notAfter, other->comment, other->revocationElement);
}

// There is one version, whose text was matched.
int Cert::AppendVersion() {
  VESK2_TRY(AppendHead(this, "version", version));
  return version->Insert("1");
}

int Cert::AppendPropagate() {
  SExpression* listed = nullptr;
  VESK2_TRY(AppendHead(this, "propagate", listed));
  propagate = true;
  return 0;
}

SExpression* Cert::GetVersion() const { return version; }
Principal* Cert::GetIssuer() const { return issuer; }
Subject* Cert::GetSubject() const { return subject; }
bool Cert::GetPropagate() const { return propagate; }
SExpression* Cert::GetTag() const { return tag; }
TimeStamp* Cert::GetNotBefore() const { return notBefore; }
TimeStamp* Cert::GetNotAfter() const { return notAfter; }
ByteString* Cert::GetComment() const { return comment; }
SExpression* Cert::GetRevocationElement() const { return revocationElement; }
int32_t Cert::GetRevocationStatus() const { return revocationStatus; }

}  // namespace ZvVesk2
