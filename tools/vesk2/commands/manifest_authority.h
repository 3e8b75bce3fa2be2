// SPDX-License-Identifier: Apache-2.0
// manifest_authority.h: whether a manifest's signer was authorized, as every command asks it that
// acts on the answer: the library's verdict, every member of what is asked, what is revoked by now,
// the clock, the floor.
#ifndef VESK2_TOOLS_MANIFEST_AUTHORITY_H
#define VESK2_TOOLS_MANIFEST_AUTHORITY_H

#include <functional>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "tools/vesk2/authority/supposition.h"
#include "tools/vesk2/explain/evidence.h"
#include "tools/vesk2/options/options.h"
#include "tools/vesk2/say/report.h"
#include "tools/vesk2/verify/keep_floor.h"
#include "tools/vesk2/verify/store_check.h"
#include "tools/vesk2/verify/today.h"

#include <vesk2/manifest.h>

namespace vesk2_command {

struct AuthorityOptions {
  std::string manifest;
  std::string tag;
  PeriodOptions period;
  std::string at;
  bool noStoreUpdate = false;
  std::string aclDirectory;
  bool explain = false;
  StoreCheck stores;
  FloorOptions floor;
  SuppositionOptions supposed;  // declared by the commands that take them
};
// The manifest and the other operands are the command's own to declare.
void AddAuthorityOptions(OptionList& list, AuthorityOptions& options);

// Puts the members into the result that an answer about authority and a tree has; a program finds
// every one in every answer.
void StartTreeResult();

// Whether the answer of a verification was about the tree: the signer was authorized then.
bool JudgedTree(const ZvVesk2::Manifest& manifest, int code);

class ManifestAuthority {
 public:
  // `signing` is for Question::signing. The options must outlive it.
  ManifestAuthority(const AuthorityOptions& options, std::vector<std::string> signing);

  // Initialize readies a manifest to be asked about `directory`; `path` is where its bytes are.
  void Initialize(ZvVesk2::Manifest& manifest, const std::string& directory,
                  const std::string& path) const;
  // The period to ask about, in seconds; 0 where it is open.
  long First() const;
  long Last() const;
  // Whether the answer is about a machine that differs from this one: it is to change nothing.
  bool IsHypothetical() const { return supposition_.Any(); }
  // For Manifest::SetEvidence, of the verification that Judge is told of.
  ZvVesk2::Evidence& proved() { return proved_; }

  // Judge returns the no that has been said, or nothing for a manifest that is authorized. `code`
  // is what the library answered, 0 where its answer was about the tree only. Trouble for what
  // could not be read.
  std::optional<ExitCode> Judge(const ZvVesk2::Manifest& manifest, int code);

  // Keeps the lists that the manifest carries, as far as the options let it. To be called before a
  // verdict is told: trouble with the store must not follow a yes.
  void Keep(bool yes) const;
  // Raises the floor to what is about to be accepted: see KeepFloor::Raise.
  std::optional<ExitCode> RaiseFloor(const std::function<void()>& accept = nullptr);

  // "as signed at STAMP by FINGERPRINT", and what of the chain has ended since.
  std::string SignedText() const;
  // What --explain and machines are told of a yes.
  void TellYes();
  // The same of a signer who was authorized, whose tree is refused: for machines only.
  void TellCollectedGrant();
  const Question& question() const { return question_; }

 private:
  // Explains by what is known today, where that is what was asked.
  void TellGrant();
  [[noreturn]] void ThrowTrouble(const ZvVesk2::Manifest& manifest, int code) const;
  int Suppose(int code);
  int JudgeAll(int first);
  int JudgeMember(SExpression* tag) const;
  ExitCode Refuse(int code);
  std::optional<ExitCode> RefuseTime();

  const AuthorityOptions& options_;
  Request request_;
  Supposition supposition_;
  Question question_;
  ZvVesk2::Evidence proved_{nullptr};
  std::optional<Today> today_;
  std::optional<KeepFloor> floor_;
  std::set<std::string> broken_;  // sources whose stored list does not count
  bool byToday_ = false;  // refused by what is known now, not by what was at the time of signing
};

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_MANIFEST_AUTHORITY_H
