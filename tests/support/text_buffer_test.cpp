// SPDX-License-Identifier: MIT
// The fixed text buffers.
#include <cstring>
#include <string>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/text_buffer.h"

namespace {

using testing::Each;

template <std::size_t kSize>
struct Guarded {
  Guarded() { std::memset(this, '#', sizeof *this); }
  char before;
  char text[kSize];
  char behind;
};

template <std::size_t kSize>
void expectToBeClearedWhole() {
  Guarded<kSize> memory;
  vst_zerostruct(memory.text);
  EXPECT_THAT(memory.text, Each('\0'));
  EXPECT_EQ(memory.before, '#');
  EXPECT_EQ(memory.behind, '#');
}

TEST(VstZerostruct, FillsTheWholeArrayAndNothingBehindIt) {
  expectToBeClearedWhole<114>();
  expectToBeClearedWhole<256>();
  expectToBeClearedWhole<500>();
}

TEST(TextIn, EndsAtTheFirstZeroByte) {
  const char buffer[114] = "Gain\0left over";
  EXPECT_EQ(textIn(buffer), "Gain");
}

TEST(TextIn, IsEmptyInAClearedBuffer) {
  char buffer[500];
  vst_zerostruct(buffer);
  EXPECT_EQ(textIn(buffer), "");
}

TEST(TextIn, IsTheWholeBufferWhereThereIsNoZeroByte) {
  Guarded<256> memory;
  std::memset(memory.text, 'x', sizeof memory.text);
  EXPECT_EQ(textIn(memory.text), std::string(256, 'x'));
}

TEST(TextIn, KeepsBytesBeyondAscii) {
  const char buffer[4] = {'\xC3', '\xA9', '\xFF', '\0'};
  EXPECT_EQ(textIn(buffer), "\xC3\xA9\xFF");
}

}  // namespace
