// SPDX-License-Identifier: MIT
// The doors that memory comes through, with a limit.
#include "tests/shared/scarce_memory.h"

#include <atomic>
#include <cstdlib>
#include <limits>
#include <new>

namespace {

std::atomic<std::size_t> largestBlock{std::numeric_limits<std::size_t>::max()};

}  // namespace

// NOLINTBEGIN(bugprone-reserved-identifier): the linker's names
extern "C" void* __real_malloc(std::size_t size);

extern "C" void* __wrap_malloc(std::size_t size) {
  return size <= largestBlock ? __real_malloc(size) : nullptr;
}
// NOLINTEND(bugprone-reserved-identifier)

void* operator new(std::size_t size) {
  if (void* block = std::malloc(size == 0 ? 1 : size)) return block;
  throw std::bad_alloc();
}

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  return std::malloc(size == 0 ? 1 : size);
}

void operator delete(void* block) noexcept { std::free(block); }
void operator delete(void* block, std::size_t) noexcept { std::free(block); }
void operator delete(void* block, const std::nothrow_t&) noexcept { std::free(block); }

namespace preset_tests {

ScarceMemory::ScarceMemory(std::size_t largestBlockInBytes) { largestBlock = largestBlockInBytes; }

ScarceMemory::~ScarceMemory() { largestBlock = std::numeric_limits<std::size_t>::max(); }

}  // namespace preset_tests
