// SPDX-License-Identifier: MIT
// VSTWrapper: answers of more than 32 bits. Built only where VstIntPtr has 64 bits.
//
// Answers that the interface calls 32-bit numbers lose their upper half; of answers that mean yes or no all
// 64 bits count.
#include "tests/shared/wrapper_fixture.h"
#include "vst2/speakers.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

constexpr VstIntPtr kOnlyAbove = 0x100000000;

class VSTWrapperWideAnswers : public host_tests::WrapperTest {};

TEST_F(VSTWrapperWideAnswers, TheExtensionTokenIsLookedForInTheLow32Bits) {
  effect.setCapability("hasCockosExtensions", 0x12345678BEEF0000);
  open();
  EXPECT_TRUE(wrapper->hasCockosExtensions);
  effect.setCapability("hasCockosExtensions", 0x0000BEEF00000000);
  open();
  EXPECT_FALSE(wrapper->hasCockosExtensions);
}

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
  effect.answerNext(effShellGetNextPlugin, {0xF0000000, kOnlyAbove});
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

TEST_F(VSTWrapperWideAnswers, YesMayBeInTheUpperHalfOnly) {
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
  wrapper->storedProgramNames = {"", "stored"};
  EXPECT_EQ(wrapper->getProgramName(1), "");
  effect.forget();
  EXPECT_EQ(wrapper->getEffectName(), "");
  EXPECT_EQ(wrapper->getManufacturerName(), "");
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetEffectName), request(effGetVendorString), programNameIndexed(0)));
}

}  // namespace
