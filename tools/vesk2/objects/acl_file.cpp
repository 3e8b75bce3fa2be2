// acl_file.cpp: reading ACL entries one by one.
#include "tools/vesk2/objects/acl_file.h"

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/hash.h>
#include <vesk2/verify.h>

namespace vesk2_command {

using ZvVesk2::AclEntry;
using ZvVesk2::Hash;

Ref<AclEntry> ReadEntry(const std::string& path) {
  const Buffer buffer = OpenBuffer(path);
  Ref<AclEntry> entry(new AclEntry(nullptr));
  const int code = entry->Import(buffer.get());
  if (code != 0) Malformed(path, buffer->Position(), "ACL entry", code);
  return entry;
}

void CheckEntry(AclEntry& entry, const std::string& path) {
  Ref<SExpression> acl;
  Check(SExpression::Create(acl.Out(), "acl", nullptr), "checking an entry");
  auto shared = Ref<AclEntry>::Share(&entry);
  Check(acl->Insert(shared.get()), "checking an entry");
  (void)shared.Release();
  Ref<SExpression> chain;
  Check(SExpression::Create(chain.Out(), "sequence", nullptr), "checking an entry");
  const Buffer text = WrapBytes("(4:hash6:sha256" + Atom(std::string(32, '\0')) + ")");
  Ref<Hash> anybody(new Hash(nullptr));
  Check(anybody->Import(text.get()), "checking an entry");
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
