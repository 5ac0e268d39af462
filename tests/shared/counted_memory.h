// SPDX-License-Identifier: MIT
// The malloc and free of a test program, as the linker hands them over (--wrap): they record what passes
// through and fail as told.
//
//   const MemoryWatch watch;
//   buffer.setSize(64);
//   EXPECT_THAT(watch.events(), ElementsAre("malloc 64"));
//
// A block made under a watch is filled with #. One watch at a time, on one thread; without one, memory is as
// ever.
#pragma once

#include <cstddef>
#include <string>
#include <vector>

class MemoryWatch {
 public:
  MemoryWatch();
  ~MemoryWatch();
  MemoryWatch(const MemoryWatch&) = delete;
  MemoryWatch& operator=(const MemoryWatch&) = delete;

  /// Every malloc from now on answers null.
  void exhaust();

  /// What happened so far, in order: "malloc 64", "malloc 64 failed", "free 64", and "free other" for a block
  /// that was not made under this watch. Freeing null is not shown.
  [[nodiscard]] std::vector<std::string> events() const;

  /// How many of the blocks made under this watch are not freed yet.
  [[nodiscard]] int blocksAlive() const;
};
