// SPDX-License-Identifier: Apache-2.0
// ref.h: Ref<T>, the owner of one reference to a counted value.
//
//   Ref<SExpression> list;
//   code = SExpression::ParseAdvanced(list.Out(), text, nullptr);       a factory fills it
//   Ref<SExpression> again = Ref<SExpression>::Share(list.get());       a reference of its own
//   code = other->Insert(again.get());                                  which takes over ...
//   if (code == 0) (void)again.Release();                               ... so it is not ours now
#ifndef VESK2_REF_H
#define VESK2_REF_H

#include <utility>

namespace ZvVesk2 {

// Ref owns one reference and frees it when it goes. Values start with one reference, which belongs
// to whoever made them: adopt it with Ref(p). Share(p) takes a further reference to a borrowed
// value. Release hands the reference out; Out passes the pointer to a factory that fills it.
//
// A Ref can be moved and not copied: a second reference is written as Share. It is compiled into
// the program and calls nothing but IncrementRefCount and Free. It belongs to a thread as its value
// does.
template <typename T>
class Ref {
 public:
  // An empty Ref, of no value.
  Ref() = default;
  // Adopts the caller's reference; null makes an empty one.
  explicit Ref(T* adopted) : value_(adopted) {}
  // Moving leaves `other` empty; what the target held is freed.
  Ref(Ref&& other) noexcept : value_(other.Release()) {}
  Ref& operator=(Ref&& other) noexcept {
    Reset(other.Release());
    return *this;
  }
  Ref(const Ref&) = delete;
  Ref& operator=(const Ref&) = delete;
  // Gives its reference back.
  ~Ref() { Reset(); }

  // A Ref with a new reference to a value that somebody else holds; empty for null.
  static Ref Share(T* borrowed) {
    if (borrowed != nullptr) borrowed->IncrementRefCount();
    return Ref(borrowed);
  }

  // The value, borrowed; null, and not to be followed, when it is empty.
  T* get() const { return value_; }
  // As get; an empty one must not be followed.
  T* operator->() const { return value_; }
  T& operator*() const { return *value_; }
  // Whether it holds a value: after a factory, whether there was memory.
  explicit operator bool() const { return value_ != nullptr; }

  // Gives the reference to the caller, and is empty then.
  [[nodiscard]] T* Release() { return std::exchange(value_, nullptr); }
  // Frees what is held and adopts the caller's reference instead.
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
