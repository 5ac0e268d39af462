// SPDX-License-Identifier: MIT
// VSTWrapper::New: what a new instance is asked, and what the wrapper is like afterwards.
#include <climits>
#include <cstdint>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;

class VSTWrapperCreation : public host_tests::WrapperTest {};

TEST_F(VSTWrapperCreation, AsksAPluginWithoutPinsInThisOrder) {
  plugin.willCreate(effect);
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effIdentify), request(effSetSampleRate, 0, 0, 44100.0f),
                                             request(effSetBlockSize, 0, 512), request(effOpen),
                                             request(effSetProgram), canDo("hasCockosExtensions")));
}

TEST_F(VSTWrapperCreation, ConnectsTwoInputsAndThreeOutputsFromTheLastPinDown) {
  effect.aeffect.numInputs = 2;
  effect.aeffect.numOutputs = 3;
  plugin.willCreate(effect);
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effIdentify), request(effSetSampleRate, 0, 0, 44100.0f),
                          request(effSetBlockSize, 0, 512), request(effOpen), request(effSetProgram),
                          request(effConnectInput, 1, 1), request(effConnectInput, 0, 1),
                          request(effConnectOutput, 2, 1), request(effConnectOutput, 1, 1),
                          request(effConnectOutput, 0, 1), canDo("hasCockosExtensions")));
}

TEST_F(VSTWrapperCreation, ConnectsNothingForCountsBelowZero) {
  effect.aeffect.numInputs = -1;
  effect.aeffect.numOutputs = INT_MIN;
  plugin.willCreate(effect);
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_THAT(effect.requestsOf({effConnectInput, effConnectOutput}), IsEmpty());
  EXPECT_EQ(effect.requests().size(), 6u);
}

TEST_F(VSTWrapperCreation, ReadsThePinCountsWhenItConnects) {
  plugin.willCreate(effect);
  effect.onRequest = [this](const Request& request) {
    if (request.opcode == effOpen) effect.aeffect.numInputs = 1;
  };
  wrapper = create();
  EXPECT_THAT(effect.requestsOf({effConnectInput, effConnectOutput}), ElementsAre(connectInput(0)));
}

TEST_F(VSTWrapperCreation, NeverSwitchesOn) {
  effect.aeffect.numInputs = 2;
  open();
  EXPECT_THAT(effect.requestsOf(effMainsChanged), IsEmpty());
  EXPECT_FALSE(wrapper->mainsOn);
}

TEST_F(VSTWrapperCreation, TouchesNeitherParametersNorProgramNames) {
  effect.setPrograms({{"Soft", {0.25f, 0.5f}}, {"Loud", {0.75f, 1.0f}}});
  plugin.willCreate(effect);
  wrapper = create();
  EXPECT_THAT(effect.parameterReads(), IsEmpty());
  EXPECT_THAT(effect.parameterWrites(), IsEmpty());
  EXPECT_THAT(effect.requestsOf({effGetProgram, effGetProgramName, effGetProgramNameIndexed}), IsEmpty());
}

TEST_F(VSTWrapperCreation, GivesTheEntryPointTheHostCallbackOnce) {
  open();
  EXPECT_THAT(plugin.entryCalls(), ElementsAre(&VSTWrapper::masterCallback));
}

TEST_F(VSTWrapperCreation, IgnoresWhatThePluginAnswersOnTheWay) {
  effect.aeffect.numInputs = 1;
  effect.aeffect.numOutputs = 1;
  for (const VstEffectOpcode opcode : {effIdentify, effSetSampleRate, effSetBlockSize, effOpen, effSetProgram,
                                       effConnectInput, effConnectOutput, effCanDo}) {
    effect.answer(opcode, -1);
  }
  plugin.willCreate(effect);
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(effect.requests().size(), 8u);
}

TEST_F(VSTWrapperCreation, KeepsWhatItWasGiven) {
  int owner = 0;
  auto* const support = reinterpret_cast<KelVSTSupportEffect*>(&owner);
  VST_ChildSpec child(1234);
  child.childName = "Shimmer";
  plugin.willCreate(effect);
  wrapper = create(child, support);
  child.childName = "another";
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(wrapper->loader.get(), module.get());
  EXPECT_TRUE(wrapper->childSpec.hasChildID);
  EXPECT_EQ(wrapper->childSpec.childID, 1234);
  EXPECT_EQ(wrapper->childSpec.childName, "Shimmer");
  EXPECT_EQ(wrapper->supportEffect, support);
  EXPECT_EQ(wrapper->effect, &effect.aeffect);
}

