// SPDX-License-Identifier: MIT
// Which requests a description makes, and what becomes of the answers.
#include <cstring>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include "describer/description_json.h"
#include "describer/plugin_description.h"
#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/shared/recording_effect.h"
#include "tests/shared/thrown.h"
#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Optional;

class PluginDescriptionTest : public host_tests::WrapperTest {
 protected:
  PluginDescription describe() {
    open();
    return PluginDescription(*wrapper, VST_Class_Spec(VST_DLL_Info("/test.vst", "test"), VST_ChildSpec()));
  }

  /// A parameter from 1 to 2 in integer steps.
  void makeStepped(VstInt32 parameter) {
    VstParameterProperties stepped = {};
    stepped.flags = kVstParameterUsesIntegerMinMax | kVstParameterUsesIntStep;
    stepped.minInteger = 1;
    stepped.maxInteger = 2;
    stepped.stepInteger = 1;
    effect.setParameterProperties(parameter, stepped);
  }
};

TEST_F(PluginDescriptionTest, MakesEachRequestOnceBesidesThoseOfItsRecord) {
  effect.aeffect.numInputs = 1;
  effect.aeffect.numOutputs = 2;
  effect.setPrograms({{"Soft", {0.5f}}, {"Loud", {0.5f}}, {"Last", {0.5f}}});
  effect.currentProgram = 1;
  effect.namesProgramsByIndex = true;
  effect.setText(effGetEffectName, "Name");
  effect.setText(effGetVendorString, "Maker");
  effect.ignore(effSetProgram);  // Creation selects program 0.
  describe();
  EXPECT_THAT(
      effect.requests(),
      ElementsAre(request(effGetPlugCategory), request(effGetParamDisplay, 0),
                  // The record.
                  request(effGetEffectName), request(effGetVendorString), request(effGetVstVersion),
                  request(effGetPlugCategory), canDo("receiveVstMidiEvent"), canDo("sendVstMidiEvent"),
                  getParameterOf(0), request(effGetParamName, 0), request(effGetParamLabel, 0),
                  request(effCanBeAutomated, 0), request(effGetParameterProperties, 0),
                  // The rest.
                  request(effGetProductString), request(effGetVendorVersion),
                  request(effGetInputProperties, 0), request(effGetOutputProperties, 0),
                  request(effGetOutputProperties, 1), request(effGetProgram), programNameIndexed(0),
                  request(effGetProgramName), programNameIndexed(2)));
}

TEST_F(PluginDescriptionTest, OfAShellAsksForItsChildrenAndForNoParameterOrProgram) {
  effect.setPrograms({{"Only", {0.5f}}});
  effect.answer(effGetPlugCategory, kPlugCategShell);
  effect.setShellChildren({{7, "Seven"}, {-8, "Minus eight"}});
  const PluginDescription description = describe();
  EXPECT_THAT(
      effect.requestsOf({effShellGetNextPlugin, effGetParamDisplay, effGetProgram, effGetProgramName}),
      ElementsAre(request(effShellGetNextPlugin), request(effShellGetNextPlugin),
                  request(effShellGetNextPlugin)));
  ASSERT_EQ(description.info.childIDs.size(), 2U);
  EXPECT_EQ(description.info.childIDs[1].childID, -8);
}

TEST_F(PluginDescriptionTest, ReadsAParametersTextBeforeTheRecordStepsThroughItsValues) {
  effect.setParameters({0.25f});
  makeStepped(0);
  int displays = 0;
  effect.onRequest = [&](const Request& asked) {
    if (asked.kind != Request::Kind::kDispatch || asked.opcode != effGetParamDisplay) return;
    effect.setText(effGetParamDisplay, "text " + std::to_string(++displays));
  };
  const PluginDescription description = describe();
  EXPECT_THAT(description.valueTexts, ElementsAre("text 1"));
  EXPECT_THAT(description.info.params[0].valueTexts, ElementsAre("text 2", "text 3"));
}

TEST_F(PluginDescriptionTest, HasNoNameForAProgramThatThePluginNamesOnlyWhenItIsSelected) {
  effect.setPrograms({{"Soft", {}}, {"Loud", {}}});
  const PluginDescription description = describe();
  EXPECT_THAT(description.programs, ElementsAre(Optional(std::string("Soft")), std::nullopt));
  EXPECT_TRUE(effect.requestsOf(effSetProgram).empty());
}

