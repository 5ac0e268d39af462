// SPDX-License-Identifier: MIT
// The recording sample shows what a pointer from the host points to; equal texts mean equal contents.
#include <gmock/gmock.h>

#include "plugins/records_requests/pointer_content.h"
#include "vst2/effect_opcodes.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

using namespace sample_plugins;
using testing::EndsWith;
using testing::StartsWith;

namespace {

TEST(DescribePointer, ShowsTextsAndChunks) {
  EXPECT_EQ(describePointer(effCanDo, 0, "bypass"), "text \"bypass\"");
  EXPECT_EQ(describePointer(effSetProgramName, 0, ""), "text \"\"");
  EXPECT_EQ(describePointer(effString2Parameter, 0, nullptr), "null");
  const unsigned char chunk[] = {0x00, 0x9a, 0xff, 0x77};
  EXPECT_EQ(describePointer(effSetChunk, 3, chunk), "chunk 009aff");
}

TEST(DescribePointer, ShowsWhetherMemoryIsZero) {
  char buffer[114] = {};
  EXPECT_EQ(describePointer(effGetEffectName, 0, buffer), "buffer zero");
  buffer[1] = '\x2f';
  EXPECT_THAT(describePointer(effGetEffectName, 0, buffer), StartsWith("buffer 002f00"));
  VstPinProperties pin = {};
  EXPECT_EQ(describePointer(effGetOutputProperties, 0, &pin), "pin zero");
  pin.future[47] = 1;
  EXPECT_THAT(describePointer(effGetOutputProperties, 0, &pin), EndsWith("0001"));
  VstParameterProperties properties = {};
  EXPECT_EQ(describePointer(effGetParameterProperties, 0, &properties), "properties zero");
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

}  // namespace
