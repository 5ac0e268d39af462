// SPDX-License-Identifier: MIT
// The malloc and free of a test program, which the linker leads here (--wrap): they record each call and fail
// when a test says so.
//
//   const MemoryWatch watch;
//   buffer.setSize(64);
//   EXPECT_THAT(watch.events(), ElementsAre("malloc 64"));
//
// A block made under a watch is filled with '#'. One watch at a time, on one thread; without a watch, malloc
// and free are the system's.
#pragma once

#include <string>
#include <vector>

class MemoryWatch {
 public:
  MemoryWatch();
  ~MemoryWatch();
  MemoryWatch(const MemoryWatch&) = delete;
  MemoryWatch& operator=(const MemoryWatch&) = delete;

  /// Every malloc from now on returns null.
  void exhaust();

  /// What happened so far, in order: "malloc 64", "malloc 64 failed", "free 64", and "free other" for a block
  /// that is not of this watch, or no longer. Freeing null is not shown.
  [[nodiscard]] std::vector<std::string> events() const;
};
