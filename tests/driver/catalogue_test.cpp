// SPDX-License-Identifier: MIT
// The six tests: their names, their texts, and every request that each of them makes, in order.
#include <climits>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "driver/catalogue.h"
#include "gmock/gmock.h"
#include "tests/driver/torture_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;

struct CatalogueEntry {
  int number;
  const char* name;
  const char* stepLine;
};

void PrintTo(const CatalogueEntry& entry, std::ostream* stream) { *stream << entry.stepLine; }

class Catalogue : public InstanceFixture, public testing::WithParamInterface<CatalogueEntry> {};

TEST_P(Catalogue, NamesTheTestAndAnnouncesIt) {
  gStep = 40;
  runOneTest(GetParam().number, open());
  EXPECT_STREQ(gCurTest, GetParam().name);
  EXPECT_EQ(gStep, 41);
  EXPECT_EQ(output(), std::string("41, ") + GetParam().stepLine + "\n");
}

TEST_P(Catalogue, AnnouncesTheTestBeforeTheFirstRequest) {
  VSTWrapper* const live = open();
  first.answer(effGetVendorString, 1);
  first.setParameters({0.5F});
  first.onRequest = [this](const Request&) {
    EXPECT_EQ(gStep, 1);
    EXPECT_STREQ(gCurTest, GetParam().name);
  };
  runOneTest(GetParam().number, live);
}

// The two texts of a test differ on purpose.
INSTANTIATE_TEST_SUITE_P(Tests, Catalogue,
                         testing::ValuesIn(std::vector<CatalogueEntry>{
                             {0, "inspect class info test", "inspect class info"},
                             {1, "inspect preset info test", "inspect preset info"},
                             {2, "inspect parameter info test", "inspect parameter info"},
                             {3, "test setting state", "testing setting states"},
                             {4, "inspect latency test", "inspect latency"},
                             {5, "inspect io config", "inspect stream format"},
                         }),
                         [](const auto& tested) { return "Test" + std::to_string(tested.param.number); });

class RunOneTest : public InstanceFixture {
 protected:
  Requests requestsOfTest(int number) {
    VSTWrapper* const live = open();
    runOneTest(number, live);
    return first.requests();
  }
};

TEST_F(RunOneTest, ANumberOutsideTheCatalogueDoesNothing) {
  VSTWrapper* const live = open();
  gStep = 3;
  gCurTest = "as it was";
  for (const int number : {6, -1, 7, INT_MAX, INT_MIN}) {
    runOneTest(number, live);
    runOneTest(number, nullptr);
  }
  EXPECT_EQ(gStep, 3);
  EXPECT_STREQ(gCurTest, "as it was");
  EXPECT_EQ(output(), "");
  EXPECT_THAT(first.requests(), IsEmpty());
}

// ---- Test 0 ----

const Requests kCapabilityQuestions = {canDo("sendVstMidiEvent"),   canDo("receiveVstMidiEvent"),
                                       canDo("receiveVstTimeInfo"), canDo("offline"),
                                       canDo("midiProgramNames"),   canDo("bypass")};

const Requests kNameQuestions = {request(effGetEffectName), request(effGetVendorString),
                                 request(effGetPlugCategory)};

TEST_F(RunOneTest, ClassInfoAsksForNamesPinsAndCapabilities) {
  first.setText(effGetEffectName, "Chorus");
  first.setText(effGetVendorString, "Maker");
  first.aeffect.numInputs = 2;
  first.aeffect.numOutputs = 3;
  EXPECT_THAT(
      requestsOfTest(0),
      ElementsAreArray(conversation({kNameQuestions,
                                     {request(effGetInputProperties, 0), request(effGetInputProperties, 1),
                                      request(effGetOutputProperties, 0), request(effGetOutputProperties, 1),
                                      request(effGetOutputProperties, 2)},
                                     kCapabilityQuestions})));
}

TEST_F(RunOneTest, ClassInfoAsksForTheFirstOutputOfAPluginWithoutOutputs) {
  first.setText(effGetEffectName, "Chorus");
  for (const VstInt32 none : {0, -4}) {
    first.aeffect.numInputs = none;
    first.aeffect.numOutputs = none;
    EXPECT_THAT(requestsOfTest(0),
                ElementsAreArray(conversation(
                    {kNameQuestions, {request(effGetOutputProperties, 0)}, kCapabilityQuestions})));
  }
}

TEST_F(RunOneTest, ClassInfoClearsThePinRecordBeforeEveryQuestion) {
  VstPinProperties full;
  std::memset(&full, 'x', sizeof full);
  first.aeffect.numInputs = 2;
  first.setInputProperties(0, full);
  requestsOfTest(0);
  EXPECT_THAT(first.requestsOf({effGetInputProperties, effGetOutputProperties}),
              ElementsAre(request(effGetInputProperties, 0), request(effGetInputProperties, 1),
                          request(effGetOutputProperties, 0)));
}

