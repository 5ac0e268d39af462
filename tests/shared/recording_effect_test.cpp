// SPDX-License-Identifier: MIT
// The recording instance: that it records exactly what was asked and answers exactly what it was told.
#include <stdexcept>
#include <string>
#include <thread>

#include "gmock/gmock.h"
#include "gtest/gtest.h"
#include "tests/shared/recording_effect.h"
#include "vst2/dispatch.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

struct TextAnswer {
  std::string text;
  VstIntPtr number;
};

TextAnswer askText(RecordingEffect& effect, VstEffectOpcode opcode, VstInt32 index = 0) {
  char buffer[512] = {};
  const VstIntPtr number = dispatch(effect.aeffect, opcode, index, 0, buffer);
  return {buffer, number};
}

VstIntPtr askCapability(RecordingEffect& effect, const char* capability) {
  return dispatch(effect.aeffect, effCanDo, 0, 0, textArgument(capability));
}

float askParameter(RecordingEffect& effect, VstInt32 index) {
  return effect.aeffect.getParameter(&effect.aeffect, index);
}

void tellParameter(RecordingEffect& effect, VstInt32 index, float value) {
  effect.aeffect.setParameter(&effect.aeffect, index, value);
}

TEST(RecordingEffect, StartsAsAPluginWithoutAnything) {
  RecordingEffect effect;
  EXPECT_EQ(effect.aeffect.magic, 0x56737450);
  EXPECT_EQ(effect.aeffect.numPrograms, 0);
  EXPECT_EQ(effect.aeffect.numParams, 0);
  EXPECT_EQ(effect.aeffect.numInputs, 0);
  EXPECT_EQ(effect.aeffect.numOutputs, 0);
  EXPECT_EQ(effect.aeffect.flags, 0);
  EXPECT_EQ(effect.aeffect.resvd2, 0);
  EXPECT_EQ(effect.aeffect.process, nullptr);
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST(RecordingEffect, RecordsAllKindsOfRequestsInOrder) {
  RecordingEffect effect;
  dispatch(effect.aeffect, effOpen);
  dispatch(effect.aeffect, effSetSampleRate, 0, 0, nullptr, 44100.0f);
  tellParameter(effect, 2, 0.5f);
  askParameter(effect, 2);
  askCapability(effect, "offline");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effOpen), setSampleRate(44100.0f),
                                             setParameterTo(2, 0.5f), getParameterOf(2), canDo("offline")));
}

TEST(RecordingEffect, ChoosesRequestsByKind) {
  RecordingEffect effect;
  dispatch(effect.aeffect, effOpen);
  dispatch(effect.aeffect, effConnectInput, 0, 1);
  dispatch(effect.aeffect, effConnectOutput, 0, 1);
  askParameter(effect, 1);
  tellParameter(effect, 1, 0.25f);
  EXPECT_THAT(effect.requestsOf(effOpen), ElementsAre(request(effOpen)));
  EXPECT_THAT(effect.requestsOf({effConnectOutput, effConnectInput}),
              ElementsAre(connectInput(0), connectOutput(0)));
  EXPECT_THAT(effect.parameterReads(), ElementsAre(getParameterOf(1)));
  EXPECT_THAT(effect.parameterWrites(), ElementsAre(setParameterTo(1, 0.25f)));
}

TEST(RecordingEffect, ForgetsRequestsAndKeepsEverythingElse) {
  RecordingEffect effect;
  effect.answer(effGetVstVersion, 2400);
  effect.setParameters({0.5f});
  dispatch(effect.aeffect, effClose);
  effect.forget();
  EXPECT_THAT(effect.requests(), IsEmpty());
  EXPECT_TRUE(effect.closed());
  EXPECT_EQ(dispatch(effect.aeffect, effGetVstVersion), 2400);
  EXPECT_EQ(askParameter(effect, 0), 0.5f);
}

TEST(RecordingEffect, CountsClosingsAndShowsRequestsThatComeTooLate) {
  RecordingEffect effect;
  EXPECT_FALSE(effect.closed());
  dispatch(effect.aeffect, effClose);
  dispatch(effect.aeffect, effMainsChanged);
  dispatch(effect.aeffect, effClose);
  EXPECT_EQ(effect.timesClosed(), 2);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effClose), mainsChanged(0), request(effClose)));
}

TEST(RecordingEffect, RecordsFromSeveralThreads) {
  RecordingEffect effect;
  const auto ask = [&effect] {
    for (int i = 0; i < 200; ++i) askParameter(effect, i);
  };
  std::thread first(ask);
  std::thread second(ask);
  first.join();
  second.join();
  EXPECT_THAT(effect.requests(), SizeIs(400));
}

