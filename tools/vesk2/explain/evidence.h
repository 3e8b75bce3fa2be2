// SPDX-License-Identifier: Apache-2.0
// evidence.h: what an answer about authority rests on, as the verification kept it: the
// certificates, the ACL entries and the revocation lists. Nothing is read again.
#ifndef VESK2_TOOLS_EVIDENCE_H
#define VESK2_TOOLS_EVIDENCE_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/cert_chain.h"
#include "tools/vesk2/objects/request.h"
#include "tools/vesk2/objects/times.h"

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>
#include <vesk2/evidence.h>

namespace vesk2_command {

// What was asked, of which file.
struct Question {
  std::string file;
  bool manifest = false;             // else a chain
  const Request* request = nullptr;  // null: none, as when a manifest is only shown
  Period period = {};                // none, about a manifest: the time of signing
  std::string aclDirectory;          // entries beside the store's, or empty
  // How to sign the manifest again: its directory, and options for what was left out of it.
  std::vector<std::string> signing = {};
  // What the verification that answered kept.
  const ZvVesk2::Evidence* proved = nullptr;
};

struct CertEvidence {
  Ref<ZvVesk2::Cert> cert;
  Ref<ZvVesk2::Signature> signature;
  int code = 0;             // what the signature is worth
  Ref<SExpression> source;  // the tag of the lists to ask; null when there is none
};

struct EntryEvidence {
  Ref<ZvVesk2::AclEntry> entry;
  std::string file;  // its name in the store, or its path
  bool inStore = false;
  bool relevant = false;  // it names a key of the chain
};

struct Evidence {
  const ZvVesk2::Evidence* proved = nullptr;
  std::vector<CertEvidence> certs;     // the end of the chain first
  std::vector<EntryEvidence> entries;  // as the library loads them
  std::vector<std::string> carried;    // the canonical text of a manifest's lists
  Ref<TimeStamp> signedAt;             // of a manifest
  bool contentSigned = true;           // a manifest's signer names the content that is there
  // The period asked about; null where it is open.
  TimeStamp* first = nullptr;
  TimeStamp* last = nullptr;

  // The moment about which revocation was asked.
  TimeStamp* RevocationStart() const { return proved->GetRevocationFirst(); }
};
// GatherEvidence takes apart what was proved for a question.
Evidence GatherEvidence(const Question& question);

// What was read for the answer, as notes that only --verbose asks for.
void DetailEvidence(const Question& question);

// "certificate N (issuer FINGERPRINT)".
std::string CertName(const Evidence& evidence, size_t index);
std::string EntryName(const EntryEvidence& entry);
// Whether a subject is a key, names it by its digest or counts it among its k-of-n.
bool Names(ZvVesk2::Subject* subject, DExpression* key);
// The last entry of exactly that tag, which decides whose lists count; null without one.
const EntryEvidence* Voucher(const Evidence& evidence, SExpression* source);
// Fresh copies of the lists, the stored ones first, then a manifest's own: which of them count is
// for the entries to say (CrlSequence::VerifySelf).
Ref<SExpression> LoadLists(const Evidence& evidence);
// (acl ENTRY...) of the evidence.
Ref<SExpression> AllEntries(const Evidence& evidence);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EVIDENCE_H
