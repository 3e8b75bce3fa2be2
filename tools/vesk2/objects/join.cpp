// SPDX-License-Identifier: Apache-2.0
// join.cpp: putting chains together.
#include "tools/vesk2/objects/join.h"

#include <algorithm>
#include <set>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Subject;

Subject& SubjectOf(const ChainPart& part) { return *part.signedCert.cert->GetSubject(); }

void RequireSignatures(const ChainFile& file) {
  for (size_t i = 0; i < file.parts.size(); ++i) {
    const SignedCert& each = file.parts[i].signedCert;
    const int code = each.signature->Verify(each.cert.get());
    if (code == 0) continue;
    throw FileTrouble(file.path, "certificate " + std::to_string(i + 1) + ": " + Reason(code),
                      ReasonWord(code));
  }
}

void RequireOneKey(const ChainFile& first, const ChainFile& other) {
  Subject& key = SubjectOf(first.parts.front());
  Subject& subject = SubjectOf(other.parts.front());
  if (subject.IsEqual(&key)) return;
  throw Trouble(Escape(other.path) + ": its first certificate is for " + Fingerprint(subject) +
                ", that of " + InputName(first.path) + " for " + Fingerprint(key));
}

}  // namespace

ChainFile ReadChainFile(const std::string& path) {
  ChainFile file{path, {}};
  const CertChain chain = ReadCertChain(path);
  for (const ChainLink& link : ChainLinks(chain, path)) {
    file.parts.push_back(
        {{Ref<ZvVesk2::Cert>::Share(link.cert), Ref<ZvVesk2::Signature>::Share(link.signature)},
         Ref<SExpression>::Share(link.extra)});
  }
  return file;
}

std::vector<ChainPart> JoinChains(std::vector<ChainFile> files) {
  std::vector<ChainPart> joined;
  std::set<std::string> seen;
  for (const ChainFile& file : files) {
    RequireSignatures(file);
    RequireOneKey(files.front(), file);
  }
  const Ref<Subject> key = Ref<Subject>::Share(&SubjectOf(files.front().parts.front()));
  for (ChainFile& file : files) {
    for (ChainPart& part : file.parts) {
      // Issued again, the same certificate has another signature.
      const bool isNew = seen.insert(Canonical(*part.signedCert.cert)).second;
      if (isNew) joined.push_back(std::move(part));
    }
  }
  const auto others = std::stable_partition(
      joined.begin(), joined.end(),
      [&](const ChainPart& part) { return SubjectOf(part).IsEqual(key.get()); });
  std::stable_partition(joined.begin(), others, [](const ChainPart& part) {
    return !part.signedCert.cert->GetPropagate();
  });
  return joined;
}

size_t CountNotPassedOn(const std::vector<ChainPart>& parts) {
  Subject& key = SubjectOf(parts.front());
  return static_cast<size_t>(std::count_if(parts.begin(), parts.end(), [&](const ChainPart& part) {
    return !part.signedCert.cert->GetPropagate() && SubjectOf(part).IsEqual(&key);
  }));
}

void NoteNotPassedOn(size_t count) {
  if (count < 2) return;
  Note(
      "note: without --propagate these certificates do not combine to a manifest's authority: only "
      "the first of several may pass on to the content what it was granted");
}

}  // namespace vesk2_command
