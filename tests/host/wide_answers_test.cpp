// SPDX-License-Identifier: MIT
// VSTWrapper: answers of more than 32 bits. Built where VstIntPtr has 64.
//
// Answers that the interface calls 32-bit numbers lose their upper half; answers that mean yes or no are
// judged whole.
#include "tests/shared/wrapper_fixture.h"
#include "vst2/speakers.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

constexpr VstIntPtr kOnlyAbove = 0x100000000;

class VSTWrapperWideAnswers : public host_tests::WrapperTest {};

struct WideTokenCase {
  const char* name;
  VstIntPtr answer;
  bool known;
};

class VSTWrapperWideToken : public host_tests::WrapperTest,
                            public testing::WithParamInterface<WideTokenCase> {};

TEST_P(VSTWrapperWideToken, IsLookedForInTheLow32Bits) {
  effect.setCapability("hasCockosExtensions", GetParam().answer);
  open();
  EXPECT_EQ(wrapper->hasCockosExtensions, GetParam().known);
}

INSTANTIATE_TEST_SUITE_P(
    Answers, VSTWrapperWideToken,
    testing::Values(WideTokenCase{"SignExtended", static_cast<VstIntPtr>(0xFFFFFFFFBEEF0000u), true},
                    WideTokenCase{"SignExtendedAndMore", static_cast<VstIntPtr>(0xFFFFFFFFBEEF1234u), true},
                    WideTokenCase{"ZeroExtended", 0x00000000BEEF0000, true},
                    WideTokenCase{"WithOtherBitsAbove", 0x12345678BEEF0000, true},
                    WideTokenCase{"AboveOnly", static_cast<VstIntPtr>(0xBEEF000000000000u), false},
                    WideTokenCase{"AcrossTheMiddle", 0x0000BEEF00000000, false}),
    host_tests::nameOfCase<WideTokenCase>);

TEST_F(VSTWrapperWideAnswers, NumbersAreTheLow32Bits) {
  open();
  for (const VstEffectOpcode opcode :
       {effGetPlugCategory, effSetSampleRate, effSetBlockSize, effShellGetNextPlugin}) {
    effect.answer(opcode, kOnlyAbove + 5);
  }
  VST_ChildSpec child;
  EXPECT_EQ(wrapper->getEffectCategory(), 5);
  EXPECT_EQ(wrapper->setSampleRate(44100.0), 5);
  EXPECT_EQ(wrapper->setBufferSize(512), 5);
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childID, 5);
}

TEST_F(VSTWrapperWideAnswers, AChildsIdIsNegativeAlsoWithoutSignExtension) {
  open();
  effect.answerNext(effShellGetNextPlugin, {0xF0000000, kOnlyAbove});
  VST_ChildSpec child;
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childID, -268435456);
  EXPECT_FALSE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childID, 0);
}

TEST_F(VSTWrapperWideAnswers, TheCurrentProgramIsTheLow32Bits) {
  effect.setPrograms({{"Soft", {}}, {"Loud", {}}});
  open();
  effect.answer(effGetProgram, kOnlyAbove + 1);
  wrapper->setCurrentProgram(1);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram)));
}

TEST_F(VSTWrapperWideAnswers, YesMayStandInTheUpperHalfOnly) {
  effect.setPrograms({{"Soft", {}}, {"Loud", {}}});
  open();
  for (const VstEffectOpcode opcode :
       {effGetSpeakerArrangement, effGetInputProperties, effGetOutputProperties, effCanBeAutomated,
        effGetParameterProperties, effString2Parameter, effGetEffectName, effGetVendorString,
        effGetProgramNameIndexed}) {
    effect.answer(opcode, kOnlyAbove);
  }
  VstSpeakerArrangement speakers{};
  VstPinProperties pin{};
  VstParameterProperties parameter{};
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&speakers, &speakers));
  EXPECT_TRUE(wrapper->getInputProperties(0, pin));
  EXPECT_TRUE(wrapper->getOutputProperties(0, pin));
  EXPECT_TRUE(wrapper->isParameterAutomatable(0));
  EXPECT_TRUE(wrapper->getParameterProps(0, parameter));
  EXPECT_EQ(wrapper->setParameterCurValueFromText(0, "on"), kOnlyAbove);
  effect.forget();
  EXPECT_EQ(wrapper->getEffectName(), "");
  EXPECT_EQ(wrapper->getManufacturerName(), "");
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetEffectName), request(effGetVendorString), programNameIndexed(0)));
}

TEST_F(VSTWrapperWideAnswers, AnAnswerInTheUpperHalfNamesAProgramByIndex) {
  effect.setPrograms({{"Soft", {}}, {"Loud", {}}});
  open();
  wrapper->storedProgramNames = {"", "stored"};
  effect.setTextAt(effGetProgramNameIndexed, 1, "asked");
  effect.answer(effGetProgramNameIndexed, kOnlyAbove);
  EXPECT_EQ(wrapper->getProgramName(1), "asked");
}

}  // namespace
