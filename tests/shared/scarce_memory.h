// SPDX-License-Identifier: MIT
// Makes memory scarce: while a ScarceMemory lives, no block above its limit can be had.
//
// malloc answers null and operator new throws std::bad_alloc, whatever the machine has and whichever
// sanitizer is on. The test program is linked with -Wl,--wrap=malloc, so this holds for its own code and the
// program's, not for shared libraries.
//
// Threads: the limit is one for the whole process.
#pragma once

#include <cstddef>

namespace preset_tests {

class ScarceMemory {
 public:
  explicit ScarceMemory(std::size_t largestBlockInBytes);
  /// All the memory there is again.
  ~ScarceMemory();
  ScarceMemory(const ScarceMemory&) = delete;
  ScarceMemory& operator=(const ScarceMemory&) = delete;
};

}  // namespace preset_tests
