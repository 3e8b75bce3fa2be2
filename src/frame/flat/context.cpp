// SPDX-License-Identifier: Apache-2.0
// Flat functions: the context, and memory that was handed out. What is handed out for Vesk2Free
// comes from new char[] or new unsigned char[] everywhere in the library: one function can release
// it without knowing what it was.
#include <vesk2.h>

#include "src/frame/check.h"

// The handle is only carried: the crypto layer beneath is libcrypto, which needs none.
int Vesk2Init(Vesk2ContextStruct** ctx, uint32_t value) {
  if (ctx == nullptr) return 0;  // callers without a use for a context may say so
  *ctx = ZvVesk2::TryNew<Vesk2ContextStruct>();
  VESK2_REQUIRE(*ctx != nullptr, VESK2_ERR_MEM_ALLOC);
  (*ctx)->cryptoHandle = value;
  return 0;
}

int Vesk2FreeContext(Vesk2ContextStruct* ctx) {
  delete ctx;
  return 0;
}

// Everything handed out for Vesk2Free is an array of characters or bytes.
void Vesk2Free(void* array) { delete[] static_cast<char*>(array); }

void Vesk2DoNothing(void) {}
