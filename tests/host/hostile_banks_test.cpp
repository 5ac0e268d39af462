// SPDX-License-Identifier: MIT
// Current programs, names and strides that lie: nothing of ours is read or written out of bounds, which the
// address sanitizer watches.
#include <cstdint>
#include <limits>
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using preset_bytes::inHex;
using preset_bytes::program;

constexpr int kIntMax = std::numeric_limits<int>::max();
constexpr int kIntMin = std::numeric_limits<int>::min();

class HostileBank : public PresetTest {
 protected:
  HostileBank() { effect.setPrograms({{"A", {0.5f}}, {"B", {1.0f}}, {"C", {-2.0f}}}); }
};

struct Current {
  std::string name;
  VstInt32 number;
  VstInt32 clamped;
};

class CurrentOutsideTheBank : public HostileBank, public testing::WithParamInterface<Current> {};

INSTANTIATE_TEST_SUITE_P(Numbers, CurrentOutsideTheBank,
                         testing::Values(Current{"MinusOne", -1, 0}, Current{"TheSmallest", kIntMin, 0},
                                         Current{"OnePastTheLast", 3, 2}, Current{"Far", 1000, 2}),
                         [](const auto& instance) { return instance.param.name; });

TEST_P(CurrentOutsideTheBank, HasNoBlockOfItsOwn) {
  open();
  effect.currentProgram = GetParam().number;
  EXPECT_EQ(inHex(save(kBank)),
            inHex(preset_bytes::bank(
                {program("A", {0x3F000000}), program("B", {0x3F800000}), program("C", {0xC0000000})})));
  EXPECT_EQ(effect.currentProgram, GetParam().clamped);
}

TEST_P(CurrentOutsideTheBank, LeavesTheOneBlockOfABankWithoutProgramsEmpty) {
  open();
  effect.aeffect.numPrograms = 0;
  effect.currentProgram = GetParam().number;
  EXPECT_EQ(inHex(save(kBank)), inHex(preset_bytes::header("FxBk", 0) + std::string(128 + 60, '\0')));
}

TEST_P(CurrentOutsideTheBank, GetsNoBlockFromABankThatIsLoaded) {
  open();
  effect.currentProgram = GetParam().number;
  EXPECT_FALSE(load(preset_bytes::bank({program("X", {0}), program("Y", {0}), program("Z", {0})}), 0));
  EXPECT_EQ(effect.program(0).name, "X");
  EXPECT_EQ(effect.program(1).name, "Y");
  EXPECT_EQ(effect.program(2).name, "Z");
  EXPECT_EQ(effect.currentProgram, GetParam().clamped);
}

TEST_F(HostileBank, TheLargestCurrentProgramGetsNoBlockEither) {
  open();
  effect.currentProgram = kIntMax;
  EXPECT_FALSE(load(preset_bytes::bank({program("X", {0}), program("Y", {0}), program("Z", {0})}), 0));
  EXPECT_EQ(effect.currentProgram, 2);
}

TEST_F(HostileBank, OneThatNeverSelectsAnythingIsSavedAllTheSame) {
  open();
  effect.ignore(effSetProgram);
  EXPECT_EQ(inHex(save(kBank)),
            inHex(preset_bytes::bank(
                {program("A", {0x3F000000}), program("A", {0x3F000000}), program("A", {0x3F000000})})));
}

TEST_F(HostileBank, LeavesNothingBehindWhicheverRequestThrows) {
  open();
  for (int throwAt = 1;; ++throwAt) {
    int requestsSoFar = 0;
    effect.currentProgram = 0;
    effect.onRequest = [&](const doubles::Request&) {
      if (++requestsSoFar == throwAt) throw std::string("no");
    };
    AutoBuffer<char> out;
    try {
      wrapper->saveToFXBData(out, kBank);
    } catch (const std::string& thrown) {
      EXPECT_EQ(thrown, "no");
    }
    if (requestsSoFar < throwAt) break;
  }
  effect.onRequest = nullptr;
  effect.currentProgram = 0;
  EXPECT_EQ(save(kBank).size(), 336u);
}

