// SPDX-License-Identifier: Apache-2.0
// Hash::HashFile: the SHA-256 of a file, the loop that most of a manifest's verification time goes
// through. The bytes are asked for four at a time, by the contract of the layer below, and are
// moved in blocks all the same (ReadAndFeed): the file's block and the hash's block are filled and
// emptied where they stand.
#include "src/objects/hash_file.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "src/frame/check.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::zv_read;
using ZVsysutil::ZvFile;

// The file is read this many bytes a call, into a larger buffer; the layer below makes such small
// calls cheap.
constexpr size_t kReadSize = 4;
// Only its first bytes are used.
constexpr size_t kBufferSize = 1024;

// What a loop that nobody watches tells.
struct Unwatched {
  size_t Untroubled() const { return SIZE_MAX; }
  [[nodiscard]] int Read(size_t) { return 0; }
  [[nodiscard]] int End() { return 0; }
};

// Tells the callbacks about every kTold bytes. Whoever watches is asked between blocks, so that a
// callback can stop even a file of a terabyte soon.
class Watched {
 public:
  explicit Watched(const Vesk2FileCallbacks& callbacks) : callbacks_(callbacks) {}
  // The bytes that can be read before the next call back.
  size_t Untroubled() const { return kTold - untold_; }
  [[nodiscard]] int Read(size_t count) {
    untold_ += count;
    return untold_ >= kTold ? End() : 0;
  }
  // What is left is told before the file is done with, so that the bytes add up to what it held.
  [[nodiscard]] int End() {
    const size_t count = std::exchange(untold_, 0);
    if (count == 0 || callbacks_.fileBytes == nullptr) return 0;
    return callbacks_.fileBytes(callbacks_.user, count) == 0 ? 0 : VESK2_ERR_USER_INTERRUPT;
  }

 private:
  static constexpr size_t kTold = size_t{64} << 10;
  static_assert(kTold % kReadSize == 0);
  const Vesk2FileCallbacks& callbacks_;
  size_t untold_ = 0;
};

// As many calls of kReadSize bytes as both sides have at hand, one after the other; the compiler
// sees what they come to.
void ReadAndFeed(unsigned char* __restrict to, const unsigned char* __restrict from, size_t calls) {
  for (size_t i = 0; i < calls; ++i) {
    unsigned char read[kReadSize];
    std::memcpy(read, from + i * kReadSize, kReadSize);
    std::memcpy(to + i * kReadSize, read, kReadSize);
  }
}

}  // namespace

// It ends with the file, which yields no more bytes than it held when it was opened (file.h): one
// that grows as fast as it is read ends it as well.
template <typename Watch>
int FileDigester::Feed(Watch watch) {
  unsigned char* const bytes = buffer_.get();
  ZVsysutil::ZvReader reader(file_.get());
  ZVCLMHashFeed feed(hash_.get());
  for (;;) {
    const size_t calls = std::min({reader.Ready(), feed.Room(), watch.Untroubled()}) / kReadSize;
    ReadAndFeed(feed.Next(), reader.Next(), calls);
    reader.Skip(calls * kReadSize);
    feed.Filled(calls * kReadSize);
    VESK2_TRY(watch.Read(calls * kReadSize));
    // The call for which one side needs more.
    const size_t count = zv_read(reader, bytes, kReadSize);
    if (count == 0) return watch.End();
    VESK2_TRY(zvclm_HashUpdate(feed, bytes, count, handle_));
    VESK2_TRY(watch.Read(count));
  }
}

// Memory is taken for the first file and kept for all: a tree has a million, and an allocation for
// each is what would be measured.
int FileDigester::MakeReady() {
  if (file_ == nullptr) file_ = ZVsysutil::zv_reader();
  if (buffer_ == nullptr) buffer_.reset(TryNewArray<unsigned char>(kBufferSize));
  VESK2_REQUIRE(file_ != nullptr && buffer_ != nullptr, VESK2_ERR_MEM_ALLOC);
  if (hash_ != nullptr) return zvclm_HashRestart(hash_.get(), handle_);
  ZVCLMHashContextData* started = nullptr;
  VESK2_TRY(zvclm_HashAlloc(&started, ZVCLM_HASH_SHA256, handle_));
  hash_.reset(started);
  return 0;
}

int FileDigester::DigestOpened(unsigned char* digest, const Vesk2FileCallbacks* callbacks) {
  VESK2_TRY(callbacks == nullptr ? Feed(Unwatched()) : Feed(Watched(*callbacks)));
  // A torn file must not pass for a whole one: neither the prefix before a read error nor a mixture
  // of two versions.
  VESK2_TRY(ZVsysutil::zv_read_error(file_.get()));
  VESK2_TRY(ZVsysutil::zv_check_unchanged(file_.get()));
  return zvclm_HashFinal(hash_.get(), digest, handle_);
}

// fileEnd follows every fileStart, whatever came between, as callers free by it what they made. A
// file that cannot be opened is told of by neither.
int FileDigester::Digest(const FileToDigest& file, unsigned char (&digest)[kFileDigestSize],
                         bool& held) {
  held = false;
  VESK2_TRY(MakeReady());
  const int opened = ZVsysutil::zv_reopen(file_.get(), file.place);
  held = opened == VESK2_ERR_READ_FILE;
  VESK2_TRY(opened);
  int code = 0;
  if (callbacks_ == nullptr) {
    code = DigestOpened(digest, nullptr);
  } else {
    const auto bytes = static_cast<uint64_t>(file_->opened.st_size);
    const bool wanted = callbacks_->fileStart == nullptr ||
                        callbacks_->fileStart(callbacks_->user, file.path, bytes) == 0;
    code = wanted ? DigestOpened(digest, callbacks_) : VESK2_ERR_USER_INTERRUPT;
    if (callbacks_->fileEnd != nullptr) callbacks_->fileEnd(callbacks_->user, file.path, code);
  }
  ZVsysutil::zv_shut(file_.get());
  return code;
}

// The one form does the other's work without a listener.
int Hash::HashFile(const char* path, unsigned char* digest, unsigned int* digestLength,
                   Vesk2ContextStruct* context) {
  return HashFile(path, digest, digestLength, context, nullptr);
}

int Hash::HashFile(const char* path, unsigned char* digest, unsigned int* digestLength,
                   Vesk2ContextStruct* context, const Vesk2FileCallbacks* callbacks) {
  VESK2_REQUIRE(path != nullptr && digest != nullptr && digestLength != nullptr,
                VESK2_ERR_INVALID_PARAM);
  VESK2_REQUIRE(*digestLength == 0 || *digestLength >= kFileDigestSize, VESK2_ERR_BUFFER_OVERFLOW);
  unsigned char made[kFileDigestSize];
  bool held = false;
  FileDigester digester(context, callbacks);
  const int code = digester.Digest({{ZVsysutil::kZvNoDirectory, path}, path}, made, held);
  // Copied out only when all of the file is in it: a caller who forgets the code does not have half
  // a digest.
  if (code == 0) std::copy_n(made, kFileDigestSize, digest);
  *digestLength = code == 0 ? kFileDigestSize : 0;
  return code;
}

}  // namespace ZvVesk2