TEST(RecordingEffectHook, RunsAfterRecordingAndBeforeTheAnswer) {
  RecordingEffect effect;
  effect.onRequest = [&effect](const Request& request) {
    EXPECT_THAT(effect.requests(), ElementsAre(request));
    effect.answer(effGetVstVersion, 2300);
  };
  EXPECT_EQ(dispatch(effect.aeffect, effGetVstVersion), 2300);
}

TEST(RecordingEffectHook, ThrowsThroughToTheHost) {
  RecordingEffect effect;
  effect.setParameters({0.5f});
  effect.onRequest = [](const Request&) { throw std::runtime_error("from the plug-in"); };
  EXPECT_THROW(dispatch(effect.aeffect, effOpen), std::runtime_error);
  EXPECT_THROW(askParameter(effect, 0), std::runtime_error);
  EXPECT_THROW(tellParameter(effect, 0, 1.0f), std::runtime_error);
  EXPECT_EQ(effect.program(0).parameters[0], 0.5f);
  EXPECT_THAT(effect.requests(), SizeIs(3));
}

TEST(RecordingEffectHook, MayMakeRequestsChangeTheInstanceAndRemoveItself) {
  RecordingEffect effect;
  effect.onRequest = [&effect](const Request&) {
    effect.onRequest = nullptr;
    effect.aeffect.numParams = 9;
    dispatch(effect.aeffect, effGetProgram);
  };
  dispatch(effect.aeffect, effOpen);
  dispatch(effect.aeffect, effGetVstVersion);
  EXPECT_EQ(effect.aeffect.numParams, 9);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effOpen), request(effGetProgram), request(effGetVstVersion)));
}

TEST(RecordingEffectHook, MayWriteThroughThePointerOfTheRequest) {
  RecordingEffect effect;
  effect.onRequest = [](const Request& request) { *static_cast<int*>(request.pointee.address) = 42; };
  int target = 0;
  dispatch(effect.aeffect, effGetSpeakerArrangement, 0, 0, &target);
  EXPECT_EQ(target, 42);
}

TEST(RecordingEffectAnswers, AreZeroUnlessScripted) {
  RecordingEffect effect;
  for (const VstEffectOpcode opcode : {effOpen, effIdentify, effGetPlugCategory, effGetVstVersion,
                                       effCanBeAutomated, effGetSpeakerArrangement, effGetTailSize}) {
    EXPECT_EQ(dispatch(effect.aeffect, opcode), 0) << opcode;
  }
}

TEST(RecordingEffectAnswers, PreferTheQueueThenTheIndexThenTheOpcode) {
  RecordingEffect effect;
  effect.answer(effCanBeAutomated, 5);
  effect.answerAt(effCanBeAutomated, 1, 6);
  effect.answerNext(effCanBeAutomated, {7, 8});
  EXPECT_EQ(dispatch(effect.aeffect, effCanBeAutomated, 1), 7);
  EXPECT_EQ(dispatch(effect.aeffect, effCanBeAutomated, 2), 8);
  EXPECT_EQ(dispatch(effect.aeffect, effCanBeAutomated, 1), 6);
  EXPECT_EQ(dispatch(effect.aeffect, effCanBeAutomated, 2), 5);
  EXPECT_EQ(dispatch(effect.aeffect, effGetVstVersion, 1), 0);
}

TEST(RecordingEffectAnswers, ReplaceOnlyTheNumber) {
  RecordingEffect effect;
  effect.setText(effGetEffectName, "Written");
  effect.answer(effGetEffectName, 0);
  const TextAnswer answer = askText(effect, effGetEffectName);
  EXPECT_EQ(answer.text, "Written");
  EXPECT_EQ(answer.number, 0);
}

TEST(RecordingEffectAnswers, KeepTheWholeWidthOfAPointer) {
  RecordingEffect effect;
  effect.answer(effCanDo, static_cast<VstIntPtr>(static_cast<VstInt32>(0xBEEF1234u)));
  EXPECT_EQ(askCapability(effect, "any"), static_cast<VstIntPtr>(-1091628492));
}

TEST(RecordingEffectTexts, AreWrittenWithTheirTerminatorAndAnsweredWithOne) {
  RecordingEffect effect;
  effect.setText(effGetVendorString, "Play");
  char buffer[114];
  std::fill(std::begin(buffer), std::end(buffer), '#');
  EXPECT_EQ(dispatch(effect.aeffect, effGetVendorString, 0, 0, buffer), 1);
  EXPECT_EQ(std::string(buffer, 6), std::string("Play\0#", 6));
}

TEST(RecordingEffectTexts, PreferTheIndex) {
  RecordingEffect effect;
  effect.setText(effGetParamName, "any");
  effect.setTextAt(effGetParamName, 2, "two");
  EXPECT_EQ(askText(effect, effGetParamName, 2).text, "two");
  EXPECT_EQ(askText(effect, effGetParamName, 3).text, "any");
}

