// SPDX-License-Identifier: MIT
// The addition for the counter of the lock.
#include <cstdint>

#include "gtest/gtest.h"
#include "support/atomic_add.h"
#include "tests/support/start_together.h"

namespace {

TEST(AtomicAdd32Implementation, ReturnsTheValueBeforeTheAdditionWhichWrapsAround) {
  struct Addition {
    std::int32_t before, amount, after;
  };
  for (const auto& [before, amount, after] :
       {Addition{0, 1, 1}, Addition{1, -1, 0}, Addition{0, -1, -1}, Addition{41, 0, 41},
        Addition{-5, 1000, 995}, Addition{INT32_MAX, 1, INT32_MIN}, Addition{INT32_MIN, -1, INT32_MAX}}) {
    std::int32_t target = before;
    EXPECT_EQ(AtomicAdd32Implementation(&target, amount), before);
    EXPECT_EQ(target, after);
  }
}

TEST(AtomicAdd32Implementation, LosesNoAdditionOfSeveralThreads) {
  std::int32_t target = 0;
  runTogether(4, [&](int) {
    for (int i = 0; i < 200000; ++i) {
      AtomicAdd32Implementation(&target, 3);
      AtomicAdd32Implementation(&target, -1);
    }
  });
  EXPECT_EQ(target, 1600000);
}

}  // namespace
