// SPDX-License-Identifier: MIT
// VSTWrapper: a plug-in's own chunk, taken, passed on, saved and loaded.
#include <climits>
#include <cstring>
#include <string>

#include "tests/host/preset_fixture.h"
#include "tests/shared/sanitizer.h"
#include "tests/shared/scarce_memory.h"
#include "tests/shared/thrown.h"

namespace {

using namespace preset_tests;
using doubles::getChunk;
using doubles::setChunk;
using preset_bytes::bankChunk;
using preset_bytes::programChunk;
using testing::ElementsAre;
using testing::IsEmpty;

constexpr bool kPreset = true;
constexpr bool kWholeBank = false;

class ChunkData : public PresetTest {
 protected:
  std::string chunkOf(bool isPreset) {
    AutoBuffer<char> out;
    wrapper->getChunkData(out, isPreset);
    return std::string(out.data(), static_cast<std::size_t>(out.size()));
  }

  void give(const std::string& chunk, bool isPreset) {
    wrapper->setChunkData(chunk.data(), static_cast<int>(chunk.size()), isPreset);
  }

  /// From now on effGetChunk answers `size` and stores `lent` in the pointer.
  void lend(void* lent, VstIntPtr size) {
    effect.ignore(effGetChunk);
    effect.answer(effGetChunk, size);
    effect.onRequest = [lent](const doubles::Request& request) {
      if (request.opcode == effGetChunk) std::memcpy(request.pointee.address, &lent, sizeof lent);
    };
  }
};

// ---- Taking

// The room is the address of a pointer, which is null.
TEST_F(ChunkData, IsAskedForWithIndex1ForAPresetAndIndex0ForABankAndIsCopied) {
  effect.programChunk = std::string("p\0q", 3);
  effect.bankChunk = "bank";
  openWithChunks();
  AutoBuffer<char> out;
  wrapper->getChunkData(out, kWholeBank);
  EXPECT_EQ(chunkOf(kPreset), std::string("p\0q", 3));  // The plug-in frees the bank's chunk now.
  EXPECT_EQ(std::string(out.data(), static_cast<std::size_t>(out.size())), "bank");
  EXPECT_THAT(requests(), ElementsAre(getChunk(0), getChunk(1)));
}

TEST_F(ChunkData, LeavesTheBufferAloneWithoutTheFlagOrAnInstance) {
  effect.bankChunk = "bank";
  open();
  AutoBuffer<char> out;
  out.setSize(3);
  out.data()[0] = '#';
  wrapper->getChunkData(out, kWholeBank);
  effect.aeffect.flags = 32;
  wrapper->effect = nullptr;
  wrapper->getChunkData(out, kWholeBank);
  wrapper->effect = &effect.aeffect;
  EXPECT_EQ(out.size(), 3);
  EXPECT_EQ(out.data()[0], '#');
  EXPECT_THAT(requests(), IsEmpty());
}

TEST_F(ChunkData, IsEmptyWithoutASizeWhateverThePointer) {
  effect.setPrograms({{"A", {}}});
  openWithChunks();
  char chunk[] = "chunk";
  for (void* const lent : {static_cast<void*>(nullptr), static_cast<void*>(chunk)}) {
    lend(lent, 0);
    AutoBuffer<char> out;
    out.setSize(3);
    wrapper->getChunkData(out, kPreset);
    EXPECT_EQ(out.size(), 0);
    EXPECT_EQ(save(kProgram), programChunk("A", ""));
    EXPECT_EQ(save(kBank), bankChunk(""));
  }
}

TEST_F(ChunkData, OfASizeThatIsNegativeOrTooLargeIsMinusOneAndLeavesTheBufferAlone) {
  openWithChunks();
  char chunk[] = "chunk";
  // The low 32 bits of some would be a size that fits. Where VstIntPtr has 32 bits, those are left out.
  for (const std::int64_t size :
       {std::int64_t{-1}, std::int64_t{INT_MIN}, std::int64_t{INT_MAX}, std::int64_t{INT_MAX - 60},
        std::int64_t{16 * 1024 * 1024 + 1}, std::int64_t{0x80000000}, std::int64_t{0x100000005},
        std::int64_t{-0x7FFFFFFFFFFFFFFB}}) {
    if (size != static_cast<VstIntPtr>(size)) continue;
    lend(chunk, static_cast<VstIntPtr>(size));
    for (const bool asBank : {kProgram, kBank}) {
      AutoBuffer<char> out;
      out.setSize(3);
      const ScarceMemory limit(16 * 1024 * 1024);
      EXPECT_EQ(thrownInt([&] { wrapper->saveToFXBData(out, asBank); }), -1) << size;
      EXPECT_EQ(out.size(), 3);
    }
  }
}

// On purpose: a null chunk with a size is copied as it stands.
TEST_F(ChunkData, ThatIsNullWithASizeCrashes) {
  openWithChunks();
  lend(nullptr, 5);
  AutoBuffer<char> out;
  // The sanitizers report the null pointer and end the process in their own way.
  if (kWithAddressSanitizer || kWithThreadSanitizer) {
    EXPECT_DEATH(wrapper->getChunkData(out, kPreset), "");
  } else {
    EXPECT_EXIT(wrapper->getChunkData(out, kPreset), testing::KilledBySignal(SIGSEGV), "");
  }
}

// ---- Passing on

TEST_F(ChunkData, OfAPresetIsPassedOnWithIndex1WhateverTheAnswer) {
  effect.setPrograms({{"A", {}}, {"B", {}}});
  openWithChunks();
  effect.answer(effSetChunk, 0);
  give(std::string("p\0q", 3), kPreset);
  give("x", kPreset);
  EXPECT_THAT(requests(), ElementsAre(setChunk(1, std::string("p\0q", 3)), setChunk(1, "x")));
}

TEST_F(ChunkData, OfABankIsPassedOnWithIndex0AndThenTheNamesOfTheProgramsAreCollected) {
  effect.setPrograms({{"A", {0.5f}}, {"B", {0.5f}}, {"C", {0.5f}}});
  openWithChunks();
  give("bank", kWholeBank);
  EXPECT_EQ(requests().at(0), setChunk(0, "bank"));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("A", "B", "C"));
}

