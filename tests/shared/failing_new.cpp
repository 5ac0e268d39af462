// SPDX-License-Identifier: MIT
// The replaced operators. They stand apart from the tests, so that no new is matched with a free by inlining.
#include "tests/shared/failing_new.h"

#include <cstdlib>
#include <new>

namespace host_tests {
namespace {

bool isToFail = false;
int allocationsLeft = 0;

}  // namespace

void failAfterAllocations(int count) {
  allocationsLeft = count;
  isToFail = true;
}

bool stopFailing() {
  const bool didNotFail = isToFail;
  isToFail = false;
  return didNotFail;
}

}  // namespace host_tests

void* operator new(std::size_t size) {
  if (host_tests::isToFail && host_tests::allocationsLeft-- == 0) {
    host_tests::isToFail = false;
    throw std::bad_alloc();
  }
  if (void* const block = std::malloc(size == 0 ? 1 : size)) return block;
  throw std::bad_alloc();
}
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  return std::malloc(size == 0 ? 1 : size);
}
void operator delete(void* block) noexcept { std::free(block); }
void operator delete(void* block, std::size_t) noexcept { std::free(block); }
void operator delete(void* block, const std::nothrow_t&) noexcept { std::free(block); }
