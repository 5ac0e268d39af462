// SPDX-License-Identifier: MIT
// Sizes of data whose counts come from a plug-in.
#include <cstdint>
#include <string>

#include "gtest/gtest.h"
#include "support/data_sizes.h"

namespace {

struct FittingSize {
  std::string name;
  std::int64_t fixed;
  std::int32_t count;
  std::int64_t each;
  int expected;
};

class SizeOrFail : public testing::TestWithParam<FittingSize> {};

TEST_P(SizeOrFail, IsTheFixedPartAndAllElements) {
  EXPECT_EQ(sizeOrFail(GetParam().fixed, GetParam().count, GetParam().each), GetParam().expected);
}

INSTANTIATE_TEST_SUITE_P(
    Fitting, SizeOrFail,
    testing::Values(FittingSize{"NoElements", 56, 0, 4, 56}, FittingSize{"ThreeParameters", 56, 3, 4, 68},
                    FittingSize{"FourProgramsOfTwoParameters", 156, 4, 64, 412},
                    FittingSize{"NothingAtAll", 0, 0, 0, 0},
                    FittingSize{"ElementsWithoutSize", 7, 2147483647, 0, 7},
                    FittingSize{"NoElementsOfAHugeSize", 7, 0, 4294967295, 7},
                    FittingSize{"TheLargestWithABigFixedPart", 2147483647, 0, 1, 2147483647},
                    FittingSize{"TheLargestWithOneElement", 60, 1, 2147483587, 2147483647},
                    FittingSize{"TheLargestChunk", 60, 2147483587, 1, 2147483647},
                    FittingSize{"TheMostParameters", 56, 536870897, 4, 2147483644},
                    FittingSize{"TheMostEmptyPrograms", 156, 38347919, 56, 2147483620}),
    [](const auto& instance) { return instance.param.name; });

struct ExcessiveSize {
  std::string name;
  std::int64_t fixed;
  std::int32_t count;
  std::int64_t each;
};

class SizeOrFailBeyondAnInt : public testing::TestWithParam<ExcessiveSize> {};

TEST_P(SizeOrFailBeyondAnInt, ThrowsMinusOne) {
  try {
    sizeOrFail(GetParam().fixed, GetParam().count, GetParam().each);
    FAIL() << "nothing thrown";
  } catch (int thrown) {
    EXPECT_EQ(thrown, -1);
  }
}

INSTANTIATE_TEST_SUITE_P(Excessive, SizeOrFailBeyondAnInt,
                         testing::Values(ExcessiveSize{"OneByteTooManyInTheFixedPart", 2147483648, 0, 0},
                                         ExcessiveSize{"OneByteTooManyInTheChunk", 60, 2147483588, 1},
                                         ExcessiveSize{"OneParameterTooMany", 56, 536870898, 4},
                                         ExcessiveSize{"OneProgramTooMany", 156, 38347920, 56},
                                         ExcessiveSize{"AllParametersThereAre", 56, 2147483647, 4},
                                         ExcessiveSize{"ProductAbove32Bits", 156, 2147483647, 2147483647},
                                         ExcessiveSize{"ElementsAbove32Bits", 0, 1, 4294967295}),
                         [](const auto& instance) { return instance.param.name; });

}  // namespace
