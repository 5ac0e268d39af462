// SPDX-License-Identifier: MIT
// Requests as values: what is read from a call, what counts as equal, and how they print.
#include <cmath>
#include <limits>
#include <string>

#include "gtest/gtest.h"
#include "tests/shared/request.h"

namespace {

using namespace doubles;
using Kind = Pointee::Kind;

std::string printed(const Request& request) { return testing::PrintToString(request); }

TEST(ReceivedRequest, KeepsEveryArgument) {
  const Request received = receivedRequest(31, 2, 3, nullptr, 0.5f);
  EXPECT_EQ(received.kind, Request::Kind::kDispatch);
  EXPECT_EQ(received.opcode, 31);
  EXPECT_EQ(received.index, 2);
  EXPECT_EQ(received.value, 3);
  EXPECT_EQ(received.pointee.kind, Kind::kNull);
  EXPECT_EQ(received.opt, 0.5f);
}

struct RoomCase {
  const char* name;
  VstInt32 opcode;
  std::size_t size;
};

class ReceivedRoom : public testing::TestWithParam<RoomCase> {};

TEST_P(ReceivedRoom, CountsTheZeroBytesOfTheWholeRoom) {
  std::string memory(GetParam().size + 8, '\0');
  memory[0] = 'a';
  memory[GetParam().size - 1] = 'z';
  memory[GetParam().size] = 'b';  // Outside: must not count.
  const Request received = receivedRequest(GetParam().opcode, 1, 0, memory.data(), 0.0f);
  EXPECT_EQ(received.pointee.kind, Kind::kRoom);
  EXPECT_EQ(received.pointee.roomSize, GetParam().size);
  EXPECT_EQ(received.pointee.zeroBytes, GetParam().size - 2);
  EXPECT_EQ(received.pointee.address, memory.data());
}

TEST_P(ReceivedRoom, EqualsTheExpectedRequestOnlyWhenCleared) {
  const auto opcode = static_cast<VstEffectOpcode>(GetParam().opcode);
  std::string memory(GetParam().size, '\0');
  EXPECT_EQ(receivedRequest(opcode, 1, 0, memory.data(), 0.0f), request(opcode, 1));
  memory.back() = 'z';
  EXPECT_NE(receivedRequest(opcode, 1, 0, memory.data(), 0.0f), request(opcode, 1));
  EXPECT_EQ(receivedRequest(opcode, 1, 0, memory.data(), 0.0f),
            request(opcode, 1).withZeroBytes(GetParam().size - 1));
  EXPECT_NE(receivedRequest(opcode, 1, 0, nullptr, 0.0f), request(opcode, 1));
}

INSTANTIATE_TEST_SUITE_P(
    Opcodes, ReceivedRoom,
    testing::Values(RoomCase{"ProgramName", 5, 256}, RoomCase{"ParamLabel", 6, 256},
                    RoomCase{"ParamDisplay", 7, 256}, RoomCase{"ParamName", 8, 500},
                    RoomCase{"ChunkAddress", 23, sizeof(void*)}, RoomCase{"ProgramNameIndexed", 29, 256},
                    RoomCase{"InputProperties", 33, 128}, RoomCase{"OutputProperties", 34, 128},
                    RoomCase{"EffectName", 45, 114}, RoomCase{"VendorString", 47, 114},
                    RoomCase{"ProductString", 48, 114}, RoomCase{"ParameterProperties", 56, 152},
                    RoomCase{"ShellNextPlugin", 70, 114}),
    [](const auto& tested) { return tested.param.name; });

TEST(ReceivedRequest, ReadsTheTextsThatGoToThePlugin) {
  char text[] = "offline";
  for (const VstInt32 opcode : {4, 27, 51}) {
    const Request received = receivedRequest(opcode, 0, 0, text, 0.0f);
    EXPECT_EQ(received.pointee.kind, Kind::kText) << opcode;
    EXPECT_EQ(received.pointee.content, "offline") << opcode;
  }
}

TEST(ReceivedRequest, KeepsATextAsItWasWhenItCameIn) {
  char text[] = "offline";
  const Request received = receivedRequest(51, 0, 0, text, 0.0f);
  text[0] = 'X';
  EXPECT_EQ(received, canDo("offline"));
}

TEST(ReceivedRequest, TellsANullTextFromAnEmptyOne) {
  char empty[] = "";
  EXPECT_EQ(receivedRequest(27, 1, 0, nullptr, 0.0f), canParameterBeSetFromText(1));
  EXPECT_EQ(receivedRequest(27, 1, 0, empty, 0.0f), setParameterFromText(1, ""));
  EXPECT_NE(canParameterBeSetFromText(1), setParameterFromText(1, ""));
}

TEST(ReceivedRequest, ReadsAsManyBytesOfAChunkAsTheValueSays) {
  char chunk[] = {'a', '\0', 'b', 'c'};
  EXPECT_EQ(receivedRequest(24, 1, 3, chunk, 0.0f), setChunk(1, std::string("a\0b", 3)));
  EXPECT_NE(receivedRequest(24, 1, 3, chunk, 0.0f), setChunk(1, std::string("a\0c", 3)));
  EXPECT_NE(receivedRequest(24, 1, 3, chunk, 0.0f), setChunk(0, std::string("a\0b", 3)));
  EXPECT_EQ(receivedRequest(24, 1, -3, chunk, 0.0f).pointee.content, "");
}

TEST(ReceivedRequest, ComparesArrangementsByAddress) {
  int input = 0;
  int output = 0;
  const Request received = receivedRequest(69, 0, reinterpret_cast<VstIntPtr>(&input), &output, 0.0f);
  EXPECT_EQ(received, speakerArrangement(&input, &output));
  EXPECT_NE(received, speakerArrangement(&output, &input));
  EXPECT_NE(received, speakerArrangement(&input, &input));
  EXPECT_NE(received, speakerArrangement(&input, nullptr));
}

TEST(RequestEquality, LooksAtEveryField) {
  const Request base = request(effSetSampleRate, 1, 2, 3.0f);
  EXPECT_EQ(base, request(effSetSampleRate, 1, 2, 3.0f));
  EXPECT_NE(base, request(effSetBlockSize, 1, 2, 3.0f));
  EXPECT_NE(base, request(effSetSampleRate, 0, 2, 3.0f));
  EXPECT_NE(base, request(effSetSampleRate, 1, 0, 3.0f));
  EXPECT_NE(base, request(effSetSampleRate, 1, 2, 4.0f));
  EXPECT_NE(request(effOpen), getParameterOf(0));
  EXPECT_NE(getParameterOf(0), setParameterTo(0, 0.0f));
}

TEST(RequestEquality, SeesAWideValueWhole) {
  const VstIntPtr onlyTheTopBit = std::numeric_limits<VstIntPtr>::min();
  EXPECT_NE(request(effSetBlockSize, 0, onlyTheTopBit), request(effSetBlockSize, 0, 0));
}

TEST(RequestEquality, ComparesNumbersBitByBit) {
  EXPECT_NE(setParameterTo(0, 0.0f), setParameterTo(0, -0.0f));
  EXPECT_NE(setParameterTo(0, 0.5f), setParameterTo(0, std::nextafter(0.5f, 1.0f)));
  const float nan = std::numeric_limits<float>::quiet_NaN();
  EXPECT_EQ(setParameterTo(0, nan), setParameterTo(0, nan));
}

TEST(ExpectedRequests, SayWhatTheirNamesSay) {
  EXPECT_EQ(setProgram(3), receivedRequest(2, 0, 3, nullptr, 0.0f));
  char name[] = "Lead";
  EXPECT_EQ(setProgramName("Lead"), receivedRequest(4, 0, 0, name, 0.0f));
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

TEST(RequestPrinter, NamesTheOpcodeAndWhatIsNotZero) {
  EXPECT_EQ(printed(request(effOpen)), "effOpen()");
  EXPECT_EQ(printed(connectInput(1)), "effConnectInput(index 1, value 1)");
  EXPECT_EQ(printed(canDo("offline")), "effCanDo(\"offline\")");
  EXPECT_EQ(printed(setSampleRate(44100.0f)), "effSetSampleRate(opt 44100)");
  EXPECT_EQ(printed(request(effGetNumMidiOutputChannels)), "effGetNumMidiOutputChannels()");
  EXPECT_EQ(printed(receivedRequest(80, 0, 0, nullptr, 0.0f)), "opcode 80()");
  EXPECT_EQ(printed(receivedRequest(-1, 0, 0, nullptr, 0.0f)), "opcode -1()");
}

TEST(RequestPrinter, TellsAClearedRoomFromAUsedOne) {
  EXPECT_EQ(printed(request(effGetParamName, 2)), "effGetParamName(index 2, 500 cleared bytes)");
  EXPECT_EQ(printed(request(effGetProductString).withZeroBytes(110)),
            "effGetProductString(114 bytes of which 110 are zero)");
}

TEST(RequestPrinter, ShowsAddresses) {
  const auto input = reinterpret_cast<const void*>(0x10);
  const auto output = reinterpret_cast<const void*>(0x2F);
  EXPECT_EQ(printed(speakerArrangement(input, output)),
            "effGetSpeakerArrangement(value address 0x10, address 0x2f)");
}

TEST(RequestPrinter, ShowsDataInHexadecimal) {
  EXPECT_EQ(printed(setChunk(0, "a\xFF")), "effSetChunk(value 2, 2 bytes 61 ff)");
}

TEST(RequestPrinter, ShowsParametersSoThatDifferentNumbersLookDifferent) {
  EXPECT_EQ(printed(getParameterOf(2)), "getParameter(2)");
  EXPECT_EQ(printed(setParameterTo(2, 0.5f)), "setParameter(2, 0.5)");
  EXPECT_EQ(printed(setParameterTo(2, 0.1f)), "setParameter(2, 0.1)");
  EXPECT_NE(printed(setParameterTo(2, 0.1f)), printed(setParameterTo(2, std::nextafter(0.1f, 1.0f))));
}

}  // namespace
