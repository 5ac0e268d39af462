// SPDX-License-Identifier: MIT
// VSTWrapper::saveToFXBData: what the plug-in is asked, in which order, and that it ends as it was.
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using doubles::getChunk;
using testing::ElementsAre;

class SaveToFXBData : public PresetTest {};

TEST_F(SaveToFXBData, AsksAProgramForItsNameAndItsValues) {
  effect.setPrograms({{"A", {0.5f, 1.0f}}, {"B", {}}});
  open();
  save(kProgram);
  EXPECT_EQ(requests(), inOrder({asksName(), readsParameters(2)}));
}

TEST_F(SaveToFXBData, AsksAChunkProgramForItsChunkAndItsName) {
  effect.setPrograms({{"A", {0.5f, 1.0f}}, {"B", {}}});
  effect.programChunk = "chunk";
  openWithChunks();
  save(kProgram);
  EXPECT_EQ(requests(), inOrder({{getChunk(1)}, asksName()}));
}

TEST_F(SaveToFXBData, AsksAChunkBankForItsChunkOnly) {
  effect.setPrograms({{"A", {0.5f, 1.0f}}, {"B", {}}});
  effect.bankChunk = "chunk";
  openWithChunks();
  save(kBank);
  EXPECT_THAT(requests(), ElementsAre(getChunk(0)));
}

TEST_F(SaveToFXBData, WalksABankFromTheCurrentProgramOnAndComesBack) {
  effect.setPrograms({{"A", {0.0f, 0.1f}}, {"B", {1.0f, 1.1f}}, {"C", {2.0f, 2.1f}}, {"D", {3.0f, 3.1f}}});
  open();
  effect.currentProgram = 2;
  save(kBank);
  const Requests block = inOrder({asksName(), readsParameters(2)});
  const Requests store = block;
  EXPECT_EQ(requests(), inOrder({asksProgram(), store, block,                              // 2, as it is
                                 selects(0), block, selects(1), block, selects(3), block,  // the others
                                 selects(2), keepsName(), readsParameters(2)}));  // back, nothing to mend
}

TEST_F(SaveToFXBData, LeavesTheCurrentProgramItsNameAndItsValuesAsTheyWere) {
  effect.setPrograms({{"A", {0.0f, 0.1f}}, {"B", {1.0f, 1.1f}}, {"C", {2.0f, 2.1f}}});
  open();
  effect.currentProgram = 1;
  save(kBank);
  EXPECT_EQ(effect.currentProgram, 1);
  for (const VstInt32 program : {0, 1, 2}) {
    EXPECT_EQ(effect.program(program).name, std::string(1, static_cast<char>('A' + program)));
  }
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(1.0f, 1.1f));
  EXPECT_THAT(effect.parameterWrites(), testing::IsEmpty());
}

// Many plug-ins load a program's stored state whenever it is selected: what was edited since is lost.
TEST_F(SaveToFXBData, PutsBackTheEditsThatSelectingTheProgramThrewAway) {
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
  EXPECT_EQ(saved.substr(156, 60 + 4), preset_bytes::program("A", {0x00000000, 0x3DCCCCCD}));
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

TEST_F(SaveToFXBData, SelectsNothingInABankOfOne) {
  effect.setPrograms({{"A", {0.5f}}});
  open();
  save(kBank);
  EXPECT_EQ(requests(), inOrder({asksProgram(), asksName(), readsParameters(1), asksName(),
                                 readsParameters(1), finds(), keepsName(), readsParameters(1)}));
}

TEST_F(SaveToFXBData, SelectsAndRenamesNothingWithoutPrograms) {
  effect.setParameters({0.5f});
  open();
  save(kBank);
  EXPECT_EQ(requests(), inOrder({asksProgram(), asksName(), readsParameters(1), asksName(),
                                 readsParameters(1), asksProgram(), asksProgram(), readsParameters(1)}));
}

TEST_F(SaveToFXBData, StoresTheNamesOfTheProgramsThatItVisits) {
  effect.setPrograms({{"A", {}}, {"B", {}}, {"C", {}}});
  open();
  save(kBank);
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("A", "B", "C"));
}

TEST_F(SaveToFXBData, LetsAnExceptionOfThePluginPassInTheMiddleOfABank) {
  effect.setPrograms({{"A", {0.5f}}, {"B", {0.5f}}});
  open();
  effect.onRequest = [](const doubles::Request& request) {
    if (request == doubles::setProgram(1)) throw 4711;
  };
  AutoBuffer<char> out;
  EXPECT_THROW(wrapper->saveToFXBData(out, kBank), int);
}

TEST_F(SaveToFXBData, WritesZeroForAParameterThatThrows) {
  effect.setPrograms({{"A", {0.5f, 1.0f}}});
  open();
  effect.onRequest = [](const doubles::Request& request) {
    if (request == doubles::getParameterOf(0)) throw 4711;
  };
  EXPECT_EQ(save(kProgram), preset_bytes::program("A", {0x00000000, 0x3F800000}));
}

class SetParamsInProgramBlock : public PresetTest {};

TEST_F(SetParamsInProgramBlock, FillsTheBlockThatItIsGivenAndNoMore) {
  effect.setPrograms({{"Init", {0.5f, 1.0f}}});
  open();
  std::string memory(64 + 8, '#');
  wrapper->setParamsInProgramBlock(reinterpret_cast<fxProgram*>(&memory[0]));
  EXPECT_EQ(memory, preset_bytes::program("Init", {0x3F000000, 0x3F800000}) + "########");
  EXPECT_EQ(requests(), inOrder({asksName(), readsParameters(2)}));
}

}  // namespace