TEST(RecordingEffectTexts, CanLackTheZeroByte) {
  RecordingEffect effect;
  effect.setUnterminatedText(effGetParamLabel, 256, 'q');
  std::string buffer(260, '#');
  dispatch(effect.aeffect, effGetParamLabel, 0, 0, buffer.data());
  EXPECT_EQ(buffer, std::string(256, 'q') + "####");
}

TEST(RecordingEffectTexts, AreNotWrittenToANullPointer) {
  RecordingEffect effect;
  effect.setText(effGetEffectName, "text");
  EXPECT_EQ(dispatch(effect.aeffect, effGetEffectName), 0);
}

TEST(RecordingEffectIgnore, RecordsTheRequestWithoutDoingAnything) {
  RecordingEffect effect;
  effect.setPrograms({{"A", {}}, {"B", {}}});
  effect.ignore(effSetProgram);
  dispatch(effect.aeffect, effSetProgram, 0, 1);
  EXPECT_EQ(dispatch(effect.aeffect, effGetProgram), 0);
  EXPECT_THAT(effect.requests(), ElementsAre(setProgram(1), request(effGetProgram)));
}

TEST(RecordingEffectCapabilities, AnswerByName) {
  RecordingEffect effect;
  effect.setCapability("sendVstMidiEvent", -1);
  EXPECT_EQ(askCapability(effect, "sendVstMidiEvent"), -1);
  EXPECT_EQ(askCapability(effect, "sendVstMidiEvent "), 0);
  EXPECT_EQ(askCapability(effect, "offline"), 0);
}

TEST(RecordingEffectRecords, AreWrittenForTheirIndexOnly) {
  RecordingEffect effect;
  VstParameterProperties filled{};
  filled.maxInteger = 99;
  effect.setParameterProperties(1, filled);
  VstParameterProperties got{};
  EXPECT_EQ(dispatch(effect.aeffect, effGetParameterProperties, 0, 0, &got), 0);
  EXPECT_EQ(got.maxInteger, 0);
  EXPECT_EQ(dispatch(effect.aeffect, effGetParameterProperties, 1, 0, &got), 1);
  EXPECT_EQ(got.maxInteger, 99);
}

TEST(RecordingEffectRecords, TellInputsFromOutputs) {
  RecordingEffect effect;
  VstPinProperties in{};
  in.flags = 1;
  VstPinProperties out{};
  out.flags = 2;
  effect.setInputProperties(0, in);
  effect.setOutputProperties(0, out);
  VstPinProperties got{};
  EXPECT_EQ(dispatch(effect.aeffect, effGetInputProperties, 0, 0, &got), 1);
  EXPECT_EQ(got.flags, 1);
  EXPECT_EQ(dispatch(effect.aeffect, effGetOutputProperties, 0, 0, &got), 1);
  EXPECT_EQ(got.flags, 2);
}

TEST(RecordingEffectShell, ListsItsChildrenThenZeroThenBeginsAgain) {
  RecordingEffect effect;
  effect.setShellChildren({{11, "First"}, {12, "Second"}, {11, "First"}});
  for (int round = 0; round < 2; ++round) {
    EXPECT_EQ(askText(effect, effShellGetNextPlugin).number, 11);
    const TextAnswer second = askText(effect, effShellGetNextPlugin);
    EXPECT_EQ(second.number, 12);
    EXPECT_EQ(second.text, "Second");
    EXPECT_EQ(askText(effect, effShellGetNextPlugin).number, 11);
    const TextAnswer end = askText(effect, effShellGetNextPlugin);
    EXPECT_EQ(end.number, 0);
    EXPECT_EQ(end.text, "");
  }
}

class RecordingEffectPrograms : public testing::Test {
 protected:
  RecordingEffectPrograms() { effect.setPrograms({{"Soft", {0.1f, 0.2f}}, {"Loud", {0.8f, 0.9f}}}); }
  RecordingEffect effect;
};

TEST_F(RecordingEffectPrograms, SetTheCounts) {
  EXPECT_EQ(effect.aeffect.numPrograms, 2);
  EXPECT_EQ(effect.aeffect.numParams, 2);
}

TEST_F(RecordingEffectPrograms, ReplaceTheFormerOnesWhole) {
  dispatch(effect.aeffect, effSetProgram, 0, 1);
  effect.setPrograms({{"Only", {0.3f}}});
  EXPECT_EQ(effect.currentProgram, 0);
  EXPECT_EQ(effect.aeffect.numPrograms, 1);
  EXPECT_EQ(effect.aeffect.numParams, 1);
  EXPECT_EQ(effect.program(1).name, "");
}

