// Hash::HashFile: the SHA-256 of a file, the loop that most of a manifest's verification time goes
// through.
#include <vesk2/hash.h>

#include <cerrno>
#include <memory>

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

int FeedFile(ZVCLMHashContextData* hash, ZvFile* file, uint32_t handle) {
  const std::unique_ptr<unsigned char[]> buffer(TryNewArray<unsigned char>(kBufferSize));
  VESK2_REQUIRE(buffer, VESK2_ERR_MEM_ALLOC);
  unsigned char* const bytes = buffer.get();
  ZVsysutil::ZvReader reader(file);
  ZVCLMHashFeed feed(hash);
  while (const size_t count = zv_read(reader, bytes, kReadSize)) {
    VESK2_TRY(zvclm_HashUpdate(feed, bytes, count, handle));
  }
  return 0;
}

int DigestFile(const char* path, unsigned char* digest, uint32_t handle) {
  errno = 0;
  const std::unique_ptr<ZvFile, FileClose> file(ZVsysutil::zv_open(path, ZVsysutil::ZV_READ));
  // A file that there was no memory for is not a missing one.
  VESK2_REQUIRE(file || errno != ENOMEM, VESK2_ERR_MEM_ALLOC);
  VESK2_REQUIRE(file, VESK2_ERR_FILE_OPEN);
  ZVCLMHashContextData* started = nullptr;
  VESK2_TRY(zvclm_HashAlloc(&started, ZVCLM_HASH_SHA256, handle));
  const HashOwner hash(started, HashFree{handle});
  VESK2_TRY(FeedFile(hash.get(), file.get(), handle));
  // A torn file must not pass for a whole one: neither the prefix before a read error nor a mixture
  // of two versions.
  VESK2_REQUIRE(!ZVsysutil::zv_failed(file.get()) && ZVsysutil::zv_unchanged(file.get()),
                VESK2_ERR_READ_FILE);
  return zvclm_HashFinal(hash.get(), digest, handle);
}

}  // namespace

int Hash::HashFile(const char* path, unsigned char* digest, unsigned int* digestLength,
                   Vesk2ContextStruct* context) {
  VESK2_REQUIRE(path != nullptr && digest != nullptr && digestLength != nullptr,
                VESK2_ERR_INVALID_PARAM);
  ZVCLMHashInfo info{};
  info.size = sizeof(info);
  VESK2_TRY(zvclm_HashInfo(ZVCLM_HASH_SHA256, &info));
  VESK2_REQUIRE(*digestLength == 0 || *digestLength >= info.digestLength,
                VESK2_ERR_BUFFER_OVERFLOW);
  const int code = DigestFile(path, digest, context != nullptr ? context->cryptoHandle : 0);
  *digestLength = code == 0 ? info.digestLength : 0;
  return code;
}

}  // namespace ZvVesk2
