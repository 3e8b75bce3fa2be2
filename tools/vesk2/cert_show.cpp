// cert_show.cpp: vesk2 cert show.
#include "tools/vesk2/command.h"
#include "tools/vesk2/inspect.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {
namespace {

std::string OwnerText(SExpression* extra) {
  const Text text(extra != nullptr ? extra->ExportTag("owner") : nullptr);
  return text ? Escape(text.get()) : "";
}

std::string CommentText(const ByteString* comment) {
  if (comment == nullptr) return "";
  return Escape({reinterpret_cast<const char*>(comment->GetData()), comment->GetLength()});
}

void SayLink(const ChainLink& link) {
  const ZvVesk2::Cert& cert = *link.cert;
  SayRow("issuer", SubjectText(*cert.GetIssuer()));
  SayRow("subject", SubjectText(*cert.GetSubject()));
  SayRow("tag", TagText(cert.GetTag()));
  SayRow("propagate", cert.GetPropagate() ? "yes" : "no");
  SayRow("valid", PeriodText(cert.GetNotBefore(), cert.GetNotAfter()));
  if (cert.GetComment() != nullptr) SayRow("comment", CommentText(cert.GetComment()));
  const std::string owner = OwnerText(link.extra);
  if (!owner.empty()) SayRow("owner", owner);
  SExpression* source = cert.GetRevocationElement();
  SayRow("revocation", source != nullptr ? SourceText(*source) : "by key only");
  const int code = link.signature->Verify(link.cert);
  SayRow("signature", code == 0 ? "holds" : Reason(code));
}

ExitCode Run(const std::string& file) {
  const CertChain chain = ReadCertChain(file);
  const std::vector<ChainLink> links = ChainLinks(chain, file);
  for (size_t i = 0; i < links.size(); ++i) {
    Say((i == 0 ? "" : "\n") + std::string("certificate ") + std::to_string(i + 1) + " of " +
        std::to_string(links.size()));
    SayLink(links[i]);
  }
  return kYes;
}

}  // namespace

Action DefineCertShow(CLI::App& app) {
  auto file = std::make_shared<std::string>();
  app.add_option("file", *file, "A certificate file")->required();
  return [file] { return Run(*file); };
}

}  // namespace vesk2_command