TEST_F(VSTWrapperCreation, StartsWithAllElseUnset) {
  open();
  EXPECT_EQ(wrapper->paramBeingSet, -1);
  EXPECT_FALSE(wrapper->bypassed);
  EXPECT_FALSE(wrapper->mainsOn);
  EXPECT_FALSE(wrapper->hasCockosExtensions);
  EXPECT_FALSE(wrapper->auxFlag);
  EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
  EXPECT_EQ(wrapper->lock.lockCount, 0);
  EXPECT_EQ(wrapper->lock.recursionDepth, 0);
  EXPECT_TRUE(wrapper->lock.owner.IsEqual(NiduThreadID()));
}

TEST_F(VSTWrapperCreation, CountsItselfAmongTheModulesUsersForAsLongAsItLives) {
  EXPECT_EQ(module->refCount, 1u);
  open();
  EXPECT_EQ(module->refCount, 2u);
  close();
  EXPECT_EQ(module->refCount, 1u);
}

TEST_F(VSTWrapperCreation, PutsTheWrappersAddressIntoTheInstanceBeforeTheFirstRequest) {
  plugin.willCreate(effect);
  VstIntPtr seen = 0;
  effect.onRequest = [&](const Request& request) {
    if (request.opcode == effIdentify) seen = effect.aeffect.resvd2;
  };
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(effect.aeffect.resvd2, reinterpret_cast<VstIntPtr>(wrapper.get()));
  EXPECT_EQ(seen, effect.aeffect.resvd2);
  EXPECT_EQ(effect.aeffect.resvd1, 0);
}

// Some plug-ins leave it empty or write their own.
TEST_F(VSTWrapperCreation, AcceptsAnyMagicNumber) {
  for (const VstInt32 magic : {0, -1, 0x50747356, 0x56737451}) {
    effect.aeffect.magic = magic;
    plugin.willCreate(effect);
    EXPECT_NE(create(), nullptr) << magic;
    EXPECT_EQ(effect.aeffect.magic, magic);
  }
}

TEST_F(VSTWrapperCreation, MakesAsManyInstancesAsItIsAskedFor) {
  RecordingEffect second;
  plugin.willCreate(effect);
  plugin.willCreate(second);
  const auto one = create();
  const auto other = create();
  EXPECT_EQ(one->effect, &effect.aeffect);
  EXPECT_EQ(other->effect, &second.aeffect);
  EXPECT_EQ(module->refCount, 3u);
  EXPECT_EQ(plugin.instancesAlive(), 2);
}

struct TokenCase {
  const char* name;
  std::uint32_t answer;
  bool known;
};

class VSTWrapperExtensionToken : public host_tests::WrapperTest,
                                 public testing::WithParamInterface<TokenCase> {};

TEST_P(VSTWrapperExtensionToken, IsTheUpperHalfOfTheAnswersLowWord) {
  effect.setCapability("hasCockosExtensions", static_cast<VstInt32>(GetParam().answer));
  open();
  EXPECT_EQ(wrapper->hasCockosExtensions, GetParam().known);
  EXPECT_FALSE(wrapper->auxFlag);
}

INSTANTIATE_TEST_SUITE_P(
    Answers, VSTWrapperExtensionToken,
    testing::Values(TokenCase{"Token", 0xBEEF0000u, true}, TokenCase{"TokenAndMore", 0xBEEF1234u, true},
                    TokenCase{"TokenAndAllElse", 0xBEEFFFFFu, true}, TokenCase{"Zero", 0u, false},
                    TokenCase{"One", 1u, false}, TokenCase{"MinusOne", 0xFFFFFFFFu, false},
                    TokenCase{"TokenInTheLowerHalf", 0x0000BEEFu, false},
                    TokenCase{"OneBitLess", 0xBEEE0000u, false}, TokenCase{"OneBitMore", 0xFEEF0000u, false},
                    TokenCase{"TopBitMissing", 0x3EEF0000u, false}),
    host_tests::nameOfCase<TokenCase>);

}  // namespace
