// SPDX-License-Identifier: MIT
// Requests as values: what is read from a call, when two are equal, and how they are printed.
#include <cmath>
#include <limits>
#include <string>
#include <utility>
#include <vector>

#include "gtest/gtest.h"
#include "tests/shared/request.h"

namespace {

using namespace doubles;

std::string printed(const Request& request) { return testing::PrintToString(request); }

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

TEST(ReceivedRequest, CopiesTextsWhenTheRequestIsMade) {
  char text[] = "offline";
  const Request capability = receivedRequest(effCanDo, 0, 0, text, 0.0f);
  const Request name = receivedRequest(effSetProgramName, 0, 0, text, 0.0f);
  const Request value = receivedRequest(effString2Parameter, 1, 0, text, 0.0f);
  text[0] = '\0';
  EXPECT_EQ(capability, canDo("offline"));
  EXPECT_EQ(name, setProgramName("offline"));
  EXPECT_EQ(value, setParameterFromText(1, "offline"));
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
}

TEST(RequestEquality, ComparesNumbersBitByBit) {
  EXPECT_NE(setParameterTo(0, 0.0f), setParameterTo(0, -0.0f));
  const float nan = std::numeric_limits<float>::quiet_NaN();
  EXPECT_EQ(setParameterTo(0, nan), setParameterTo(0, nan));
}

TEST(ExpectedRequests, HaveTheOpcodeAndTheArgumentsOfTheirName) {
  EXPECT_EQ(setProgram(3), receivedRequest(2, 0, 3, nullptr, 0.0f));
  char buffer[256] = {};
  EXPECT_EQ(programNameIndexed(7), receivedRequest(29, 7, -1, buffer, 0.0f));
  EXPECT_EQ(setSampleRate(44100.0f), receivedRequest(10, 0, 0, nullptr, 44100.0f));
  EXPECT_EQ(setBlockSize(512), receivedRequest(11, 0, 512, nullptr, 0.0f));
  EXPECT_EQ(mainsChanged(1), receivedRequest(12, 0, 1, nullptr, 0.0f));
  EXPECT_EQ(setBypass(1), receivedRequest(44, 0, 1, nullptr, 0.0f));
  EXPECT_EQ(connectInput(1), receivedRequest(31, 1, 1, nullptr, 0.0f));
  EXPECT_EQ(connectOutput(2, 0), receivedRequest(32, 2, 0, nullptr, 0.0f));
  void* chunk = nullptr;
  EXPECT_EQ(getChunk(1), receivedRequest(23, 1, 0, &chunk, 0.0f));
}

TEST(RequestPrinter, ShowsEverythingThatMakesRequestsDiffer) {
  EXPECT_EQ(printed(request(effGetNumMidiOutputChannels)), "effGetNumMidiOutputChannels()");
  EXPECT_EQ(printed(receivedRequest(80, 0, 0, nullptr, 0.0f)), "opcode 80()");
  EXPECT_EQ(printed(receivedRequest(-1, 0, 0, nullptr, 0.0f)), "opcode -1()");
  EXPECT_EQ(printed(request(effOpen)), "effOpen()");
  EXPECT_EQ(printed(connectInput(1)), "effConnectInput(index 1, value 1)");
  EXPECT_EQ(printed(setSampleRate(44100.0f)), "effSetSampleRate(opt 44100)");
  EXPECT_EQ(printed(canDo("offline")), "effCanDo(\"offline\")");
  EXPECT_EQ(printed(setChunk(0, "a\xFF")), "effSetChunk(value 2, 2 bytes 61 ff)");
  EXPECT_EQ(printed(request(effGetParamName, 2)), "effGetParamName(index 2, 500 cleared bytes)");
  EXPECT_EQ(printed(request(effGetProductString).withZeroBytes(110)),
            "effGetProductString(114 bytes of which 110 are zero)");
  EXPECT_EQ(printed(speakerArrangement(reinterpret_cast<void*>(0x10), reinterpret_cast<void*>(0x2F))),
            "effGetSpeakerArrangement(value address 0x10, address 0x2f)");
  EXPECT_EQ(printed(getParameterOf(2)), "getParameter(2)");
  EXPECT_EQ(printed(setParameterTo(2, 0.1f)), "setParameter(2, 0.1)");
  EXPECT_EQ(printed(setParameterTo(2, std::nextafter(0.1f, 1.0f))), "setParameter(2, 0.100000009)");
}

}  // namespace
