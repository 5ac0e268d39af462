// SPDX-License-Identifier: MIT
// Counts and program numbers that lie or change while the host works: nothing of ours is read or written out
// of bounds, which the address sanitizer watches, and what is saved has the size that was asked for at the
// start.
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

enum class Count { kParameters, kPrograms };

struct Change {
  std::string name;
  Count count;
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

  /// Runs `work` once for each request that it makes, with the change in the middle of that request.
  /// Answers the number of times.
  template <typename Work>
  int atEveryRequest(const Work& work) {
    for (int changeAt = 1;; ++changeAt) {
      SCOPED_TRACE("the count changes in request " + std::to_string(changeAt));
      reset();
      int requestsSoFar = 0;
      effect.onRequest = [this, changeAt, &requestsSoFar](const doubles::Request&) {
        if (++requestsSoFar != changeAt) return;
        (GetParam().count == Count::kParameters ? effect.aeffect.numParams : effect.aeffect.numPrograms) =
            GetParam().becomes;
      };
      work();
      if (requestsSoFar < changeAt || HasFailure()) return changeAt - 1;
    }
  }
};

INSTANTIATE_TEST_SUITE_P(To, CountsThatChange,
                         testing::Values(Change{"NoParameters", Count::kParameters, 0},
                                         Change{"OneParameter", Count::kParameters, 1},
                                         Change{"MoreParameters", Count::kParameters, 50},
                                         Change{"FarMoreParameters", Count::kParameters, 5000},
                                         Change{"NegativeParameters", Count::kParameters, kIntMin},
                                         Change{"NoPrograms", Count::kPrograms, 0},
                                         Change{"OneProgram", Count::kPrograms, 1},
                                         Change{"MorePrograms", Count::kPrograms, 50},
                                         Change{"NegativePrograms", Count::kPrograms, kIntMin}),
                         [](const auto& instance) { return instance.param.name; });

TEST_P(CountsThatChange, LeaveASavedProgramItsSize) {
  const int times = atEveryRequest([this] {
    const std::string saved = save(kProgram);
    EXPECT_EQ(saved.size(), 64u);
    EXPECT_EQ(inHex(saved.substr(0, 28)), inHex(preset_bytes::header("FxCk", 2)));
  });
  EXPECT_EQ(times, 4);
}

TEST_P(CountsThatChange, LeaveASavedBankItsSize) {
  const int times = atEveryRequest([this] {
    const std::string saved = save(kBank);
    EXPECT_EQ(saved.size(), 348u);
    EXPECT_EQ(inHex(saved.substr(0, 28)), inHex(preset_bytes::header("FxBk", 3)));
    for (const std::size_t block : {156u, 220u, 284u}) {
      EXPECT_EQ(inHex(saved.substr(block, 28)), inHex(preset_bytes::header("FxCk", 2)));
    }
  });
  EXPECT_GE(times, 20);
}

TEST_P(CountsThatChange, DoNoHarmToASavedChunk) {
  effect.aeffect.flags = 32;
  effect.programChunk = "chunk";
  atEveryRequest([this] {
    EXPECT_EQ(save(kProgram).size(), 65u);
    EXPECT_EQ(save(kBank).size(), 160u);
  });
}

TEST_P(CountsThatChange, DoNoHarmToLoading) {
  const std::string newProgram = program("New", {0x3F000000, 0x40000000});
  atEveryRequest([&] { EXPECT_TRUE(load(newProgram, 0)); });
  const std::string newBank = preset_bytes::bank({newProgram, newProgram, newProgram});
  atEveryRequest([&] { EXPECT_TRUE(load(newBank, 0)); });
}

TEST_P(CountsThatChange, DoNoHarmToLearningTheNames) {
  effect.aeffect.flags = 32;
  const int times = atEveryRequest([this] { EXPECT_TRUE(load(preset_bytes::bankChunk("bank"), 0)); });
  EXPECT_GE(times, 10);
}

class GrowingParameterCount : public PresetTest {};

// For as many parameters as there can be there is no store; one that was made before is not left.
TEST_F(GrowingParameterCount, IsMinusOneBeforeTheStoreAndHarmlessAfterIt) {
  open();
  int times = 0;
  int failures = 0;
  for (bool changed = true; changed;) {
    effect.setPrograms({{"A", {0.5f}}, {"B", {1.0f}}});
    const int changeAt = ++times;
    int requestsSoFar = 0;
    effect.onRequest = [&](const doubles::Request&) {
      if (++requestsSoFar == changeAt) effect.aeffect.numParams = kIntMax;
    };
    AutoBuffer<char> out;
    try {
      wrapper->saveToFXBData(out, kBank);
      EXPECT_EQ(out.size(), 276);
    } catch (int thrown) {
      EXPECT_EQ(thrown, -1);
      ++failures;
    }
    changed = requestsSoFar >= changeAt;
  }
  EXPECT_GT(times, 15);
  EXPECT_EQ(failures, 1);
}

// On purpose the number of parameters may be another when a store is put back; what the store has not is
// left.
TEST_F(GrowingParameterCount, LeavesTheNewParametersAlone) {
  effect.setPrograms({{"A", {0.5f}}});
  open();
  AutoBuffer<char> store;
  wrapper->createTempParameterStore(store);
  effect.setPrograms({{"A", {0.0f, 0.25f, 0.75f}}});
  effect.forget();
  wrapper->restoreFromTempParameterStore(store);
  EXPECT_EQ(requests(), inOrder({keepsName(), sets(0, 0.5f)}));
}

}  // namespace
