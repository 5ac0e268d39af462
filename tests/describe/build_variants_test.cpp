// SPDX-License-Identifier: MIT
// The variants that fit a plug-in's channel counts.
#include <climits>
#include <cstdint>
#include <vector>

#include "describe/vst_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"

namespace {

using testing::ElementsAreArray;
using testing::IsEmpty;

struct PluginCase {
  const char* name;
  std::int32_t inputs;
  std::int32_t outputs;
  bool isSynth;
  VSTBundle in;
  VSTBundle out;
  std::vector<std::int32_t> rows;
};

class BuildVariants : public DescribedPlugin, public testing::WithParamInterface<PluginCase> {};

TEST_P(BuildVariants, FindsTheRowsThatFitAndAcceptsNone) {
  const PluginCase& expected = GetParam();
  VSTWrapper* const live = open();
  effect.aeffect.numInputs = expected.inputs;
  effect.aeffect.numOutputs = expected.outputs;
  std::vector<std::int32_t> rows;
  for (const VSTVariant& variant : KelVSTInfoCache::VSTInfo::BuildVariants(live, expected.isSynth)) {
    rows.push_back(variant.variantID);
    EXPECT_EQ(variant.inBundle.mainChannels, expected.in.mainChannels);
    EXPECT_EQ(variant.inBundle.extraChannels, expected.in.extraChannels);
    EXPECT_EQ(variant.outBundle.mainChannels, expected.out.mainChannels);
    EXPECT_EQ(variant.outBundle.extraChannels, expected.out.extraChannels);
    EXPECT_FALSE(variant.accepted);
  }
  EXPECT_THAT(rows, ElementsAreArray(expected.rows));
  EXPECT_THAT(effect.requests(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(
    Plugins, BuildVariants,
    testing::ValuesIn(std::vector<PluginCase>{
        {"StereoEffect", 2, 2, false, {2, 0}, {2, 0}, {0, 1, 2}},
        // On purpose: one input counts as none, and every effect row has inputs.
        {"MonoEffect", 1, 1, false, {0, 0}, {1, 0}, {}},
        {"MonoToStereoEffect", 1, 2, false, {0, 0}, {2, 0}, {}},
        {"StereoToMonoEffect", 2, 1, false, {1, 1}, {1, 0}, {0}},
        {"SurroundEffect", 6, 6, false, {2, 4}, {2, 4}, {0, 1, 2}},
        {"EffectWithoutOutputs", 2, 0, false, {1, 1}, {1, 0}, {0}},
        {"EffectWithoutInputs", 0, 2, false, {0, 0}, {2, 0}, {}},
        {"EffectWithTheHighestCounts", INT_MAX, INT_MAX, false, {2, 2147483645}, {2, 2147483645}, {0, 1, 2}},
        {"EffectWithTheLowestCounts", INT_MIN, INT_MIN, false, {0, 0}, {1, 0}, {}},
        {"Instrument", 0, 2, true, {0, 0}, {2, 0}, {21, 22}},
        {"InstrumentWithoutOutputs", 0, 0, true, {0, 0}, {1, 0}, {21}},
        {"InstrumentWithOneInput", 1, 2, true, {0, 0}, {2, 0}, {21, 22}},
        {"InstrumentWithSixteenOutputs", 2, 16, true, {2, 0}, {2, 14}, {21, 22}},
        {"InstrumentWithNegativeCounts", -2, -5, true, {0, 0}, {1, 0}, {21}},
    }),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
