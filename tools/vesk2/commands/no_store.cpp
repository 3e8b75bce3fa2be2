// SPDX-License-Identifier: Apache-2.0
// no_store.cpp: a machine without a store.
#include "tools/vesk2/commands/no_store.h"

#include <utility>

#include "tools/vesk2/explain/explain.h"
#include "tools/vesk2/files/stores.h"
#include "tools/vesk2/stores/acl_store.h"

#include <vesk2.h>

namespace vesk2_command {
namespace {

// The verification stopped where it had no entries. It is judged to its end with none, so that what
// else stands in the way is told, and nothing that was only not asked.
void ExplainWithoutEntries(Question& question) {
  ZvVesk2::Evidence judged(nullptr);
  Check(judged.Copy(*question.proved), "explaining");
  judged.SetEntries(ListOf({}, "acl").get());
  judged.SetLists(nullptr, question.proved->GetCarriedLists());
  const int code = judged.Judge(question.request->tag.get());
  const ZvVesk2::Evidence* proved = std::exchange(question.proved, &judged);
  ExplainRefusal(question, code);
  question.proved = proved;
}

}  // namespace

ExitCode RefuseWithoutStore(Question& question, int code) {
  if (!HasNoStore(question.aclDirectory)) ThrowNoStore(code);
  for (size_t i = 0; i < question.request->members.size(); ++i) {
    TellMember(*question.request, i, VESK2_ERR_NOT_AUTHORIZED);
  }
  const ExitCode verdict =
      No("nothing-trusted", "this machine trusts nobody: there is no entry in its ACL store, " +
                                Escape(AclDirectory()));
  TellHowToTrust();
  ExplainWithoutEntries(question);
  return verdict;
}

}  // namespace vesk2_command
