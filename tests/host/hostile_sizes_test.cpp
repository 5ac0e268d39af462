// SPDX-License-Identifier: MIT
// Sizes that a plug-in makes up: what cannot be allocated is the int -1, and the caller's buffer stays.
#include <cstdint>
#include <cstring>
#include <initializer_list>
#include <limits>
#include <string>

#include "tests/host/preset_fixture.h"
#include "tests/shared/scarce_memory.h"

namespace {

using namespace preset_tests;
using preset_bytes::inHex;
using preset_bytes::word;
using testing::IsEmpty;

constexpr int kIntMax = std::numeric_limits<int>::max();
constexpr int kIntMin = std::numeric_limits<int>::min();
constexpr std::size_t kMegabyte = 1024 * 1024;

class HostileSizes : public PresetTest {
 protected:
  /// What saving throws, 0 when it throws nothing. Fails the test unless the buffer is left as it was.
  int thrownBySaving(bool asBank) {
    AutoBuffer<char> out;
    const std::string old = "old";
    out.setSize(static_cast<int>(old.size()));
    std::memcpy(out.data(), old.data(), old.size());
    try {
      const ScarceMemory memory(16 * kMegabyte);
      wrapper->saveToFXBData(out, asBank);
      return 0;
    } catch (int thrown) {
      EXPECT_EQ(std::string(out.data(), static_cast<std::size_t>(out.size())), old);
      return thrown;
    }
  }
};

struct Counts {
  std::string name;
  VstInt32 parameters;
  VstInt32 programs;
  bool asBank;
};

class HugeCounts : public HostileSizes, public testing::WithParamInterface<Counts> {};

TEST_P(HugeCounts, AreMinusOneBeforeAnythingIsAsked) {
  effect.setPrograms({{"A", {0.5f}}});
  open();
  effect.aeffect.numParams = GetParam().parameters;
  effect.aeffect.numPrograms = GetParam().programs;
  EXPECT_EQ(thrownBySaving(GetParam().asBank), -1);
  EXPECT_THAT(requests(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(Save, HugeCounts,
                         testing::Values(Counts{"ParametersOfAProgram", kIntMax, 1, kProgram},
                                         Counts{"ParametersJustAboveAnInt", 536870898, 1, kProgram},
                                         Counts{"ParametersJustWithinAnInt", 536870897, 1, kProgram},
                                         // 32 bits of 4 x 1073741824 are 0.
                                         Counts{"ParametersThatWrapToNone", 1073741824, 1, kProgram},
                                         Counts{"ParametersOfABank", kIntMax, 1, kBank},
                                         Counts{"ParametersOfABankWithoutPrograms", kIntMax, 0, kBank},
                                         Counts{"Programs", 1, kIntMax, kBank},
                                         Counts{"ProgramsJustAboveAnInt", 0, 38347920, kBank},
                                         Counts{"ProgramsJustWithinAnInt", 0, 38347919, kBank},
                                         // 32 bits of 67108864 x 64 are 0.
                                         Counts{"ProgramsThatWrapToNone", 2, 67108864, kBank},
                                         Counts{"Both", kIntMax, kIntMax, kBank}),
                         [](const auto& instance) { return instance.param.name; });

TEST_F(HostileSizes, AnEarlierFailureDoesNotHinderTheNextSave) {
  effect.setPrograms({{"A", {0.5f}}});
  open();
  effect.aeffect.numParams = kIntMax;
  EXPECT_EQ(thrownBySaving(kProgram), -1);
  effect.aeffect.numParams = 1;
  EXPECT_EQ(thrownBySaving(kProgram), 0);
}

// The store for the walk is as large as the parameter count of that moment.
TEST_F(HostileSizes, AStoreThatCannotBeAllocatedIsMinusOne) {
  effect.setPrograms({{"A", {0.5f}}, {"B", {0.5f}}});
  open();
  for (const VstInt32 parameters : {536870896, 536870895, kIntMax}) {
    effect.aeffect.numParams = 1;
    effect.onRequest = [this, parameters](const doubles::Request&) { effect.aeffect.numParams = parameters; };
    AutoBuffer<char> out;
    const ScarceMemory memory(16 * kMegabyte);
    EXPECT_THROW(wrapper->saveToFXBData(out, kBank), int);
    EXPECT_EQ(effect.currentProgram, 0);
  }
}

TEST_F(HostileSizes, NegativeParameterCountsAreNone) {
  effect.setPrograms({{"A", {0.5f}}});
  open();
  for (const VstInt32 parameters : {-1, -14, -15, kIntMin}) {
    effect.aeffect.numParams = parameters;
    effect.forget();
    EXPECT_EQ(inHex(save(kProgram)), inHex(preset_bytes::program("A", {})));
    EXPECT_EQ(requests(), asksName());
    EXPECT_EQ(inHex(save(kBank)), inHex(preset_bytes::bank({preset_bytes::program("A", {})})));
    EXPECT_THAT(effect.parameterReads(), IsEmpty());
  }
}

TEST_F(HostileSizes, NegativeProgramCountsGetOneBlockAndAreWrittenAsTheyAre) {
  effect.setParameters({0.5f});
  open();
  for (const VstInt32 programs : {-1, kIntMin}) {
    effect.aeffect.numPrograms = programs;
    effect.aeffect.flags = 0;
    const std::string saved = save(kBank);
    EXPECT_EQ(inHex(saved),
              inHex(preset_bytes::with(preset_bytes::bank({preset_bytes::program("", {0x3F000000})}), 24,
                                       word(programs))));
    effect.aeffect.flags = 32;
    EXPECT_EQ(inHex(save(kProgram).substr(24, 4)), inHex(word(programs)));
    EXPECT_EQ(inHex(save(kBank).substr(24, 4)), inHex(word(programs)));
    effect.forget();
    EXPECT_TRUE(load(saved, 0));
    EXPECT_THAT(requests(), IsEmpty());
  }
}

// ---- Chunks

class HostileChunks : public HostileSizes {
 protected:
  /// effGetChunk answers `size` and leaves `lent` in the pointer.
  void lend(void* lent, VstIntPtr size) {
    effect.ignore(effGetChunk);
    effect.answer(effGetChunk, size);
    effect.onRequest = [lent](const doubles::Request& request) {
      if (request.opcode == effGetChunk) std::memcpy(request.pointee.address, &lent, sizeof lent);
    };
  }
  char chunk[8] = {'c', 'h', 'u', 'n', 'k'};
};

TEST_F(HostileChunks, NullWithASizeIsMinusOne) {
  openWithChunks();
  for (const VstIntPtr size : {1, 5, kIntMax}) {
    lend(nullptr, size);
    EXPECT_EQ(thrownBySaving(kProgram), -1);
    EXPECT_EQ(thrownBySaving(kBank), -1);
  }
}

TEST_F(HostileChunks, NullWithoutASizeIsEmpty) {
  effect.setPrograms({{"A", {}}});
  openWithChunks();
  lend(nullptr, 0);
  EXPECT_EQ(save(kProgram), preset_bytes::programChunk("A", ""));
  EXPECT_EQ(save(kBank), preset_bytes::bankChunk(""));
}

TEST_F(HostileChunks, APointerWithoutASizeIsEmpty) {
  effect.setPrograms({{"A", {}}});
  openWithChunks();
  lend(chunk, 0);
  EXPECT_EQ(save(kProgram), preset_bytes::programChunk("A", ""));
}

TEST_F(HostileChunks, NegativeSizesAreMinusOne) {
  openWithChunks();
  for (const VstIntPtr size : {-1, -60, kIntMin}) {
    lend(chunk, size);
    EXPECT_EQ(thrownBySaving(kProgram), -1);
    EXPECT_EQ(thrownBySaving(kBank), -1);
  }
}

TEST_F(HostileChunks, SizesThatCannotBeAllocatedAreMinusOne) {
  openWithChunks();
  for (const VstIntPtr size : {kIntMax, kIntMax - 60, kIntMax - 160, 16 * 1024 * 1024 + 1}) {
    lend(chunk, size);
    EXPECT_EQ(thrownBySaving(kProgram), -1);
    EXPECT_EQ(thrownBySaving(kBank), -1);
  }
}

// Nothing of a size is cut off: its low 32 bits alone would fit.
TEST_F(HostileChunks, SizesAboveAnIntAreMinusOne) {
  openWithChunks();
  for (const std::int64_t size : std::initializer_list<std::int64_t>{
           0x80000000, 0x100000005, 0x7FFFFFFFFFFFFFFF, -0x7FFFFFFFFFFFFFFB}) {
    if (size != static_cast<VstIntPtr>(size)) continue;  // Where a plug-in has 32 bits to answer with.
    lend(chunk, static_cast<VstIntPtr>(size));
    EXPECT_EQ(thrownBySaving(kProgram), -1);
    EXPECT_EQ(thrownBySaving(kBank), -1);
  }
}

TEST_F(HostileChunks, ASizeLikeAnyOtherIsCopied) {
  effect.setPrograms({{"A", {}}});
  openWithChunks();
  lend(chunk, 5);
  EXPECT_EQ(save(kProgram), preset_bytes::programChunk("A", "chunk"));
}

// ---- Program numbers

// A name is remembered by the number of its program; for this one there is no room.
TEST_F(HostileSizes, AProgramNumberWithoutRoomForItsNameIsMinusOne) {
  effect.setPrograms({{"A", {0.5f}}, {"B", {0.5f}}});
  open();
  for (const VstInt32 current : {kIntMax, 100 * 1000 * 1000}) {
    effect.currentProgram = current;
    AutoBuffer<char> out;
    const ScarceMemory memory(16 * kMegabyte);
    EXPECT_THROW(wrapper->saveToFXBData(out, kProgram), int);
    EXPECT_THROW(wrapper->saveToFXBData(out, kBank), int);
    EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
  }
}

}  // namespace
