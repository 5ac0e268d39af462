// SPDX-License-Identifier: MIT
// The six tests of the catalogue on plug-ins to which they make special requests. Their step lines and all requests
// to an ordinary plug-in are in tests/end_to_end/golden/conversation_*.txt, their names in tests/fault_matrix.
#include <climits>
#include <limits>
#include <new>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "describe/vst_info.h"
#include "driver/catalogue.h"
#include "gmock/gmock.h"
#include "tests/driver/torture_fixture.h"
#include "tests/shared/scarce_memory.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;

class RunOneTest : public InstanceFixture {
 protected:
  Requests requestsOfTest(int number) {
    VSTWrapper* const live = open();
    runOneTest(number, live);
    return first.requests();
  }
};

TEST_F(RunOneTest, DoesNothingForANumberOutsideTheCatalogue) {
  VSTWrapper* const live = open();
  gCurTest = "unchanged";
  for (const int number : {6, -1, INT_MAX, INT_MIN}) runOneTest(number, live);
  runOneTest(6, nullptr);
  EXPECT_EQ(gStep, 0);
  EXPECT_STREQ(gCurTest, "unchanged");
  EXPECT_EQ(output(), "");
  EXPECT_THAT(first.requests(), IsEmpty());
}

// ---- Test 0 ----

TEST_F(RunOneTest, ClassInfoAsksAboutOutput0OfAPluginWithoutOutputs) {
  for (const VstInt32 none : {0, -4}) {
    first.aeffect.numInputs = none;
    first.aeffect.numOutputs = none;
    requestsOfTest(0);
    EXPECT_THAT(first.requestsOf({effGetInputProperties, effGetOutputProperties}),
                ElementsAre(request(effGetOutputProperties, 0)));
  }
}

// ---- Test 1 ----

TEST_F(RunOneTest, PresetInfoOfAPluginWithoutProgramsAsksOnlyForTheCurrentOne) {
  for (const VstInt32 none : {0, -2}) {
    first.aeffect.numPrograms = none;
    EXPECT_THAT(requestsOfTest(1),
                ElementsAre(request(effGetProgram), request(effGetProgramName), request(effGetProgram)));
  }
}

TEST_F(RunOneTest, PresetInfoReadsTheProgramCountBeforeTheFirstRequest) {
  VSTWrapper* const live = open();
  first.setPrograms({{"Soft", {}}, {"Loud", {}}, {"Wild", {}}});
  first.aeffect.numPrograms = 2;
  first.onRequest = [this](const Request&) { first.aeffect.numPrograms = 3; };
  runOneTest(1, live);
  EXPECT_THAT(first.requestsOf(effSetProgram), ElementsAre(setProgram(1)));
}

TEST_F(RunOneTest, PresetInfoGivesAProgramTheNameThatItReported) {
  VSTWrapper* const live = open();
  first.setPrograms({{"", {}}});
  int timesAsked = 0;
  first.onRequest = [&](const Request& received) {
    if (received.opcode == effGetProgramName && received.kind == Request::Kind::kDispatch) {
      first.setText(effGetProgramName, "Take " + std::to_string(++timesAsked));
    }
  };
  runOneTest(1, live);
  // The first answer is to the query before the programs, the third to the comparison before the renaming.
  EXPECT_THAT(first.requestsOf(effSetProgramName), ElementsAre(setProgramName("Take 2")));
}

// ---- Test 2 ----

TEST_F(RunOneTest, ParameterInfoWritesBackTheValueThatItRead) {
  // A value that is not equal to itself is always sent; others are not sent when the plug-in has them
  // already.
  const float nan = std::numeric_limits<float>::quiet_NaN();
  first.setParameters({nan, 0.25F});
  requestsOfTest(2);
  EXPECT_THAT(first.parameterWrites(), ElementsAre(setParameterTo(0, nan)));
}

TEST_F(RunOneTest, ParameterInfoOfAPluginWithoutParametersMakesNoRequest) {
  for (const VstInt32 none : {0, -1}) {
    first.aeffect.numParams = none;
    EXPECT_THAT(requestsOfTest(2), IsEmpty());
  }
}

