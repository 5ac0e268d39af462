// SPDX-License-Identifier: MIT
// This test program's memory: no single object may be larger than 1 GiB. A count that no memory can hold thus
// fails in the same way on every machine and in every build, also where the system promises what it lacks.
#include <cstddef>
#include <cstdlib>
#include <new>

namespace {

constexpr std::size_t kLargestObjectInBytes = std::size_t{1} << 30;

}  // namespace

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  return size > kLargestObjectInBytes ? nullptr : std::malloc(size == 0 ? 1 : size);
}

void* operator new(std::size_t size) {
  void* const memory = operator new(size, std::nothrow);
  if (memory == nullptr) throw std::bad_alloc();
  return memory;
}

void* operator new[](std::size_t size) { return operator new(size); }
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
  return operator new(size, std::nothrow);
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete[](void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t) noexcept { std::free(memory); }
void operator delete[](void* memory, std::size_t) noexcept { std::free(memory); }
