// SPDX-License-Identifier: Apache-2.0
// A program over the exported classes that looks at all that they show. See other_layout.py.
#include <vesk2.hpp>

#include <cstdio>
#include <cstring>
#include <memory>
#include <string>

using namespace ZvVesk2;

namespace {

int failures = 0;

#define CHECK(condition) \
  if (!(condition)) ++failures, std::printf("line %d: not %s\n", __LINE__, #condition)

constexpr char kHash[] = "(4:hash4:sha120:abcdefghijklmnopqrst)";

template <typename T>
Ref<T> Read(const char* text) {
  const std::unique_ptr<ZvBuffer, void (*)(ZvBuffer*)> buffer(
      ZVsysutil::zv_buffer_wrap(text, std::strlen(text)), ZVsysutil::zv_buffer_free);
  CHECK(buffer->Position() == 0 && buffer->Remaining() == std::strlen(text));
  Ref<T> object(new T(nullptr));
  CHECK(object->Import(buffer.get()) == 0);
  CHECK(buffer->Remaining() == 0 && object->GetRefCount() == 1 && object->GetContext() == nullptr);
  return object;
}

bool Is(const ByteString* text, const char* wanted) {
  return text != nullptr && text->GetLength() == std::strlen(wanted) &&
         std::memcmp(text->GetData(), wanted, text->GetLength()) == 0;
}

void LookAtValues() {
  const Ref<TimeStamp> stamp = Read<TimeStamp>("19:2011-01-01_00:00:00");
  CHECK(Is(stamp.get(), "2011-01-01_00:00:00") && stamp->GetType() == ByteString::BsNone);
  const Ref<Hash> hash = Read<Hash>(kHash);
  CHECK(hash->GetAlgorithm() == ZVCLM_HASH_SHA1 && hash->Count() == 3);
  CHECK(Is(hash->GetValue(), "abcdefghijklmnopqrst") && hash->GetDigest() == hash->GetValue());
  size_t count = 0;
  for (auto it = hash->Begin(); it; it.Next()) count += it.Value() != nullptr;
  CHECK(count == 3 && hash->GetStorageType() == StoragePath && hash->GetFileName() == nullptr);
  const Ref<PublicKey> key = Read<PublicKey>("(10:public-key(3:rsa(1:e1:\3)(1:n1:n)))");
  CHECK(key->GetType() == ZVCLM_KEY_RSA && key->GetLength() == 7 && key->GetKey() != nullptr);
  const Ref<ThresholdSubject> both(new ThresholdSubject(nullptr));
  CHECK(both->Set(1, 2) == 0 && both->GetK() == 1 && both->GetN() == 2);
  const Ref<Name> name(new Name(nullptr));
  CHECK(name->Set("a") == 0 && Is(name->GetName(), "a"));
}

void LookAtGrants() {
  const std::string hash = kHash;
  const std::string valid = "(5:valid(10:not-before1:a)(9:not-after1:b))(7:comment1:c)";
  const std::string to = "(7:subject" + hash + ")(9:propagate)(3:tag1:x)";
  const auto cert =
      Read<Cert>(("(4:cert(7:version1:1)(6:issuer" + hash + ")" + to + valid + "(1:r))").c_str());
  CHECK(cert->GetVersion() && cert->GetIssuer() && cert->GetSubject() && cert->GetPropagate());
  CHECK(cert->GetTag()->Count() == 2 && Is(cert->GetNotBefore(), "a"));
  CHECK(Is(cert->GetNotAfter(), "b") && Is(cert->GetComment(), "c"));
  CHECK(cert->GetRevocationElement()->Count() == 1 && cert->GetRevocationStatus() == 0);
  const auto signature = Read<Signature>(("(9:signature" + hash + hash + "(1:a1:v))").c_str());
  CHECK(signature->GetHash() && signature->GetPrincipal() && Is(signature->GetValue(), "v"));
  CHECK(Is(signature->GetAlgorithm(), "a"));
  const auto entry = Read<AclEntry>(
      ("(5:entry(7:version1:1)" + to + "(5:valid(9:not-after1:b))(10:generation1:\7))").c_str());
  CHECK(entry->GetVersion() && entry->GetSubject() && entry->GetPropagate() && entry->GetTag());
  CHECK(!entry->GetNotBefore() && Is(entry->GetNotAfter(), "b") && entry->GetGeneration() == 7);
  CHECK(entry->GetComment() == nullptr);
  Ref<Crl> crl;
  CHECK(Crl::Create(crl.Out(), nullptr) == 0 && crl->GetList1() && crl->GetList2());
  Ref<CrlSequence> list;
  CHECK(CrlSequence::Create(list.Out(), crl.get(), cert.get(), signature.get(), nullptr) == 0);
  CHECK(list->GetCrl() == crl.get() && list->GetCert() == cert.get());
  CHECK(list->GetSignature() == signature.get() && crl->GetIssuerTag() == nullptr);
}

void LookAtManifests() {
  BodyDirectory body(nullptr);
  ManifestWriter writer(nullptr);
  CHECK(writer.BeginBody({1, 2, 3, 4}) == 0 && writer.AddFile("f", {9}) == 0);
  CHECK(writer.OpenDirectory("d") == 0 && writer.CloseDirectory() == 0 && writer.EndBody() == 0);
  size_t length = 0;
  const char* const text = writer.GetBody(&length);
  ZvBuffer* const buffer = ZVsysutil::zv_buffer_wrap(text, length);
  CHECK(body.ParseBody(buffer, nullptr) == 0);
  ZVsysutil::zv_buffer_free(buffer);
  CHECK(body.GetFiles().GetCount() == 1 && body.GetSubdirectories().GetCount() == 1);
  CHECK(body.GetIgnored().GetCount() == 0 && body.GetIsDirectory());
  const auto& file = static_cast<BodyFile&>(*body.GetFiles().at(0));
  CHECK(std::strcmp(file.GetName(), "f") == 0 && file.GetHashLength() == 32);
  CHECK(file.GetHash()[0] == 9 && file.GetStatus() == BodyObject::StatusNone);
  PointerArray<char> names;
  CHECK(names.push(new char[1]{}) == 1 && names.begin() && names.GetCursor() == 1);
  names.reset();
  CHECK(names.GetCursor() == 0 && names.GetCapacity() == 32);

  Manifest manifest(nullptr);
  CHECK(manifest.Initialize("dir", "file", "(x)") == 0 && manifest.GetTag()->Count() == 2);
  CHECK(std::strcmp(manifest.GetDirectory(), "dir") == 0);
  CHECK(std::strcmp(manifest.GetManifestPath(), "file") == 0);
  manifest.SetFailOnExtraEntries(true);
  manifest.SetStoreUpdate(false);
  CHECK(manifest.GetFailOnExtraEntries() && !manifest.GetStoreUpdate());
  CHECK(manifest.CopyExtraAclDirectory("more") == 0);
  CHECK(std::strcmp(manifest.GetExtraAclDirectory(), "more") == 0);
  Evidence evidence(nullptr);
  manifest.SetEvidence(&evidence);
  CHECK(manifest.VerifyManifest(0, 0) == VESK2_ERR_OPEN_MANIFEST_FILE && !manifest.GetValid());
  CHECK(evidence.GetKind() == Evidence::SignedManifest && evidence.CountCerts() == 0);
}

}  // namespace

int main() {
  LookAtValues();
  LookAtGrants();
  LookAtManifests();
  return failures == 0 ? 0 : 1;
}