// ---- Test 3 ----

// A request, and the wrapper's flags during it: opcode, value, mainsOn, bypassed.
using FlagsAtRequest = std::tuple<VstInt32, VstIntPtr, bool, bool>;

TEST_F(RunOneTest, SettingStateChangesTheFlagsBetweenTheseRequests) {
  VSTWrapper* const live = open();
  std::vector<FlagsAtRequest> seen;
  first.onRequest = [&](const Request& received) {
    if (received.opcode == effSetBlockSize || received.opcode == effMainsChanged ||
        received.opcode == effSetBypass) {
      seen.emplace_back(received.opcode, received.value, live->mainsOn, live->bypassed);
    }
  };
  runOneTest(3, live);
  EXPECT_THAT(seen, ElementsAre(FlagsAtRequest{11, 512, false, false},  //
                                FlagsAtRequest{12, 1, false, false},
                                FlagsAtRequest{44, 1, true, true},   // On purpose: bypassed already.
                                FlagsAtRequest{44, 0, true, false},  // On purpose: no longer bypassed.
                                FlagsAtRequest{12, 0, true, false}));
  EXPECT_FALSE(live->mainsOn);
  EXPECT_FALSE(live->bypassed);
}

// ---- Test 5 ----

struct VariantsCase {
  const char* name;
  VstInt32 flags;  // 256 marks an instrument.
  VstInt32 inputs;
  VstInt32 outputs;
  bool hasVariants;
};

class StreamFormat : public RunOneTest, public testing::WithParamInterface<VariantsCase> {};

// A list with variants needs memory, so without memory the test fails exactly when it builds one.
TEST_P(StreamFormat, BuildsTheVariantsAndOffersNone) {
  first.aeffect.flags = GetParam().flags;
  first.aeffect.numInputs = GetParam().inputs;
  first.aeffect.numOutputs = GetParam().outputs;
  EXPECT_THAT(requestsOfTest(5), IsEmpty());
  bool wasMemoryMissing = false;
  try {
    const preset_tests::ScarceMemory none(0);
    runOneTest(5, wrapper.get());
  } catch (const std::bad_alloc&) {
    wasMemoryMissing = true;
  }
  EXPECT_EQ(wasMemoryMissing, GetParam().hasVariants);
  EXPECT_STREQ(gCurTest, "inspect io config");  // Seen only where memory is missing.
}

INSTANTIATE_TEST_SUITE_P(Plugins, StreamFormat,
                         testing::ValuesIn(std::vector<VariantsCase>{
                             {"StereoEffect", 0, 2, 2, true},
                             {"MonoEffect", 0, 1, 1, false},
                             {"EffectWithoutInputs", 0, 0, 2, false},
                             {"Instrument", 256, 0, 2, true},
                             {"InstrumentAmongOtherFlags", 0x7FFFFFFF, 0, 2, true},
                             {"AllFlagsButTheInstrument", ~256, 0, 2, false},
                         }),
                         [](const auto& tested) { return tested.param.name; });

TEST_F(InstanceFixture, OfferVariantsSetsTheArrangementsOfEachAcceptedVariantInListOrder) {
  VSTWrapper* const live = open();
  std::vector<std::pair<VstInt32, VstInt32>> offered;  // Arrangement types, in and out.
  first.onRequest = [&](const Request& received) {
    const auto* in = reinterpret_cast<const VstSpeakerArrangement*>(received.value);
    const auto* out = static_cast<const VstSpeakerArrangement*>(received.pointee.address);
    offered.emplace_back(in->type, out->type);
  };
  const std::vector<PrototypeVSTVariant>& rows = GetPrototypeVariants();
  offerVariants(*live, {VSTVariant(rows[10]), VSTVariant(rows[2], {2, 0}, {2, 0}), VSTVariant(rows[28]),
                        VSTVariant(rows[10])});
  EXPECT_THAT(offered, ElementsAre(Pair(1, 10), Pair(-1, 22), Pair(1, 10)));
  EXPECT_EQ(first.requestsOf(effGetSpeakerArrangement).size(), 3U);
}

}  // namespace
