// SPDX-License-Identifier: MIT
// Who the host says it is.
#include "gtest/gtest.h"
#include "host/host_answers.h"
#include "host/host_identity.h"

namespace {

TEST(GetHostVersion, FillsInEightZeroZero) {
  KelClientVersion version{1, 2, 3};
  GetHostVersion(version);
  EXPECT_EQ(version.major, 8);
  EXPECT_EQ(version.minor, 0);
  EXPECT_EQ(version.third, 0);
}

// The callback hands it out in 64 bytes, its zero byte among them.
TEST(GetHostId, IsAReverseDnsNameThatFitsIntoTheProductString) {
  EXPECT_EQ(GetHostId(), "com.nidu.kel");
  EXPECT_LT(GetHostId().size(), 64u);
}

TEST(PackedVersion, HasTheMajorPartOnTopAndTheThirdAtTheBottom) {
  EXPECT_EQ(packedVersion({8, 0, 0}), 134217728);
  EXPECT_EQ(packedVersion({1, 2, 3}), 0x01020003);
  EXPECT_EQ(packedVersion({0, 1, 0}), 65536);
  EXPECT_EQ(packedVersion({0, 0, 65535}), 65535);
  EXPECT_EQ(packedVersion({127, 255, 65535}), 2147483647);
  EXPECT_EQ(packedVersion({0, 0, 0}), 0);
}

// The parts are joined by OR, so one that is too large does not carry over.
TEST(PackedVersion, JoinsByOr) {
  EXPECT_EQ(packedVersion({0, 1, 65536}), 65536);
  EXPECT_EQ(packedVersion({1, 256, 0}), 16777216);
}

}  // namespace
