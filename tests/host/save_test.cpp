// SPDX-License-Identifier: MIT
// VSTWrapper::saveToFXBData: the exact bytes of the four forms, and the requests that saving makes.
#include <cstdint>
#include <cstring>
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using doubles::getChunk;
using preset_bytes::hex;
using preset_bytes::inHex;
using testing::ElementsAre;

class SaveToFXBData : public PresetTest {
 protected:
  SaveToFXBData() { effect.aeffect.version = 0x00010203; }
};

const std::string kReserved =
    "00000000 00000000 00000000 00000000 00000000 00000000 00000000 00000000"
    "00000000 00000000 00000000 00000000 00000000 00000000 00000000 00000000"
    "00000000 00000000 00000000 00000000 00000000 00000000 00000000 00000000"
    "00000000 00000000 00000000 00000000 00000000 00000000 00000000 00000000";

// ---- Bytes

TEST_F(SaveToFXBData, AProgramWithThreeParametersHas68Bytes) {
  effect.setPrograms({{"Init", {0.5f, 1.0f, -2.0f}}, {"Other", {}}});
  open();
  EXPECT_EQ(inHex(save(kProgram)), inHex(hex("43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000003"
                                             "496E6974 00000000 00000000 00000000 00000000 00000000 00000000"
                                             "3F000000 3F800000 C0000000")));
  EXPECT_EQ(requests(), inOrder({asksName(), readsParameters(3)}));
}

TEST_F(SaveToFXBData, AProgramWithoutParametersHas56Bytes) {
  effect.setPrograms({{"Init", {}}});
  effect.aeffect.uniqueID = -2;
  effect.aeffect.version = -1;
  open();
  AutoBuffer<char> out;
  out.setSize(1000);  // What the buffer held before is gone.
  EXPECT_TRUE(wrapper->saveToFXBData(out, kProgram));
  EXPECT_EQ(inHex(std::string(out.data(), static_cast<std::size_t>(out.size()))),
            inHex(hex("43636E4B 00000000 4678436B 00000001 FFFFFFFE FFFFFFFF 00000000"
                      "496E6974 00000000 00000000 00000000 00000000 00000000 00000000")));
}

// On purpose: the count is that of programs, in a single program too.
TEST_F(SaveToFXBData, AProgramWithAChunkHoldsTheProgramCount) {
  effect.setPrograms({{"Init", {0.5f, 1.0f}}, {"B", {}}, {"C", {}}, {"D", {}}, {"E", {}}});
  effect.programChunk = hex("01 00 FF");
  effect.bankChunk = "not this one";
  openWithChunks();
  EXPECT_EQ(inHex(save(kProgram)), inHex(hex("43636E4B 00000000 46504368 00000001 44656D6F 00010203 00000005"
                                             "496E6974 00000000 00000000 00000000 00000000 00000000 00000000"
                                             "00000003 0100FF")));
  EXPECT_EQ(requests(), inOrder({{getChunk(1)}, asksName()}));
}

TEST_F(SaveToFXBData, ABankWithAChunkAsksForTheChunkOnly) {
  effect.setPrograms({{"Init", {0.5f, 1.0f}}, {"B", {}}, {"C", {}}, {"D", {}}, {"E", {}}});
  effect.programChunk = "not this one";
  effect.bankChunk = hex("00 80 7F 00 0A");
  openWithChunks();
  EXPECT_EQ(inHex(save(kBank)), inHex(hex("43636E4B 00000000 46424368 00000001 44656D6F 00010203 00000005" +
                                          kReserved + "00000005 00807F00 0A")));
  EXPECT_THAT(requests(), ElementsAre(getChunk(0)));
}

TEST_F(SaveToFXBData, ABankOfFourProgramsWithTwoParametersHas412BytesWhicheverIsCurrent) {
  effect.setPrograms(
      {{"A", {0.0f, 1.0f}}, {"Bee", {0.5f, 0.25f}}, {"", {2.0f, -1.0f}}, {"D", {0.125f, 4.0f}}});
  open();
  for (const VstInt32 current : {0, 2, 3}) {
    effect.currentProgram = current;
    EXPECT_EQ(inHex(save(kBank)),
              inHex(hex("43636E4B 00000000 4678426B 00000001 44656D6F 00010203 00000004" + kReserved +

                        "43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000002"
                        "41000000 00000000 00000000 00000000 00000000 00000000 00000000"
                        "00000000 3F800000"

                        "43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000002"
                        "42656500 00000000 00000000 00000000 00000000 00000000 00000000"
                        "3F000000 3E800000"

                        "43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000002"
                        "00000000 00000000 00000000 00000000 00000000 00000000 00000000"
                        "40000000 BF800000"

                        "43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000002"
                        "44000000 00000000 00000000 00000000 00000000 00000000 00000000"
                        "3E000000 40800000")));
  }
}

TEST_F(SaveToFXBData, ABankWithoutProgramsStillHasOneBlock) {
  effect.setParameters({0.5f, 1.0f});
  open();
  EXPECT_EQ(inHex(save(kBank)),
            inHex(hex("43636E4B 00000000 4678426B 00000001 44656D6F 00010203 00000000" + kReserved +
                      "43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000002"
                      "00000000 00000000 00000000 00000000 00000000 00000000 00000000"
                      "3F000000 3F800000")));
  const Requests block = inOrder({asksName(), readsParameters(2)});
  EXPECT_EQ(requests(),
            inOrder({asksProgram(), block, block, asksProgram(), asksProgram(), readsParameters(2)}));
}

