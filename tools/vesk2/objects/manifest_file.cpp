// manifest_file.cpp: reading manifest files.
#include "tools/vesk2/objects/manifest_file.h"

#include <algorithm>

#include "tools/vesk2/files/files.h"
#include "tools/vesk2/say/progress.h"
#include "tools/vesk2/say/report.h"

#include <vesk2/hash.h>

namespace vesk2_command {

using ZvVesk2::BodyDirectory;
using ZvVesk2::Cert;
using ZvVesk2::CrlSequence;
using ZvVesk2::Hash;
using ZvVesk2::Manifest;
using ZvVesk2::Signature;

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
int ReadInto(Ref<T>& out, ZvBuffer* buffer) {
  Ref<T> object(new T(nullptr));
  const int code = object->Import(buffer);
  if (code == 0) out = std::move(object);
  return code;
}

// A literal and the value behind it.
template <typename T>
int ReadAfter(const char* literal, Ref<T>& out, ZvBuffer* buffer) {
  const int code = buffer->Expect(literal);
  return code != 0 ? code : ReadInto(out, buffer);
}

int ReadHead(ZvBuffer* buffer, SignatureBlock& block) {
  int code = ReadAfter("(8:manifest(7:version", block.version, buffer);
  if (code == 0) code = ReadInto(block.creator, buffer);
  if (code == 0) code = ReadAfter(")(4:type", block.type, buffer);
  if (code == 0)
    code = ReadAfter(")(15:signature-block(15:time-of-signing", block.signedAt, buffer);
  return code == 0 ? buffer->Expect(")") : code;
}

int ReadCerts(ZvBuffer* buffer, SignatureBlock& block) {
  while (buffer->Peek() == '(') {
    SignedCert each;
    int code = ReadInto(each.cert, buffer);
    if (code == 0) code = ReadInto(each.signature, buffer);
    if (code != 0) return code;
    block.certs.push_back(std::move(each));
  }
  // The first speaks for the content, the second for its issuer.
  return block.certs.size() > 1 ? buffer->Expect(")") : VESK2_ERR_PARSE_FILE;
}

int ReadCrls(ZvBuffer* buffer, SignatureBlock& block) {
  const int start = buffer->Expect("(3:crl");
  if (start != 0) return start;
  while (buffer->Peek() == '(') {
    Ref<CrlSequence> crl;
    const int code = ReadInto(crl, buffer);
    if (code != 0) return code;
    block.crls.push_back(std::move(crl));
  }
  return 0;
}

// Whether the signer certificate is for what the file holds: the elements before the certificates,
// and the text behind the lists up to the final ")".
bool IsContentSigned(const SignatureBlock& block, std::string_view body) {
  if (block.certs.empty() || body.empty()) return false;
  auto* named = dynamic_cast<ZvVesk2::Hash*>(block.certs[0].cert->GetSubject());
  const Ref<ZvVesk2::Hash> digest(new ZvVesk2::Hash(nullptr));
  if (named == nullptr || digest->Init(named->GetAlgorithm()) != 0) return false;
  const std::string head = "(" + Atom("version") + Canonical(*block.version) +
                           Canonical(*block.creator) + ")(" + Atom("type") +
                           Canonical(*block.type) + ")(" + Atom("time-of-signing") +
                           Canonical(*block.signedAt) + ")";
  body.remove_suffix(1);
  for (const std::string_view text : {std::string_view(head), body}) {
    const auto* bytes = reinterpret_cast<const unsigned char*>(text.data());
    if (digest->Update(bytes, static_cast<unsigned>(text.size())) != 0) return false;
  }
  return digest->Finalize() == 0 && digest->IsEqual(named);
}

int ReadBody(ZvBuffer* buffer, SignatureBlock& block) {
  block.listing = std::make_unique<BodyDirectory>(nullptr);
  int code = buffer->Expect(")");
  const auto* body = reinterpret_cast<const char*>(buffer->Data());
  block.contentSigned = IsContentSigned(block, {body, buffer->Remaining()});
  if (code == 0) code = block.listing->ParseBody(buffer, nullptr);
  if (code == 0) code = buffer->Expect(")");
  if (code != 0) block.damage = "byte " + std::to_string(buffer->Position()) + ": " + Reason(code);
  return code;
}

}  // namespace

