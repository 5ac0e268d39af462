// SPDX-License-Identifier: MIT
// Byte order.
#include <vector>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "support/endian.h"

namespace {

using Bytes = std::vector<unsigned char>;

TEST(EndianSwap, ReversesTheFieldAndNothingAroundIt) {
  struct Field {
    int length;
    Bytes after;
  };
  const Bytes before = {0xEE, 1, 0x80, 3, 4, 5, 6, 7, 0xF8, 0xFF};
  for (const Field& field :
       {Field{0, before}, Field{1, before}, Field{2, {0xEE, 0x80, 1, 3, 4, 5, 6, 7, 0xF8, 0xFF}},
        Field{3, {0xEE, 3, 0x80, 1, 4, 5, 6, 7, 0xF8, 0xFF}},
        Field{4, {0xEE, 4, 3, 0x80, 1, 5, 6, 7, 0xF8, 0xFF}},
        Field{5, {0xEE, 5, 4, 3, 0x80, 1, 6, 7, 0xF8, 0xFF}},
        Field{8, {0xEE, 0xF8, 7, 6, 5, 4, 3, 0x80, 1, 0xFF}}}) {
    Bytes memory = before;
    Endian::Swap(memory.data() + 1, field.length);
    EXPECT_EQ(memory, field.after) << field.length;
  }
}

}  // namespace
