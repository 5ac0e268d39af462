// SPDX-License-Identifier: MIT
// The replaced malloc and operators. They stand apart from the tests, so that inlining matches no new with a
// free.
#include "tests/shared/scarce_memory.h"

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <new>

namespace {

constexpr std::size_t kNoLimit = std::numeric_limits<std::size_t>::max();
constexpr std::size_t kMostFilled = std::size_t{1} << 20;

std::atomic<std::size_t> largestBlock{kNoLimit};
bool isToFail = false;
int allocationsLeft = 0;

}  // namespace

// NOLINTBEGIN(bugprone-reserved-identifier): the linker's names
extern "C" void* __real_malloc(std::size_t size);

extern "C" void* __wrap_malloc(std::size_t size) {
  void* const block = size <= largestBlock ? __real_malloc(size) : nullptr;
  if (block != nullptr) std::memset(block, 0xEE, std::min(size, kMostFilled));
  return block;
}
// NOLINTEND(bugprone-reserved-identifier)

void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  return std::malloc(size == 0 ? 1 : size);
}

void* operator new(std::size_t size) {
  if (isToFail && allocationsLeft-- == 0) {
    isToFail = false;
    throw std::bad_alloc();
  }
  if (void* const block = operator new(size, std::nothrow)) return block;
  throw std::bad_alloc();
}

void* operator new[](std::size_t size) { return operator new(size); }
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept {
  return operator new(size, std::nothrow);
}
void operator delete(void* block) noexcept { std::free(block); }
void operator delete(void* block, std::size_t) noexcept { std::free(block); }
void operator delete(void* block, const std::nothrow_t&) noexcept { std::free(block); }
void operator delete[](void* block) noexcept { std::free(block); }
void operator delete[](void* block, std::size_t) noexcept { std::free(block); }
void operator delete[](void* block, const std::nothrow_t&) noexcept { std::free(block); }

namespace preset_tests {

ScarceMemory::ScarceMemory(std::size_t largestBlockInBytes) { largestBlock = largestBlockInBytes; }
ScarceMemory::~ScarceMemory() { largestBlock = kNoLimit; }

void failAfterAllocations(int count) {
  allocationsLeft = count;
  isToFail = true;
}

bool stopFailing() {
  const bool didNotFail = isToFail;
  isToFail = false;
  return didNotFail;
}

}  // namespace preset_tests
