// SPDX-License-Identifier: MIT
// VSTWrapper::loadFromFXBData: programs, and what goes to the plug-in for them.
#include <cstdint>
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using doubles::getParameterOf;
using doubles::setParameterTo;
using preset_bytes::hex;
using preset_bytes::program;
using preset_bytes::with;
using preset_bytes::word;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr std::uint32_t kHalf = 0x3F000000;
constexpr std::uint32_t kOne = 0x3F800000;
constexpr std::uint32_t kMinusTwo = 0xC0000000;

class LoadProgram : public PresetTest {};

TEST_F(LoadProgram, RenamesTheCurrentProgramAndSetsEveryValue) {
  effect.setPrograms({{"A", {0.0f, 0.0f, 0.0f}}, {"B", {0.1f, 0.2f, 0.3f}}});
  open();
  effect.currentProgram = 1;
  EXPECT_TRUE(
      load(hex("43636E4B 00000000 4678436B 00000001 44656D6F 00010203 00000003"
               "496E6974 00000000 00000000 00000000 00000000 00000000 00000000"
               "3F000000 3F800000 C0000000")));
  EXPECT_EQ(requests(), inOrder({renames("Init"), sets(0, 0.5f), sets(1, 1.0f), sets(2, -2.0f)}));
  EXPECT_EQ(effect.program(1).name, "Init");
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(0.5f, 1.0f, -2.0f));
  EXPECT_EQ(effect.program(0).name, "A");
}

TEST_F(LoadProgram, OfItsOwnMakingBringsTheStateBack) {
  effect.setPrograms({{"Init", {0.5f, 1.0f, -2.0f}}});
  open();
  const std::string saved = save(kProgram);
  effect.setPrograms({{"Other", {0.1f, 0.2f, 0.3f}}});
  EXPECT_TRUE(load(saved, 0));
  EXPECT_EQ(effect.program(0).name, "Init");
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.5f, 1.0f, -2.0f));
}

TEST_F(LoadProgram, SendsNeitherNameNorValuesThatArePresentAlready) {
  effect.setPrograms({{"Init", {0.5f, 1.0f}}});
  open();
  EXPECT_TRUE(load(program("Init", {kHalf, kMinusTwo})));
  EXPECT_EQ(requests(), inOrder({keepsName(), {getParameterOf(0)}, sets(1, -2.0f)}));
}

TEST_F(LoadProgram, SendsTheFirst24CharactersOfTheName) {
  effect.setPrograms({{"Init", {}}});
  open();
  EXPECT_TRUE(load(program("abcdefghijklmnopqrstuvwxyz0", {})));
  EXPECT_EQ(requests(), renames("abcdefghijklmnopqrstuvwx"));
}

TEST_F(LoadProgram, ReadsANameWithoutAZeroByteWithinItsField) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  EXPECT_TRUE(load(with(program("", {kHalf}), 28, std::string(28, 'n'))));
  EXPECT_EQ(requests(), inOrder({renames(std::string(24, 'n')), sets(0, 0.5f)}));
}

TEST_F(LoadProgram, PassesNoValueForWhichThereIsNoParameter) {
  effect.setPrograms({{"Init", {0.0f, 0.0f}}});
  open();
  EXPECT_TRUE(load(program("Init", {kHalf, kOne, kMinusTwo})));
  EXPECT_EQ(requests(), inOrder({keepsName(), sets(0, 0.5f), sets(1, 1.0f)}));
}

TEST_F(LoadProgram, LeavesParametersThatTheDataDoesNotHave) {
  effect.setPrograms({{"Init", {0.0f, 0.25f}}});
  open();
  EXPECT_TRUE(load(program("Init", {kHalf})));
  EXPECT_EQ(requests(), inOrder({keepsName(), sets(0, 0.5f)}));
}

TEST_F(LoadProgram, SetsNothingForACountBelowOne) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  for (const std::int64_t count : {std::int64_t{0}, std::int64_t{-1}, std::int64_t{-2147483648}}) {
    effect.forget();
    EXPECT_TRUE(load(with(program("Init", {kHalf}), 24, word(count))));
    EXPECT_EQ(requests(), keepsName());
  }
}

// On purpose: 28 bytes are enough to be accepted, and the values are read wherever the size ends.
TEST_F(LoadProgram, DoesNotCheckTheValuesAgainstTheSize) {
  effect.setPrograms({{"Init", {0.0f, 0.0f}}});
  open();
  EXPECT_TRUE(loadAs(program("New", {kHalf, kOne}), 28));
  EXPECT_EQ(requests(), inOrder({renames("New"), sets(0, 0.5f), sets(1, 1.0f)}));
}

TEST_F(LoadProgram, SetsTheValuesButNotTheNameWithoutPrograms) {
  effect.setParameters({0.0f});
  open();
  EXPECT_TRUE(load(program("New", {kHalf})));
  EXPECT_EQ(requests(), inOrder({asksProgram(), asksProgram(), sets(0, 0.5f)}));
}

TEST_F(LoadProgram, TakesNoNoticeOfPluginIdAndVersionAndByteSize) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  std::string data = with(program("Init", {kHalf}), 4, word(-1));
  data = with(with(data, 16, "Else"), 20, word(99));
  EXPECT_TRUE(load(data));
  EXPECT_THAT(effect.parameterWrites(), ElementsAre(setParameterTo(0, 0.5f)));
}

TEST_F(LoadProgram, GoesOnWhereAParameterThrows) {
  effect.setPrograms({{"Init", {0.0f, 0.0f}}});
  open();
  effect.onRequest = [](const doubles::Request& request) {
    if (request == setParameterTo(0, 0.5f)) throw 4711;
  };
  EXPECT_TRUE(load(program("Init", {kHalf, kOne})));
  EXPECT_THAT(effect.program(0).parameters, ElementsAre(0.0f, 1.0f));
  EXPECT_EQ(wrapper->paramBeingSet, -1);
}

// Parameter values go to a plug-in with chunks too: the data decides, not the flags.
TEST_F(LoadProgram, GoesToAPluginWithChunksAsWell) {
  effect.setPrograms({{"Init", {0.0f}}});
  openWithChunks();
  EXPECT_TRUE(load(program("Init", {kHalf})));
  EXPECT_EQ(requests(), inOrder({keepsName(), sets(0, 0.5f)}));
}

class RestoreProgramSettings : public PresetTest {
 protected:
  bool restore(const std::string& block) {
    return wrapper->restoreProgramSettings(reinterpret_cast<const fxProgram*>(block.data()));
  }
};

TEST_F(RestoreProgramSettings, PutsNameAndValuesIntoTheCurrentProgram) {
  effect.setPrograms({{"Init", {0.0f, 0.0f}}});
  open();
  EXPECT_TRUE(restore(program("New", {kHalf, kOne})));
  EXPECT_EQ(requests(), inOrder({renames("New"), sets(0, 0.5f), sets(1, 1.0f)}));
}

TEST_F(RestoreProgramSettings, RefusesOtherMagics) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  const std::string good = program("New", {kHalf});
  for (const char* chunkMagic : {"KncC", "ccnK", "VstP"}) EXPECT_FALSE(restore(with(good, 0, chunkMagic)));
  for (const char* formMagic : {"kCxF", "FxBk", "FPCh", "FBCh"})
    EXPECT_FALSE(restore(with(good, 8, formMagic)));
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(RestoreProgramSettings, TakesAnyFormatVersion) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  EXPECT_TRUE(restore(with(program("Init", {kHalf}), 12, word(2))));
  EXPECT_EQ(requests(), inOrder({keepsName(), sets(0, 0.5f)}));
}

}  // namespace
