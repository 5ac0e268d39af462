// SPDX-License-Identifier: MIT
// The recording instance records exactly what was asked and answers exactly what it was told.
#include <stdexcept>
#include <string>
#include <thread>

#include "gmock/gmock.h"
#include "tests/shared/recording_effect.h"
#include "vst2/dispatch.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

class RecordingEffectTest : public testing::Test {
 protected:
  VstIntPtr ask(VstEffectOpcode opcode, VstInt32 index = 0, VstIntPtr value = 0, void* ptr = nullptr) {
    return dispatch(effect.aeffect, opcode, index, value, ptr);
  }
  /// The first 8 bytes of a buffer of '#' after the request.
  std::string askText(VstEffectOpcode opcode, VstInt32 index = 0) {
    std::string buffer(512, '#');
    ask(opcode, index, 0, buffer.data());
    return buffer.substr(0, 8);
  }
  VstIntPtr askCapability(const char* capability) { return ask(effCanDo, 0, 0, textArgument(capability)); }
  float get(VstInt32 index) { return effect.aeffect.getParameter(&effect.aeffect, index); }
  void set(VstInt32 index, float value) { effect.aeffect.setParameter(&effect.aeffect, index, value); }
  std::string getChunkText(VstInt32 index) {
    void* chunk = nullptr;
    const VstIntPtr size = ask(effGetChunk, index, 0, &chunk);
    return chunk == nullptr ? "(null)"
                            : std::string(static_cast<char*>(chunk), static_cast<std::size_t>(size));
  }

  RecordingEffect effect;
};

std::string eightBytes(std::string text) { return text.append(8 - text.size(), '#'); }

TEST_F(RecordingEffectTest, RecordsEveryRequestInOrderAlsoAfterTheClose) {
  ask(effOpen);
  dispatch(effect.aeffect, effSetSampleRate, 0, 0, nullptr, 44100.0f);
  set(2, 0.5f);
  get(2);
  ask(effClose);
  askCapability("offline");
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effOpen), setSampleRate(44100.0f), setParameterTo(2, 0.5f),
                          getParameterOf(2), request(effClose), canDo("offline")));
  EXPECT_THAT(effect.requestsOf({effClose, effOpen}), ElementsAre(request(effOpen), request(effClose)));
  EXPECT_THAT(effect.parameterReads(), ElementsAre(getParameterOf(2)));
  EXPECT_THAT(effect.parameterWrites(), ElementsAre(setParameterTo(2, 0.5f)));
  effect.forget();
  EXPECT_THAT(effect.requests(), IsEmpty());
  EXPECT_EQ(effect.timesClosed(), 1);
}

TEST_F(RecordingEffectTest, RecordsFromSeveralThreads) {
  const auto askAgainAndAgain = [this] {
    for (int i = 0; i < 200; ++i) get(i);
  };
  std::thread first(askAgainAndAgain);
  std::thread second(askAgainAndAgain);
  first.join();
  second.join();
  EXPECT_THAT(effect.requests(), SizeIs(400));
}

TEST_F(RecordingEffectTest, RunsTheHookAfterRecordingAndBeforeTheAnswer) {
  effect.onRequest = [this](const Request& asked) {
    effect.onRequest = nullptr;
    EXPECT_THAT(effect.requests(), ElementsAre(asked));
    effect.answer(effGetVstVersion, 2300);
    ask(effGetProgram);
  };
  EXPECT_EQ(ask(effGetVstVersion), 2300);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetVstVersion), request(effGetProgram)));
}

TEST_F(RecordingEffectTest, PassesWhatTheHookThrowsToTheHost) {
  effect.setParameters({0.5f});
  effect.onRequest = [](const Request&) { throw std::runtime_error("from the plug-in"); };
  EXPECT_THROW(ask(effOpen), std::runtime_error);
  EXPECT_THROW(get(0), std::runtime_error);
  EXPECT_THROW(set(0, 1.0f), std::runtime_error);
  EXPECT_EQ(effect.program(0).parameters[0], 0.5f);
}

TEST_F(RecordingEffectTest, PrefersTheNextAnswersThenTheIndexThenTheOpcode) {
  effect.answer(effCanBeAutomated, 5);
  effect.answerAt(effCanBeAutomated, 1, 6);
  effect.answerNext(effCanBeAutomated, {7, 8});
  EXPECT_EQ(ask(effCanBeAutomated, 1), 7);
  EXPECT_EQ(ask(effCanBeAutomated, 2), 8);
  EXPECT_EQ(ask(effCanBeAutomated, 1), 6);
  EXPECT_EQ(ask(effCanBeAutomated, 2), 5);
  EXPECT_EQ(ask(effGetVstVersion, 1), 0);
}

TEST_F(RecordingEffectTest, WritesTextsWithTheirZeroByteWhateverTheNumberIs) {
  effect.setText(effGetParamName, "any");
  effect.setTextAt(effGetParamName, 2, "two");
  effect.setUnterminatedText(effGetParamLabel, 6, 'q');
  effect.answer(effGetParamName, 0);
  EXPECT_EQ(askText(effGetParamName, 3), eightBytes(std::string("any\0", 4)));
  EXPECT_EQ(askText(effGetParamName, 2), eightBytes(std::string("two\0", 4)));
  EXPECT_EQ(askText(effGetParamLabel), eightBytes("qqqqqq"));
  char buffer[256];
  EXPECT_EQ(ask(effGetParamLabel, 0, 0, buffer), 1);
  EXPECT_EQ(ask(effGetParamLabel), 0) << "there is no buffer";
}

