// SPDX-License-Identifier: MIT
// VSTWrapper::loadFromFXBData and restoreProgramSettings: programs and banks with parameter values.
#include <cstdint>
#include <string>
#include <vector>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using doubles::getParameterOf;
using doubles::setParameterTo;
using preset_bytes::bank;
using preset_bytes::program;
using preset_bytes::with;
using preset_bytes::word;
using testing::ElementsAre;
using testing::IsEmpty;

class LoadProgram : public PresetTest {
 protected:
  LoadProgram() { effect.setPrograms({{"Init", {0.0f, 0.0f}}, {"Other", {0.1f, 0.2f}}}); }

  bool restore(const std::string& block) {
    return wrapper->restoreProgramSettings(reinterpret_cast<const fxProgram*>(block.data()));
  }
};

TEST_F(LoadProgram, RenamesTheCurrentProgramAndSetsEveryValue) {
  open();
  effect.currentProgram = 1;
  EXPECT_TRUE(load(
      preset_bytes::hex("43636E4B FFFFFFFF 4678436B 00000001 456C7365 00010203 00000002"  // Size and id are
                        "4E657700 00000000 00000000 00000000 00000000 00000000 00000000"  // not looked at.
                        "3F000000 C0000000"),
      0));
  EXPECT_EQ(requests(), inOrder({renames("New"), sets(0, 0.5f), sets(1, -2.0f)}));
  EXPECT_EQ(effect.program(0).name, "Init");
}

TEST_F(LoadProgram, SendsNeitherTheNameNorAValueThatIsPresentAlready) {
  open();
  EXPECT_TRUE(load(program("Init", {0, kMinusTwo})));
  EXPECT_EQ(requests(), inOrder({keepsName(), {getParameterOf(0)}, sets(1, -2.0f)}));
}

// The bytes behind the field are not zero, so reading on would give another name.
TEST_F(LoadProgram, ReadsANameWithoutAZeroByteOnlyWithinItsField) {
  const std::string name(28, 'n');
  effect.setPrograms({{name, {0.0f}}});
  open();
  EXPECT_TRUE(load(with(program("", {kHalf}), 28, name)));
  EXPECT_EQ(requests(), inOrder({keepsName(), sets(0, 0.5f)}));
  effect.setPrograms({{"Init", {0.0f}}});
  EXPECT_TRUE(load(with(program("", {kHalf}), 28, name)));
  EXPECT_THAT(effect.requestsOf(effSetProgramName),
              ElementsAre(doubles::setProgramName(std::string(24, 'n'))));
}

TEST_F(LoadProgram, SetsNoMoreValuesThanThereAreInTheDataAndInThePlugin) {
  open();
  EXPECT_TRUE(load(program("Init", {kHalf, kOne, kMinusTwo})));
  EXPECT_EQ(requests(), inOrder({keepsName(), sets(0, 0.5f), sets(1, 1.0f)}));
  for (const std::int64_t count : {std::int64_t{0}, std::int64_t{-1}, std::int64_t{-2147483648}}) {
    effect.forget();
    EXPECT_TRUE(load(with(program("Init", {kMinusTwo}), 24, word(count))));
    EXPECT_EQ(requests(), keepsName());
  }
}

// On purpose: 28 bytes are enough to be accepted, and the values are read wherever the data ends.
TEST_F(LoadProgram, DoesNotCheckTheValuesAgainstTheSize) {
  open();
  EXPECT_TRUE(loadAs(program("New", {kHalf, kOne}), 28));
  EXPECT_EQ(requests(), inOrder({renames("New"), sets(0, 0.5f), sets(1, 1.0f)}));
}

TEST_F(LoadProgram, GoesOnWhereAParameterThrows) {
  open();
  effect.onRequest = [](const doubles::Request& request) {
    if (request == setParameterTo(0, 0.5f)) throw 4711;
  };
  EXPECT_TRUE(load(program("Init", {kHalf, kOne})));
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.0f, 1.0f));
}

TEST_F(LoadProgram, RestoresABlockOfAnyFormatVersion) {
  open();
  EXPECT_TRUE(restore(with(program("New", {kHalf, kOne}), 12, word(2))));
  EXPECT_EQ(requests(), inOrder({renames("New"), sets(0, 0.5f), sets(1, 1.0f)}));
}

