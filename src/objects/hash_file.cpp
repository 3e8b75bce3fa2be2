// Hash::HashFile: the SHA-256 of a file, the loop that most of a manifest's verification time goes
// through.
#include <vesk2/hash.h>

#include <cerrno>
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

struct FileClose {
  void operator()(ZvFile* file) const { ZVsysutil::zv_close(file); }
};

// What a loop that nobody watches tells: the calls of it cost nothing.
struct Unwatched {
  int Read(size_t) { return 0; }
  int End() { return 0; }
};

// Tells the callbacks about every kTold bytes.
class Watched {
 public:
  explicit Watched(const Vesk2FileCallbacks& callbacks) : callbacks_(callbacks) {}
  int Read(size_t count) {
    untold_ += count;
    return untold_ >= kTold ? End() : 0;
  }
  int End() {
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
int FeedFile(ZVCLMHashContextData* hash, ZvFile* file, uint32_t handle, Watch watch) {
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

int DigestOpened(ZvFile* file, unsigned char* digest, uint32_t handle,
                 const Vesk2FileCallbacks* callbacks) {
  ZVCLMHashContextData* started = nullptr;
  VESK2_TRY(zvclm_HashAlloc(&started, ZVCLM_HASH_SHA256, handle));
  const HashOwner hash(started, HashFree{handle});
  VESK2_TRY(callbacks == nullptr ? FeedFile(hash.get(), file, handle, Unwatched())
                                 : FeedFile(hash.get(), file, handle, Watched(*callbacks)));
  // A torn file must not pass for a whole one: neither the prefix before a read error nor a mixture
  // of two versions.
  VESK2_REQUIRE(!ZVsysutil::zv_failed(file) && ZVsysutil::zv_unchanged(file), VESK2_ERR_READ_FILE);
  return zvclm_HashFinal(hash.get(), digest, handle);
}

int DigestFile(const char* path, unsigned char* digest, uint32_t handle,
               const Vesk2FileCallbacks* callbacks) {
  errno = 0;
  const std::unique_ptr<ZvFile, FileClose> file(ZVsysutil::zv_open(path, ZVsysutil::ZV_READ));
  // A file that there was no memory for is not a missing one.
  VESK2_REQUIRE(file || errno != ENOMEM, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(file, VESK2_ERR_FILE_OPEN);
  if (callbacks == nullptr) return DigestOpened(file.get(), digest, handle, nullptr);
  const auto bytes = static_cast<uint64_t>(file->opened.st_size);
  const bool wanted =
      callbacks->fileStart == nullptr || callbacks->fileStart(callbacks->user, path, bytes) == 0;
  const int code =
      wanted ? DigestOpened(file.get(), digest, handle, callbacks) : VESK2_ERR_USER_INTERRUPT;
  if (callbacks->fileEnd != nullptr) callbacks->fileEnd(callbacks->user, path, code);
  return code;
}

}  // namespace

int Hash::HashFile(const char* path, unsigned char* digest, unsigned int* digestLength,
                   Vesk2ContextStruct* context) {
  return HashFile(path, digest, digestLength, context, nullptr);
}

int Hash::HashFile(const char* path, unsigned char* digest, unsigned int* digestLength,
                   Vesk2ContextStruct* context, const Vesk2FileCallbacks* callbacks) {
  VESK2_REQUIRE(path != nullptr && digest != nullptr && digestLength != nullptr,
                VESK2_ERR_INVALID_PARAM);
  ZVCLMHashInfo info{};
  info.size = sizeof(info);
  VESK2_TRY(zvclm_HashInfo(ZVCLM_HASH_SHA256, &info));
  VESK2_REQUIRE(*digestLength == 0 || *digestLength >= info.digestLength,
                VESK2_ERR_BUFFER_OVERFLOW);
  const uint32_t handle = context != nullptr ? context->cryptoHandle : 0;
  const int code = DigestFile(path, digest, handle, callbacks);
  *digestLength = code == 0 ? info.digestLength : 0;
  return code;
}

}  // namespace ZvVesk2
