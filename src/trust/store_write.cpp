// See store_write.h.
#include "src/trust/store_write.h"

#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <memory>

#include "src/frame/check.h"
#include "src/platform/file.h"

namespace ZvVesk2 {
namespace {

using namespace ZVsysutil;

// The longest name that a file system takes.
constexpr size_t kMaxFileName = 255;

// "<path>.tmp<pid>", which no scan of a store matches; a long name is cut to make room.
std::unique_ptr<char[]> TemporaryPath(const char* path) {
  char suffix[32];
  std::snprintf(suffix, sizeof suffix, ".tmp%ld", static_cast<long>(getpid()));
  const char* const slash = std::strrchr(path, '/');
  const size_t directory = slash != nullptr ? static_cast<size_t>(slash - path) + 1 : 0;
  const size_t name = std::min(std::strlen(path) - directory, kMaxFileName - std::strlen(suffix));
  const size_t size = directory + name + std::strlen(suffix) + 1;
  std::unique_ptr<char[]> temporary(TryNewArray<char>(size));
  if (temporary) {
    std::snprintf(temporary.get(), size, "%.*s%s", static_cast<int>(directory + name), path,
                  suffix);
  }
  return temporary;
}

int WriteNew(SExpression* object, const char* path) {
  ZvFile* const file = zv_create_new(path);
  VESK2_REQUIRE(file != nullptr, VESK2_ERR_FILE_OPEN);
  int code = object->PrintCanonical(zv_stream(file));
  if (code == 0) code = zv_sync(file);
  const int closed = zv_close(file);
  return code != 0 ? code : closed;
}

}  // namespace

int WriteStored(SExpression* object, const char* path) {
  const std::unique_ptr<char[]> temporary = TemporaryPath(path);
  VESK2_REQUIRE(temporary, VESK2_ERR_MEM_ALLOC);
  // A process of this number that died here left its file behind.
  static_cast<void>(std::remove(temporary.get()));
  int code = WriteNew(object, temporary.get());
  if (code == 0 && std::rename(temporary.get(), path) != 0) code = VESK2_ERR_WRITE_FILE;
  if (code != 0) static_cast<void>(std::remove(temporary.get()));
  return code;
}

}  // namespace ZvVesk2
