// SPDX-License-Identifier: MIT
// VSTWrapper::loadFromFXBData: banks, program by program or as one chunk.
#include <cstdint>
#include <string>
#include <vector>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using doubles::setChunk;
using preset_bytes::bank;
using preset_bytes::bankChunk;
using preset_bytes::hex;
using preset_bytes::program;
using preset_bytes::with;
using preset_bytes::word;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::uint32_t kHalf = 0x3F000000;
constexpr std::uint32_t kOne = 0x3F800000;
constexpr std::uint32_t kMinusTwo = 0xC0000000;

class LoadBank : public PresetTest {
 protected:
  // Three programs with one parameter: a stride of 60 bytes, and 336 in all.
  LoadBank() { effect.setPrograms({{"a", {0.0f}}, {"b", {0.0f}}, {"c", {0.0f}}}); }
  const std::string threePrograms =
      bank({program("A", {kHalf}), program("B", {kOne}), program("C", {kMinusTwo})});
  std::vector<std::string> names() const {
    return {effect.program(0).name, effect.program(1).name, effect.program(2).name};
  }
};

TEST_F(LoadBank, LoadsTheCurrentProgramLastAfterSwitchingBackToIt) {
  open();
  effect.currentProgram = 1;
  EXPECT_TRUE(load(threePrograms, 0));
  EXPECT_EQ(requests(), inOrder({asksProgram(),                             //
                                 selects(0), renames("A"), sets(0, 0.5f),   //
                                 selects(2), renames("C"), sets(0, -2.0f),  //
                                 selects(1), renames("B"), sets(0, 1.0f)}));
  EXPECT_THAT(names(), ElementsAre("A", "B", "C"));
  EXPECT_EQ(effect.currentProgram, 1);
}

TEST_F(LoadBank, OfItsOwnMakingBringsTheStateBack) {
  effect.setPrograms({{"A", {0.5f, 0.1f}}, {"B", {1.0f, 0.2f}}, {"C", {-2.0f, 0.3f}}});
  open();
  effect.currentProgram = 2;
  const std::string saved = save(kBank);
  effect.setPrograms({{"x", {0.0f, 0.0f}}, {"y", {0.0f, 0.0f}}, {"z", {0.0f, 0.0f}}});
  EXPECT_TRUE(load(saved, 0));
  EXPECT_THAT(names(), ElementsAre("A", "B", "C"));
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.5f, 0.1f));
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(1.0f, 0.2f));
  EXPECT_THAT(effect.program(2).parameters, ElementsAre(-2.0f, 0.3f));
  EXPECT_EQ(effect.currentProgram, 0);
}

TEST_F(LoadBank, PassesTheMagicCheckWithTheReversedChunkMagic) {
  open();
  EXPECT_TRUE(load(with(threePrograms, 0, "KncC")));
  EXPECT_THAT(names(), ElementsAre("A", "B", "C"));
}

TEST_F(LoadBank, DoesNothingForANegativeCount) {
  open();
  for (const std::int64_t count : {std::int64_t{-1}, std::int64_t{-2147483648}}) {
    EXPECT_TRUE(loadAs(with(threePrograms, 24, word(count)), 28));
    EXPECT_THAT(requests(), IsEmpty());
  }
}

TEST_F(LoadBank, LoadsTheCurrentProgramOnlyForACountOfZero) {
  open();
  effect.currentProgram = 1;
  EXPECT_TRUE(load(with(threePrograms, 24, word(0))));
  EXPECT_EQ(requests(), inOrder({asksProgram(), renames("B"), sets(0, 1.0f)}));
}

TEST_F(LoadBank, OfFewerProgramsLeavesTheOthersAlone) {
  open();
  EXPECT_TRUE(load(bank({program("A", {kHalf}), program("B", {kOne})})));
  EXPECT_THAT(names(), ElementsAre("A", "B", "c"));
}

// The last programs all go into the plug-in's last one.
TEST_F(LoadBank, OfMoreProgramsIsClampedToThoseThatThereAre) {
  effect.setPrograms({{"a", {0.0f}}, {"b", {0.0f}}});
  open();
  EXPECT_TRUE(load(threePrograms));
  EXPECT_EQ(requests(), inOrder({asksProgram(),                             //
                                 selects(1), renames("B"), sets(0, 1.0f),   //
                                 selects(1), renames("C"), sets(0, -2.0f),  // asked for 2
                                 selects(0), renames("A"), sets(0, 0.5f)}));
}

// A current program that the bank does not reach: the others are loaded, and the end is a refusal.
TEST_F(LoadBank, WithoutABlockForTheCurrentProgramIsRefusedAfterAllOthers) {
  open();
  effect.currentProgram = 2;
  EXPECT_FALSE(load(bank({program("A", {kHalf}), program("B", {kOne})})));
  EXPECT_THAT(names(), ElementsAre("A", "B", "c"));
  EXPECT_EQ(effect.currentProgram, 2);
}

// On purpose: all programs are taken to be as long as the first.
TEST_F(LoadBank, TakesTheFirstProgramsCountForTheStride) {
  open();
  // The second block lies 64 bytes after the first, whatever its own count says.
  const std::string second = with(program("B", {kOne, kOne}), 24, word(1));
  EXPECT_TRUE(load(bank({program("A", {kHalf, kHalf}), second})));
  EXPECT_EQ(requests(), inOrder({asksProgram(), selects(1), renames("B"), sets(0, 1.0f),  //
                                 selects(0), renames("A"), sets(0, 0.5f)}));
}

