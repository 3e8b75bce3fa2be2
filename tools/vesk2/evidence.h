// evidence.h: what an answer about authority rests on, read again by the library's public
// interface: the certificates, the ACL entries and the revocation lists.
#ifndef VESK2_TOOLS_EVIDENCE_H
#define VESK2_TOOLS_EVIDENCE_H

#include <optional>
#include <string>
#include <vector>

#include "tools/vesk2/issue.h"
#include "tools/vesk2/request.h"

#include <vesk2/acl_entry.h>
#include <vesk2/crl.h>

namespace vesk2_command {

// What was asked, of which file.
struct Question {
  std::string file;
  bool manifest = false;  // else a chain
  const Request* request = nullptr;
  Period period = {};        // none, about a manifest: the time of signing
  std::string aclDirectory;  // entries beside the store's, or empty
  // How to sign the manifest again: its directory, and options for what was left out of it.
  std::vector<std::string> signing = {};
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
};

struct Evidence {
  std::vector<CertEvidence> certs;     // the end of the chain first
  std::vector<EntryEvidence> entries;  // as the library loads them
  std::vector<std::string> carried;    // the canonical text of a manifest's lists
  Ref<TimeStamp> signedAt;             // of a manifest
  bool contentSigned = true;           // a manifest's signer names the content that is there
  std::string damage;                  // where a manifest's listing stops making sense
  // The period asked about; null where it is open. Revocation is asked about the same, but the time
  // of signing stands in for an open end of a manifest's.
  TimeStamp* first = nullptr;
  TimeStamp* last = nullptr;

  TimeStamp* RevocationStart() const { return first != nullptr ? first : signedAt.get(); }
  TimeStamp* RevocationEnd() const { return last != nullptr ? last : signedAt.get(); }
};
// GatherEvidence reads what there is; no store means no entries.
Evidence GatherEvidence(const Question& question);

// Whether a subject is a key, names it by its digest or counts it among its k-of-n.
bool Names(ZvVesk2::Subject* subject, DExpression* key);
// The tag of the lists that a certificate's revocation element names; null without one.
Ref<SExpression> RevocationSource(const ZvVesk2::Cert& cert);
// The last entry of exactly that tag, which decides whose lists count; null without one.
const EntryEvidence* Voucher(const Evidence& evidence, SExpression* source);
// The lists that count with these entries: the stored ones, then a manifest's own.
Ref<SExpression> LoadLists(const Evidence& evidence, SExpression* entries);
// (acl ENTRY...) of the evidence.
Ref<SExpression> EntryList(const std::vector<ZvVesk2::AclEntry*>& entries);
std::vector<ZvVesk2::AclEntry*> AllEntries(const Evidence& evidence);

// Adds a reference of the list's own.
void InsertShared(SExpression& list, DExpression* item);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EVIDENCE_H
