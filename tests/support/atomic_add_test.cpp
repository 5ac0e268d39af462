// SPDX-License-Identifier: MIT
// The addition under the lock's counter.
#include <cstdint>
#include <thread>
#include <vector>

#include "gtest/gtest.h"
#include "support/atomic_add.h"

namespace {

struct Addition {
  const char* name;
  std::int32_t before;
  std::int32_t amount;
  std::int32_t after;
};

class AtomicAdd32 : public testing::TestWithParam<Addition> {};

TEST_P(AtomicAdd32, ReturnsTheValueBeforeTheAddition) {
  const Addition& row = GetParam();
  std::int32_t target = row.before;
  EXPECT_EQ(AtomicAdd32Implementation(&target, row.amount), row.before);
  EXPECT_EQ(target, row.after);
}

INSTANTIATE_TEST_SUITE_P(Implementation, AtomicAdd32,
                         testing::Values(Addition{"One", 0, 1, 1}, Addition{"MinusOne", 1, -1, 0},
                                         Addition{"BelowNought", 0, -1, -1}, Addition{"Nothing", 41, 0, 41},
                                         Addition{"Many", -5, 1000, 995},
                                         Addition{"OverTheTop", 2147483647, 1, -2147483647 - 1},
                                         Addition{"UnderTheBottom", -2147483647 - 1, -1, 2147483647}),
                         [](const auto& row) { return row.param.name; });

TEST(AtomicAdd32Implementation, LosesNoAdditionOfSeveralThreads) {
  std::int32_t target = 0;
  std::vector<std::thread> threads;
  for (int thread = 0; thread < 4; ++thread) {
    threads.emplace_back([&] {
      for (int i = 0; i < 5000; ++i) {
        AtomicAdd32Implementation(&target, 3);
        AtomicAdd32Implementation(&target, -1);
      }
    });
  }
  for (std::thread& thread : threads) thread.join();
  EXPECT_EQ(target, 40000);
}

}  // namespace