// ---- Texts

// 256 bytes, which is the whole buffer, and no zero byte among them.
TEST_F(HostileBank, NamesThatFillTheBufferAreCut) {
  effect.setPrograms({{"A", {0.5f}}});
  open();
  effect.setUnterminatedText(effGetProgramName, 256, 'x');
  EXPECT_EQ(inHex(save(kProgram)), inHex(program(std::string(27, 'x'), {0x3F000000})));
  EXPECT_EQ(inHex(save(kBank)), inHex(preset_bytes::bank({program(std::string(27, 'x'), {0x3F000000})})));
  effect.aeffect.flags = 32;
  EXPECT_EQ(inHex(save(kProgram)), inHex(preset_bytes::programChunk(std::string(27, 'x'), "")));
}

// The store has room for 63 characters: a longer name never compares equal and is sent again.
TEST_F(HostileBank, ANameLongerThanTheStoreHoldsIsSentAgainAfterTheWalk) {
  effect.setPrograms({{std::string(63, 'x'), {}}});
  open();
  save(kBank);
  EXPECT_TRUE(effect.requestsOf(effSetProgramName).empty());
  effect.setPrograms({{std::string(64, 'x'), {}}});
  save(kBank);
  EXPECT_THAT(effect.requestsOf(effSetProgramName),
              testing::ElementsAre(doubles::setProgramName(std::string(24, 'x'))));
}

TEST_F(HostileBank, NamesByIndexThatFillTheBufferAreRead) {
  openWithChunks();
  effect.setUnterminatedText(effGetProgramNameIndexed, 256, 'x');
  EXPECT_TRUE(load(preset_bytes::bankChunk("bank")));
  EXPECT_EQ(wrapper->getProgramName(1), std::string(256, 'x'));
}

// ---- Strides

struct Stride {
  std::string name;
  std::int64_t firstCount;
};

class HostileStride : public HostileBank, public testing::WithParamInterface<Stride> {};

INSTANTIATE_TEST_SUITE_P(Counts, HostileStride,
                         testing::Values(Stride{"OneBlockBack", -29}, Stride{"JustBeforeTheData", -54},
                                         Stride{"FarBack", -1000000}, Stride{"TheSmallest", -2147483648},
                                         // In 32 bits these strides would be negative, 0 and 60.
                                         Stride{"JustAboveAnInt", 536870898},
                                         Stride{"WrapsToZero", 1073741810},
                                         Stride{"WrapsToOneParameter", 1073741825},
                                         Stride{"TheLargest", 2147483647}),
                         [](const auto& instance) { return instance.param.name; });

TEST_P(HostileStride, RefusesTheSecondProgram) {
  open();
  const std::string one = program("N", {0x3F800000});
  const std::string data =
      preset_bytes::with(preset_bytes::bank({one, one, one}), 180, preset_bytes::word(GetParam().firstCount));
  EXPECT_FALSE(load(data, 0));
  EXPECT_TRUE(effect.requestsOf(effSetProgramName).empty());
  EXPECT_TRUE(effect.parameterWrites().empty());
  // The first program is where it always is; but the numbers of the others are multiplied with the stride.
  effect.currentProgram = 2;
  EXPECT_FALSE(load(data, 0));
}

// A stride of 0: every program is the first block.
TEST_F(HostileBank, AStrideOfZeroLoadsTheFirstBlockIntoEveryProgram) {
  open();
  const std::string data = preset_bytes::with(
      preset_bytes::bank({program("N", {0x3F800000}), program("M", {0}), program("M", {0})}), 180,
      preset_bytes::word(-14));
  EXPECT_TRUE(load(data, 0));
  for (const VstInt32 i : {0, 1, 2}) EXPECT_EQ(effect.program(i).name, "N");
  EXPECT_TRUE(effect.parameterWrites().empty());
}

}  // namespace
