// SPDX-License-Identifier: MIT
// VSTWrapper::getCurrentProgramName and getProgramName, and the names that they store and find.
#include <climits>
#include <string>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;

class VSTWrapperProgramNames : public host_tests::WrapperTest {
 protected:
  /// Three programs, of which "Loud" (1) is the current one; they cannot be named by index.
  VSTWrapperProgramNames() {
    effect.setPrograms({{"Soft", {}}, {"Loud", {}}, {"Warm", {}}});
    open();
    effect.currentProgram = 1;
  }
};

TEST_F(VSTWrapperProgramNames, TheCurrentOneIsAskedForAndThenWhichProgramItIs) {
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Loud");
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgramName), request(effGetProgram)));
}

TEST_F(VSTWrapperProgramNames, TheCurrentOneIsStoredAndThoseBeforeItAreEmpty) {
  wrapper->getCurrentProgramName();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperProgramNames, TheStoreOnlyGrows) {
  wrapper->getCurrentProgramName();
  effect.currentProgram = 2;
  wrapper->getCurrentProgramName();
  effect.currentProgram = 0;
  wrapper->getCurrentProgramName();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Soft", "Loud", "Warm"));
}

// On purpose: the first name that is not empty stays.
TEST_F(VSTWrapperProgramNames, AStoredOneStaysWhateverThePluginSaysLater) {
  wrapper->getCurrentProgramName();
  effect.setText(effGetProgramName, "Louder");
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Louder");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperProgramNames, AnEmptyOneIsReplacedInTheStore) {
  effect.setText(effGetProgramName, "");
  EXPECT_EQ(wrapper->getCurrentProgramName(), "");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", ""));
  effect.setText(effGetProgramName, "Loud");
  wrapper->getCurrentProgramName();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperProgramNames, TheCurrentOneIsNotStoredForAProgramBelowZero) {
  for (const VstInt32 current : {-1, INT_MIN}) {
    effect.answer(effGetProgram, current);
    EXPECT_EQ(wrapper->getCurrentProgramName(), "Loud");
  }
  EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
}

TEST_F(VSTWrapperProgramNames, TheCurrentOneIsStoredAlsoBeyondTheLastProgram) {
  effect.answer(effGetProgram, 4);
  wrapper->getCurrentProgramName();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "", "", "Loud"));
}

TEST_F(VSTWrapperProgramNames, TheCurrentOneCountsWhateverThePluginAnswers) {
  effect.answer(effGetProgramName, 0);
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Loud");
}

TEST_F(VSTWrapperProgramNames, TheCurrentOneIsAskedForInAPluginWithoutProgramsToo) {
  effect.setPrograms({});
  effect.setText(effGetProgramName, "Default");
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Default");
  EXPECT_EQ(wrapper->getProgramName(0), "Default");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Default"));
}

TEST_F(VSTWrapperProgramNames, RunToTheEndOfTheBufferWithoutAZeroByte) {
  effect.setUnterminatedText(effGetProgramName, 256, 'p');
  effect.setUnterminatedText(effGetProgramNameIndexed, 256, 'i');
  EXPECT_EQ(wrapper->getCurrentProgramName(), std::string(256, 'p'));
  EXPECT_EQ(wrapper->getProgramName(2), std::string(256, 'i'));
  EXPECT_EQ(wrapper->storedProgramNames.at(1), std::string(256, 'p'));
}

TEST_F(VSTWrapperProgramNames, AreAskedForInAClearedBufferEachTime) {
  effect.setUnterminatedText(effGetProgramName, 256);
  effect.setUnterminatedText(effGetProgramNameIndexed, 256);
  for (int i = 0; i < 2; ++i) {
    wrapper->getCurrentProgramName();
    wrapper->getProgramName(2);
  }
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetProgramName), request(effGetProgram), request(effGetProgram),
                          programNameIndexed(2), request(effGetProgramName), request(effGetProgram),
                          request(effGetProgram), programNameIndexed(2)));
}

// ---- By index ----

