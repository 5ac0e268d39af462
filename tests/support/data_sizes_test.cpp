// SPDX-License-Identifier: MIT
// Sizes of data whose element counts come from a plug-in.
#include <cstdint>
#include <string>

#include "gtest/gtest.h"
#include "support/data_sizes.h"
#include "tests/shared/thrown.h"

namespace {

constexpr int kThrows = -1;

struct Size {
  std::string name;
  std::int64_t fixed;
  std::int32_t count;
  std::int64_t each;
  int expected;
};

class SizeOrFail : public testing::TestWithParam<Size> {};

TEST_P(SizeOrFail, IsTheFixedPartAndAllElementsOrThrowsMinusOneOutsideAnInt) {
  int size = 0;
  const auto thrown =
      thrownInt([&] { size = sizeOrFail(GetParam().fixed, GetParam().count, GetParam().each); });
  EXPECT_EQ(thrown.value_or(size), GetParam().expected);
  EXPECT_EQ(thrown.has_value(), GetParam().expected == kThrows);
}

INSTANTIATE_TEST_SUITE_P(Sizes, SizeOrFail,
                         testing::Values(Size{"NothingAtAll", 0, 0, 0, 0}, Size{"NoElements", 56, 0, 4, 56},
                                         Size{"ThreeParameters", 56, 3, 4, 68},
                                         Size{"ElementsWithoutSize", 7, 2147483647, 0, 7},
                                         Size{"NoElementsOfAHugeSize", 7, 0, 4294967295, 7},
                                         Size{"TheLargestFixedPart", 2147483647, 0, 1, 2147483647},
                                         Size{"TheLargestElement", 60, 1, 2147483587, 2147483647},
                                         Size{"TheLargestChunk", 60, 2147483587, 1, 2147483647},
                                         Size{"TheMostParameters", 56, 536870897, 4, 2147483644},
                                         Size{"OneByteTooManyInTheFixedPart", 2147483648, 0, 0, kThrows},
                                         Size{"OneByteTooManyInTheChunk", 60, 2147483588, 1, kThrows},
                                         Size{"OneParameterTooMany", 56, 536870898, 4, kThrows},
                                         Size{"ProductAbove32Bits", 156, 2147483647, 2147483647, kThrows},
                                         Size{"ElementAbove32Bits", 0, 1, 4294967295, kThrows},
                                         Size{"NegativeCount", 64, -2, 4, 56},
                                         Size{"NothingLeft", 56, -14, 4, 0},
                                         Size{"LessThanNothing", 56, -15, 4, kThrows},
                                         Size{"NegativeElement", 156, 40, -4, kThrows}),
                         [](const auto& instance) { return instance.param.name; });

}  // namespace
