#include "tests/sweep/failing_memory.h"

#include <cstdlib>
#include <new>

namespace {

long countdown = -1;
bool fired = false;

bool Fails() {
  if (countdown < 0 || fired) return false;
  if (countdown-- > 0) return false;
  fired = true;
  return true;
}

}  // namespace

namespace vesk2test {

void Arm(long n) {
  fired = false;
  countdown = n;
}

bool Disarm() {
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
  return Fails() ? nullptr : std::malloc(size);
}
void* operator new[](size_t size) { return ::operator new(size); }
void* operator new[](size_t size, const std::nothrow_t& tag) noexcept {
  return ::operator new(size, tag);
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, size_t) noexcept { std::free(memory); }
void operator delete[](void* memory) noexcept { std::free(memory); }
void operator delete[](void* memory, size_t) noexcept { std::free(memory); }