TEST_F(VSTWrapperProgramNames, TheCurrentOneByIndexIsTheCurrentOne) {
  effect.namesProgramsByIndex = true;
  EXPECT_EQ(wrapper->getProgramName(1), "Loud");
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetProgram), request(effGetProgramName), request(effGetProgram)));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperProgramNames, AnotherOneIsAskedForByIndexWithCategoryMinusOne) {
  effect.namesProgramsByIndex = true;
  EXPECT_EQ(wrapper->getProgramName(2), "Warm");
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetProgram), request(effGetProgramNameIndexed, 2, -1)));
  EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
}

// On purpose: the upper bound is one past the last program.
TEST_F(VSTWrapperProgramNames, AnIndexBeyondTheEndIsAskedForAsTheNumberOfPrograms) {
  for (const int index : {3, 4, 5, INT_MAX}) wrapper->getProgramName(index);
  EXPECT_EQ(effect.requestsOf(effGetProgramNameIndexed), std::vector<Request>(4, programNameIndexed(3)));
}

TEST_F(VSTWrapperProgramNames, AnIndexBelowZeroIsAskedForAsZero) {
  for (const int index : {-1, -2, INT_MIN}) wrapper->getProgramName(index);
  EXPECT_EQ(effect.requestsOf(effGetProgramNameIndexed), std::vector<Request>(3, programNameIndexed(0)));
}

// Compared with the current program as given: the clamped index is asked for, current or not.
TEST_F(VSTWrapperProgramNames, AnIndexBelowZeroIsAskedForAlsoWhereTheFirstProgramIsTheCurrentOne) {
  effect.currentProgram = 0;
  wrapper->getProgramName(-1);
  EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), programNameIndexed(0)));
}

TEST_F(VSTWrapperProgramNames, WithoutProgramsEveryOtherIndexIsZero) {
  effect.setPrograms({});
  wrapper->getProgramName(5);
  wrapper->getProgramName(-5);
  EXPECT_THAT(effect.requestsOf(effGetProgramNameIndexed),
              ElementsAre(programNameIndexed(0), programNameIndexed(0)));
}

TEST_F(VSTWrapperProgramNames, AnyAnswerButZeroNamesByIndex) {
  effect.setTextAt(effGetProgramNameIndexed, 2, "By index");
  effect.answer(effGetProgramNameIndexed, -1);
  wrapper->storedProgramNames = {"", "", "Stored"};
  EXPECT_EQ(wrapper->getProgramName(2), "By index");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "Stored"));
}

TEST_F(VSTWrapperProgramNames, AnEmptyNameByIndexIsTheName) {
  effect.answer(effGetProgramNameIndexed, 1);
  wrapper->storedProgramNames = {"", "", "Stored"};
  EXPECT_EQ(wrapper->getProgramName(2), "");
}

TEST_F(VSTWrapperProgramNames, TextThatIsAnsweredWithZeroGivesWayToTheStoredName) {
  effect.setText(effGetProgramNameIndexed, "By index");
  effect.answer(effGetProgramNameIndexed, 0);
  wrapper->storedProgramNames = {"Stored 0", "Stored 1", "Stored 2"};
  EXPECT_EQ(wrapper->getProgramName(2), "Stored 2");
  EXPECT_EQ(wrapper->getProgramName(0), "Stored 0");
  EXPECT_EQ(wrapper->getProgramName(-7), "Stored 0");
}

TEST_F(VSTWrapperProgramNames, TheStoredNameIsLookedUpUnderTheClampedIndex) {
  wrapper->storedProgramNames = {"0", "1", "2", "3", "4"};
  EXPECT_EQ(wrapper->getProgramName(4), "3");
}

TEST_F(VSTWrapperProgramNames, WithoutAStoredNameTheNameIsEmptyAndNoProgramIsSelected) {
  wrapper->storedProgramNames = {""};
  EXPECT_EQ(wrapper->getProgramName(0), "");
  EXPECT_EQ(wrapper->getProgramName(2), "");
  EXPECT_EQ(wrapper->getProgramName(3), "");
  EXPECT_THAT(effect.requestsOf(effSetProgram), IsEmpty());
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre(""));
}

}  // namespace
