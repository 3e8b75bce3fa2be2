// crl_show.cpp: vesk2 crl show.
#include <algorithm>

#include "tools/vesk2/command.h"
#include "tools/vesk2/crl_file.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

using ZvVesk2::Hash;

bool IsDummy(const Hash& hash) {
  const ByteString& digest = *hash.GetDigest();
  return std::all_of(digest.GetData(), digest.GetData() + digest.GetLength(),
                     [](unsigned char byte) { return byte == 0; });
}

// The items of a list, each (item HASH DATE).
void SayItems(const SExpression& list, const std::string& name) {
  auto it = list.Begin();
  for (it.Next(); it; it.Next()) {
    const auto* item = dynamic_cast<SExpression*>(it.Value());
    auto at = item->Begin();
    at.Next();
    auto* hash = dynamic_cast<Hash*>(at.Value());
    const auto* date = dynamic_cast<TimeStamp*>(item->Last());
    SayRow(name, IsDummy(*hash) ? "none" : SubjectText(*hash) + " from " + StampText(*date));
  }
}

ExitCode Run(const std::string& file) {
  const Ref<CrlSequence> list = ReadCrl(file);
  const ZvVesk2::Cert& cert = *list->GetCert();
  SayRow("issuer", SubjectText(*cert.GetIssuer()));
  SayRow("tag", TagText(cert.GetTag()));
  SayRow("valid", PeriodText(cert.GetNotBefore(), cert.GetNotAfter()));
  SayItems(*list->GetCrl()->GetList1(), "certificate");
  SayItems(*list->GetCrl()->GetList2(), "key");
  const int code = CheckIssuerWord(*list);
  SayRow("signature", code == 0 ? "holds" : Reason(code));
  return kYes;
}

}  // namespace

Action DefineCrlShow(CLI::App& app) {
  auto file = std::make_shared<std::string>();
  app.add_option("file", *file, "A revocation list file")->required();
  return [file] { return Run(*file); };
}

}  // namespace vesk2_command
