// SPDX-License-Identifier: MIT
// Handles that share an object, which contains its own reference count.
//
// Threads: one. Counts are plain integers.
#pragma once

#include <cstdint>

namespace NiduCOM {

/// What reset() does to the count of the object that it is given.
enum class AddRef : int {
  kTake = 0,   ///< Adds one: the handle takes a new reference.
  kAdopt = 1,  ///< Nothing: the handle takes over a reference of the caller's. So does every value but 0.
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

  /// Holds `p` from now on. The new reference is taken before the old one is given back, so it is safe to
  /// reset a handle to the pointer that it holds.
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