TEST_F(LoadProgram, RestoresNoBlockWithOtherMagics) {
  open();
  const std::string good = program("New", {kHalf});
  for (const char* chunkMagic : {"KncC", "ccnK"}) EXPECT_FALSE(restore(with(good, 0, chunkMagic)));
  for (const char* formMagic : {"kCxF", "FxBk", "FPCh"}) EXPECT_FALSE(restore(with(good, 8, formMagic)));
  EXPECT_THAT(requests(), IsEmpty());
}

// ---- Banks

class LoadBank : public PresetTest {
 protected:
  // Three programs with one parameter: a stride of 60 bytes, blocks at 156, 216 and 276, 336 bytes in all.
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
}

TEST_F(LoadBank, TakesTheReversedChunkMagicAndAnyFormatVersionInItsPrograms) {
  open();
  EXPECT_TRUE(load(with(with(threePrograms, 0, "KncC"), 216 + 12, word(2))));
  EXPECT_THAT(names(), ElementsAre("A", "B", "C"));
}

TEST_F(LoadBank, DoesNothingForANegativeCount) {
  open();
  for (const std::int64_t count : {std::int64_t{-1}, std::int64_t{-2147483648}}) {
    EXPECT_TRUE(loadAs(with(threePrograms, 24, word(count)), 28));
  }
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(LoadBank, LoadsTheCurrentProgramOnlyForACountOfZero) {
  open();
  effect.currentProgram = 1;
  EXPECT_TRUE(load(with(threePrograms, 24, word(0))));
  EXPECT_EQ(requests(), inOrder({asksProgram(), renames("B"), sets(0, 1.0f)}));
}

TEST_F(LoadBank, IsRefusedForACountOfZeroWithTheCurrentProgramOutside) {
  open();
  for (const VstInt32 current : {3, -3, 2147483647}) {
    effect.currentProgram = current;
    effect.forget();
    EXPECT_FALSE(load(with(threePrograms, 24, word(0))));
    EXPECT_EQ(requests(), asksProgram());
  }
}

// All programs beyond the plug-in's last one are loaded into that one.
TEST_F(LoadBank, OfMoreProgramsIsClampedToThosePresent) {
  effect.setPrograms({{"a", {0.0f}}, {"b", {0.0f}}});
  open();
  EXPECT_TRUE(load(threePrograms));
  EXPECT_EQ(requests(), inOrder({asksProgram(),                             //
                                 selects(1), renames("B"), sets(0, 1.0f),   //
                                 selects(1), renames("C"), sets(0, -2.0f),  // asked for 2
                                 selects(0), renames("A"), sets(0, 0.5f)}));
}

TEST_F(LoadBank, OfFewerProgramsIsRefusedAfterThemIfTheCurrentOneIsNotAmongThem) {
  open();
  const std::string twoPrograms = bank({program("A", {kHalf}), program("B", {kOne})});
  effect.currentProgram = 2;
  EXPECT_FALSE(load(twoPrograms));
  EXPECT_THAT(names(), ElementsAre("A", "B", "c"));
  EXPECT_EQ(effect.currentProgram, 2);
  effect.currentProgram = 0;
  EXPECT_TRUE(load(twoPrograms));
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
  EXPECT_TRUE(loadAs(threePrograms, 277));
  EXPECT_THAT(names(), ElementsAre("A", "B", "C"));
  EXPECT_TRUE(loadAs(bank({program("D", {kHalf})}), 157));
  EXPECT_EQ(effect.program(0).name, "D");
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
  effect.currentProgram = 0;
  effect.forget();
  EXPECT_FALSE(loadAs(bank({program("A", {kHalf})}), 156));
  EXPECT_EQ(requests(), inOrder({asksProgram(), asksProgram()}));
}

TEST_F(LoadBank, StopsAtABlockThatIsNoProgramAndKeepsWhatWasLoadedBefore) {
  open();
  EXPECT_FALSE(load(with(threePrograms, 276, "KncC")));
  EXPECT_THAT(names(), ElementsAre("a", "B", "c"));
  EXPECT_EQ(effect.currentProgram, 2);
  effect.currentProgram = 0;
  EXPECT_FALSE(load(with(threePrograms, 156 + 8, "FPCh")));  // The current program's, which comes last.
  EXPECT_THAT(names(), ElementsAre("a", "B", "C"));
  EXPECT_EQ(effect.currentProgram, 0);
}

}  // namespace
