// SPDX-License-Identifier: MIT
// VSTWrapper: category, rates, speaker arrangements and pins.
#include <climits>
#include <cstring>

#include "tests/shared/wrapper_fixture.h"
#include "vst2/speakers.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

class VSTWrapperQueries : public host_tests::WrapperTest {
 protected:
  VSTWrapperQueries() { open(); }
};

TEST_F(VSTWrapperQueries, TheCategoryIsThePluginsAnswer) {
  const VSTWrapper& readOnly = *wrapper;
  for (const VstInt32 category : {0, 2, 10, 11, 4711, -1}) {
    effect.answer(effGetPlugCategory, category);
    EXPECT_EQ(readOnly.getEffectCategory(), category);
  }
  EXPECT_EQ(effect.requests(), std::vector<Request>(6, request(effGetPlugCategory)));
}

TEST_F(VSTWrapperQueries, TheSampleRateIsSentAsA32BitFloat) {
  wrapper->setSampleRate(96000.0);
  wrapper->setSampleRate(44100.0001);
  wrapper->setSampleRate(0.1);
  wrapper->setSampleRate(-1.0);
  EXPECT_THAT(
      effect.requests(),
      ElementsAre(request(effSetSampleRate, 0, 0, 96000.0f), request(effSetSampleRate, 0, 0, 44100.0f),
                  request(effSetSampleRate, 0, 0, 0.1f), request(effSetSampleRate, 0, 0, -1.0f)));
}

TEST_F(VSTWrapperQueries, TheBlockSizeIsSentAsTheValue) {
  wrapper->setBufferSize(64);
  wrapper->setBufferSize(0);
  wrapper->setBufferSize(-1);
  wrapper->setBufferSize(INT_MAX);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effSetBlockSize, 0, 64), request(effSetBlockSize, 0, 0),
                          request(effSetBlockSize, 0, -1), request(effSetBlockSize, 0, 2147483647)));
}

TEST_F(VSTWrapperQueries, TheSettingsGiveThePluginsAnswer) {
  effect.answer(effSetSampleRate, -3);
  effect.answer(effSetBlockSize, 12);
  EXPECT_EQ(wrapper->setSampleRate(48000.0), -3);
  EXPECT_EQ(wrapper->setBufferSize(128), 12);
}

// On purpose not effSetSpeakerArrangement (42), and not pointers to the records.
TEST_F(VSTWrapperQueries, SpeakerArrangementsAreOfferedWithOpcode69AndTheRecordsThemselves) {
  VstSpeakerArrangement input{};
  VstSpeakerArrangement output{};
  effect.answer(static_cast<VstEffectOpcode>(69), 1);
  effect.answer(static_cast<VstEffectOpcode>(42), 0);
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&input, &output));
  EXPECT_THAT(effect.requests(), ElementsAre(speakerArrangement(&input, &output)));
  EXPECT_EQ(effect.requests().at(0).opcode, 69);
  EXPECT_EQ(effect.requests().at(0).value, reinterpret_cast<VstIntPtr>(&input));
  EXPECT_EQ(effect.requests().at(0).pointee.address, &output);
}

TEST_F(VSTWrapperQueries, ASpeakerArrangementIsAcceptedWithAnyAnswerButZero) {
  VstSpeakerArrangement input{};
  VstSpeakerArrangement output{};
  effect.answerNext(effGetSpeakerArrangement, {0, 1, -1, 2, INT_MIN});
  EXPECT_FALSE(wrapper->setSpeakerArrangement(&input, &output));
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&input, &output));
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&input, &output));
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&input, &output));
  EXPECT_TRUE(wrapper->setSpeakerArrangement(&input, &output));
}

TEST_F(VSTWrapperQueries, ASpeakerArrangementMayBeNull) {
  EXPECT_FALSE(wrapper->setSpeakerArrangement(nullptr, nullptr));
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetSpeakerArrangement)));
}

// Many plug-ins take the two for pointers to pointers, and store a pointer at each place.
TEST_F(VSTWrapperQueries, APluginMayWriteOverTheArrangements) {
  VstSpeakerArrangement input{};
  VstSpeakerArrangement output{};
  effect.onRequest = [&](const Request& request) {
    void* const pluginsOwn = &effect;
    std::memcpy(reinterpret_cast<void*>(request.value), &pluginsOwn, sizeof pluginsOwn);
    std::memcpy(request.pointee.address, &pluginsOwn, sizeof pluginsOwn);
  };
  EXPECT_FALSE(wrapper->setSpeakerArrangement(&input, &output));
  void* written = nullptr;
  std::memcpy(&written, &input, sizeof written);
  EXPECT_EQ(written, &effect);
  EXPECT_EQ(input.speakers[0].type, 0);
}

TEST_F(VSTWrapperQueries, APinsPropertiesAreFilledInPlace) {
  VstPinProperties left{};
  std::strcpy(left.label, "Left");
  left.flags = 3;
  VstPinProperties side{};
  std::strcpy(side.label, "Side chain");
  side.arrangementType = -2;
  effect.setInputProperties(7, side);
  effect.setOutputProperties(0, left);

  VstPinProperties input{};
  EXPECT_TRUE(wrapper->getInputProperties(7, input));
  EXPECT_STREQ(input.label, "Side chain");
  EXPECT_EQ(input.arrangementType, -2);
  VstPinProperties output{};
  EXPECT_TRUE(wrapper->getOutputProperties(0, output));
  EXPECT_STREQ(output.label, "Left");
  EXPECT_EQ(output.flags, 3);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetInputProperties, 7), request(effGetOutputProperties)));
  EXPECT_EQ(effect.requests().at(0).pointee.address, &input);
  EXPECT_EQ(effect.requests().at(1).pointee.address, &output);
}

TEST_F(VSTWrapperQueries, APinsIndexIsPassedOnUnchecked) {
  VstPinProperties pin{};
  EXPECT_FALSE(wrapper->getInputProperties(-1, pin));
  EXPECT_FALSE(wrapper->getOutputProperties(INT_MAX, pin));
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetInputProperties, -1), request(effGetOutputProperties, 2147483647)));
}

TEST_F(VSTWrapperQueries, APinsAnswerOfZeroIsFalseAlsoWhereTheRecordWasWritten) {
  VstPinProperties written{};
  written.flags = 1;
  effect.setInputProperties(0, written);
  effect.answer(effGetInputProperties, 0);
  effect.answer(effGetOutputProperties, -1);
  VstPinProperties pin{};
  EXPECT_FALSE(wrapper->getInputProperties(0, pin));
  EXPECT_EQ(pin.flags, 1);
  EXPECT_TRUE(wrapper->getOutputProperties(0, pin));
}

// The caller clears a record, the wrapper does not.
TEST_F(VSTWrapperQueries, APinsRecordIsHandedOnAsItIs) {
  VstPinProperties pin{};
  std::memset(&pin, 'x', sizeof pin);
  wrapper->getInputProperties(0, pin);
  wrapper->getOutputProperties(0, pin);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetInputProperties).withZeroBytes(0),
                                             request(effGetOutputProperties).withZeroBytes(0)));
}

}  // namespace
