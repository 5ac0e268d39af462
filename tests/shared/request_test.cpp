// SPDX-License-Identifier: MIT
// Requests as values: no two that differ are equal, or tests would pass on the wrong request.
#include <cmath>
#include <limits>
#include <string>
#include <utility>
#include <vector>

#include "gtest/gtest.h"
#include "tests/shared/request.h"

namespace {

using namespace doubles;

// The sizes of the host's buffers and of the interface's records.
TEST(ReceivedRequest, CountsTheZeroBytesOfTheWholeRoom) {
  const std::vector<std::pair<VstEffectOpcode, std::size_t>> rooms = {
      {effGetProgramName, 256},     {effGetParamLabel, 256},       {effGetParamDisplay, 256},
      {effGetParamName, 500},       {effGetChunk, sizeof(void*)},  {effGetProgramNameIndexed, 256},
      {effGetInputProperties, 128}, {effGetOutputProperties, 128}, {effGetEffectName, 114},
      {effGetVendorString, 114},    {effGetProductString, 114},    {effGetParameterProperties, 152},
      {effShellGetNextPlugin, 114}};
  for (const auto& [opcode, size] : rooms) {
    std::string memory(size + 1, '\0');
    memory[size] = 'b';  // Outside: must not count.
    EXPECT_EQ(receivedRequest(opcode, 1, 0, memory.data(), 0.0f), request(opcode, 1)) << opcode;
    memory[size - 1] = 'z';
    EXPECT_EQ(receivedRequest(opcode, 1, 0, memory.data(), 0.0f), request(opcode, 1).withZeroBytes(size - 1));
    EXPECT_NE(receivedRequest(opcode, 1, 0, memory.data(), 0.0f), request(opcode, 1)) << opcode;
    EXPECT_NE(receivedRequest(opcode, 1, 0, nullptr, 0.0f), request(opcode, 1)) << opcode;
  }
}

TEST(ReceivedRequest, TellsAnEmptyTextFromNone) {
  char text[] = "";
  EXPECT_EQ(receivedRequest(effString2Parameter, 1, 0, text, 0.0f), setParameterFromText(1, ""));
  EXPECT_EQ(receivedRequest(effString2Parameter, 1, 0, nullptr, 0.0f), canParameterBeSetFromText(1));
  EXPECT_NE(canParameterBeSetFromText(1), setParameterFromText(1, ""));
}

TEST(ReceivedRequest, ReadsAsManyBytesOfAChunkAsTheValueSays) {
  char chunk[] = {'a', '\0', 'b', 'c'};
  EXPECT_EQ(receivedRequest(effSetChunk, 1, 3, chunk, 0.0f), setChunk(1, std::string("a\0b", 3)));
  EXPECT_NE(receivedRequest(effSetChunk, 1, 3, chunk, 0.0f), setChunk(1, std::string("a\0c", 3)));
  EXPECT_EQ(receivedRequest(effSetChunk, 1, -3, chunk, 0.0f).pointee.content, "");
}

TEST(ReceivedRequest, ComparesArrangementsByAddress) {
  int input = 0;
  int output = 0;
  const auto value = reinterpret_cast<VstIntPtr>(&input);
  const Request received = receivedRequest(effGetSpeakerArrangement, 0, value, &output, 0.0f);
  EXPECT_EQ(received, speakerArrangement(&input, &output));
  EXPECT_NE(received, speakerArrangement(&output, &output));
  EXPECT_NE(received, speakerArrangement(&input, &input));
  EXPECT_NE(received, speakerArrangement(&input, nullptr));
}

TEST(RequestEquality, LooksAtEveryField) {
  const Request base = request(effSetSampleRate, 1, 2, 3.0f);
  EXPECT_EQ(base, receivedRequest(effSetSampleRate, 1, 2, nullptr, 3.0f));
  EXPECT_NE(base, request(effSetBlockSize, 1, 2, 3.0f));
  EXPECT_NE(base, request(effSetSampleRate, 0, 2, 3.0f));
  EXPECT_NE(base, request(effSetSampleRate, 1, std::numeric_limits<VstIntPtr>::min() + 2, 3.0f));
  EXPECT_NE(base, request(effSetSampleRate, 1, 2, std::nextafter(3.0f, 4.0f)));
  EXPECT_NE(request(effOpen), getParameterOf(0));
  EXPECT_NE(getParameterOf(0), setParameterTo(0, 0.0f));
  EXPECT_NE(setParameterTo(0, 0.0f), setParameterTo(0, -0.0f));
}

}  // namespace
