// explain.h: why a manifest was refused, in words.
//
// The library answers with one code. These functions look at the same files again, by the public
// interface, and name the certificate, entry or file. They never change the verdict.
#ifndef VESK2_TOOLS_EXPLAIN_H
#define VESK2_TOOLS_EXPLAIN_H

#include <string>
#include <vector>

#include "tools/vesk2/times.h"

#include <vesk2/expression.h>

namespace vesk2_command {

// What was asked about a manifest.
struct Question {
  std::string manifest;
  ZvVesk2::SExpression* tag;
  Period period;             // none: the time of signing
  std::string aclDirectory;  // entries beside the store's, or empty
};

// One line a reason, most telling first; empty when nothing could be found out.
std::vector<std::string> ExplainAuthority(const Question& question, int code);

// Why the ACL store yields no entry.
std::vector<std::string> ExplainStore();
// Notes that, and throws the Trouble for a store without which nothing can be answered.
[[noreturn]] void ThrowNoStore(int code);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_EXPLAIN_H
