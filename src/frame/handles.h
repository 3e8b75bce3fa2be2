// Owners of platform handles, so that no error path releases one by hand.
#ifndef VESK2_SRC_FRAME_HANDLES_H
#define VESK2_SRC_FRAME_HANDLES_H

#include <cerrno>
#include <cstdint>
#include <memory>

#include <vesk2/platform.h>

#include "src/platform/crypto.h"
#include "src/platform/file.h"

namespace ZvVesk2 {

struct BufferFree {
  void operator()(ZvBuffer* buffer) const { ZVsysutil::zv_buffer_free(buffer); }
};
using BufferOwner = std::unique_ptr<ZvBuffer, BufferFree>;

// WrapFile reads a file into `out`. Returns `failure` when it cannot be read, but
// VESK2_ERR_MEM_ALLOC for lack of memory: taken for a missing file, a revocation list would count
// for nothing. `listed`: a ZvDir says that it is a regular file.
[[nodiscard]] inline int WrapFile(BufferOwner& out, const char* path, int failure,
                                  bool listed = false) {
  errno = 0;
  out.reset(ZVsysutil::zv_buffer_wrap_file(path, listed));
  if (out != nullptr) return 0;
  return errno == ENOMEM ? VESK2_ERR_MEM_ALLOC : failure;
}

struct HashFree {
  uint32_t handle;  // the context's cryptoHandle
  void operator()(ZVCLMHashContextData* hash) const { zvclm_HashFree(hash, handle); }
};
using HashOwner = std::unique_ptr<ZVCLMHashContextData, HashFree>;

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_HANDLES_H
