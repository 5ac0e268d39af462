// SPDX-License-Identifier: MIT
// VSTWrapper::setCurrentProgram and changeProgramName: selecting and renaming the current program.
#include <climits>
#include <string>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;

class VSTWrapperPrograms : public host_tests::WrapperTest {
 protected:
  /// Four programs, of which "Warm" (2) is the current one.
  VSTWrapperPrograms() {
    effect.setPrograms({{"Soft", {}}, {"Loud", {}}, {"Warm", {}}, {"Cold", {}}});
    open();
    effect.currentProgram = 2;
  }
};

TEST_F(VSTWrapperPrograms, SelectingAnotherProgramAsksForTheCurrentOneFirst) {
  wrapper->setCurrentProgram(1);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), request(effSetProgram, 0, 1)));
  EXPECT_EQ(effect.currentProgram, 1);
}

TEST_F(VSTWrapperPrograms, SelectingTheCurrentProgramSendsNothing) {
  wrapper->setCurrentProgram(2);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram)));
}

TEST_F(VSTWrapperPrograms, SelectingBeyondTheLastProgramSelectsTheLast) {
  for (const int index : {4, 9, INT_MAX}) {
    effect.forget();
    effect.currentProgram = 2;
    wrapper->setCurrentProgram(index);
    EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), request(effSetProgram, 0, 3)));
  }
}

TEST_F(VSTWrapperPrograms, SelectingBelowTheFirstProgramSelectsTheFirst) {
  for (const int index : {-1, -3, INT_MIN}) {
    effect.forget();
    effect.currentProgram = 2;
    wrapper->setCurrentProgram(index);
    EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), request(effSetProgram, 0, 0)));
  }
}

// On purpose: compared as given, and only then clamped.
TEST_F(VSTWrapperPrograms, SelectingBeyondTheLastProgramSendsTheLastAlsoWhereItIsTheCurrentOne) {
  effect.currentProgram = 3;
  wrapper->setCurrentProgram(4);
  effect.currentProgram = 0;
  wrapper->setCurrentProgram(-1);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), request(effSetProgram, 0, 3),
                                             request(effGetProgram), request(effSetProgram, 0, 0)));
}

TEST_F(VSTWrapperPrograms, SelectingAnImpossibleProgramThatThePluginCallsCurrentSendsNothing) {
  effect.answer(effGetProgram, -1);
  wrapper->setCurrentProgram(-1);
  effect.answer(effGetProgram, 9);
  wrapper->setCurrentProgram(9);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), request(effGetProgram)));
}

TEST_F(VSTWrapperPrograms, SelectingInAPluginWithoutProgramsAsksNothing) {
  for (const VstInt32 count : {0, -1, INT_MIN}) {
    effect.aeffect.numPrograms = count;
    wrapper->setCurrentProgram(0);
    wrapper->setCurrentProgram(1);
    wrapper->setCurrentProgram(-1);
  }
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperPrograms, SelectingFollowsTheNumberOfProgramsAsItIsNow) {
  effect.aeffect.numPrograms = 2;
  wrapper->setCurrentProgram(3);
  EXPECT_EQ(effect.requests().back(), setProgram(1));
}

// Some plug-ins switch later, or not at all.
TEST_F(VSTWrapperPrograms, SelectingIsTriedOnceAndNotChecked) {
  effect.ignore(effSetProgram);
  wrapper->setCurrentProgram(1);
  wrapper->setCurrentProgram(1);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetProgram), setProgram(1), request(effGetProgram), setProgram(1)));
}

// ---- Renaming ----

TEST_F(VSTWrapperPrograms, RenamingTheCurrentProgramComparesFirst) {
  wrapper->changeProgramName(2, "Hot");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), request(effGetProgramName),
                                             request(effGetProgram), setProgramName("Hot")));
  EXPECT_EQ(effect.program(2).name, "Hot");
}

TEST_F(VSTWrapperPrograms, RenamingToThePresentNameSendsNothing) {
  wrapper->changeProgramName(2, "Warm");
  EXPECT_THAT(effect.requestsOf(effSetProgramName), IsEmpty());
}

TEST_F(VSTWrapperPrograms, RenamingAnotherProgramAsksNothingMore) {
  for (const int index : {0, 1, 3, 4, -1, INT_MAX}) {
    effect.forget();
    wrapper->changeProgramName(index, "Hot");
    EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram)));
  }
}

TEST_F(VSTWrapperPrograms, RenamingInAPluginWithoutProgramsDoesNothing) {
  for (const VstInt32 count : {0, -1}) {
    effect.forget();
    effect.aeffect.numPrograms = count;
    wrapper->changeProgramName(2, "Hot");
    EXPECT_THAT(effect.requestsOf({effSetProgramName, effGetProgramName}), IsEmpty());
  }
}

TEST_F(VSTWrapperPrograms, RenamingSendsTheFirst24Characters) {
  wrapper->changeProgramName(2, "123456789.123456789.123456789.");
  wrapper->changeProgramName(2, "abcdefghi.abcdefghi.abcd");
  wrapper->changeProgramName(2, "abcdefghi.abcdefghi.abcde");
  EXPECT_THAT(
      effect.requestsOf(effSetProgramName),
      ElementsAre(setProgramName("123456789.123456789.1234"), setProgramName("abcdefghi.abcdefghi.abcd"),
                  // Compared whole, so it is sent although 24 characters are the same.
                  setProgramName("abcdefghi.abcdefghi.abcd")));
}

TEST_F(VSTWrapperPrograms, RenamingToNothingSendsAnEmptyName) {
  wrapper->changeProgramName(2, "");
  EXPECT_THAT(effect.requestsOf(effSetProgramName), ElementsAre(setProgramName("")));
}

TEST_F(VSTWrapperPrograms, RenamingComparesWithWhatThePluginSaysAndNotWithTheStoredName) {
  wrapper->storedProgramNames = {"", "", "Hot"};
  wrapper->changeProgramName(2, "Hot");
  EXPECT_THAT(effect.requestsOf(effSetProgramName), ElementsAre(setProgramName("Hot")));
}

// On purpose: the former name stays stored.
TEST_F(VSTWrapperPrograms, RenamingDoesNotChangeTheStoredName) {
  wrapper->changeProgramName(2, "Hot");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "Warm"));
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Hot");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "Warm"));
}

}  // namespace
