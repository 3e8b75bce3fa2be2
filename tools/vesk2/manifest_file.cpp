// manifest_file.cpp: reading manifest files.
#include "tools/vesk2/manifest_file.h"

#include "tools/vesk2/files.h"
#include "tools/vesk2/progress.h"
#include "tools/vesk2/report.h"

namespace vesk2_command {

using ZvVesk2::BodyDirectory;
using ZvVesk2::Cert;
using ZvVesk2::CrlSequence;
using ZvVesk2::Manifest;
using ZvVesk2::Signature;

std::unique_ptr<BodyDirectory> ReadListing(const std::string& path, const std::string& directory) {
  Manifest manifest(nullptr);
  Check(manifest.Initialize(directory.c_str(), path.c_str(), "none"), Escape(path));
  ZvBuffer* handed = nullptr;
  const int code = manifest.ReadManifest(false, 0, 0, &handed);
  const Buffer body(handed);
  if (code != 0) Malformed(path, manifest.GetReadPosition(), "manifest", code);

  auto root = std::make_unique<BodyDirectory>(nullptr);
  root->SetName(NewText(directory));
  const size_t start = manifest.GetReadPosition() - 1 - body->Remaining();
  const int parsed = root->ParseBody(body.get(), nullptr);
  if (parsed != 0) Malformed(path, start + body->Position(), "manifest", parsed);
  return root;
}

void IgnoreEntries(Manifest& manifest, const std::set<std::string>& names) {
  FileItem* list = nullptr;
  for (const std::string& name : names) {
    FileItem* item = ZvVesk2::FileItemCreate(NewText(name), nullptr);
    if (item == nullptr) throw std::bad_alloc();
    item->next = list;
    list = item;
  }
  const std::unique_ptr<FileItem, decltype(&ZvVesk2::FileItemDelete)> owner(
      list, &ZvVesk2::FileItemDelete);
  Check(manifest.SetIgnoredEntries(list), "preparing");
}

void CheckSigned(const std::string& path, const std::string& directory,
                 const std::set<std::string>& ignored) {
  Manifest manifest(nullptr);
  Check(manifest.Initialize(directory.c_str(), path.c_str(), "none"), "preparing");
  IgnoreEntries(manifest, ignored);
  const ProgressLine progress("checking", directory);
  Check(manifest.SetFileCallbacks(progress.Callbacks()), "preparing");
  ZvBuffer* handed = nullptr;
  const int code = manifest.ReadManifest(false, 0, 0, &handed);
  const Buffer body(handed);
  Check(code, "the new manifest could not be verified");
  if (manifest.Verify(body.get(), directory.c_str()) == 0) return;
  for (const FileItem* list : {manifest.GetInvalid(), manifest.GetMissing(), manifest.GetExtra()}) {
    for (; list != nullptr; list = list->next) Note("changed meanwhile: " + Escape(list->name));
  }
  throw FileTrouble(directory, "changed while it was signed; nothing was signed", "tree-changed");
}

namespace {

template <typename T>
bool ReadInto(Ref<T>& out, ZvBuffer* buffer) {
  Ref<T> object(new T(nullptr));
  if (object->Import(buffer) != 0) return false;
  out = std::move(object);
  return true;
}

// The version's two texts, the type and the time of signing.
bool ReadHead(ZvBuffer* buffer, SignatureBlock& block) {
  Ref<ByteString> text;
  return buffer->Accept("(8:manifest(7:version") && ReadInto(text, buffer) &&
         ReadInto(text, buffer) && buffer->Accept(")(4:type") && ReadInto(text, buffer) &&
         buffer->Accept(")(15:signature-block(15:time-of-signing") &&
         ReadInto(block.signedAt, buffer) && buffer->Accept(")");
}

bool ReadCert(ZvBuffer* buffer, SignatureBlock& block) {
  SignedCert each;
  if (!ReadInto(each.cert, buffer) || !ReadInto(each.signature, buffer)) return false;
  block.certs.push_back(std::move(each));
  return true;
}

}  // namespace

SignatureBlock ReadSignatureBlock(const std::string& path) {
  SignatureBlock block;
  const Buffer buffer = OpenBuffer(path);
  if (!ReadHead(buffer.get(), block)) return block;
  while (buffer->Peek() == '(') {
    if (!ReadCert(buffer.get(), block)) return block;
  }
  if (!buffer->Accept(")(3:crl")) return block;
  while (buffer->Peek() == '(') {
    Ref<CrlSequence> crl;
    if (!ReadInto(crl, buffer.get())) return block;
    block.crls.push_back(std::move(crl));
  }
  BodyDirectory listing(nullptr);
  int code = buffer->Expect(")");
  if (code == 0) code = listing.ParseBody(buffer.get(), nullptr);
  if (code == 0) code = buffer->Expect(")");
  if (code != 0) block.damage = "byte " + std::to_string(buffer->Position()) + ": " + Reason(code);
  return block;
}

}  // namespace vesk2_command
