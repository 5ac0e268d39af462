// SPDX-License-Identifier: MIT
// The fixed text buffers.
#include <cstring>
#include <string>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/text_buffer.h"

namespace {

// A buffer full of '#', between two bytes that must not change.
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
  EXPECT_EQ(textIn(memory.text), std::string(kSize, '#'));
  vst_zerostruct(memory.text);
  EXPECT_THAT(memory.text, testing::Each('\0'));
  EXPECT_EQ(textIn(memory.text), "");
  EXPECT_EQ(memory.before, '#');
  EXPECT_EQ(memory.behind, '#');
}

TEST(VstZerostruct, ClearsTheWholeArrayAndNothingAroundIt) {
  expectToBeClearedWhole<114>();
  expectToBeClearedWhole<256>();
  expectToBeClearedWhole<500>();
}

TEST(TextIn, EndsAtTheFirstZeroByteAndKeepsBytesAboveAscii) {
  const char buffer[114] = "G\xC3\xA9\xFFn\0left over";
  EXPECT_EQ(textIn(buffer), "G\xC3\xA9\xFFn");
}

}  // namespace
