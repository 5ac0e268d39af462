// SPDX-License-Identifier: MIT
// The well-behaved samples answer as a correct plug-in does, where the golden conversations of
// end_to_end_tests do not show it.
#include <cstring>
#include <vector>

#include <gmock/gmock.h>

#include "tests/plugins/loaded_plugin.h"
#include "vst2/properties.h"

using namespace sample_plugins_test;
using testing::ElementsAre;

namespace {

class WellBehavedEffect : public testing::Test {
 protected:
  ~WellBehavedEffect() override { dispatch(effect, effClose); }
  float get(VstInt32 index) { return effect.getParameter(&effect, index); }

  AEffect& effect = *LoadedPlugin("well_behaved_effect").callEntry();
};

TEST_F(WellBehavedEffect, DescribesItself) {
  EXPECT_EQ(effect.magic, 0x56737450);
  EXPECT_EQ(effect.flags, 16);
  EXPECT_EQ(effect.uniqueID, 0x57624566);
  EXPECT_EQ(dispatch(effect, effGetPlugCategory), 1);
  EXPECT_EQ(dispatch(effect, effIdentify), 0x4E764566);
  EXPECT_EQ(dispatch(effect, effGetVstVersion), 2400);
  EXPECT_EQ(textOf(effect, effGetEffectName), "Well-behaved effect");
  EXPECT_EQ(textOf(effect, effGetVendorString), "Sample Plug-ins");
}

TEST_F(WellBehavedEffect, DescribesAndParsesItsParameters) {
  EXPECT_EQ(textOf(effect, effGetParamName, 0), "Volume");
  EXPECT_EQ(textOf(effect, effGetParamLabel, 1), "%");
  EXPECT_NE(dispatch(effect, effString2Parameter, 1, 0, textArgument("0.75")), 0);
  EXPECT_EQ(dispatch(effect, effString2Parameter, 1, 0, textArgument("loud")), 0);
  EXPECT_EQ(textOf(effect, effGetParamDisplay, 1), "0.750");
  VstParameterProperties properties{};
  ASSERT_EQ(dispatch(effect, effGetParameterProperties, 2, 0, &properties), 1);
  EXPECT_STREQ(properties.label, "Shape");
  EXPECT_EQ(properties.flags, 2 + 8);
  EXPECT_EQ(properties.maxInteger, 3);
  ASSERT_EQ(dispatch(effect, effGetParameterProperties, 0, 0, &properties), 1);
  EXPECT_EQ(properties.flags, 0);
}

TEST_F(WellBehavedEffect, KeepsAValueAndANameForEachProgram) {
  effect.setParameter(&effect, 0, 0.125f);
  dispatch(effect, effSetProgram, 0, 3);
  dispatch(effect, effSetProgram, 0, 4);  // There is no such program.
  EXPECT_EQ(get(0), 0.5f);
  EXPECT_EQ(textOf(effect, effGetProgramName), "Loud");
  dispatch(effect, effSetProgramName, 0, 0, textArgument("A name of more than 23 bytes"));
  EXPECT_EQ(textOf(effect, effGetProgramName), "A name of more than 23 ");
  EXPECT_EQ(textOf(effect, effGetProgramNameIndexed, 1), "Wide");
  EXPECT_EQ(textOf(effect, effGetProgramNameIndexed, 4), "");
  dispatch(effect, effSetProgram, 0, 0);
  EXPECT_EQ(get(0), 0.125f);
}

TEST_F(WellBehavedEffect, DescribesItsPins) {
  VstPinProperties pin{};
  ASSERT_EQ(dispatch(effect, effGetInputProperties, 0, 0, &pin), 1);
  EXPECT_STREQ(pin.label, "In 1");
  EXPECT_EQ(pin.flags, 3);
  ASSERT_EQ(dispatch(effect, effGetOutputProperties, 1, 0, &pin), 1);
  EXPECT_STREQ(pin.label, "Out 2");
  EXPECT_EQ(pin.flags, 1);
  EXPECT_EQ(dispatch(effect, effGetOutputProperties, 2, 0, &pin), 0);
}

TEST_F(WellBehavedEffect, MultipliesWithItsVolume) {
  float in[2][2] = {{1.0f, -1.0f}, {0.5f, 0.0f}};
  float out[2][2] = {};
  float* inputs[] = {in[0], in[1]};
  float* outputs[] = {out[0], out[1]};
  effect.processReplacing(&effect, inputs, outputs, 2);
  EXPECT_THAT(out[0], ElementsAre(0.5f, -0.5f));
  EXPECT_THAT(out[1], ElementsAre(0.25f, 0.0f));
}

class WellBehavedInstrument : public testing::Test {
 protected:
  ~WellBehavedInstrument() override { dispatch(effect, effClose); }

  /// A copy of the chunk: of the current program, or of the bank.
  std::vector<float> chunk(bool isProgram) {
    void* data = nullptr;
    const VstIntPtr size = dispatch(effect, effGetChunk, isProgram ? 1 : 0, 0, &data);
    std::vector<float> values(static_cast<std::size_t>(size) / sizeof(float));
    std::memcpy(values.data(), data, static_cast<std::size_t>(size));
    return values;
  }
  VstIntPtr load(bool isProgram, std::vector<float> values) {
    return dispatch(effect, effSetChunk, isProgram ? 1 : 0,
                    static_cast<VstIntPtr>(values.size() * sizeof(float)), values.data());
  }

  AEffect& effect = *LoadedPlugin("well_behaved_instrument").callEntry();
};

TEST_F(WellBehavedInstrument, IsASynthThatTakesMidi) {
  EXPECT_EQ(effect.flags, 16 + 32 + 256);
  EXPECT_EQ(effect.numInputs, 0);
  EXPECT_EQ(effect.numOutputs, 2);
  EXPECT_EQ(dispatch(effect, effGetPlugCategory), 2);
  EXPECT_EQ(dispatch(effect, effCanDo, 0, 0, textArgument("receiveVstMidiEvent")), 1);
  EXPECT_EQ(dispatch(effect, effCanDo, 0, 0, textArgument("sendVstMidiEvent")), -1);
}

TEST_F(WellBehavedInstrument, SavesAndLoadsItsStateInChunks) {
  EXPECT_THAT(chunk(false), ElementsAre(0.0f, 0.5f, 0.75f, 0.5f, 0.75f));
  EXPECT_EQ(load(false, {1.0f, 0.1f, 0.2f, 0.3f, 0.4f}), 1);
  EXPECT_EQ(dispatch(effect, effGetProgram), 1);
  EXPECT_THAT(chunk(true), ElementsAre(0.3f, 0.4f));
  EXPECT_EQ(load(true, {0.6f, 0.7f}), 1);
  EXPECT_EQ(load(true, {0.8f}), 0);
  EXPECT_EQ(load(false, {2.0f, 0.1f, 0.2f, 0.3f, 0.4f}), 0);
  EXPECT_THAT(chunk(false), ElementsAre(1.0f, 0.1f, 0.2f, 0.6f, 0.7f));
}

}  // namespace
