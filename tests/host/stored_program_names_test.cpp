// SPDX-License-Identifier: MIT
// VSTWrapper::updateStoredProgramNames: the walk through all programs, and the way back.
#include <algorithm>
#include <climits>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;

class VSTWrapperStoredProgramNames : public host_tests::WrapperTest {
 protected:
  /// Three programs of two parameters, of which "Loud" (1) is the current one; they cannot be named by index.
  VSTWrapperStoredProgramNames() {
    effect.setPrograms({{"Soft", {0.125f, 0.25f}}, {"Loud", {0.5f, 0.75f}}, {"Warm", {1.0f, 0.0f}}});
    open();
    effect.currentProgram = 1;
  }
};

TEST_F(VSTWrapperStoredProgramNames, AreCollectedInThisConversation) {
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(
      effect.requests(),
      ElementsAre(programNameIndexed(0), request(effGetProgram),
                  // The store
                  request(effGetProgramName), request(effGetProgram), getParameterOf(0), getParameterOf(1),
                  // Program 0
                  request(effGetProgram), setProgram(0), request(effGetProgramName), request(effGetProgram),
                  // Program 1
                  request(effGetProgram), setProgram(1), request(effGetProgramName), request(effGetProgram),
                  // Program 2
                  request(effGetProgram), setProgram(2), request(effGetProgramName), request(effGetProgram),
                  // Back
                  request(effGetProgram), setProgram(1),
                  // The store again: the name is compared, then the values are
                  request(effGetProgram), request(effGetProgram), request(effGetProgramName),
                  request(effGetProgram), getParameterOf(0), getParameterOf(1)));
}

TEST_F(VSTWrapperStoredProgramNames, NameTheProgramsThatAreNotCurrentAfterwards) {
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Soft", "Loud", "Warm"));
  EXPECT_EQ(wrapper->getProgramName(0), "Soft");
  EXPECT_EQ(wrapper->getProgramName(2), "Warm");
  EXPECT_EQ(effect.currentProgram, 1);
}

TEST_F(VSTWrapperStoredProgramNames, AreThoseOfTheFirstVisit) {
  wrapper->updateStoredProgramNames();
  effect.setPrograms({{"Soft 2", {}}, {"Loud 2", {}}, {"Warm 2", {}}});
  wrapper->updateStoredProgramNames();
  EXPECT_EQ(wrapper->getProgramName(1), "Loud");
  EXPECT_EQ(wrapper->getProgramName(2), "Warm");
}

TEST_F(VSTWrapperStoredProgramNames, AreCollectedWithoutSelectingTheOnlyProgram) {
  effect.setPrograms({{"Only", {}}});
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requestsOf(effSetProgram), IsEmpty());
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Only"));
}

TEST_F(VSTWrapperStoredProgramNames, AreNotCollectedFromAPluginThatNamesProgramsByIndex) {
  effect.namesProgramsByIndex = true;
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requests(), ElementsAre(programNameIndexed(0)));
  EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
}

TEST_F(VSTWrapperStoredProgramNames, AreNotCollectedWithAnyAnswerButZero) {
  effect.answer(effGetProgramNameIndexed, -1);
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requests(), ElementsAre(programNameIndexed(0)));
}

TEST_F(VSTWrapperStoredProgramNames, AreCollectedWhereTheAnswerIsZeroAndTextWasWritten) {
  effect.setText(effGetProgramNameIndexed, "By index");
  effect.answer(effGetProgramNameIndexed, 0);
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Soft", "Loud", "Warm"));
}

TEST_F(VSTWrapperStoredProgramNames, AreNotCollectedFromAPluginWithoutPrograms) {
  for (const VstInt32 count : {0, -1, INT_MIN}) {
    effect.aeffect.numPrograms = count;
    wrapper->updateStoredProgramNames();
  }
  EXPECT_THAT(effect.requests(), IsEmpty());
}

// Changing the program takes back what was done to the one before.
TEST_F(VSTWrapperStoredProgramNames, CostAForgetfulPluginNeitherNameNorValues) {
  wrapper->setParameter(1, 0.875f);
  wrapper->changeProgramName(1, "Edited");
  effect.forget();
  effect.onRequest = [this](const Request& request) {
    if (request.kind != Request::Kind::kDispatch || request.opcode != effSetProgram) return;
    effect.setPrograms({{"Soft", {0.125f, 0.25f}}, {"Loud", {0.5f, 0.75f}}, {"Warm", {1.0f, 0.0f}}});
  };
  wrapper->updateStoredProgramNames();
  EXPECT_EQ(effect.currentProgram, 1);
  EXPECT_EQ(effect.program(1).name, "Edited");
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(0.5f, 0.875f));
  EXPECT_THAT(effect.requestsOf(effSetProgramName), ElementsAre(setProgramName("Edited")));
  EXPECT_THAT(effect.parameterWrites(), ElementsAre(setParameterTo(1, 0.875f)));
  EXPECT_EQ(effect.requests().back(), setParameterTo(1, 0.875f));
}

// Some plug-ins switch later, or not at all: the walk ends, and nothing is stored for the others.
TEST_F(VSTWrapperStoredProgramNames, EndWithAPluginThatDoesNotSwitch) {
  effect.ignore(effSetProgram);
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requestsOf(effSetProgram), ElementsAre(setProgram(0), setProgram(2)));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperStoredProgramNames, FollowTheNumberOfProgramsAsItIsOnTheWay) {
  effect.onRequest = [this](const Request& request) {
    if (request.kind == Request::Kind::kDispatch && request.opcode == effSetProgram) {
      effect.aeffect.numPrograms = 2;
    }
  };
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requestsOf(effSetProgram), ElementsAre(setProgram(0), setProgram(1)));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Soft", "Loud"));
}

}  // namespace
