// SPDX-License-Identifier: MIT
// VSTWrapper::loadFromFXBData: parameter values of every kind of bits.
#include <cstdint>
#include <cstring>
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using preset_bytes::program;
using testing::IsEmpty;

struct LoadedValue {
  std::string name;
  std::uint32_t bits;
};

class LoadedValueTest : public PresetTest, public testing::WithParamInterface<LoadedValue> {
 protected:
  static std::uint32_t bitsOf(float number) {
    std::uint32_t bits = 0;
    std::memcpy(&bits, &number, sizeof bits);
    return bits;
  }
};

TEST_P(LoadedValueTest, ReachesThePluginWithItsBits) {
  effect.setPrograms({{"Init", {0.75f}}});
  open();
  EXPECT_TRUE(load(program("Init", {GetParam().bits})));
  ASSERT_THAT(effect.parameterWrites(), testing::SizeIs(1));
  EXPECT_EQ(bitsOf(effect.parameterWrites()[0].opt), GetParam().bits);
}

INSTANTIATE_TEST_SUITE_P(Bits, LoadedValueTest,
                         testing::Values(LoadedValue{"NegativeZero", 0x80000000},
                                         LoadedValue{"SmallestDenormal", 0x00000001},
                                         LoadedValue{"Infinity", 0x7F800000},
                                         LoadedValue{"QuietNaN", 0x7FC00001},
                                         LoadedValue{"OddPattern", 0x3DCCCCCD},
                                         LoadedValue{"SignallingNaNBeforeItIsReversed", 0x0100A07F}),
                         [](const auto& instance) { return instance.param.name; });

// A register of the older kind, as floats travel through on 32-bit x86, makes a signalling NaN quiet.
#if !defined(__i386__)
INSTANTIATE_TEST_SUITE_P(SignallingNaNs, LoadedValueTest,
                         testing::Values(LoadedValue{"Positive", 0x7FA00001},
                                         LoadedValue{"Negative", 0xFF800001}),
                         [](const auto& instance) { return instance.param.name; });
#endif

class LoadedZerosAndNaNs : public PresetTest {};

// The two zeros are equal, so one is not sent to a plug-in that holds the other.
TEST_F(LoadedZerosAndNaNs, ANegativeZeroIsNotSentInPlaceOfAZero) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  EXPECT_TRUE(load(program("Init", {0x80000000})));
  EXPECT_THAT(effect.parameterWrites(), IsEmpty());
}

// A NaN differs from everything, itself included.
TEST_F(LoadedZerosAndNaNs, ANaNIsSentEachTime) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  EXPECT_TRUE(load(program("Init", {0x7FC00000})));
  EXPECT_TRUE(load(program("Init", {0x7FC00000})));
  EXPECT_THAT(effect.parameterWrites(), testing::SizeIs(2));
}

}  // namespace
