// SPDX-License-Identifier: Apache-2.0
// ref.h: Ref<T>, the owner of one reference to a counted value.
#ifndef VESK2_REF_H
#define VESK2_REF_H

#include <utility>

namespace ZvVesk2 {

// Ref owns one reference and frees it when it goes. Values start with one reference, which belongs
// to whoever made them: adopt it with Ref(p). Share(p) takes a further reference to a borrowed
// value. Release hands the reference out; Out passes the pointer to a factory that fills it.
template <typename T>
class Ref {
 public:
  Ref() = default;
  explicit Ref(T* adopted) : value_(adopted) {}
  Ref(Ref&& other) noexcept : value_(other.Release()) {}
  Ref& operator=(Ref&& other) noexcept {
    Reset(other.Release());
    return *this;
  }
  Ref(const Ref&) = delete;
  Ref& operator=(const Ref&) = delete;
  ~Ref() { Reset(); }

  static Ref Share(T* borrowed) {
    if (borrowed != nullptr) borrowed->IncrementRefCount();
    return Ref(borrowed);
  }

  T* get() const { return value_; }
  T* operator->() const { return value_; }
  T& operator*() const { return *value_; }
  explicit operator bool() const { return value_ != nullptr; }

  // Gives the reference to the caller.
  [[nodiscard]] T* Release() { return std::exchange(value_, nullptr); }
  void Reset(T* adopted = nullptr) {
    T* old = std::exchange(value_, adopted);
    if (old != nullptr) old->Free();
  }
  // Frees what is held and exposes the pointer, null, for a factory's out-parameter.
  T*& Out() {
    Reset();
    return value_;
  }

 private:
  T* value_ = nullptr;
};

}  // namespace ZvVesk2

#endif  // VESK2_REF_H
