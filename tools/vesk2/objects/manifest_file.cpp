// SPDX-License-Identifier: Apache-2.0
// manifest_file.cpp: reading manifest files.
#include "tools/vesk2/objects/manifest_file.h"

#include <algorithm>

#include "tools/vesk2/files/files.h"

namespace vesk2_command {

using ZvVesk2::Cert;
using ZvVesk2::CrlSequence;
using ZvVesk2::Evidence;
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

void CheckSigned(const std::string& path, const std::string& directory) {
  Manifest manifest(nullptr);
  Check(manifest.Initialize(directory.c_str(), path.c_str(), "none"), "preparing");
  ZvBuffer* handed = nullptr;
  const int code = manifest.ReadManifest(false, 0, 0, &handed);
  const Buffer body(handed);
  Check(code, "the new manifest could not be verified");
  ZvVesk2::BodyDirectory listing(nullptr);
  Check(listing.ParseBody(body.get(), nullptr), "the new manifest could not be verified");
}

namespace {

// An item of a list that the library read; null where it read none.
template <typename T>
Ref<T> ItemOf(const SExpression* list, size_t index) {
  if (list == nullptr) return {};
  auto item = list->Begin();
  for (; item && index > 0; --index) item.Next();
  return item ? Ref<T>::Share(dynamic_cast<T*>(item.Value())) : Ref<T>();
}

void AddParts(SignatureBlock& block, const Evidence& evidence) {
  const Manifest& manifest = *block.owner;
  block.version = ItemOf<ByteString>(manifest.GetVersion(), 1);
  block.creator = ItemOf<ByteString>(manifest.GetVersion(), 2);
  block.type = ItemOf<ByteString>(manifest.GetType(), 1);
  block.signedAt = Ref<TimeStamp>::Share(evidence.GetSigningTime());
  for (size_t i = 0; i < evidence.CountCerts(); ++i) {
    block.certs.push_back(
        {Ref<Cert>::Share(evidence.GetCert(i)), Ref<Signature>::Share(evidence.GetSignature(i))});
  }
  for (CrlSequence* const list : ItemsOf<CrlSequence>(evidence.GetCarriedLists())) {
    block.crls.push_back(Ref<CrlSequence>::Share(list));
  }
}

}  // namespace

SignatureBlock ReadSignatureBlock(const std::string& path) {
  SignatureBlock block;
  block.owner = std::make_unique<Manifest>(nullptr);
  Manifest& manifest = *block.owner;
  block.proved = std::make_unique<Evidence>(nullptr);
  Evidence& evidence = *block.proved;
  Check(manifest.Initialize("", InputPath(path).c_str(), "none"), InputName(path));
  manifest.SetEvidence(&evidence);
  block.code = manifest.ReadManifest(false, 0, 0, nullptr);
  manifest.SetEvidence(nullptr);
  if (block.code == VESK2_ERR_OPEN_MANIFEST_FILE || block.code == VESK2_ERR_MEM_ALLOC) {
    ThrowUnreadable(path, manifest, block.code);
  }
  AddParts(block, evidence);
  if (block.code == 0 || IsRefusal(block.code)) block.listing = manifest.GetListing();
  block.position = manifest.GetReadPosition();
  if (block.listing != nullptr) {
    block.position = evidence.GetListingPosition() + 1;
  } else if (evidence.GetListingCode() != 0) {
    block.code = evidence.GetListingCode();
    block.position = evidence.GetListingPosition();
  }
  return block;
}

int ReadSigned(const std::string& path, Manifest& manifest, Buffer& body) {
  Check(manifest.Initialize("", InputPath(path).c_str(), "none"), InputName(path));
  ZvBuffer* read = nullptr;
  const int code = manifest.ReadManifest(false, 0, 0, &read);
  body.reset(read);
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
  if (!wasRead) Check(code, InputName(path));
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
