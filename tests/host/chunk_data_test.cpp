// SPDX-License-Identifier: MIT
// VSTWrapper::getChunkData and setChunkData: a plug-in's state as the plug-in keeps it.
#include <cstdint>
#include <limits>
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace preset_tests;
using doubles::getChunk;
using doubles::setChunk;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr bool kPreset = true;
constexpr bool kWholeBank = false;

class GetChunkData : public PresetTest {
 protected:
  std::string chunkOf(bool isPreset) {
    AutoBuffer<char> out;
    wrapper->getChunkData(out, isPreset);
    return std::string(out.data(), static_cast<std::size_t>(out.size()));
  }
};

TEST_F(GetChunkData, AsksWithIndex1ForAPresetAndIndex0ForABank) {
  effect.programChunk = std::string("p\0q", 3);
  effect.bankChunk = "bank";
  openWithChunks();
  EXPECT_EQ(chunkOf(kPreset), std::string("p\0q", 3));
  EXPECT_EQ(chunkOf(kWholeBank), "bank");
  // The room is the address of a pointer, which is null.
  EXPECT_THAT(requests(), ElementsAre(getChunk(1), getChunk(0)));
}

TEST_F(GetChunkData, CopiesSoThatTheMemoryStaysThePlugins) {
  effect.bankChunk = "bank";
  openWithChunks();
  AutoBuffer<char> out;
  wrapper->getChunkData(out, kWholeBank);
  chunkOf(kPreset);  // The plug-in gives its lent memory up.
  EXPECT_EQ(std::string(out.data(), 4), "bank");
}

TEST_F(GetChunkData, LeavesTheBufferAloneWithoutTheFlag) {
  effect.bankChunk = "bank";
  open();
  AutoBuffer<char> out;
  out.setSize(3);
  out.data()[0] = '#';
  wrapper->getChunkData(out, kWholeBank);
  EXPECT_EQ(out.size(), 3);
  EXPECT_EQ(out.data()[0], '#');
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(GetChunkData, LeavesTheBufferAloneWithoutAnInstance) {
  openWithChunks();
  wrapper->effect = nullptr;
  AutoBuffer<char> out;
  wrapper->getChunkData(out, kWholeBank);
  EXPECT_EQ(out.size(), 0);
  EXPECT_EQ(out.data(), nullptr);
  wrapper->effect = &effect.aeffect;
}

TEST_F(GetChunkData, IsEmptyForAnEmptyChunk) {
  openWithChunks();
  AutoBuffer<char> out;
  out.setSize(3);
  wrapper->getChunkData(out, kPreset);
  EXPECT_EQ(out.size(), 0);
}

class SetChunkData : public PresetTest {
 protected:
  void give(const std::string& chunk, bool isPreset) {
    wrapper->setChunkData(chunk.data(), static_cast<int>(chunk.size()), isPreset);
  }
};

TEST_F(SetChunkData, GivesAPresetWithIndex1) {
  effect.setPrograms({{"A", {}}, {"B", {}}});
  openWithChunks();
  give(std::string("p\0q", 3), kPreset);
  EXPECT_THAT(requests(), ElementsAre(setChunk(1, std::string("p\0q", 3))));
  EXPECT_EQ(effect.programChunk, std::string("p\0q", 3));
}

TEST_F(SetChunkData, GivesOneByte) {
  openWithChunks();
  give("x", kPreset);
  EXPECT_THAT(requests(), ElementsAre(setChunk(1, "x")));
}

TEST_F(SetChunkData, AsksForTheFirstNameByIndexAfterABank) {
  effect.setPrograms({{"A", {}}, {"B", {}}});
  effect.namesProgramsByIndex = true;
  openWithChunks();
  give("bank", kWholeBank);
  EXPECT_THAT(requests(), ElementsAre(setChunk(0, "bank"), doubles::programNameIndexed(0)));
}

TEST_F(SetChunkData, VisitsEveryProgramAfterABankWhereTheyHaveNoNamesByIndex) {
  effect.setPrograms({{"A", {0.5f}}, {"B", {0.5f}}, {"C", {0.5f}}});
  openWithChunks();
  effect.currentProgram = 1;
  give("bank", kWholeBank);
  EXPECT_EQ(requests(), inOrder({{setChunk(0, "bank"), doubles::programNameIndexed(0)},
                                 asksProgram(),
                                 asksName(),
                                 readsParameters(1),  // the present state
                                 selects(0),
                                 asksName(),
                                 selects(1),
                                 asksName(),
                                 selects(2),
                                 asksName(),
                                 selects(1),
                                 keepsName(),
                                 readsParameters(1)}));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("A", "B", "C"));
  EXPECT_EQ(effect.currentProgram, 1);
}

TEST_F(SetChunkData, AsksForNoNamesAfterABankWithoutPrograms) {
  openWithChunks();
  give("bank", kWholeBank);
  EXPECT_THAT(requests(), ElementsAre(setChunk(0, "bank")));
}

TEST_F(SetChunkData, SendsNothingWithoutTheFlag) {
  effect.setPrograms({{"A", {}}});
  open();
  give("chunk", kPreset);
  give("chunk", kWholeBank);
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(SetChunkData, SendsNothingForASizeBelowOne) {
  effect.setPrograms({{"A", {}}});
  openWithChunks();
  for (const int size : {0, -1, std::numeric_limits<int>::min()}) {
    wrapper->setChunkData("chunk", size, kPreset);
    wrapper->setChunkData("chunk", size, kWholeBank);
  }
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(SetChunkData, SendsNothingWithoutAnInstance) {
  openWithChunks();
  wrapper->effect = nullptr;
  give("chunk", kPreset);
  give("chunk", kWholeBank);
  EXPECT_THAT(requests(), IsEmpty());
  wrapper->effect = &effect.aeffect;
}

TEST_F(SetChunkData, PassesWhateverThePluginAnswers) {
  openWithChunks();
  effect.answer(effSetChunk, 0);
  EXPECT_TRUE(load(preset_bytes::programChunk("", "chunk")));
  EXPECT_EQ(effect.programChunk, "chunk");
}

}  // namespace
