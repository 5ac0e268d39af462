// SPDX-License-Identifier: MIT
// The table of operations that every stream implements.
#include <type_traits>

#include "gtest/gtest.h"
#include "loader/stream.h"
#include "tests/loader/virtual_slot.h"

namespace {

TEST(INiduStream, KeepsItsOperationsInOrder) {
  const std::size_t first = virtualSlot(&INiduStream::writeString);
  EXPECT_EQ(virtualSlot(&INiduStream::writeBool), first + 1);
  EXPECT_EQ(virtualSlot(&INiduStream::writeInt32), first + 2);
  EXPECT_EQ(virtualSlot(&INiduStream::readString), first + 3);
  EXPECT_EQ(virtualSlot(&INiduStream::readBool), first + 4);
  EXPECT_EQ(virtualSlot(&INiduStream::readInt32), first + 5);
}

TEST(INiduStream, IsAnInterfaceOnly) { EXPECT_TRUE(std::is_abstract_v<INiduStream>); }

}  // namespace
