// SPDX-License-Identifier: Apache-2.0
// request.h: what is asked for, and the single requests that it stands for.
//
// The library compares sets strictly: (* set a b) as a request is refused although a and b are
// granted. So a requested set is taken apart, and every member has to be granted.
#ifndef VESK2_TOOLS_REQUEST_H
#define VESK2_TOOLS_REQUEST_H

#include <string>
#include <vector>

#include "tools/vesk2/objects/objects.h"

namespace vesk2_command {

struct Request {
  struct Member {
    Ref<SExpression> tag;
    std::string text;  // in the advanced form, as it can be parsed again
  };
  std::string text;
  Ref<SExpression> tag;
  std::vector<Member> members;  // at least one; the request itself unless it holds a set
};

// ParseRequest is ParseTag, and takes the sets apart, nested ones too. Ranges and prefixes stay one
// member. Trouble for more than 64 members.
Request ParseRequest(const std::string& text);

// The members as a list.
Ref<SExpression> MemberList(const Request& request);

// NoteMeantRequest notes, beside a no, what was probably meant by a tag without its parentheses.
void NoteMeantRequest(const Request& request);

// TellMember says the answer about one of several members, and adds it to "members" of the result.
void TellMember(const Request& request, size_t index, int code);

// The body of a tag as text that ParseTypedTag reads back, for commands that are told to people;
// empty when there is none, since the advanced form has no quoting.
std::string ReadableTag(SExpression* tag);
// The same for commands that issue it: text that ParseIssuedTag reads back.
std::string IssuableTag(SExpression* tag);

}  // namespace vesk2_command

#endif  // VESK2_TOOLS_REQUEST_H
