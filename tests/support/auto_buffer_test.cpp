// SPDX-License-Identifier: MIT
// The owned block of bytes, down to each malloc and free.
#include <cstdlib>
#include <cstring>
#include <string>
#include <type_traits>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/auto_buffer.h"
#include "tests/shared/counted_memory.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

// What `action` throws as an int; 0 where it returns.
template <typename Action>
int intThrownBy(Action action) {
  try {
    action();
  } catch (int thrown) {
    return thrown;
  }
  return 0;
}

TEST(AutoBuffer, OwnsNothingAtFirst) {
  const MemoryWatch watch;
  {
    const AutoBuffer<char> buffer;
    EXPECT_EQ(buffer.data(), nullptr);
    EXPECT_EQ(buffer.size(), 0);
  }
  EXPECT_THAT(watch.events(), IsEmpty());
}

TEST(AutoBuffer, MakesRoomForExactlyTheSizeAskedFor) {
  const MemoryWatch watch;
  AutoBuffer<char> buffer;
  buffer.setSize(64);
  EXPECT_EQ(buffer.size(), 64);
  ASSERT_NE(buffer.data(), nullptr);
  std::memset(buffer.data(), 'x', 64);
  EXPECT_THAT(watch.events(), ElementsAre("malloc 64"));
}

TEST(AutoBuffer, GetsTheNewBlockBeforeItFreesTheOld) {
  const MemoryWatch watch;
  AutoBuffer<char> buffer;
  buffer.setSize(64);
  const void* const first = buffer.data();
  buffer.setSize(16);
  EXPECT_EQ(buffer.size(), 16);
  EXPECT_NE(buffer.data(), first);
  EXPECT_THAT(watch.events(), ElementsAre("malloc 64", "malloc 16", "free 64"));
}

TEST(AutoBuffer, IsMadeAnewForEverySizeAlsoForTheSame) {
  const MemoryWatch watch;
  AutoBuffer<char> buffer;
  for (const int size : {1, 63, 63, 1025}) buffer.setSize(size);
  EXPECT_THAT(watch.events(), ElementsAre("malloc 1", "malloc 63", "free 1", "malloc 63", "free 63",
                                          "malloc 1025", "free 63"));
}

TEST(AutoBuffer, DoesNotCopyTheOldContents) {
  const MemoryWatch watch;
  AutoBuffer<char> buffer;
  buffer.setSize(4);
  std::memset(buffer.data(), 'x', 4);
  buffer.setSize(8);
  EXPECT_EQ(std::string(buffer.data(), 8), "########");
  std::memset(buffer.data(), 'x', 8);
  buffer.setSize(2);
  EXPECT_EQ(std::string(buffer.data(), 2), "##");
}

TEST(AutoBuffer, FreesItsBlockAtItsEnd) {
  const MemoryWatch watch;
  {
    AutoBuffer<char> buffer;
    buffer.setSize(8);
  }
  EXPECT_THAT(watch.events(), ElementsAre("malloc 8", "free 8"));
}

TEST(AutoBuffer, KeepsItsBlockAndSizeWhenThereIsNoMemory) {
  MemoryWatch watch;
  {
    AutoBuffer<char> buffer;
    buffer.setSize(6);
    std::strcpy(buffer.data(), "saved");
    const void* const block = buffer.data();
    watch.exhaust();
    EXPECT_EQ(intThrownBy([&] { buffer.setSize(100); }), -1);
    EXPECT_EQ(buffer.data(), block);
    EXPECT_EQ(buffer.size(), 6);
    EXPECT_STREQ(buffer.data(), "saved");
    EXPECT_EQ(watch.blocksAlive(), 1);
  }
  EXPECT_THAT(watch.events(), ElementsAre("malloc 6", "malloc 100 failed", "free 6"));
}

TEST(AutoBuffer, RefusesANegativeSizeAsItRefusesTooLargeAOne) {
  AutoBuffer<char> buffer;
  buffer.setSize(6);
  const void* const block = buffer.data();
  EXPECT_EQ(intThrownBy([&] { buffer.setSize(-1); }), -1);
  EXPECT_EQ(intThrownBy([&] { buffer.setSize(-2147483647 - 1); }), -1);
  EXPECT_EQ(buffer.data(), block);
  EXPECT_EQ(buffer.size(), 6);
}

TEST(AutoBuffer, CanBeEmptiedToABlockOfNoBytes) {
  const MemoryWatch watch;
  AutoBuffer<char> buffer;
  buffer.setSize(5);
  buffer.setSize(0);
  EXPECT_EQ(buffer.size(), 0);
  EXPECT_THAT(watch.events(), ElementsAre("malloc 5", "malloc 0", "free 5"));
}

TEST(AutoBuffer, IsNotCopied) {
  EXPECT_FALSE(std::is_copy_constructible_v<AutoBuffer<char>>);
  EXPECT_FALSE(std::is_copy_assignable_v<AutoBuffer<char>>);
}

TEST(AutoBufferNewBuffer, TellsTheSizeAndGivesTheBlockAway) {
  const MemoryWatch watch;
  std::int32_t size = -5;
  char* const block = AutoBuffer<char>::NewBuffer(28, size);
  EXPECT_EQ(size, 28);
  EXPECT_EQ(watch.blocksAlive(), 1);
  std::free(block);
  EXPECT_THAT(watch.events(), ElementsAre("malloc 28", "free 28"));
}

TEST(AutoBufferNewBuffer, LeavesTheSizeAloneWhenThereIsNoMemory) {
  MemoryWatch watch;
  watch.exhaust();
  std::int32_t size = -5;
  EXPECT_EQ(intThrownBy([&] { AutoBuffer<char>::NewBuffer(28, size); }), -1);
  EXPECT_EQ(size, -5);
}

}  // namespace
