// SPDX-License-Identifier: Apache-2.0
// acl_file.cpp: reading and building ACL entries.
#include "tools/vesk2/objects/acl_file.h"

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/verify.h>

namespace vesk2_command {

using ZvVesk2::AclEntry;
using ZvVesk2::Hash;

Ref<AclEntry> BuildEntry(EntryText text) {
  Ref<ByteString> comment = MakeText(text.comment);
  Ref<AclEntry> entry;
  Check(AclEntry::Create(entry.Out(), text.subject.get(), text.propagate, text.tag.get(),
                         text.period.notBefore.get(), text.period.notAfter.get(), 0, comment.get()),
        "building an ACL entry");
  // The entry holds the references now.
  (void)text.subject.Release();
  (void)text.tag.Release();
  (void)text.period.notBefore.Release();
  (void)text.period.notAfter.Release();
  (void)comment.Release();
  return entry;
}

Ref<AclEntry> ReadEntry(const std::string& path) {
  const Buffer buffer = OpenBuffer(path);
  Ref<AclEntry> entry(new AclEntry(nullptr));
  const int code = entry->Import(buffer.get());
  if (code != 0) Malformed(path, buffer->Position(), "ACL entry", code);
  return entry;
}

void CheckEntry(AclEntry& entry, const std::string& path) {
  const Ref<SExpression> acl = ListOf({&entry}, "acl");
  const Ref<SExpression> chain = ListOf({}, "sequence");
  const Ref<Hash> anybody = MakeHash(ZVCLM_HASH_SHA256, std::string(32, '\0'));
  Ref<SExpression> tag;
  Ref<SExpression> notBefore;
  Ref<SExpression> notAfter;
  const int code = ZvVesk2::Verify::ReductB(nullptr, acl.get(), chain.get(), anybody.get(),
                                            tag.Out(), notBefore.Out(), notAfter.Out());
  if (code == 0) return;
  Trouble trouble =
      FileTrouble(path, "would stop every verification: " + Reason(code), "malformed");
  trouble.code = code;
  throw trouble;
}

}  // namespace vesk2_command
