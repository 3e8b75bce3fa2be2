// Hash::HashFile: the SHA-256 of a file, the loop that most of a manifest's verification time goes
// through.
#include "src/objects/hash_file.h"

#include <algorithm>
#include <memory>
#include <utility>

#include "src/frame/check.h"
#include "src/frame/handles.h"
#include "src/platform/file.h"

namespace ZvVesk2 {
namespace {

using ZVsysutil::zv_read;
using ZVsysutil::ZvFile;

// The file is read this many bytes a call, into a larger buffer; callers rely on the calls being
// this small, and the layer below makes them cheap.
constexpr size_t kReadSize = 4;
constexpr size_t kBufferSize = 1024;

// What a loop that nobody watches tells: the calls of it cost nothing.
struct Unwatched {
  [[nodiscard]] int Read(size_t) { return 0; }
  [[nodiscard]] int End() { return 0; }
};

// Tells the callbacks about every kTold bytes.
class Watched {
 public:
  explicit Watched(const Vesk2FileCallbacks& callbacks) : callbacks_(callbacks) {}
  [[nodiscard]] int Read(size_t count) {
    untold_ += count;
    return untold_ >= kTold ? End() : 0;
  }
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

template <typename Watch>
[[nodiscard]] int FeedFile(ZVCLMHashContextData* hash, ZvFile* file, uint32_t handle, Watch watch) {
  const std::unique_ptr<unsigned char[]> buffer(TryNewArray<unsigned char>(kBufferSize));
  VESK2_REQUIRE(buffer, VESK2_ERR_MEM_ALLOC);
  unsigned char* const bytes = buffer.get();
  ZVsysutil::ZvReader reader(file);
  ZVCLMHashFeed feed(hash);
  while (const size_t count = zv_read(reader, bytes, kReadSize)) {
    VESK2_TRY(zvclm_HashUpdate(feed, bytes, count, handle));
    VESK2_TRY(watch.Read(count));
  }
  return watch.End();
}

[[nodiscard]] int DigestOpened(ZvFile* file, unsigned char* digest, uint32_t handle,
                               const Vesk2FileCallbacks* callbacks) {
  ZVCLMHashContextData* started = nullptr;
  VESK2_TRY(zvclm_HashAlloc(&started, ZVCLM_HASH_SHA256, handle));
  const HashOwner hash(started, HashFree{handle});
  VESK2_TRY(callbacks == nullptr ? FeedFile(hash.get(), file, handle, Unwatched())
                                 : FeedFile(hash.get(), file, handle, Watched(*callbacks)));
  // A torn file must not pass for a whole one: neither the prefix before a read error nor a mixture
  // of two versions.
  VESK2_TRY(ZVsysutil::zv_read_error(file));
  VESK2_TRY(ZVsysutil::zv_check_unchanged(file));
  return zvclm_HashFinal(hash.get(), digest, handle);
}

}  // namespace

int DigestFile(const char* path, unsigned char (&digest)[kFileDigestSize], bool& held,
               Vesk2ContextStruct* context, const Vesk2FileCallbacks* callbacks) {
  const uint32_t handle = context != nullptr ? context->cryptoHandle : 0;
  ZVsysutil::ZvFileOwner file;
  const int opened = ZVsysutil::zv_open(file, path, ZVsysutil::ZV_READ);
  held = opened == VESK2_ERR_READ_FILE;
  VESK2_TRY(opened);
  if (callbacks == nullptr) return DigestOpened(file.get(), digest, handle, nullptr);
  const auto bytes = static_cast<uint64_t>(file->opened.st_size);
  const bool wanted =
      callbacks->fileStart == nullptr || callbacks->fileStart(callbacks->user, path, bytes) == 0;
  const int code =
      wanted ? DigestOpened(file.get(), digest, handle, callbacks) : VESK2_ERR_USER_INTERRUPT;
  if (callbacks->fileEnd != nullptr) callbacks->fileEnd(callbacks->user, path, code);
  return code;
}

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
  const int code = DigestFile(path, made, held, context, callbacks);
  if (code == 0) std::copy_n(made, kFileDigestSize, digest);
  *digestLength = code == 0 ? kFileDigestSize : 0;
  return code;
}

}  // namespace ZvVesk2
