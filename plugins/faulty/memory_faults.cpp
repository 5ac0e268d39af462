// SPDX-License-Identifier: MIT
// Faults in the memory. Volatile pointers to volatile memory keep the compiler from seeing what is done on
// purpose.
#include <cstdlib>

#include "plugins/faulty/faults.h"

namespace sample_plugins {
namespace {

const char kReadOnlyText[] = "a text in read-only memory";
volatile bool isDeepEnough = false;

__attribute__((noinline)) int descend(int depth) {
  volatile char frame[4096];
  frame[0] = static_cast<char>(depth);
  return isDeepEnough ? depth : descend(depth + 1) + frame[0];
}

}  // namespace

void writeToReadOnlyMemory() {
  volatile char* volatile text = const_cast<char*>(kReadOnlyText);
  *text = 'A';
}

void overflowTheStack() { descend(0); }

void freeTwice() {
  void* volatile block = std::malloc(100);
  std::free(block);
  std::free(block);
}

/// The next block's head is overwritten, which the heap notices when this one is freed.
void writeBehindABlock() {
  constexpr std::size_t kSize = 2000;  // More than the heap keeps in its unchecked caches.
  void* volatile block = std::malloc(kSize);
  void* volatile next = std::malloc(kSize);
  auto* bytes = static_cast<volatile char*>(block);
  for (std::size_t i = 0; i < kSize + 64; ++i) bytes[i] = 'A';
  std::free(block);
  std::free(next);
}

}  // namespace sample_plugins
