// SPDX-License-Identifier: MIT
// The recording instance hides no request and no answer: otherwise tests of what the host must not ask, or must not
// take, would prove nothing.
#include <stdexcept>

#include "gmock/gmock.h"
#include "tests/shared/recording_effect.h"
#include "vst2/dispatch.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;

class RecordingEffectTest : public testing::Test {
 protected:
  VstIntPtr ask(VstEffectOpcode opcode, VstInt32 index = 0, void* ptr = nullptr) {
    return dispatch(effect.aeffect, opcode, index, 0, ptr);
  }
  float get(VstInt32 index) { return effect.aeffect.getParameter(&effect.aeffect, index); }
  void set(VstInt32 index, float value) { effect.aeffect.setParameter(&effect.aeffect, index, value); }

  RecordingEffect effect;
};

TEST_F(RecordingEffectTest, RecordsEveryRequestInOrderAlsoAfterTheClose) {
  ask(effOpen);
  dispatch(effect.aeffect, effSetSampleRate, 0, 0, nullptr, 44100.0f);
  set(2, 0.5f);
  get(2);
  ask(effClose);
  ask(effCanDo, 0, textArgument("offline"));
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effOpen), request(effSetSampleRate, 0, 0, 44100.0f),
                          setParameterTo(2, 0.5f), getParameterOf(2), request(effClose), canDo("offline")));
  EXPECT_THAT(effect.requestsOf({effClose, effOpen}), ElementsAre(request(effOpen), request(effClose)));
  EXPECT_THAT(effect.parameterReads(), ElementsAre(getParameterOf(2)));
  EXPECT_THAT(effect.parameterWrites(), ElementsAre(setParameterTo(2, 0.5f)));
  effect.forget();
  EXPECT_THAT(effect.requests(), IsEmpty());
  EXPECT_EQ(effect.timesClosed(), 1);
}

TEST_F(RecordingEffectTest, PassesWhatTheHookThrowsToTheHost) {
  effect.setParameters({0.5f});
  effect.onRequest = [](const Request&) { throw std::runtime_error("from the plug-in"); };
  EXPECT_THROW(ask(effOpen), std::runtime_error);
  EXPECT_THROW(get(0), std::runtime_error);
  EXPECT_THROW(set(0, 1.0f), std::runtime_error);
  EXPECT_EQ(effect.program(0).parameters[0], 0.5f);
}

TEST_F(RecordingEffectTest, WritesTextsAndRecordsAlsoWhenItAnswersZero) {
  VstPinProperties written{};
  written.flags = 2;
  effect.setText(effGetParamName, "any");
  effect.setOutputProperties(0, written);
  effect.answer(effGetParamName, 0);
  effect.answer(effGetOutputProperties, 0);
  char text[500] = "#####";  // The double looks at as much as the wrapper has for a name.
  VstPinProperties pin{};
  EXPECT_EQ(ask(effGetParamName, 3, text), 0);
  EXPECT_EQ(std::string(text, 5), std::string("any\0#", 5));
  EXPECT_EQ(ask(effGetOutputProperties, 0, &pin), 0);
  EXPECT_EQ(pin.flags, 2);
}

TEST_F(RecordingEffectTest, LendsAChunkOnlyWithTheFlag) {
  effect.bankChunk = "bank";
  void* chunk = nullptr;
  EXPECT_EQ(ask(effGetChunk, 0, &chunk), 0);
  EXPECT_EQ(chunk, nullptr);
}

}  // namespace