TEST_F(PluginDescriptionTest, HasNothingForAPinThatIsNotAnswered) {
  effect.aeffect.numInputs = 2;
  VstPinProperties pin = {};
  std::memset(pin.label, 'x', sizeof pin.label);  // Without a final zero.
  pin.flags = kVstPinIsStereo | kVstPinUseSpeaker;
  pin.arrangementType = 15;
  effect.setInputProperties(1, pin);
  const PluginDescription description = describe();
  ASSERT_EQ(description.inputs.size(), 2U);
  EXPECT_FALSE(description.inputs[0]);
  ASSERT_TRUE(description.inputs[1]);
  EXPECT_EQ(description.inputs[1]->label, std::string(64, 'x'));
  EXPECT_THAT(description.inputs[1]->speakerArrangement, Optional(15));
}

TEST_F(PluginDescriptionTest, SurvivesAPluginWhoseParametersGrowInTheMiddle) {
  effect.setParameters({0.1f});
  effect.onRequest = [&](const Request& asked) {
    if (asked.kind == Request::Kind::kDispatch && asked.opcode == effGetVstVersion)
      effect.aeffect.numParams = 3;
  };
  const PluginDescription description = describe();
  EXPECT_EQ(description.info.params.size(), 3U);
  EXPECT_THAT(description.valueTexts, ElementsAre("", "", ""));
}

struct LyingCount {
  const char* name;
  VstInt32 AEffect::*count;
  VstInt32 most;
};

class PluginDescriptionCountTest : public PluginDescriptionTest,
                                   public testing::WithParamInterface<LyingCount> {};

TEST_P(PluginDescriptionCountTest, AboveTheLimitIsMinusOne) {
  open();
  effect.aeffect.*GetParam().count = GetParam().most + 1;
  const VST_Class_Spec spec(VST_DLL_Info("/test.vst", "test"), VST_ChildSpec());
  EXPECT_THAT(thrownInt([&] { PluginDescription(*wrapper, spec); }), Optional(-1));
}

TEST_P(PluginDescriptionCountTest, BelowZeroCountsAsZero) {
  open();
  effect.aeffect.*GetParam().count = -1;
  const VST_Class_Spec spec(VST_DLL_Info("/test.vst", "test"), VST_ChildSpec());
  const PluginDescription description(*wrapper, spec);
  EXPECT_EQ(description.inputs.size() + description.outputs.size() + description.programs.size() +
                description.info.params.size(),
            0U);
}

INSTANTIATE_TEST_SUITE_P(Counts, PluginDescriptionCountTest,
                         testing::Values(LyingCount{"Inputs", &AEffect::numInputs, 1 << 16},
                                         LyingCount{"Outputs", &AEffect::numOutputs, 1 << 16},
                                         LyingCount{"Programs", &AEffect::numPrograms, 1 << 20},
                                         LyingCount{"Parameters", &AEffect::numParams, 1 << 20}),
                         [](const auto& row) { return row.param.name; });

TEST_F(PluginDescriptionTest, AsJsonSaysWhichTextsWereTakenAsLatin1) {
  effect.setParameters({0.1f, 0.2f});
  effect.setTextAt(effGetParamLabel, 1, "\xB5s");
  const std::string json = descriptionAsJson(describe());
  EXPECT_THAT(json, HasSubstr("\"label\": \"\xC2\xB5s\""));
  EXPECT_THAT(json, HasSubstr("\"latin1\": [\n    \"/parameters/1/label\"\n  ]"));
}

struct IdCase {
  const char* name;
  VstInt32 id;
  const char* text;
};

class PluginDescriptionIdTest : public PluginDescriptionTest, public testing::WithParamInterface<IdCase> {};

TEST_P(PluginDescriptionIdTest, AsJsonIsANumberAndFourCharactersWhereItHasThem) {
  effect.aeffect.uniqueID = GetParam().id;
  EXPECT_THAT(descriptionAsJson(describe()), HasSubstr(std::string("\"text\": ") + GetParam().text + "\n"));
}

INSTANTIATE_TEST_SUITE_P(Ids, PluginDescriptionIdTest,
                         testing::Values(IdCase{"Printable", 0x616D7379, "\"amsy\""},
                                         IdCase{"Quote", 0x61226279, "\"a\\\"by\""},
                                         IdCase{"Zero", 0, "null"}, IdCase{"Negative", -1, "null"}),
                         [](const auto& row) { return row.param.name; });

}  // namespace
