// SPDX-License-Identifier: MIT
// No container is used while calls are recorded: its memory would be recorded, too.
#include "tests/shared/counted_memory.h"

#include <cstddef>
#include <cstdlib>
#include <cstring>

extern "C" {
void* __real_malloc(std::size_t sizeInBytes);
void __real_free(void* block);
void* __wrap_malloc(std::size_t sizeInBytes);
void __wrap_free(void* block);
}

namespace {

struct Call {
  bool isMalloc;
  std::size_t sizeInBytes;
  void* block;  // Of a malloc: null when it failed and once the block is freed. Of a free: null for "other".
  bool failed;
};

constexpr int kRoom = 1000;
Call recorded[kRoom];
int recordedCount = 0;
bool watching = false;
bool exhausted = false;

void record(const Call& call) {
  if (recordedCount == kRoom) std::abort();
  recorded[recordedCount++] = call;
}

std::string described(const Call& call) {
  const std::string size = std::to_string(call.sizeInBytes);
  if (call.isMalloc) return "malloc " + size + (call.failed ? " failed" : "");
  return "free " + (call.block == nullptr ? "other" : size);
}

}  // namespace

void* __wrap_malloc(std::size_t sizeInBytes) {
  if (!watching) return __real_malloc(sizeInBytes);
  void* const block = exhausted ? nullptr : __real_malloc(sizeInBytes);
  if (block != nullptr) std::memset(block, '#', sizeInBytes);
  record({true, sizeInBytes, block, block == nullptr});
  return block;
}

void __wrap_free(void* block) {
  if (watching && block != nullptr) {
    Call call{false, 0, nullptr, false};
    for (int i = 0; i < recordedCount; ++i) {
      if (!recorded[i].isMalloc || recorded[i].block != block) continue;
      call = {false, recorded[i].sizeInBytes, block, false};
      recorded[i].block = nullptr;  // The address may come again.
    }
    record(call);
  }
  __real_free(block);
}

MemoryWatch::MemoryWatch() {
  recordedCount = 0;
  exhausted = false;
  watching = true;
}

MemoryWatch::~MemoryWatch() { watching = false; }

void MemoryWatch::exhaust() { exhausted = true; }

std::vector<std::string> MemoryWatch::events() const {
  watching = false;
  std::vector<std::string> all;
  for (int i = 0; i < recordedCount; ++i) all.push_back(described(recorded[i]));
  watching = true;
  return all;
}
