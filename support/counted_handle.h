// SPDX-License-Identifier: MIT
// Counted handles to objects that carry their own count.
//
// Threads: one. Counts are plain integers.
#pragma once

#include <cstdint>

namespace NiduCOM {

/// How a handle takes a pointer over.
enum class AddRef : int {
  kTake = 0,   ///< Counts a new reference.
  kAdopt = 1,  ///< Any value but 0: adopts a reference that the caller owns already.
};

namespace RefCount {

/// Gives one reference back and returns the new count. At 0 the object is destroyed and freed.
template <class T>
std::uint32_t Release(T* p) {
  const std::uint32_t count = --p->refCount;
  if (count == 0) delete p;
  return count;
}

}  // namespace RefCount

/// Shares a T, which has an unsigned 32-bit member `refCount`. May be null.
template <class T>
class i_ptr {
 public:
  i_ptr() = default;
  i_ptr(const i_ptr& other) { reset(other.pointer, AddRef::kTake); }
  i_ptr& operator=(const i_ptr& other) {
    if (this != &other) reset(other.pointer, AddRef::kTake);
    return *this;
  }
  ~i_ptr() {
    if (pointer != nullptr) RefCount::Release(pointer);
  }

  /// Holds `p` from now on. The new reference is taken before the old one is given up, so a handle may be
  /// reset to what it holds.
  void reset(T* p, AddRef tag) {
    T* old = pointer;
    pointer = p;
    if (p != nullptr && tag == AddRef::kTake) ++p->refCount;
    if (old != nullptr) RefCount::Release(old);
  }

  [[nodiscard]] T* get() const { return pointer; }
  T* operator->() const { return pointer; }
  T& operator*() const { return *pointer; }

 private:
  T* pointer = nullptr;
};

}  // namespace NiduCOM
