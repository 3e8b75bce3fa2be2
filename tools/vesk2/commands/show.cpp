// SPDX-License-Identifier: Apache-2.0
// show.cpp: vesk2 show: any object of the system, or any S-expression.
#include <unistd.h>

#include <algorithm>

#include "tools/vesk2/commands/command.h"
#include "tools/vesk2/commands/describe.h"
#include "tools/vesk2/files/descriptor.h"
#include "tools/vesk2/files/files.h"
#include "tools/vesk2/keys/key_reference.h"
#include "tools/vesk2/objects/expression.h"

#include <vesk2/acl_entry.h>

namespace vesk2_command {
namespace {

using ZvVesk2::AclEntry;
using ZvVesk2::Cert;
using ZvVesk2::CertSequence;
using ZvVesk2::Crl;
using ZvVesk2::Hash;
using ZvVesk2::Signature;
using ZvVesk2::ThresholdSubject;

struct Options {
  std::string file;
  bool raw = false;
  bool canonical = false;
  bool advanced = false;
  std::string output = kStandard;
  WriteFlags flags;
};

// What is shown, in canonical form, and how far it has been read.
struct Source {
  std::string path;
  bool typed = false;  // it was advanced text: places in the canonical form are none in the file
  Buffer bytes;
};

std::string_view Rest(const ZvBuffer& buffer) {
  return {reinterpret_cast<const char*>(buffer.Data()), buffer.Remaining()};
}

[[noreturn]] void Refuse(const Source& source, const std::string& kind, int code) {
  if (!source.typed) Malformed(source.path, source.bytes->Position(), kind, code);
  throw FileTrouble(source.path, "malformed " + kind + ": " + Reason(code), "malformed");
}

// ---- The kinds ----

template <typename T>
Ref<T> Read(Source& source, const char* kind) {
  Ref<T> object(new T(nullptr));
  const int code = object->Import(source.bytes.get());
  if (code != 0) Refuse(source, kind, code);
  return object;
}

Ref<SExpression> ReadExpression(Source& source) {
  Ref<SExpression> list;
  const int code = SExpression::Import(list.Out(), source.bytes.get(), nullptr);
  if (code != 0) Refuse(source, "expression", code);
  return list;
}

Sheet ShowKey(Source& source) { return DescribeKey(*Read<PublicKey>(source, "public key")); }
Sheet ShowHash(Source& source) { return DescribeSubject(*Read<Hash>(source, "digest")); }
Sheet ShowThreshold(Source& source) {
  return DescribeSubject(*Read<ThresholdSubject>(source, "k-of-n"));
}
Sheet ShowList(Source& source) { return DescribeCrl(*Read<Crl>(source, "revocation list")); }
Sheet ShowVouchedList(Source& source) {
  return DescribeCrl(*Read<CrlSequence>(source, "revocation list"));
}
Sheet ShowSignature(Source& source) {
  return DescribeSignature(*Read<Signature>(source, "signature"));
}

// The reader of entries leaves the ")" behind a tag that comes last: what it read is no measure.
Sheet ShowEntry(Source& source) {
  Source whole{source.path, source.typed, WrapBytes(Rest(*source.bytes))};
  ReadExpression(whole);
  const Ref<AclEntry> entry = Read<AclEntry>(source, "ACL entry");
  source.bytes->Skip(source.bytes->Remaining() - whole.bytes->Remaining());
  return DescribeEntry(*entry);
}

// A certificate is checked when its signature follows.
Sheet ShowCert(Source& source) {
  const Ref<Cert> cert = Read<Cert>(source, "certificate");
  Ref<Signature> signature;
  if (source.bytes->LooksAt("(9:signature")) signature = Read<Signature>(source, "signature");
  return DescribeCert(*cert, signature.get());
}

Sheet ShowChain(Source& source) {
  CertChain chain;
  const int code = CertSequence::Import(chain.Out(), source.bytes.get(), nullptr);
  if (code != 0) Refuse(source, "certificate sequence", code);
  return DescribeChain(ChainLinks(chain, source.path));
}

Sheet ShowManifest(Source& source) {
  const std::string_view rest = Rest(*source.bytes);
  const auto read = [](std::string_view text) {
    const Descriptor file(MemoryFile(text));
    return ReadSignatureBlock(file.Path());
  };
  SignatureBlock block = read(rest);
  // Other objects may follow: what stops the listing is then the end of this one.
  const size_t end = block.position;
  if (block.listing == nullptr && end + 1 < rest.size() && rest[end] == ')') {
    block = read(rest.substr(0, end + 1));
  }
  source.bytes->Skip(block.position);
  if (block.listing == nullptr) Refuse(source, "manifest", block.code);
  return DescribeManifest(block, block.code);
}

Sheet ShowTag(Source& source) {
  Sheet sheet("tag");
  sheet.Add("tag", TagText(ReadExpression(source).get()));
  return sheet;
}

Sheet ShowExpression(Source& source) {
  Sheet sheet("expression");
  for (const std::string& line : TreeLines(*ReadExpression(source))) sheet.AddLine(line);
  return sheet;
}

// What an object begins with tells its kind; the first row that fits. The last fits everything.
constexpr struct Kind {
  const char* start;
  const char* heading;
  Sheet (*show)(Source&);
} kKinds[] = {
    {"(10:public-key", "public key", ShowKey},
    {"(5:entry", "ACL entry", ShowEntry},
    {"(4:cert", "certificate", ShowCert},
    {"(9:signature", "signature", ShowSignature},
    {"(8:sequence(3:crl", "revocation list", ShowVouchedList},
    {"(8:sequence", "certificate sequence", ShowChain},
    {"(3:crl", "revocation list without its signature", ShowList},
    {"(8:manifest", "manifest", ShowManifest},
    {"(4:hash", "digest", ShowHash},
    {"(6:k-of-n", "k of n", ShowThreshold},
    {"(3:tag", "tag", ShowTag},
    {"", "expression", ShowExpression},
};

const Kind& KindOf(const ZvBuffer& bytes, bool raw) {
  const auto fits = [&](const Kind& kind) { return bytes.LooksAt(kind.start); };
  return raw ? *std::rbegin(kKinds) : *std::find_if(std::begin(kKinds), std::end(kKinds), fits);
}

// ---- The two forms ----

// Whether a text begins as the canonical form does: with a list, or with a length and a colon.
bool LooksCanonical(std::string_view text) {
  if (!text.starts_with('(')) return false;
  text.remove_prefix(1);
  if (text.starts_with('[') || text.starts_with('(') || text.starts_with(')')) return true;
  const size_t digits = std::min(text.find_first_not_of("0123456789"), text.size());
  return digits > 0 && text.substr(digits).starts_with(':');
}

// Reads advanced text, any number of lists, into the canonical form.
std::string CanonicalOf(const std::string& path, const std::string& text) {
  std::string bytes;
  unsigned at = 0;
  do {
    Ref<DExpression> list;
    int code = SExpression::ParseAdvanced(list.Out(), text.c_str(), at, nullptr);
    while (code == 0 && std::isspace(static_cast<unsigned char>(text[at])) != 0) ++at;
    if (code != 0) Malformed(path, at, "expression", code);
    bytes += Canonical(*list);
  } while (at < text.size());
  return bytes;
}

Source Open(const std::string& path) {
  Source source{path, false, OpenBuffer(path)};
  if (source.bytes->LooksAt("-----BEGIN ")) {
    if (IsPrivatePem(path)) {
      throw FileTrouble(path, "a private key; vesk2 key show tells what can be told of it",
                        "usage");
    }
    source.bytes = WrapBytes(Canonical(*ReadPublicKey(path)));
    source.typed = true;
  } else if (!LooksCanonical(Rest(*source.bytes))) {
    source.bytes = WrapBytes(CanonicalOf(path, std::string(Rest(*source.bytes))));
    source.typed = true;
  }
  return source;
}

// ---- What is printed ----

// The next object, with its expressions for machines.
Sheet ShowNext(Source& source, const Kind& kind) {
  const std::string_view rest = Rest(*source.bytes);
  Sheet sheet = kind.show(source);
  if (GetStyle().json) {
    Json expressions = Json::array();
    const std::string_view read = rest.substr(0, rest.size() - source.bytes->Remaining());
    Source again{source.path, true, WrapBytes(read)};
    while (again.bytes->Remaining() != 0) {
      expressions.push_back(ExpressionJson(*ReadExpression(again)));
    }
    sheet.AddMember("expressions", std::move(expressions));
  }
  return sheet;
}

// Every object of a file; nothing is said before all of them have been read.
void ShowAll(Source& source, bool raw) {
  Sheet whole("file");
  do {
    const Kind& kind = KindOf(*source.bytes, raw);
    whole.AddPart("objects", kind.heading, ShowNext(source, kind));
  } while (source.bytes->Remaining() != 0);
  Present(whole);
}

// The lists of a file, each on a line.
std::string AdvancedOf(Source& source) {
  std::string text;
  do {
    text += AdvancedText(*ReadExpression(source)) + "\n";
  } while (source.bytes->Remaining() != 0);
  return text;
}

void Write(const Options& options, Source& source) {
  const bool standard = options.output == kStandard;
  std::string text(Rest(*source.bytes));
  const std::string advanced = AdvancedOf(source);  // reads all of it, for canonical bytes too
  if (options.advanced) text = advanced;
  if (standard && GetStyle().json) {
    Result()[options.advanced ? "advanced" : "canonical_hex"] =
        options.advanced ? advanced.substr(0, advanced.size() - 1) : Hex(text);
    return;
  }
  if (standard && options.canonical && isatty(STDOUT_FILENO) == 1) {
    throw Trouble("canonical bytes are not for a terminal: --output FILE takes them");
  }
  WriteFile(options.output, text, {options.flags});
}

ExitCode Run(const Options& options) {
  if (options.output != kStandard && !options.canonical && !options.advanced) {
    throw Trouble("--output is for --canonical or --advanced", "usage");
  }
  Source source = Open(options.file);
  if (options.canonical || options.advanced) {
    Write(options, source);
  } else {
    ShowAll(source, options.raw);
  }
  return kYes;
}

}  // namespace

Action DefineShow(OptionList& list) {
  auto options = std::make_shared<Options>();
  list.Add("file", options->file, "A file of objects, in canonical or advanced form").Required();
  Option& raw = list.Add("--raw", options->raw, "Show the S-expression, whatever it stands for");
  Option& canonical = list.Add("--canonical", options->canonical, "Write the canonical bytes");
  Option& advanced = list.Add("--advanced", options->advanced, "Write the advanced text");
  raw.Excludes(canonical).Excludes(advanced);
  canonical.Excludes(advanced);
  list.Add("-o,--output", options->output, "Where --canonical and --advanced write").ShowPreset();
  AddWriteFlags(list, options->flags);
  return [options] { return Run(*options); };
}

}  // namespace vesk2_command