TEST_F(SaveToFXBData, TheFlagsDecideBetweenTheForms) {
  effect.setPrograms({{"Init", {0.5f}}});
  effect.aeffect.flags = ~32;
  open();
  EXPECT_EQ(save(kProgram).substr(8, 4), "FxCk");
  EXPECT_EQ(save(kBank).substr(8, 4), "FxBk");
  effect.aeffect.flags = 32;
  EXPECT_EQ(save(kProgram).substr(8, 4), "FPCh");
  EXPECT_EQ(save(kBank).substr(8, 4), "FBCh");
}

// ---- Values

struct ValueBits {
  std::string name;
  std::uint32_t bits;
};

class PresetValue : public PresetTest, public testing::WithParamInterface<ValueBits> {};

TEST_P(PresetValue, IsSavedAndLoadedWithItsBits) {
  std::uint32_t bits = GetParam().bits;
  float value = 0.0f;
  std::memcpy(&value, &bits, sizeof value);
  effect.setPrograms({{"Init", {value}}});
  open();
  const std::string saved = save(kProgram);
  EXPECT_EQ(inHex(saved.substr(56)), inHex(preset_bytes::word(bits)));
  effect.setPrograms({{"Init", {0.75f}}});
  EXPECT_TRUE(load(saved));
  ASSERT_THAT(effect.parameterWrites(), testing::SizeIs(1));
  bits = 0;
  std::memcpy(&bits, &effect.parameterWrites()[0].opt, sizeof bits);
  EXPECT_EQ(bits, GetParam().bits);
}

INSTANTIATE_TEST_SUITE_P(Bits, PresetValue,
                         testing::Values(ValueBits{"NegativeZero", 0x80000000},
                                         ValueBits{"SmallestDenormal", 0x00000001},
                                         ValueBits{"NegativeInfinity", 0xFF800000},
                                         ValueBits{"QuietNaN", 0x7FC00001},
                                         // Reversed, these bytes are a signalling NaN: a float of them must
                                         // not be made on the way.
                                         ValueBits{"SignallingNaNWhenReversed", 0x0100A07F}),
                         host_tests::nameOfCase<ValueBits>);

// Where floats pass through an x87 register, as on 32-bit x86, it makes a signalling NaN quiet.
#if !defined(__i386__)
INSTANTIATE_TEST_SUITE_P(SignallingNaN, PresetValue, testing::Values(ValueBits{"Negative", 0xFF800001}),
                         host_tests::nameOfCase<ValueBits>);
#endif

// ---- Requests

TEST_F(SaveToFXBData, WalksABankFromTheCurrentProgramOnAndComesBack) {
  effect.setPrograms({{"A", {0.0f, 0.1f}}, {"B", {1.0f, 1.1f}}, {"C", {2.0f, 2.1f}}, {"D", {3.0f, 3.1f}}});
  open();
  effect.currentProgram = 2;
  save(kBank);
  const Requests block = inOrder({asksName(), readsParameters(2)});
  const Requests store = block;
  EXPECT_EQ(requests(), inOrder({asksProgram(), store, block,                              // 2, as it is
                                 selects(0), block, selects(1), block, selects(3), block,  // the others
                                 selects(2), keepsName(), readsParameters(2)}));  // back, nothing to restore
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("A", "B", "C", "D"));
}

// Many plug-ins load a program's stored state whenever it is selected: what was edited since is lost.
TEST_F(SaveToFXBData, RestoresTheEditsThatSelectingTheProgramThrewAway) {
  effect.setPrograms({{"A", {0.0f, 0.1f}}, {"B", {1.0f, 1.1f}}});
  open();
  effect.onRequest = [this](const doubles::Request& request) {
    if (request == doubles::setProgram(0))
      effect.setPrograms({{"Factory", {0.7f, 0.1f}}, {"B", {1.0f, 1.1f}}});
  };
  const std::string saved = save(kBank);
  EXPECT_EQ(effect.currentProgram, 0);
  EXPECT_EQ(effect.program(0).name, "A");
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.0f, 0.1f));
  EXPECT_EQ(saved.substr(156 + 28, 1), "A");
  const Requests block = inOrder({asksName(), readsParameters(2)});
  EXPECT_EQ(requests(), inOrder({asksProgram(),
                                 block,
                                 block,
                                 selects(1),
                                 block,
                                 selects(0),
                                 renames("A"),
                                 sets(0, 0.0f),
                                 {doubles::getParameterOf(1)}}));
}

// Each request throws once; the address sanitizer reports memory that is not freed.
TEST_F(SaveToFXBData, LetsEveryExceptionOfADispatcherCallPass) {
  effect.setPrograms({{"A", {0.5f}}, {"B", {1.0f}}});
  open();
  int passed = 0;
  int requestsSoFar = 0;
  for (int throwAt = 1; requestsSoFar >= throwAt - 1; ++throwAt) {
    requestsSoFar = 0;
    effect.currentProgram = 0;
    effect.onRequest = [&](const doubles::Request&) {
      if (++requestsSoFar == throwAt) throw std::string("no");
    };
    AutoBuffer<char> out;
    try {
      wrapper->saveToFXBData(out, kBank);
    } catch (const std::string&) {
      ++passed;
    }
  }
  // Of 19 requests four ask for a parameter's value.
  EXPECT_EQ(passed, 15);
}

// ---- Blocks

TEST_F(SaveToFXBData, AProgramBlockIsFilledAndNoMore) {
  effect.setPrograms({{"Init", {0.5f, 1.0f}}});
  open();
  std::string memory(64 + 8, '#');
  wrapper->setParamsInProgramBlock(reinterpret_cast<fxProgram*>(&memory[0]));
  EXPECT_EQ(inHex(memory), inHex(hex("43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000002"
                                     "496E6974 00000000 00000000 00000000 00000000 00000000 00000000"
                                     "3F000000 3F800000 23232323 23232323")));
}

}  // namespace
