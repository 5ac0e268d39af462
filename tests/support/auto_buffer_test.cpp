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
#include "tests/shared/thrown.h"

namespace {

using testing::ElementsAre;
using testing::IsEmpty;

static_assert(!std::is_copy_constructible_v<AutoBuffer<char>>);
static_assert(!std::is_copy_assignable_v<AutoBuffer<char>>);

TEST(AutoBuffer, OwnsNothingBeforeTheFirstSize) {
  const MemoryWatch watch;
  {
    const AutoBuffer<char> buffer;
    EXPECT_EQ(buffer.data(), nullptr);
    EXPECT_EQ(buffer.size(), 0);
  }
  EXPECT_THAT(watch.events(), IsEmpty());
}

TEST(AutoBuffer, GetsABlockOfExactlyTheNewSizeAndThenFreesTheOld) {
  const MemoryWatch watch;
  {
    AutoBuffer<char> buffer;
    for (const int size : {1, 63, 63, 1025, 16, 0}) {
      buffer.setSize(size);
      EXPECT_EQ(buffer.size(), size);
      EXPECT_NE(buffer.data(), nullptr);
    }
  }
  EXPECT_THAT(watch.events(),
              ElementsAre("malloc 1", "malloc 63", "free 1", "malloc 63", "free 63", "malloc 1025", "free 63",
                          "malloc 16", "free 1025", "malloc 0", "free 16", "free 0"));
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

TEST(AutoBuffer, KeepsItsBlockAndSizeWhenTheNewOneCannotBeHad) {
  MemoryWatch watch;
  {
    AutoBuffer<char> buffer;
    buffer.setSize(6);
    std::strcpy(buffer.data(), "saved");
    const void* const block = buffer.data();
    EXPECT_EQ(thrownInt([&] { buffer.setSize(-1); }), -1);
    EXPECT_EQ(thrownInt([&] { buffer.setSize(-2147483647 - 1); }), -1);
    watch.exhaust();
    EXPECT_EQ(thrownInt([&] { buffer.setSize(100); }), -1);
    EXPECT_EQ(buffer.data(), block);
    EXPECT_EQ(buffer.size(), 6);
    EXPECT_STREQ(buffer.data(), "saved");
  }
  EXPECT_THAT(watch.events(), ElementsAre("malloc 6", "malloc 100 failed", "free 6"));
}

TEST(AutoBufferNewBuffer, GivesTheBlockToTheCallerAndSetsTheSizeOnlyOnSuccess) {
  MemoryWatch watch;
  std::int32_t size = -5;
  std::free(AutoBuffer<char>::NewBuffer(28, size));
  EXPECT_EQ(size, 28);
  watch.exhaust();
  EXPECT_EQ(thrownInt([&] { AutoBuffer<char>::NewBuffer(29, size); }), -1);
  EXPECT_EQ(size, 28);
  EXPECT_THAT(watch.events(), ElementsAre("malloc 28", "free 28", "malloc 29 failed"));
}

}  // namespace