// ---- Test 1 ----

const Requests kCurrentName = {request(effGetProgramName), request(effGetProgram)};

// One program of the walk that is current already: it is not selected, and named twice.
const Requests kCurrentProgramOfTheWalk =
    conversation({{request(effGetProgram)},  // select: it is the current one
                  {request(effGetProgram)},
                  kCurrentName,  // its name
                  {request(effGetProgram)},
                  kCurrentName});  // give it back: it has this name

TEST_F(RunOneTest, PresetInfoVisitsEveryProgramAndStaysOnTheLast) {
  first.setPrograms({{"Soft", {}}, {"Loud", {}}, {"Wild", {}}});
  EXPECT_THAT(requestsOfTest(1), ElementsAreArray(conversation({{request(effGetProgram)},
                                                                kCurrentName,
                                                                kCurrentProgramOfTheWalk,
                                                                {request(effGetProgram), setProgram(1)},
                                                                {request(effGetProgram)},
                                                                kCurrentName,
                                                                {request(effGetProgram)},
                                                                kCurrentName,
                                                                {request(effGetProgram), setProgram(2)},
                                                                {request(effGetProgram)},
                                                                kCurrentName,
                                                                {request(effGetProgram)},
                                                                kCurrentName})));
  EXPECT_EQ(first.currentProgram, 2);
}

TEST_F(RunOneTest, PresetInfoOfAPluginWithoutProgramsAsksOnlyForTheCurrentOne) {
  first.setPrograms({});
  EXPECT_THAT(requestsOfTest(1), ElementsAreArray(conversation({{request(effGetProgram)}, kCurrentName})));
  first.aeffect.numPrograms = -2;
  EXPECT_THAT(requestsOfTest(1), ElementsAreArray(conversation({{request(effGetProgram)}, kCurrentName})));
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
  // Take 1 is the query before the walk, take 2 the name reported, take 3 the name at the renaming.
  EXPECT_THAT(first.requestsOf(effSetProgramName), ElementsAre(setProgramName("Take 2")));
}

// ---- Test 2 ----

TEST_F(RunOneTest, ParameterInfoGoesThroughEveryParameter) {
  first.setParameters({0.5F, 0.25F});
  first.answerAt(effString2Parameter, 1, 1);
  first.setTextAt(effGetParamDisplay, 1, "-6 dB");
  EXPECT_THAT(
      requestsOfTest(2),
      ElementsAre(getParameterOf(0),  // its value
                  getParameterOf(0),  // written back: it has this value
                  request(effGetParamName, 0), request(effGetParamLabel, 0), request(effGetParamDisplay, 0),
                  canParameterBeSetFromText(0),                                          // it cannot
                  request(effCanBeAutomated, 0), request(effGetParameterProperties, 0),  //
                  getParameterOf(1), getParameterOf(1), request(effGetParamName, 1),
                  request(effGetParamLabel, 1), request(effGetParamDisplay, 1), canParameterBeSetFromText(1),
                  setParameterFromText(1, "-6 dB"), request(effCanBeAutomated, 1),
                  request(effGetParameterProperties, 1)));
}

TEST_F(RunOneTest, ParameterInfoWritesBackTheValueThatItRead) {
  // A value that equals none, not even itself, is always sent.
  const float nan = std::numeric_limits<float>::quiet_NaN();
  first.setParameters({nan, 0.25F});
  requestsOfTest(2);
  EXPECT_THAT(first.parameterWrites(), ElementsAre(setParameterTo(0, nan)));
}

TEST_F(RunOneTest, ParameterInfoOfAPluginWithoutParametersAsksNothing) {
  EXPECT_THAT(requestsOfTest(2), IsEmpty());
  first.aeffect.numParams = -1;
  EXPECT_THAT(requestsOfTest(2), IsEmpty());
}

// ---- Tests 4 and 5 ----

TEST_F(RunOneTest, LatencyAsksForTheTailSize) {
  EXPECT_THAT(requestsOfTest(4), ElementsAre(request(effGetTailSize)));
}

TEST_F(RunOneTest, StreamFormatMakesNoRequest) {
  for (const VstInt32 flags : {0, 256}) {
    first.aeffect.flags = flags;
    for (const VstInt32 pins : {0, 1, 2, 8}) {
      first.aeffect.numInputs = pins;
      first.aeffect.numOutputs = pins;
      EXPECT_THAT(requestsOfTest(5), IsEmpty()) << flags << ' ' << pins;
    }
  }
}

}  // namespace
