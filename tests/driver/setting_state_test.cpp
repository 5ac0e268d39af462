// SPDX-License-Identifier: MIT
// The test of settings and state: its requests for each kind of plug-in, and the wrapper's flags as the
// plug-in finds them during the requests.
#include <cstdint>
#include <string>
#include <tuple>
#include <vector>

#include "driver/catalogue.h"
#include "gmock/gmock.h"
#include "tests/driver/torture_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::ElementsAreArray;
using testing::IsEmpty;

const Requests kSettings = {setSampleRate(44100.0F), setBlockSize(512)};
const Requests kOnBypassOff = {mainsChanged(1), setBypass(1), setBypass(0), mainsChanged(0)};

const Requests kCurrentProgram = {request(effGetProgram)};
const Requests kName = {request(effGetProgramName), request(effGetProgram)};
const Requests kValues = {getParameterOf(0), getParameterOf(1)};
const Requests kNameAndValues = conversation({kName, kValues});
// Name and values put into the current program, which has them already.
const Requests kRename = conversation({kCurrentProgram, kCurrentProgram, kName});
const Requests kRestore = conversation({kRename, kValues});

Requests select(VstIntPtr program) { return {request(effGetProgram), setProgram(program)}; }

class SettingState : public InstanceFixture {
 protected:
  Requests requestsOfTheTest() {
    VSTWrapper* const live = open();
    runOneTest(3, live);
    return first.requests();
  }
};

TEST_F(SettingState, SavesAndLoadsProgramAndBankOfParameters) {
  first.setPrograms({{"Soft", {0.5F, 0.25F}}, {"Loud", {1.0F, 0.75F}}});
  EXPECT_THAT(requestsOfTheTest(),
              ElementsAreArray(conversation({kSettings,
                                             kNameAndValues,                                   // program out
                                             kRestore,                                         // and in
                                             kCurrentProgram, kNameAndValues, kNameAndValues,  // bank out
                                             select(1), kNameAndValues, select(0), kRestore, kCurrentProgram,
                                             select(1), kRestore,  // and in
                                             select(0), kRestore, kOnBypassOff})));
  EXPECT_EQ(first.program(0).parameters, (std::vector<float>{0.5F, 0.25F}));
  EXPECT_EQ(first.program(1).parameters, (std::vector<float>{1.0F, 0.75F}));
}

TEST_F(SettingState, SavesAndLoadsTheChunks) {
  first.aeffect.flags = 32;
  first.setPrograms({{"Soft", {0.5F, 0.25F}}});
  first.namesProgramsByIndex = true;
  first.programChunk = "one program";
  first.bankChunk = "the bank";
  EXPECT_THAT(requestsOfTheTest(),
              ElementsAreArray(conversation({kSettings,
                                             {getChunk(1)},
                                             kName,
                                             {setChunk(1, "one program")},
                                             kRename,
                                             {getChunk(0), setChunk(0, "the bank"), programNameIndexed(0)},
                                             kOnBypassOff})));
}

TEST_F(SettingState, OfAPluginWithoutAnythingStillSavesBothForms) {
  EXPECT_THAT(requestsOfTheTest(),
              ElementsAreArray(
                  conversation({kSettings,
                                kName,                             // program out
                                kCurrentProgram, kCurrentProgram,  // and in: there is no program to rename
                                kCurrentProgram, kName, kName,     // bank out: the values in force
                                kCurrentProgram, kCurrentProgram,  // put back
                                kCurrentProgram, kCurrentProgram, kCurrentProgram,  // and in
                                kOnBypassOff})));
}

// What the plug-in sees: opcode, value, mainsOn, bypassed.
using Seen = std::tuple<VstInt32, VstIntPtr, bool, bool>;

TEST_F(SettingState, MovesTheFlagsOnlyAtTheirPlaces) {
  VSTWrapper* const live = open();
  std::vector<Seen> seen;
  first.onRequest = [&](const Request& received) {
    if (received.opcode == effSetBlockSize || received.opcode == effMainsChanged ||
        received.opcode == effSetBypass) {
      seen.emplace_back(received.opcode, received.value, live->mainsOn, live->bypassed);
    }
  };
  runOneTest(3, live);
  EXPECT_THAT(seen, ElementsAre(Seen{11, 512, false, false},  //
                                Seen{12, 1, false, false},    //
                                Seen{44, 1, true, true},      // On purpose: bypassed already.
                                Seen{44, 0, true, false},     // On purpose: no longer bypassed.
                                Seen{12, 0, true, false}));
  EXPECT_FALSE(live->mainsOn);
  EXPECT_FALSE(live->bypassed);
}

TEST_F(SettingState, AFailureLeavesTheFlagsAsTheyWereAndThePluginIsSwitchedOffAtItsEnd) {
  VSTWrapper* const live = open();
  first.setParameters({0.5F});
  first.onRequest = [](const Request& received) {
    if (received.opcode == effSetBypass) throw 5;
  };
  EXPECT_THROW(runOneTest(3, live), int);
  EXPECT_TRUE(live->mainsOn);
  EXPECT_TRUE(live->bypassed);
  first.forget();
  wrapper.reset();
  EXPECT_THAT(first.requests(), ElementsAre(mainsChanged(0), request(effClose)));
}

// Whatever request throws, its exception passes and the data is freed (which the address sanitizer checks).
TEST_F(SettingState, EveryFailurePasses) {
  first.aeffect.flags = 32;
  first.setPrograms({{"Soft", {0.5F}}});
  first.programChunk = "one program";
  first.bankChunk = "the bank";
  VSTWrapper* const live = open();
  for (const VstEffectOpcode opcode :
       {effSetSampleRate, effSetBlockSize, effGetChunk, effGetProgramName, effSetChunk,
        effGetProgramNameIndexed, effMainsChanged, effSetBypass}) {
    first.onRequest = [opcode](const Request& received) {
      if (received.kind == Request::Kind::kDispatch && received.opcode == opcode) throw 42;
    };
    try {
      runOneTest(3, live);
      ADD_FAILURE() << "nothing was thrown at " << opcode;
    } catch (int thrown) {
      EXPECT_EQ(thrown, 42);
    }
  }
}

TEST_F(SettingState, AHostileChunkIsAFailure) {
  first.aeffect.flags = 32;
  first.answer(effGetChunk, -1);
  VSTWrapper* const live = open();
  EXPECT_THROW(runOneTest(3, live), int);
  EXPECT_THAT(first.requestsOf({effSetChunk, effMainsChanged}), IsEmpty());
}

}  // namespace
