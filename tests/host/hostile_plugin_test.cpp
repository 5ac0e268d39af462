// SPDX-License-Identifier: MIT
// Plug-ins whose counts, current program and bank data are wrong, or change while the host works. The program
// reads and writes none of its own memory out of bounds, which the address sanitizer watches.
#include <climits>
#include <cstdint>
#include <cstring>
#include <string>

#include "tests/host/preset_fixture.h"
#include "tests/shared/scarce_memory.h"
#include "tests/shared/thrown.h"

namespace {

using namespace preset_tests;
using preset_bytes::bank;
using preset_bytes::header;
using preset_bytes::inHex;
using preset_bytes::program;
using preset_bytes::with;
using preset_bytes::word;
using testing::IsEmpty;

constexpr std::size_t kLargestBlock = 16 * 1024 * 1024;

class HostilePlugin : public PresetTest {
 protected:
  HostilePlugin() { effect.setPrograms({{"A", {0.5f}}, {"B", {1.0f}}, {"C", {-2.0f}}}); }
};

// ---- Counts that are too large or negative

struct Counts {
  std::string name;
  VstInt32 parameters;
  VstInt32 programs;
  bool asBank;
};

class ImpossibleCounts : public HostilePlugin, public testing::WithParamInterface<Counts> {};

TEST_P(ImpossibleCounts, AreMinusOneBeforeAnythingIsAskedAndLeaveTheBufferAlone) {
  open();
  effect.aeffect.numParams = GetParam().parameters;
  effect.aeffect.numPrograms = GetParam().programs;
  AutoBuffer<char> out;
  out.setSize(3);
  std::memcpy(out.data(), "old", 3);
  const ScarceMemory limit(kLargestBlock);
  EXPECT_EQ(thrownInt([&] { wrapper->saveToFXBData(out, GetParam().asBank); }), -1);
  EXPECT_EQ(std::string(out.data(), static_cast<std::size_t>(out.size())), "old");
  EXPECT_THAT(requests(), IsEmpty());
}

INSTANTIATE_TEST_SUITE_P(Save, ImpossibleCounts,
                         testing::Values(Counts{"ParametersOfAProgram", INT_MAX, 1, kProgram},
                                         Counts{"ParametersJustAboveAnInt", 536870898, 1, kProgram},
                                         Counts{"ParametersJustWithinAnInt", 536870897, 1, kProgram},
                                         // 32 bits of 4 x 1073741824 are 0.
                                         Counts{"ParametersThatWrapToNone", 1073741824, 1, kProgram},
                                         Counts{"ParametersOfABankWithoutPrograms", INT_MAX, 0, kBank},
                                         Counts{"Programs", 1, INT_MAX, kBank},
                                         Counts{"ProgramsJustAboveAnInt", 0, 38347920, kBank},
                                         Counts{"ProgramsJustWithinAnInt", 0, 38347919, kBank},
                                         // 32 bits of 67108864 x 64 are 0.
                                         Counts{"ProgramsThatWrapToNone", 2, 67108864, kBank},
                                         Counts{"Both", INT_MAX, INT_MAX, kBank},
                                         // 4 x -15 + 56 is -4; 39 programs of -4 bytes and 156 are 0.
                                         Counts{"ANegativeProgram", -15, 1, kProgram},
                                         Counts{"TheMostNegativeProgram", INT_MIN, 1, kProgram},
                                         Counts{"ANegativeBank", -15, 40, kBank},
                                         Counts{"ANegativeBankOfOne", -54, 1, kBank},
                                         Counts{"TheMostNegativeBank", INT_MIN, INT_MAX, kBank}),
                         host_tests::nameOfCase<Counts>);

// On purpose: a negative count is used as it is, and written.
TEST_F(HostilePlugin, ANegativeParameterCountGivesAProgramOfTheHeaderAlone) {
  open();
  for (const VstInt32 parameters : {-1, -14}) {
    effect.aeffect.numParams = parameters;
    effect.forget();
    EXPECT_EQ(inHex(save(kProgram)), inHex(with(program("A", {}), 24, word(parameters))));
    EXPECT_EQ(requests(), asksName());
  }
}

// On purpose: the size of a bank is computed with a negative count, and is at least that of the bank's
// header.
TEST_F(HostilePlugin, ANegativeParameterCountGivesABankThatHoldsTheBeginningOfEachProgram) {
  open();
  const auto block = [](const std::string& name, VstInt32 parameters, std::size_t size) {
    return with(program(name, {}), 24, word(parameters)).substr(0, size);
  };
  const std::string front = header("FxBk", 3) + std::string(128, '\0');
  struct {
    VstInt32 parameters;
    std::size_t blockSize;
  } const rows[] = {{-1, 52}, {-6, 32}, {-13, 4}, {-14, 0}, {-15, 0}, {-16, 0}};
  for (const auto& row : rows) {
    effect.aeffect.numParams = row.parameters;
    effect.currentProgram = 1;
    effect.forget();
    EXPECT_EQ(inHex(save(kBank)),
              inHex(front + block("A", row.parameters, row.blockSize) +
                    block("B", row.parameters, row.blockSize) + block("C", row.parameters, row.blockSize)));
    EXPECT_EQ(requests(), inOrder({asksProgram(), asksName(), asksName(), selects(0), asksName(), selects(2),
                                   asksName(), selects(1), keepsName()}));
  }
}

TEST_F(HostilePlugin, ANegativeParameterCountIsWrittenInAGivenBlockWithoutValues) {
  open();
  effect.aeffect.numParams = INT_MIN;
  std::string memory(56 + 8, '#');
  wrapper->setParamsInProgramBlock(reinterpret_cast<fxProgram*>(&memory[0]));
  EXPECT_EQ(memory, with(program("A", {}), 24, word(INT_MIN)) + "########");
}

TEST_F(HostilePlugin, ANegativeProgramCountGivesOneBlockAndIsWritten) {
  effect.setPrograms({});
  effect.setParameters({0.5f});
  open();
  for (const VstInt32 programs : {-1, INT_MIN}) {
    effect.aeffect.numPrograms = programs;
    effect.aeffect.flags = 0;
    EXPECT_EQ(inHex(save(kBank)), inHex(with(bank({program("", {kHalf})}), 24, word(programs))));
    effect.aeffect.flags = 32;
    EXPECT_EQ(inHex(save(kProgram).substr(24, 4)), inHex(word(programs)));
    EXPECT_EQ(inHex(save(kBank).substr(24, 4)), inHex(word(programs)));
  }
}

// The store for the walk is as large as the parameter count of that moment.
TEST_F(HostilePlugin, AStoreThatCannotBeAllocatedIsMinusOneAndTheProgramStays) {
  open();
  for (const VstInt32 parameters : {536870896, 536870895, -17}) {
    effect.onRequest = [this, parameters](const doubles::Request&) { effect.aeffect.numParams = parameters; };
    effect.aeffect.numParams = 1;
    AutoBuffer<char> out;
    const ScarceMemory limit(kLargestBlock);
    EXPECT_EQ(thrownInt([&] { wrapper->saveToFXBData(out, kBank); }), -1);
    EXPECT_EQ(effect.currentProgram, 0);
  }
}

// ---- Counts that change meanwhile

struct Change {
  std::string name;
  VstInt32 AEffect::*count;
  VstInt32 becomes;
};

class CountsThatChange : public PresetTest, public testing::WithParamInterface<Change> {
 protected:
  void SetUp() override {
    reset();
    open();
  }