int ReadSignatureBlock(ZvBuffer* buffer, SignatureBlock& block) {
  for (const auto part : {ReadHead, ReadCerts, ReadCrls, ReadBody}) {
    const int code = part(buffer, block);
    if (code != 0) return code;
  }
  return 0;
}

SignatureBlock ReadSignatureBlock(const std::string& path) {
  SignatureBlock block;
  (void)ReadSignatureBlock(OpenBuffer(path).get(), block);
  return block;
}

int CheckBlock(const SignatureBlock& block) {
  if (!block.certs[0].cert->GetSubject()->IsHash()) return VESK2_ERR_NOT_OBJECT_CERT;
  for (const SignedCert& each : block.certs) {
    if (const int code = each.signature->Verify(each.cert.get())) return code;
  }
  return block.contentSigned ? 0 : VESK2_ERR_HASH_MATCH;
}

int CheckManifest(const std::string& path) {
  Manifest manifest(nullptr);
  Check(manifest.Initialize("", InputPath(path).c_str(), "none"), Escape(path));
  const int code = manifest.ReadManifest(false, 0, 0, nullptr);
  if (code != 0 && !IsRefusal(code)) ThrowUnreadable(path, manifest, code);
  return code;
}

bool IsRefusal(int code) {
  constexpr int kRefusals[] = {
      VESK2_ERR_SIGNATURE_ID,       VESK2_ERR_NOT_IMPLEMENTED, VESK2_ERR_SIGNATURE,
      VESK2_ERR_HASH_MISMATCH,      VESK2_ERR_NOT_AUTHORIZED,  VESK2_ERR_HASH_MATCH,
      VESK2_ERR_SIGNING_CERT_ORDER, VESK2_ERR_CERT_REVOKED,    VESK2_ERR_PACKAGE_NOT_GRANTED,
      VESK2_ERR_KEY_REVOKED,        VESK2_ERR_NOT_OBJECT_CERT, VESK2_ERR_CRL_NOT_FOUND,
  };
  return std::find(std::begin(kRefusals), std::end(kRefusals), code) != std::end(kRefusals);
}

void ThrowUnreadable(const std::string& path, const Manifest& manifest, int code) {
  if (code == VESK2_ERR_OPEN_MANIFEST_FILE) throw FileTrouble(path, WhyUnreadable(path), "io");
  const bool wasRead = code > 0 && code != VESK2_ERR_MEM_ALLOC && code != VESK2_ERR_READ_FILE;
  if (!wasRead) Check(code, Escape(path));
  Malformed(path, manifest.GetReadPosition(), "manifest", code);
}

std::vector<std::string> FoundNames(const FileItem* list, const std::set<std::string>& parents) {
  std::set<std::string> names;  // an unreadable directory is recorded twice
  for (; list != nullptr; list = list->next) {
    if (list->isDirectory == 0 || parents.count(list->name) == 0) names.insert(list->name);
  }
  return {names.begin(), names.end()};
}

std::set<std::string> FoundParents(const Manifest& manifest) {
  std::set<std::string> parents;
  for (const FileItem* list : {manifest.GetInvalid(), manifest.GetMissing(), manifest.GetExtra()}) {
    for (; list != nullptr; list = list->next) {
      std::string path = list->name;
      for (size_t at = path.rfind('/'); at != std::string::npos; at = path.rfind('/')) {
        path.resize(at);
        if (!parents.insert(path).second) break;
      }
    }
  }
  return parents;
}

size_t CountFiles(const FileItem* list) {
  size_t count = 0;
  for (; list != nullptr; list = list->next) count += list->isDirectory == 0 ? 1 : 0;
  return count;
}

}  // namespace vesk2_command
