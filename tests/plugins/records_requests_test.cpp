// SPDX-License-Identifier: MIT
// The recording sample shows what a pointer from the host points to, where no run leads it to.
#include <gmock/gmock.h>

#include "plugins/records_requests/pointer_content.h"
#include "vst2/effect_opcodes.h"
#include "vst2/properties.h"
#include "vst2/speakers.h"

using namespace sample_plugins;
using testing::EndsWith;
using testing::StartsWith;

namespace {

TEST(DescribePointer, ShowsWhetherMemoryIsZero) {
  char buffer[114] = {};
  EXPECT_EQ(describePointer(effGetEffectName, 0, buffer), "buffer zero");
  buffer[1] = '\x2f';
  EXPECT_THAT(describePointer(effGetEffectName, 0, buffer), StartsWith("buffer 002f00"));
  VstPinProperties pin = {};
  EXPECT_EQ(describePointer(effGetOutputProperties, 0, &pin), "pin zero");
  pin.future[47] = 1;
  EXPECT_THAT(describePointer(effGetOutputProperties, 0, &pin), EndsWith("0001"));
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
