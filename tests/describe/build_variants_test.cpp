// SPDX-License-Identifier: MIT
// Which variants fit a plug-in's channel counts.
#include <climits>
#include <cstdint>
#include <string>
#include <vector>

#include "describe/vst_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"

namespace {

using KelVSTInfoCache::VSTInfo;
using testing::ElementsAreArray;
using testing::IsEmpty;

struct ShapeCase {
  const char* name;
  std::int32_t inputs;
  std::int32_t outputs;
  bool isSynth;
  VSTBundle in;
  VSTBundle out;
  std::vector<std::int32_t> rows;
};

void PrintTo(const ShapeCase& shape, std::ostream* stream) { *stream << shape.name; }

class BuildVariants : public DescribedPlugin, public testing::WithParamInterface<ShapeCase> {};

TEST_P(BuildVariants, FindsTheRowsThatFit) {
  const ShapeCase& shape = GetParam();
  VSTWrapper* const live = open();
  effect.aeffect.numInputs = shape.inputs;
  effect.aeffect.numOutputs = shape.outputs;
  std::vector<std::int32_t> rows;
  for (const VSTVariant& variant : VSTInfo::BuildVariants(live, shape.isSynth)) {
    rows.push_back(variant.variantID);
    EXPECT_EQ(variant.inBundle.mainChannels, shape.in.mainChannels);
    EXPECT_EQ(variant.inBundle.extraChannels, shape.in.extraChannels);
    EXPECT_EQ(variant.outBundle.mainChannels, shape.out.mainChannels);
    EXPECT_EQ(variant.outBundle.extraChannels, shape.out.extraChannels);
    EXPECT_FALSE(variant.accepted);
  }
  EXPECT_THAT(rows, ElementsAreArray(shape.rows));
  EXPECT_THAT(effect.requests(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Shapes, BuildVariants,
    testing::ValuesIn(std::vector<ShapeCase>{
        {"StereoEffect", 2, 2, false, {2, 0}, {2, 0}, {0, 1, 2}},
        // On purpose: one input counts as none, and every effect row has inputs.
        {"MonoEffect", 1, 1, false, {0, 0}, {1, 0}, {}},
        {"MonoToStereoEffect", 1, 2, false, {0, 0}, {2, 0}, {}},
        {"StereoToMonoEffect", 2, 1, false, {1, 1}, {1, 0}, {0}},
        {"SurroundEffect", 6, 6, false, {2, 4}, {2, 4}, {0, 1, 2}},
        {"Instrument", 0, 2, true, {0, 0}, {2, 0}, {21, 22}},
        {"SilentInstrument", 0, 0, true, {0, 0}, {1, 0}, {21}},
        {"InstrumentOfSixteenOutputs", 2, 16, true, {2, 0}, {2, 14}, {21, 22}},

        {"InstrumentOfOneInput", 1, 2, true, {0, 0}, {2, 0}, {21, 22}},
        {"InstrumentOfNegativeOutputs", 0, -5, true, {0, 0}, {1, 0}, {21}},
        {"EffectWithoutOutputs", 2, 0, false, {1, 1}, {1, 0}, {0}},
        {"EffectOfNegativeOutputs", 2, -1, false, {1, 1}, {1, 0}, {0}},
        {"EffectWithoutInputs", 0, 2, false, {0, 0}, {2, 0}, {}},
        {"EffectOfNegativeInputs", -2, 2, false, {0, 0}, {2, 0}, {}},
        {"EffectOfTwoInputsAndManyOutputs", 2, 8, false, {2, 0}, {2, 6}, {0, 1, 2}},
        {"EffectOfTheMostChannels", INT_MAX, INT_MAX, false, {2, 2147483645}, {2, 2147483645}, {0, 1, 2}},
        {"EffectOfTheFewestChannels", INT_MIN, INT_MIN, false, {0, 0}, {1, 0}, {}},
    }),
    [](const auto& tested) { return tested.param.name; });

// The bundles of a plug-in for which no row passes are not to be seen in a result; this one's are.
TEST_F(DescribedPlugin, InstrumentRowsCarryTheBundleOfASingleInputAsEmpty) {
  VSTWrapper* const live = open();
  effect.aeffect.numInputs = 1;
  effect.aeffect.numOutputs = 1;
  const std::vector<VSTVariant> variants = VSTInfo::BuildVariants(live, true);
  ASSERT_EQ(variants.size(), 1U);
  EXPECT_EQ(variants[0].inBundle.mainChannels, 0);
  EXPECT_EQ(variants[0].inBundle.extraChannels, 0);
}

}  // namespace
