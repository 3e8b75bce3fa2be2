// SPDX-License-Identifier: Apache-2.0
#include "tests/sweep/failing_memory.h"

#include <openssl/crypto.h>

#include <cstdlib>
#include <new>

using namespace vesk2test;

namespace {

long countdown = -1;
Shortage kind = Shortage::kOnce;
Fired fired = Fired::kNot;

bool Fails(Fired whose) {
  if (countdown < 0) return false;
  if (fired != Fired::kNot) return kind == Shortage::kLasting;
  if (countdown-- > 0) return false;
  countdown = 0;
  fired = whose;
  return true;
}

void* Allocate(size_t size, const char*, int) {
  return Fails(Fired::kLibcrypto) ? nullptr : std::malloc(size);
}
void* Reallocate(void* memory, size_t size, const char*, int) {
  return Fails(Fired::kLibcrypto) ? nullptr : std::realloc(memory, size);
}
void Release(void* memory, const char*, int) { std::free(memory); }

// Possible only before the first allocation of libcrypto.
[[maybe_unused]] const bool replaced = [] {
  if (CRYPTO_set_mem_functions(Allocate, Reallocate, Release) != 1) std::abort();
  return true;
}();

}  // namespace

namespace vesk2test {

void Arm(long n, Shortage shortage) {
  kind = shortage;
  fired = Fired::kNot;
  countdown = n;
}

Fired Disarm() {
  countdown = -1;
  return fired;
}

}  // namespace vesk2test

void* operator new(size_t size) {
  void* memory = std::malloc(size);
  if (memory == nullptr) std::abort();
  return memory;
}
void* operator new(size_t size, const std::nothrow_t&) noexcept {
  return Fails(Fired::kLibrary) ? nullptr : std::malloc(size);
}
void* operator new[](size_t size) { return ::operator new(size); }
void* operator new[](size_t size, const std::nothrow_t& tag) noexcept {
  return ::operator new(size, tag);
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, size_t) noexcept { std::free(memory); }
void operator delete[](void* memory) noexcept { std::free(memory); }
void operator delete[](void* memory, size_t) noexcept { std::free(memory); }
