// SPDX-License-Identifier: MIT
// The memory of a test program: malloc and operator new, which fail where a test says so.
//
// While a ScarceMemory exists, no block above its limit can be allocated, on every machine and with every
// sanitizer. failAfterAllocations() lets a single operator new fail. New blocks are filled with 0xEE (their
// first MiB), so that no test passes just because fresh memory is zero.
//
// The test program is linked with -Wl,--wrap=malloc, so the limit on malloc holds for its own code and the
// program's, not for shared libraries.
//
// Threads: the limit and the failure hold for the whole process.
#pragma once

#include <cstddef>

namespace preset_tests {

/// While it exists, malloc returns null and operator new throws std::bad_alloc for a block above the limit.
class ScarceMemory {
 public:
  explicit ScarceMemory(std::size_t largestBlockInBytes);
  ~ScarceMemory();
  ScarceMemory(const ScarceMemory&) = delete;
  ScarceMemory& operator=(const ScarceMemory&) = delete;
};

/// The next `count` calls of operator new succeed, the one after them throws std::bad_alloc, later ones
/// succeed. Calls of the nothrow form do not count and do not fail: their callers go on without memory.
void failAfterAllocations(int count);

/// Lets all allocations succeed again. True if the one that was to fail has not been made.
bool stopFailing();

}  // namespace preset_tests