// On purpose: only a block's start is checked against the size.
TEST_F(LoadBank, AcceptsAProgramOfWhichOnlyTheFirstByteIsInside) {
  open();
  // The third block starts at 276.
  EXPECT_TRUE(loadAs(threePrograms, 277));
  EXPECT_THAT(names(), ElementsAre("A", "B", "C"));
}

TEST_F(LoadBank, RefusesAProgramThatStartsAtTheEndAndStaysOnTheOneBefore) {
  open();
  EXPECT_FALSE(loadAs(threePrograms, 276));
  EXPECT_EQ(requests(), inOrder({asksProgram(), selects(1), renames("B"), sets(0, 1.0f)}));
  EXPECT_EQ(effect.currentProgram, 1);
}

TEST_F(LoadBank, RefusesACurrentProgramThatStartsAtTheEnd) {
  open();
  effect.currentProgram = 2;
  EXPECT_FALSE(loadAs(threePrograms, 276));
  EXPECT_EQ(requests(), inOrder({asksProgram(), selects(0), renames("A"), sets(0, 0.5f),  //
                                 selects(1), renames("B"), sets(0, 1.0f), selects(2)}));
}

TEST_F(LoadBank, ChecksTheStartOfTheCurrentProgramInABankOfOne) {
  open();
  const std::string one = bank({program("A", {kHalf})});
  EXPECT_FALSE(loadAs(one, 156));
  EXPECT_EQ(requests(), inOrder({asksProgram(), finds()}));
  EXPECT_TRUE(loadAs(one, 157));
  EXPECT_EQ(effect.program(0).name, "A");
}

TEST_F(LoadBank, StopsAtABlockThatIsNoProgramAndStaysThere) {
  open();
  EXPECT_FALSE(load(with(threePrograms, 216 + 8, "FPCh")));
  EXPECT_EQ(requests(), inOrder({asksProgram(), selects(1)}));
  EXPECT_EQ(effect.currentProgram, 1);
  EXPECT_FALSE(load(with(threePrograms, 276, "KncC")));
  EXPECT_EQ(effect.currentProgram, 2);
}

TEST_F(LoadBank, KeepsTheProgramsLoadedBeforeTheRefusal) {
  open();
  EXPECT_FALSE(load(with(threePrograms, 276, "KncC")));
  EXPECT_THAT(names(), ElementsAre("a", "B", "c"));
}

TEST_F(LoadBank, IsRefusedWhenTheCurrentProgramsBlockIsNone) {
  open();
  EXPECT_FALSE(load(with(threePrograms, 156, "KncC")));
  EXPECT_THAT(names(), ElementsAre("a", "B", "C"));
  EXPECT_EQ(effect.currentProgram, 0);
}

TEST_F(LoadBank, TakesAnyFormatVersionInItsPrograms) {
  open();
  EXPECT_TRUE(load(with(threePrograms, 216 + 12, word(2))));
  EXPECT_THAT(names(), ElementsAre("A", "B", "C"));
}

class LoadBankChunk : public PresetTest {};

TEST_F(LoadBankChunk, GivesTheChunkAndThenLearnsTheNames) {
  effect.setPrograms({{"A", {0.5f}}, {"B", {0.5f}}});
  openWithChunks();
  EXPECT_TRUE(load(bankChunk("bank"), 0));
  EXPECT_EQ(requests(), inOrder({{setChunk(0, "bank"), doubles::programNameIndexed(0)},
                                 asksProgram(),
                                 asksName(),
                                 readsParameters(1),  //
                                 finds(),
                                 asksName(),
                                 selects(1),
                                 asksName(),  //
                                 selects(0),
                                 keepsName(),
                                 readsParameters(1)}));
  effect.forget();
  EXPECT_EQ(wrapper->getProgramName(1), "B");
  EXPECT_EQ(requests(), inOrder({asksProgram(), {doubles::programNameIndexed(1)}}));
}

TEST_F(LoadBankChunk, GivesTheChunkOnlyWhereProgramsHaveNamesByIndex) {
  effect.setPrograms({{"A", {}}, {"B", {}}});
  effect.namesProgramsByIndex = true;
  openWithChunks();
  EXPECT_TRUE(load(bankChunk("bank")));
  EXPECT_THAT(requests(), ElementsAre(setChunk(0, "bank"), doubles::programNameIndexed(0)));
}

TEST_F(LoadBankChunk, OfItsOwnMakingBringsTheStateBack) {
  effect.bankChunk = "state";
  openWithChunks();
  const std::string saved = save(kBank);
  effect.bankChunk = "other";
  EXPECT_TRUE(load(saved, 0));
  EXPECT_EQ(effect.bankChunk, "state");
}

// On purpose: accepted, although nothing is passed on.
TEST_F(LoadBankChunk, IsAcceptedByAPluginWithoutChunks) {
  effect.setPrograms({{"A", {}}, {"B", {}}});
  open();
  EXPECT_TRUE(load(bankChunk("bank")));
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(LoadBankChunk, GivesOnlyTheBytesThatTheSizeFieldClaims) {
  openWithChunks();
  EXPECT_TRUE(load(bankChunk("bank and more", 4)));
  EXPECT_THAT(requests(), ElementsAre(setChunk(0, "bank")));
}

}  // namespace
