// The objects of a manifest body: what a file and a directory of the tree carry, and their order.
#include <algorithm>
#include <cstring>

#include <vesk2/manifest_body.h>

#include "src/platform/text.h"

namespace ZvVesk2 {

// The destructors live here, so that each class has one vtable, in the library.
BodyObject::~BodyObject() = default;
BodyFile::~BodyFile() = default;

int BodyObject::Cmp(const void* a, const void* b) {
  const char* const left = (*static_cast<BodyObject* const*>(a))->GetName();
  const char* const right = (*static_cast<BodyObject* const*>(b))->GetName();
  if (left == nullptr) return 1;
  if (right == nullptr) return -1;
  return ZVsysutil::zv_filenamecmp(left, right);
}

bool BodyFile::Equal(const unsigned char* digest, int length) const {
  return length >= 0 && hashLength == static_cast<uint32_t>(length) &&
         (length == 0 || std::memcmp(hash, digest, hashLength) == 0);
}

bool BodyFile::Equal(const BodyObject* other) const {
  const auto* const file = dynamic_cast<const BodyFile*>(other);
  return file != nullptr && Equal(file->hash, static_cast<int>(file->hashLength));
}

void BodyFile::SetHash(const unsigned char* digest) {
  std::copy_n(digest, sizeof hash, hash);
  hashLength = sizeof hash;
}

BodyDirectory::BodyDirectory(Vesk2ContextStruct* ctx) : BodyObject(ctx) { SetIsDirectory(true); }
BodyDirectory::~BodyDirectory() = default;

}  // namespace ZvVesk2