TEST_F(RecordingEffectTest, AnswersCapabilitiesByTheirWholeName) {
  effect.setCapability("sendVstMidiEvent", -1);
  EXPECT_EQ(askCapability("sendVstMidiEvent"), -1);
  EXPECT_EQ(askCapability("sendVstMidiEvent "), 0);
}

TEST_F(RecordingEffectTest, WritesRecordsForTheirOpcodeAndIndex) {
  VstParameterProperties parameter{};
  parameter.maxInteger = 99;
  VstPinProperties input{};
  input.flags = 1;
  VstPinProperties output{};
  output.flags = 2;
  effect.setParameterProperties(1, parameter);
  effect.setInputProperties(0, input);
  effect.setOutputProperties(0, output);
  VstParameterProperties gotParameter{};
  EXPECT_EQ(ask(effGetParameterProperties, 0, 0, &gotParameter), 0);
  EXPECT_EQ(ask(effGetParameterProperties, 1, 0, &gotParameter), 1);
  EXPECT_EQ(gotParameter.maxInteger, 99);
  VstPinProperties gotPin{};
  EXPECT_EQ(ask(effGetInputProperties, 0, 0, &gotPin), 1);
  EXPECT_EQ(gotPin.flags, 1);
  EXPECT_EQ(ask(effGetOutputProperties, 0, 0, &gotPin), 1);
  EXPECT_EQ(gotPin.flags, 2);
}

TEST_F(RecordingEffectTest, ListsItsShellChildrenAgainAfterTheZero) {
  effect.setShellChildren({{11, "First"}, {12, "Second"}});
  for (int round = 0; round < 2; ++round) {
    EXPECT_EQ(ask(effShellGetNextPlugin), 11);
    EXPECT_EQ(askText(effShellGetNextPlugin), eightBytes(std::string("Second\0", 7)));
    EXPECT_EQ(ask(effShellGetNextPlugin), 0);
  }
}

class RecordingEffectPrograms : public RecordingEffectTest {
 protected:
  RecordingEffectPrograms() { effect.setPrograms({{"Soft", {0.1f, 0.2f}}, {"Loud", {0.8f, 0.9f}}}); }
};

TEST_F(RecordingEffectPrograms, ChangeWithTheSelectedNumber) {
  EXPECT_EQ(effect.aeffect.numPrograms, 2);
  EXPECT_EQ(effect.aeffect.numParams, 2);
  ask(effSetProgram, 0, 1);
  for (const VstIntPtr outOfRange : {-1, 2}) ask(effSetProgram, 0, outOfRange);
  EXPECT_EQ(ask(effGetProgram), 1);
  EXPECT_EQ(get(1), 0.9f);
  ask(effSetProgramName, 0, 0, textArgument("New"));
  EXPECT_EQ(askText(effGetProgramName), eightBytes(std::string("New\0", 4)));
  for (const VstInt32 index : {-1, 0, 2}) set(index, 0.5f);
  EXPECT_EQ(get(2), 0.0f);
  EXPECT_EQ(effect.program(1).name, "New");
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(0.5f, 0.9f));
  EXPECT_EQ(effect.program(0).name, "Soft");
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.1f, 0.2f));
  effect.setPrograms({{"Only", {0.3f}}});
  EXPECT_EQ(effect.currentProgram, 0);
  EXPECT_EQ(effect.program(1).name, "");
}

TEST_F(RecordingEffectPrograms, StayAsTheyAreWhenTheRequestIsIgnored) {
  effect.ignore(effSetProgram);
  ask(effSetProgram, 0, 1);
  EXPECT_EQ(ask(effGetProgram), 0);
  EXPECT_THAT(effect.requests(), ElementsAre(setProgram(1), request(effGetProgram)));
}

TEST_F(RecordingEffectPrograms, AreNamedByIndexOnlyWhenAskedTo) {
  EXPECT_EQ(askText(effGetProgramNameIndexed, 1), "########");
  effect.namesProgramsByIndex = true;
  EXPECT_EQ(askText(effGetProgramNameIndexed, 1), eightBytes(std::string("Loud\0", 5)));
  EXPECT_EQ(askText(effGetProgramNameIndexed, 2), "########");
}

TEST_F(RecordingEffectTest, HasParametersWithoutPrograms) {
  effect.setParameters({0.25f, 0.75f});
  EXPECT_EQ(effect.aeffect.numPrograms, 0);
  EXPECT_EQ(effect.aeffect.numParams, 2);
  set(0, 1.5f);
  EXPECT_EQ(get(0), 1.5f);
}

TEST_F(RecordingEffectTest, LendsAndTakesChunksOnlyWithTheFlag) {
  effect.bankChunk = "bank";
  effect.programChunk = std::string("p\0q", 3);
  char data[] = "new";
  EXPECT_EQ(getChunkText(0), "(null)");
  EXPECT_EQ(ask(effSetChunk, 0, 3, data), 0);
  effect.aeffect.flags = effFlagsProgramChunks;
  EXPECT_EQ(getChunkText(0), "bank");
  EXPECT_EQ(getChunkText(1), std::string("p\0q", 3));
  EXPECT_EQ(ask(effSetChunk, 1, 2, data), 1);
  EXPECT_EQ(effect.programChunk, "ne");
  EXPECT_EQ(effect.bankChunk, "bank");
}

}  // namespace
