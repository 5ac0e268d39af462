// SPDX-License-Identifier: MIT
// Byte order.
#include <string>
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/endian.h"

namespace {

using Bytes = std::vector<unsigned char>;

struct Swapped {
  const char* name;
  Bytes before;
  Bytes after;
};

class EndianSwap : public testing::TestWithParam<Swapped> {};

TEST_P(EndianSwap, ReversesTheFieldAndNothingAroundIt) {
  const auto length = static_cast<int>(GetParam().before.size());
  Bytes memory{0xEE};
  memory.insert(memory.end(), GetParam().before.begin(), GetParam().before.end());
  memory.push_back(0xFF);
  Endian::Swap(memory.data() + 1, length);

  Bytes expected{0xEE};
  expected.insert(expected.end(), GetParam().after.begin(), GetParam().after.end());
  expected.push_back(0xFF);
  EXPECT_EQ(memory, expected);
}

INSTANTIATE_TEST_SUITE_P(
    Fields, EndianSwap,
    testing::Values(Swapped{"Nothing", {}, {}}, Swapped{"OneByte", {0x81}, {0x81}},
                    Swapped{"TwoBytes", {0x01, 0x80}, {0x80, 0x01}},
                    Swapped{"ThreeBytesKeepTheMiddle", {0x01, 0x02, 0x03}, {0x03, 0x02, 0x01}},
                    Swapped{"FourBytes", {0x01, 0x02, 0x03, 0x04}, {0x04, 0x03, 0x02, 0x01}},
                    Swapped{"FiveBytes", {1, 2, 3, 4, 5}, {5, 4, 3, 2, 1}},
                    Swapped{"EightBytes", {0, 1, 2, 3, 4, 5, 6, 0xF7}, {0xF7, 6, 5, 4, 3, 2, 1, 0}}),
    [](const auto& tested) { return std::string(tested.param.name); });

TEST(EndianSwapTwice, GivesTheFieldBack) {
  int field = 0x12345678;
  Endian::Swap(&field, 4);
  EXPECT_EQ(field, 0x78563412);
  Endian::Swap(&field, 4);
  EXPECT_EQ(field, 0x12345678);
}

}  // namespace