  void reset() {
    effect.onRequest = nullptr;
    effect.setPrograms({{"A", {0.5f, 1.0f}}, {"B", {0.5f, 1.0f}}, {"C", {0.5f, 1.0f}}});
  }

  /// Runs `work` once for each request that it makes, with the change in the middle of that request. Returns
  /// the number of times.
  template <typename Work>
  int atEveryRequest(const Work& work) {
    for (int changeAt = 1;; ++changeAt) {
      SCOPED_TRACE("the count changes in request " + std::to_string(changeAt));
      reset();
      int requestsSoFar = 0;
      effect.onRequest = [this, changeAt, &requestsSoFar](const doubles::Request&) {
        if (++requestsSoFar == changeAt) effect.aeffect.*GetParam().count = GetParam().becomes;
      };
      work();
      if (requestsSoFar < changeAt || HasFailure()) return changeAt - 1;
    }
  }
};

INSTANTIATE_TEST_SUITE_P(To, CountsThatChange,
                         testing::Values(Change{"NoParameters", &AEffect::numParams, 0},
                                         Change{"OneParameter", &AEffect::numParams, 1},
                                         Change{"MoreParameters", &AEffect::numParams, 5000},
                                         Change{"NegativeParameters", &AEffect::numParams, -16},
                                         Change{"NoPrograms", &AEffect::numPrograms, 0},
                                         Change{"OneProgram", &AEffect::numPrograms, 1},
                                         Change{"MorePrograms", &AEffect::numPrograms, 50},
                                         Change{"NegativePrograms", &AEffect::numPrograms, INT_MIN}),
                         host_tests::nameOfCase<Change>);

TEST_P(CountsThatChange, LeaveSizesAndHeadersAsTheyWereAtTheStart) {
  const int programTimes = atEveryRequest([this] {
    const std::string saved = save(kProgram);
    EXPECT_EQ(saved.size(), 64u);
    EXPECT_EQ(inHex(saved.substr(0, 28)), inHex(header("FxCk", 2)));
  });
  EXPECT_EQ(programTimes, 4);
  const int bankTimes = atEveryRequest([this] {
    const std::string saved = save(kBank);
    EXPECT_EQ(saved.size(), 348u);
    EXPECT_EQ(inHex(saved.substr(0, 28)), inHex(header("FxBk", 3)));
    for (const std::size_t block : {156u, 220u, 284u}) {
      EXPECT_EQ(inHex(saved.substr(block, 28)), inHex(header("FxCk", 2)));
    }
  });
  EXPECT_GE(bankTimes, 20);
}

TEST_P(CountsThatChange, DoNoHarmToChunksAndLoading) {
  const std::string newProgram = program("New", {kHalf, kOne});
  const std::string newBank = bank({newProgram, newProgram, newProgram});
  atEveryRequest([&] { EXPECT_TRUE(load(newProgram, 0)); });
  atEveryRequest([&] { EXPECT_TRUE(load(newBank, 0)); });
  effect.aeffect.flags = 32;
  effect.programChunk = "chunk";
  atEveryRequest([this] {
    EXPECT_EQ(save(kProgram).size(), 65u);
    EXPECT_EQ(save(kBank).size(), 160u);
  });
  const int times = atEveryRequest([this] { EXPECT_TRUE(load(preset_bytes::bankChunk("bank"), 0)); });
  EXPECT_GE(times, 10);
}

TEST_F(HostilePlugin, ParametersThatAreGoneMeanwhileAreSavedAsZero) {
  effect.setPrograms({{"A", {0.5f, 1.0f, -2.0f}}});
  open();
  effect.onRequest = [this](const doubles::Request& request) {
    if (request == doubles::getParameterOf(0)) effect.aeffect.numParams = 1;
  };
  EXPECT_EQ(inHex(save(kProgram)), inHex(program("A", {kHalf, 0, 0})));
}

// ---- Current programs outside the bank

struct Current {
  std::string name;
  VstInt32 number;
  VstInt32 clamped;
};

class CurrentOutsideTheBank : public HostilePlugin, public testing::WithParamInterface<Current> {};

INSTANTIATE_TEST_SUITE_P(Numbers, CurrentOutsideTheBank,
                         testing::Values(Current{"MinusOne", -1, 0}, Current{"TheSmallest", INT_MIN, 0},
                                         Current{"OnePastTheLast", 3, 2}, Current{"Far", 1000, 2}),
                         host_tests::nameOfCase<Current>);

TEST_P(CurrentOutsideTheBank, HasNoBlockInASavedBank) {
  open();
  effect.currentProgram = GetParam().number;
  EXPECT_EQ(inHex(save(kBank)),
            inHex(bank({program("A", {kHalf}), program("B", {kOne}), program("C", {kMinusTwo})})));
  EXPECT_EQ(effect.currentProgram, GetParam().clamped);
  // The one block of a bank without programs then stays empty.
  effect.aeffect.numPrograms = 0;
  effect.currentProgram = GetParam().number;
  EXPECT_EQ(inHex(save(kBank)), inHex(header("FxBk", 0) + std::string(128 + 60, '\0')));
}

TEST_P(CurrentOutsideTheBank, GetsNoBlockFromALoadedBank) {
  open();
  // The largest product of stride and program: about 2^31 x 2^33.
  for (const std::int64_t firstCount : {1, 2147483647}) {
    effect.currentProgram = GetParam().number;
    EXPECT_FALSE(load(
        with(bank({program("X", {0}), program("Y", {0}), program("Z", {0})}), 180, word(firstCount)), 0));
  }
  effect.currentProgram = GetParam().number;
  EXPECT_FALSE(load(bank({program("X", {0}), program("Y", {0}), program("Z", {0})}), 0));
  EXPECT_EQ(effect.program(0).name, "X");
  EXPECT_EQ(effect.program(1).name, "Y");
  EXPECT_EQ(effect.program(2).name, "Z");
  EXPECT_EQ(effect.currentProgram, GetParam().clamped);
}

// The undefined-behaviour sanitizer reports a product of stride and program that overflows.
TEST_F(HostilePlugin, TheProductOfTheLargestStrideAndTheLargestCurrentProgramDoesNotOverflow) {
  open();
  for (const std::int64_t stride : {2147483647, -2147483647 - 1}) {
    for (const VstInt32 current : {INT_MAX, INT_MIN}) {
      effect.currentProgram = current;
      effect.forget();
      EXPECT_FALSE(load(with(with(bank({program("X", {0})}), 180, word(stride)), 24, word(0)), 0));
      EXPECT_EQ(requests(), asksProgram());
    }
  }
}

// A name is remembered under the number of its program; for this one there is no memory.
TEST_F(HostilePlugin, ACurrentProgramWithoutRoomForItsNameIsMinusOne) {
  open();
  for (const VstInt32 current : {INT_MAX, 100 * 1000 * 1000}) {
    effect.currentProgram = current;
    AutoBuffer<char> out;
    const ScarceMemory limit(kLargestBlock);
    EXPECT_EQ(thrownInt([&] { wrapper->saveToFXBData(out, kProgram); }), -1);
    EXPECT_EQ(thrownInt([&] { wrapper->saveToFXBData(out, kBank); }), -1);
    EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
  }
}

TEST_F(HostilePlugin, APluginThatNeverSelectsAnythingIsSavedWithTheSameProgramInEachBlock) {
  open();
  effect.ignore(effSetProgram);
  EXPECT_EQ(inHex(save(kBank)),
            inHex(bank({program("A", {kHalf}), program("A", {kHalf}), program("A", {kHalf})})));
}

// ---- Strides

struct Stride {
  std::string name;
  std::int64_t firstCount;
};

class HostileStride : public HostilePlugin, public testing::WithParamInterface<Stride> {};

INSTANTIATE_TEST_SUITE_P(Counts, HostileStride,
                         testing::Values(Stride{"OneBlockBack", -29}, Stride{"JustBeforeTheData", -54},
                                         Stride{"TheSmallest", -2147483648},
                                         // In 32 bits these strides would be negative, 0 and 60.
                                         Stride{"JustAboveAnInt", 536870898},
                                         Stride{"WrapsToZero", 1073741810},
                                         Stride{"WrapsToOneParameter", 1073741825},
                                         Stride{"TheLargest", 2147483647}),
                         host_tests::nameOfCase<Stride>);

TEST_P(HostileStride, RefusesTheSecondProgram) {
  open();
  const std::string one = program("N", {kOne});
  const std::string data = with(bank({one, one, one}), 180, word(GetParam().firstCount));
  EXPECT_FALSE(load(data, 0));
  EXPECT_TRUE(effect.requestsOf(effSetProgramName).empty());
  // The first program is at 156 with any stride.
  effect.currentProgram = 2;
  EXPECT_FALSE(load(data, 0));
}

// A stride of 0: every program is the first block.
TEST_F(HostilePlugin, AStrideOfZeroLoadsTheFirstBlockIntoEveryProgram) {
  open();
  EXPECT_TRUE(
      load(with(bank({program("N", {kOne}), program("M", {0}), program("M", {0})}), 180, word(-14)), 0));
  for (const VstInt32 i : {0, 1, 2}) EXPECT_EQ(effect.program(i).name, "N");
  EXPECT_TRUE(effect.parameterWrites().empty());
}

}  // namespace
