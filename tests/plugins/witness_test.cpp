// SPDX-License-Identifier: MIT
// What the recording sample makes of a pointer, and the shell's list of children.
#include <cstdlib>

#include <gmock/gmock.h>

#include "plugins/records_requests/pointer_content.h"
#include "tests/plugins/loaded_plugin.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

using namespace sample_plugins;
using namespace sample_plugins_test;

namespace {

TEST(DescribePointer, ShowsTextsThatTheHostPasses) {
  EXPECT_EQ(describePointer(effCanDo, 0, "bypass"), "text \"bypass\"");
  EXPECT_EQ(describePointer(effSetProgramName, 0, ""), "text \"\"");
  EXPECT_EQ(describePointer(effString2Parameter, 0, nullptr), "null");
}

TEST(DescribePointer, ShowsWhetherRoomForATextIsClear) {
  char buffer[114] = {};
  EXPECT_EQ(describePointer(effGetEffectName, 0, buffer), "buffer zero");
  buffer[1] = '\x2f';
  EXPECT_THAT(describePointer(effGetEffectName, 0, buffer), testing::StartsWith("buffer 002f00"));
}

TEST(DescribePointer, ShowsWhetherARecordIsClear) {
  VstPinProperties pin = {};
  EXPECT_EQ(describePointer(effGetOutputProperties, 0, &pin), "pin zero");
  pin.future[47] = 1;
  EXPECT_THAT(describePointer(effGetOutputProperties, 0, &pin), testing::EndsWith("0001"));
  VstParameterProperties properties = {};
  EXPECT_EQ(describePointer(effGetParameterProperties, 0, &properties), "properties zero");
}

TEST(DescribePointer, ShowsTheBytesOfAChunk) {
  const unsigned char chunk[] = {0x00, 0x9a, 0xff, 0x77};
  EXPECT_EQ(describePointer(effSetChunk, 3, chunk), "chunk 009aff");
}

TEST(DescribePointer, ShowsSpeakerArrangements) {
  VstSpeakerArrangement arrangement = {};
  arrangement.type = 1;
  arrangement.numChannels = 2;
  arrangement.speakers[0].type = 1;
  arrangement.speakers[1].type = 2;
  EXPECT_EQ(describePointer(effGetSpeakerArrangement, 0, &arrangement), "arrangement 1: 1 2");
  EXPECT_EQ(describeValue(effGetSpeakerArrangement, reinterpret_cast<VstIntPtr>(&arrangement)),
            "arrangement 1: 1 2");
  EXPECT_EQ(describeValue(effGetSpeakerArrangement, 0), "0");
  EXPECT_EQ(describeValue(effSetProgram, 3), "3");
}

TEST(NumberText, TellsFloatsApart) {
  EXPECT_EQ(numberText(44100.0f), "44100");
  EXPECT_EQ(numberText(0.1f), "0.100000001");
}

TEST(RecordsRequestsSample, SavesItsStateInChunksWhenAsked) {
  const LoadedPlugin plugin("records_requests");
  AEffect* plain = plugin.callEntry();
  setenv("RECORDS_REQUESTS_CHUNKS", "1", 1);
  AEffect* chunked = plugin.callEntry();
  unsetenv("RECORDS_REQUESTS_CHUNKS");
  EXPECT_EQ(plain->flags, 16);
  EXPECT_EQ(chunked->flags, 48);
  EXPECT_EQ(chunked->numInputs, 2);
  EXPECT_EQ(chunked->numOutputs, 3);
  EXPECT_EQ(chunked->numParams, 3);
  EXPECT_EQ(chunked->numPrograms, 3);
  void* data = nullptr;
  EXPECT_EQ(dispatch(*plain, effGetChunk, 0, 0, &data), 0);
  EXPECT_EQ(dispatch(*chunked, effGetChunk, 0, 0, &data), 4 + 3 * 3 * 4);
  EXPECT_EQ(dispatch(*chunked, effGetChunk, 1, 0, &data), 3 * 4);
  dispatch(*plain, effClose);
  dispatch(*chunked, effClose);
}

TEST(ShellSample, ListsItsChildrenAgainAndAgain) {
  AEffect& shell = *LoadedPlugin("shell").callEntry();
  EXPECT_EQ(dispatch(shell, effGetPlugCategory), 10);
  for (int round = 0; round < 2; ++round) {
    char name[114] = {};
    EXPECT_EQ(dispatch(shell, effShellGetNextPlugin, 0, 0, name), 1001);
    EXPECT_STREQ(name, "First child");
    EXPECT_EQ(dispatch(shell, effShellGetNextPlugin, 0, 0, name), 1234);
    EXPECT_STREQ(name, "Second child");
    EXPECT_EQ(dispatch(shell, effShellGetNextPlugin, 0, 0, name), -7);
    EXPECT_STREQ(name, "Third child");
    EXPECT_EQ(dispatch(shell, effShellGetNextPlugin, 0, 0, name), 0);
  }
  dispatch(shell, effClose);
}

TEST(ShellSample, GivesAChildTheCategoryOfAnEffect) {
  wantedChild = 1234;
  AEffect& child = *LoadedPlugin("shell").callEntry();
  wantedChild = 0;
  EXPECT_EQ(dispatch(child, effGetPlugCategory), 1);
  EXPECT_EQ(textOf(child, effGetEffectName), "Second child");
  EXPECT_EQ(child.numParams, 1);
  dispatch(child, effClose);
}

}  // namespace
