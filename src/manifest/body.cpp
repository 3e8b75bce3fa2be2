// SPDX-License-Identifier: Apache-2.0
// The objects of a manifest body: what a file and a directory of the tree carry, and their order. A
// listing has an object for each file of a tree, of which there may be a million: they hold a name,
// a digest and little else.
#include <algorithm>
#include <cstring>

#include <vesk2/manifest_body.h>

#include "src/platform/text.h"

namespace ZvVesk2 {

BodyObject::BodyObject(Vesk2ContextStruct* ctx) : context(ctx) {}
BodyObject::~BodyObject() = default;

BodyFile::BodyFile(Vesk2ContextStruct* ctx) : BodyObject(ctx) {}
BodyFile::~BodyFile() = default;

// By bytes, as names have no encoding, and so that the order of the results is the same on every
// machine. Without a name it is last, where nobody looks for it.
int BodyObject::Cmp(const void* a, const void* b) {
  const char* const left = (*static_cast<BodyObject* const*>(a))->GetName();
  const char* const right = (*static_cast<BodyObject* const*>(b))->GetName();
  if (left == nullptr) return 1;
  if (right == nullptr) return -1;
  return ZVsysutil::zv_filenamecmp(left, right);
}

// A file without a digest equals none but an empty one: nothing passes for as listed because its
// digest was never set.
bool BodyFile::Equal(const unsigned char* digest, int length) const {
  return length >= 0 && hashLength == static_cast<uint32_t>(length) &&
         (length == 0 || std::memcmp(hash, digest, hashLength) == 0);
}

// What is no file differs from every file.
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

const char* BodyObject::GetName() const { return name.get(); }
uint32_t BodyObject::GetStatus() const { return status; }
bool BodyObject::GetIsDirectory() const { return isDirectory; }
Vesk2ContextStruct* BodyObject::GetContext() const { return context; }
void BodyObject::SetName(char* owned) { name.reset(owned); }
void BodyObject::SetStatus(uint32_t value) { status = value; }
void BodyObject::SetIsDirectory(bool value) { isDirectory = value; }
char* BodyObject::TakeName() { return name.release(); }

uint32_t BodyFile::GetHashLength() const { return hashLength; }

PointerArray<BodyObject>& BodyDirectory::GetFiles() { return files; }
PointerArray<BodyObject>& BodyDirectory::GetSubdirectories() { return subdirectories; }
PointerArray<char>& BodyDirectory::GetIgnored() { return ignored; }

const unsigned char* BodyFile::GetHash() const { return hash; }

}  // namespace ZvVesk2
