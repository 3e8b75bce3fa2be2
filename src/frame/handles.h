// Owners of platform handles, so that no error path releases one by hand.
#ifndef VESK2_SRC_FRAME_HANDLES_H
#define VESK2_SRC_FRAME_HANDLES_H

#include <cstdint>
#include <memory>

#include <vesk2/platform.h>

#include "src/platform/crypto.h"

namespace ZvVesk2 {

struct BufferFree {
  void operator()(ZvBuffer* buffer) const { ZVsysutil::zv_buffer_free(buffer); }
};
using BufferOwner = std::unique_ptr<ZvBuffer, BufferFree>;

struct HashFree {
  uint32_t handle;  // the context's cryptoHandle
  void operator()(ZVCLMHashContextData* hash) const { zvclm_HashFree(hash, handle); }
};
using HashOwner = std::unique_ptr<ZVCLMHashContextData, HashFree>;

}  // namespace ZvVesk2

#endif  // VESK2_SRC_FRAME_HANDLES_H
