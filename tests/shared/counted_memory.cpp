// SPDX-License-Identifier: MIT
// No container is used while memory is recorded: its own memory would come out of what is recorded.
#include "tests/shared/counted_memory.h"

#include <cstdlib>
#include <cstring>

extern "C" {
void* __real_malloc(std::size_t sizeInBytes);
void __real_free(void* block);
void* __wrap_malloc(std::size_t sizeInBytes);
void __wrap_free(void* block);
}

namespace {

struct Event {
  enum class Kind { kMade, kFailed, kFreed, kFreedOther };
  Kind kind;
  std::size_t sizeInBytes;
  void* block;  // Null once freed: the address may come again.
};

constexpr int kRoom = 1000;
Event recorded[kRoom];
int recordedCount = 0;
bool watching = false;
bool exhausted = false;

void record(Event::Kind kind, std::size_t sizeInBytes, void* block) {
  if (recordedCount == kRoom) std::abort();
  recorded[recordedCount++] = {kind, sizeInBytes, block};
}

Event* madeAs(void* block) {
  for (int i = 0; i < recordedCount; ++i) {
    if (recorded[i].kind == Event::Kind::kMade && recorded[i].block == block) return &recorded[i];
  }
  return nullptr;
}

std::string described(const Event& event) {
  const std::string size = std::to_string(event.sizeInBytes);
  switch (event.kind) {
    case Event::Kind::kMade:
      return "malloc " + size;
    case Event::Kind::kFailed:
      return "malloc " + size + " failed";
    case Event::Kind::kFreed:
      return "free " + size;
    case Event::Kind::kFreedOther:
      return "free other";
  }
  return "";
}

}  // namespace

void* __wrap_malloc(std::size_t sizeInBytes) {
  void* const block = watching && exhausted ? nullptr : __real_malloc(sizeInBytes);
  if (watching && block != nullptr) std::memset(block, '#', sizeInBytes);
  if (watching) record(block == nullptr ? Event::Kind::kFailed : Event::Kind::kMade, sizeInBytes, block);
  return block;
}

void __wrap_free(void* block) {
  if (watching && block != nullptr) {
    Event* const made = madeAs(block);
    if (made != nullptr) {
      made->block = nullptr;
      record(Event::Kind::kFreed, made->sizeInBytes, nullptr);
    } else {
      record(Event::Kind::kFreedOther, 0, nullptr);
    }
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

int MemoryWatch::blocksAlive() const {
  int alive = 0;
  for (int i = 0; i < recordedCount; ++i) {
    if (recorded[i].kind == Event::Kind::kMade && recorded[i].block != nullptr) ++alive;
  }
  return alive;
}