TEST_F(ChunkData, IsNotPassedOnWithoutTheFlagOrAnInstanceOrForASizeBelowOne) {
  effect.setPrograms({{"A", {}}});
  open();
  for (const bool isPreset : {kPreset, kWholeBank}) {
    effect.aeffect.flags = 0;
    give("chunk", isPreset);
    effect.aeffect.flags = 32;
    for (const int size : {0, -1, INT_MIN}) wrapper->setChunkData("chunk", size, isPreset);
    wrapper->effect = nullptr;
    give("chunk", isPreset);
    wrapper->effect = &effect.aeffect;
  }
  EXPECT_THAT(requests(), IsEmpty());
}

// ---- Loading

TEST_F(ChunkData, OfAProgramIsLoadedBeforeItsName) {
  effect.setPrograms({{"Init", {0.0f}}, {"B", {}}});
  openWithChunks();
  EXPECT_TRUE(load(programChunk("New", std::string("c\0d", 3)), 0));
  EXPECT_EQ(requests(), inOrder({{setChunk(1, std::string("c\0d", 3))}, renames("New")}));
}

// On purpose: accepted, although no chunk is passed on.
TEST_F(ChunkData, IsAcceptedByAPluginWithoutChunks) {
  effect.setPrograms({{"Init", {0.0f}}});
  open();
  EXPECT_TRUE(load(programChunk("New", "chunk")));
  EXPECT_EQ(requests(), renames("New"));
  effect.forget();
  EXPECT_TRUE(load(bankChunk("bank")));
  EXPECT_THAT(requests(), IsEmpty());
}

}  // namespace