TEST_F(RecordingEffectPrograms, SwitchNamesAndValuesTogether) {
  EXPECT_EQ(askText(effect, effGetProgramName).text, "Soft");
  EXPECT_EQ(askParameter(effect, 1), 0.2f);
  dispatch(effect.aeffect, effSetProgram, 0, 1);
  EXPECT_EQ(dispatch(effect.aeffect, effGetProgram), 1);
  EXPECT_EQ(askText(effect, effGetProgramName).text, "Loud");
  EXPECT_EQ(askParameter(effect, 1), 0.9f);
}

TEST_F(RecordingEffectPrograms, StayWhereTheyAreForANumberOutOfRange) {
  for (const VstIntPtr program : {-1, 2, 100}) dispatch(effect.aeffect, effSetProgram, 0, program);
  EXPECT_EQ(effect.currentProgram, 0);
}

TEST_F(RecordingEffectPrograms, ChangeOnlyTheSelectedOne) {
  dispatch(effect.aeffect, effSetProgram, 0, 1);
  dispatch(effect.aeffect, effSetProgramName, 0, 0, textArgument("Renamed"));
  tellParameter(effect, 0, 0.5f);
  EXPECT_EQ(effect.program(1).name, "Renamed");
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(0.5f, 0.9f));
  EXPECT_EQ(effect.program(0).name, "Soft");
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.1f, 0.2f));
}

TEST_F(RecordingEffectPrograms, AreNamedByIndexOnlyWhenAskedTo) {
  EXPECT_EQ(askText(effect, effGetProgramNameIndexed, 1).number, 0);
  effect.namesProgramsByIndex = true;
  EXPECT_EQ(askText(effect, effGetProgramNameIndexed, 1).text, "Loud");
  EXPECT_EQ(askText(effect, effGetProgramNameIndexed, 1).number, 1);
  EXPECT_EQ(askText(effect, effGetProgramNameIndexed, 2).number, 0);
  EXPECT_EQ(askText(effect, effGetProgramNameIndexed, -1).number, 0);
}

TEST_F(RecordingEffectPrograms, KeepParametersWithinTheirCount) {
  tellParameter(effect, 2, 1.0f);
  tellParameter(effect, -1, 1.0f);
  EXPECT_EQ(askParameter(effect, 2), 0.0f);
  EXPECT_EQ(askParameter(effect, -1), 0.0f);
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.1f, 0.2f));
}

TEST(RecordingEffectParameters, ExistWithoutPrograms) {
  RecordingEffect effect;
  effect.setParameters({0.25f, 0.75f});
  EXPECT_EQ(effect.aeffect.numPrograms, 0);
  EXPECT_EQ(effect.aeffect.numParams, 2);
  tellParameter(effect, 0, 1.5f);
  EXPECT_EQ(askParameter(effect, 0), 1.5f);
  EXPECT_EQ(askParameter(effect, 1), 0.75f);
}

class RecordingEffectChunks : public testing::Test {
 protected:
  RecordingEffectChunks() {
    effect.bankChunk = "whole bank";
    effect.programChunk = std::string("p\0q", 3);
  }
  std::string get(VstInt32 index) {
    void* chunk = nullptr;
    const VstIntPtr size = dispatch(effect.aeffect, effGetChunk, index, 0, &chunk);
    return chunk == nullptr ? "(null)"
                            : std::string(static_cast<char*>(chunk), static_cast<std::size_t>(size));
  }
  RecordingEffect effect;
};

TEST_F(RecordingEffectChunks, AreLentByIndex) {
  effect.aeffect.flags = effFlagsProgramChunks;
  EXPECT_EQ(get(0), "whole bank");
  EXPECT_EQ(get(1), std::string("p\0q", 3));
  EXPECT_THAT(effect.requests(), ElementsAre(getChunk(0), getChunk(1)));
}

TEST_F(RecordingEffectChunks, AreTakenByIndex) {
  effect.aeffect.flags = effFlagsProgramChunks;
  char data[] = "new";
  EXPECT_EQ(dispatch(effect.aeffect, effSetChunk, 1, 3, data), 1);
  EXPECT_EQ(effect.programChunk, "new");
  EXPECT_EQ(effect.bankChunk, "whole bank");
  EXPECT_EQ(dispatch(effect.aeffect, effSetChunk, 0, 2, data), 1);
  EXPECT_EQ(effect.bankChunk, "ne");
  EXPECT_THAT(effect.requests(), ElementsAre(setChunk(1, "new"), setChunk(0, "ne")));
}

TEST_F(RecordingEffectChunks, DoNotExistWithoutTheFlag) {
  char data[] = "new";
  EXPECT_EQ(get(0), "(null)");
  EXPECT_EQ(dispatch(effect.aeffect, effSetChunk, 0, 3, data), 0);
  EXPECT_EQ(effect.bankChunk, "whole bank");
}

}  // namespace
