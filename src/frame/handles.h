// SPDX-License-Identifier: Apache-2.0
// Owners of platform handles, so that no error path releases one by hand. Each is a unique_ptr with
// the handle's own way of being freed.
#ifndef VESK2_SRC_FRAME_HANDLES_H
#define VESK2_SRC_FRAME_HANDLES_H

#include <cstdint>
#include <memory>

#include <vesk2/platform.h>

#include "src/frame/check.h"
#include "src/platform/crypto.h"
#include "src/platform/file.h"

namespace ZvVesk2 {

struct BufferFree {
  void operator()(ZvBuffer* buffer) const { ZVsysutil::zv_buffer_free(buffer); }
};
using BufferOwner = std::unique_ptr<ZvBuffer, BufferFree>;

// WrapFile reads a file into `out`. Returns `failure` when it cannot be read, but
// VESK2_ERR_MEM_ALLOC and VESK2_ERR_READ_FILE (held by another process) as they are: taken for a
// missing file, a revocation list would count for nothing.
[[nodiscard]] inline int WrapFile(BufferOwner& out, const ZVsysutil::ZvPlace& place, int failure) {
  ZvBuffer* read = nullptr;
  const int code = ZVsysutil::zv_buffer_read_file(&read, place);
  out.reset(read);
  if (code == 0 || IsNoAbsence(code)) return code;
  return failure;
}
[[nodiscard]] inline int WrapFile(BufferOwner& out, const char* path, int failure) {
  return WrapFile(out, ZVsysutil::ZvPlace{ZVsysutil::kZvNoDirectory, path}, failure);
}

// The handle is kept, as freeing asks for it as well.
struct HashFree {
  uint32_t handle;  // the context's cryptoHandle
  void operator()(ZVCLMHashContextData* hash) const { zvclm_HashFree(hash, handle); }
};
using HashOwner = std::unique_ptr<ZVCLMHashContextData, HashFree>;

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_HANDLES_H
