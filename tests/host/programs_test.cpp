// SPDX-License-Identifier: MIT
// VSTWrapper: selecting, naming and renaming programs, and the names that the wrapper stores.
#include <climits>
#include <string>

#include "tests/host/preset_fixture.h"

namespace {

using namespace doubles;
using namespace preset_tests;
using testing::ElementsAre;
using testing::IsEmpty;

class VSTWrapperPrograms : public host_tests::WrapperTest {
 protected:
  /// Four programs, of which "Warm" (2) is the current one; they cannot be named by index.
  VSTWrapperPrograms() {
    effect.setPrograms({{"Soft", {}}, {"Loud", {}}, {"Warm", {}}, {"Cold", {}}});
    open();
    effect.currentProgram = 2;
  }
};

// ---- Selecting

struct Selection {
  std::string name;
  VstInt32 current;
  int index;
  VstIntPtr sent;
};

class VSTWrapperSelecting : public VSTWrapperPrograms, public testing::WithParamInterface<Selection> {};

TEST_P(VSTWrapperSelecting, AsksForTheCurrentProgramAndSendsTheClampedIndexOnce) {
  effect.currentProgram = GetParam().current;
  effect.ignore(effSetProgram);  // Some plug-ins switch later, or not at all.
  wrapper->setCurrentProgram(GetParam().index);
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetProgram), request(effSetProgram, 0, GetParam().sent)));
}

// On purpose: the index is compared with the current program as given, and clamped only then.
INSTANTIATE_TEST_SUITE_P(To, VSTWrapperSelecting,
                         testing::Values(Selection{"Another", 2, 1, 1}, Selection{"First", 2, 0, 0},
                                         Selection{"Last", 2, 3, 3}, Selection{"OneBeyondTheLast", 2, 4, 3},
                                         Selection{"TheLargest", 2, INT_MAX, 3},
                                         Selection{"MinusOne", 2, -1, 0},
                                         Selection{"TheSmallest", 2, INT_MIN, 0},
                                         Selection{"BeyondTheLastFromTheLast", 3, 4, 3},
                                         Selection{"MinusOneFromTheFirst", 0, -1, 0}),
                         host_tests::nameOfCase<Selection>);

TEST_F(VSTWrapperPrograms, SelectingWhatThePluginCallsCurrentSendsNothing) {
  for (const int index : {2, -1, 9}) {
    effect.forget();
    effect.currentProgram = index;
    wrapper->setCurrentProgram(index);
    EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram)));
  }
}

TEST_F(VSTWrapperPrograms, WithoutProgramsSelectingAndCollectingNamesAskNothing) {
  for (const VstInt32 count : {0, -1, INT_MIN}) {
    effect.aeffect.numPrograms = count;
    wrapper->setCurrentProgram(1);
    wrapper->setCurrentProgram(-1);
    wrapper->updateStoredProgramNames();
  }
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperPrograms, WithoutAnInstanceSelectingRenamingAndCollectingNamesDoNothing) {
  wrapper->effect = nullptr;
  wrapper->setCurrentProgram(1);
  wrapper->changeProgramName(2, "Hot");
  wrapper->updateStoredProgramNames();
  wrapper->effect = &effect.aeffect;
  EXPECT_THAT(effect.requests(), IsEmpty());
}

TEST_F(VSTWrapperPrograms, SelectingReadsTheCountAgainAfterTheQuestionForTheCurrentProgram) {
  struct {
    VstInt32 becomes;
    VstIntPtr sent;
  } const rows[] = {{2, 1}, {9, 7}, {0, -1}, {-1, -2}};
  for (const auto& row : rows) {
    effect.forget();
    effect.aeffect.numPrograms = 4;
    effect.currentProgram = 2;
    effect.onRequest = [&](const Request& request) {
      if (request.opcode == effGetProgram) effect.aeffect.numPrograms = row.becomes;
    };
    wrapper->setCurrentProgram(7);
    EXPECT_THAT(effect.requests(), ElementsAre(request(effGetProgram), request(effSetProgram, 0, row.sent)));
  }
}

// ---- Renaming

TEST_F(VSTWrapperPrograms, RenamingTheCurrentProgramComparesFirst) {
  wrapper->changeProgramName(2, "Hot");
  wrapper->changeProgramName(2, "Hot");
  const Requests sent = {setProgramName("Hot")};
  EXPECT_EQ(effect.requests(), inOrder({asksProgram(), asksName(), sent, asksProgram(), asksName()}));
}

TEST_F(VSTWrapperPrograms, RenamingAnotherProgramOrOneOfNoneAsksForTheCurrentProgramOnly) {
  for (const int index : {1, 3, 4, -1, INT_MAX}) wrapper->changeProgramName(index, "Hot");
  for (const VstInt32 count : {0, -1}) {
    effect.aeffect.numPrograms = count;
    wrapper->changeProgramName(2, "Hot");
  }
  EXPECT_EQ(effect.requests(), std::vector<Request>(7, request(effGetProgram)));
}

TEST_F(VSTWrapperPrograms, RenamingSendsTheFirst24Characters) {
  for (const char* name : {"abcdefghi.abcdefghi.abcd", "abcdefghi.abcdefghi.abcde", ""}) {
    wrapper->changeProgramName(2, name);
  }
  EXPECT_THAT(effect.requestsOf(effSetProgramName),
              ElementsAre(setProgramName("abcdefghi.abcdefghi.abcd"),
                          // Compared whole, so it is sent although the first 24 characters are the same.
                          setProgramName("abcdefghi.abcdefghi.abcd"), setProgramName("")));
}

// On purpose: the former name stays stored.
TEST_F(VSTWrapperPrograms, RenamingNeitherComparesWithTheStoredNameNorChangesIt) {
  wrapper->storedProgramNames = {"", "", "Hot"};
  wrapper->changeProgramName(2, "Hot");
  EXPECT_THAT(effect.requestsOf(effSetProgramName), ElementsAre(setProgramName("Hot")));
  wrapper->changeProgramName(2, "Cool");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "Hot"));
}

// ---- The current program's name

TEST_F(VSTWrapperPrograms, TheCurrentNameIsAskedForAndStored) {
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Warm");
  EXPECT_EQ(effect.requests(), asksName());
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "Warm"));
  effect.currentProgram = 0;
  wrapper->getCurrentProgramName();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Soft", "", "Warm"));
}

// On purpose: the first name that is not empty stays.
TEST_F(VSTWrapperPrograms, AStoredNameStaysAndAnEmptyOneIsReplaced) {
  effect.setText(effGetProgramName, "");
  EXPECT_EQ(wrapper->getCurrentProgramName(), "");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", ""));
  effect.setText(effGetProgramName, "Warm");
  wrapper->getCurrentProgramName();
  effect.setText(effGetProgramName, "Warmer");
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Warmer");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "Warm"));
}

TEST_F(VSTWrapperPrograms, TheCurrentNameIsStoredBeyondTheLastProgramButNotBelowZero) {
  for (const VstInt32 current : {-1, INT_MIN}) {
    effect.answer(effGetProgram, current);
    EXPECT_EQ(wrapper->getCurrentProgramName(), "Warm");
  }
  EXPECT_THAT(wrapper->storedProgramNames, IsEmpty());
  effect.answer(effGetProgram, 4);
  wrapper->getCurrentProgramName();
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "", "", "Warm"));
}

TEST_F(VSTWrapperPrograms, TheCurrentNameIsTakenWhateverTheAnswerAlsoWithoutPrograms) {
  effect.setPrograms({});
  effect.setText(effGetProgramName, "Default");
  effect.answer(effGetProgramName, 0);
  EXPECT_EQ(wrapper->getCurrentProgramName(), "Default");
  EXPECT_EQ(wrapper->getProgramName(0), "Default");
}

TEST_F(VSTWrapperPrograms, NamesRunToTheEndOfABufferThatIsClearedEachTime) {
  effect.setUnterminatedText(effGetProgramName, 256, 'p');
  effect.setUnterminatedText(effGetProgramNameIndexed, 256, 'i');
  for (int i = 0; i < 2; ++i) {
    effect.forget();
    EXPECT_EQ(wrapper->getCurrentProgramName(), std::string(256, 'p'));
    EXPECT_EQ(wrapper->getProgramName(1), std::string(256, 'i'));
    EXPECT_EQ(effect.requests(), inOrder({asksName(), asksProgram(), {programNameIndexed(1)}}));
  }
  EXPECT_EQ(wrapper->storedProgramNames.at(2), std::string(256, 'p'));
}

// ---- Names by index

TEST_F(VSTWrapperPrograms, TheNameAtTheCurrentIndexIsTheCurrentName) {
  effect.namesProgramsByIndex = true;
  EXPECT_EQ(wrapper->getProgramName(2), "Warm");
  EXPECT_EQ(effect.requests(), inOrder({asksProgram(), asksName()}));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "", "Warm"));
}

struct IndexCase {
  std::string name;
  VstInt32 programs;
  VstInt32 current;
  int index;
  VstInt32 asked;
};

class VSTWrapperProgramNameByIndex : public VSTWrapperPrograms,
                                     public testing::WithParamInterface<IndexCase> {};

TEST_P(VSTWrapperProgramNameByIndex, IsAskedForAtTheClampedIndexAndElseLookedUpThere) {
  effect.aeffect.numPrograms = GetParam().programs;
  effect.currentProgram = GetParam().current;
  wrapper->storedProgramNames = {"0", "1", "2", "3", "4", "5"};
  EXPECT_EQ(wrapper->getProgramName(GetParam().index), std::to_string(GetParam().asked));
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetProgram), request(effGetProgramNameIndexed, GetParam().asked, -1)));
}

// On purpose: the upper bound is one past the last program. Compared with the current program as given, so
// the clamped index may be that of the current program.
INSTANTIATE_TEST_SUITE_P(
    At, VSTWrapperProgramNameByIndex,
    testing::Values(IndexCase{"Another", 4, 2, 1, 1}, IndexCase{"TheCount", 4, 2, 4, 4},
                    IndexCase{"OneBeyondTheCount", 4, 2, 5, 4}, IndexCase{"TheLargest", 4, 2, INT_MAX, 4},
                    IndexCase{"MinusOne", 4, 2, -1, 0}, IndexCase{"TheSmallest", 4, 2, INT_MIN, 0},
                    IndexCase{"MinusOneFromTheFirst", 4, 0, -1, 0}, IndexCase{"FiveOfNone", 0, 2, 5, 0}),
    host_tests::nameOfCase<IndexCase>);

TEST_F(VSTWrapperPrograms, AnyAnswerButZeroNamesByIndexAlsoWithAnEmptyName) {
  effect.setTextAt(effGetProgramNameIndexed, 1, "By index");
  effect.answer(effGetProgramNameIndexed, -1);
  wrapper->storedProgramNames = {"Stored 0", "Stored 1"};
  EXPECT_EQ(wrapper->getProgramName(1), "By index");
  EXPECT_EQ(wrapper->getProgramName(0), "");
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Stored 0", "Stored 1"));
}

TEST_F(VSTWrapperPrograms, TextAnsweredWithZeroGivesWayToTheStoredNameOrNone) {
  effect.setText(effGetProgramNameIndexed, "By index");
  effect.answer(effGetProgramNameIndexed, 0);
  wrapper->storedProgramNames = {"Stored 0"};
  EXPECT_EQ(wrapper->getProgramName(0), "Stored 0");
  EXPECT_EQ(wrapper->getProgramName(1), "");
  EXPECT_EQ(wrapper->getProgramName(4), "");
  EXPECT_THAT(effect.requestsOf(effSetProgram), IsEmpty());
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Stored 0"));
}

// ---- Collecting all names

class VSTWrapperStoredProgramNames : public host_tests::WrapperTest {
 protected:
  /// Three programs of two parameters, of which "Loud" (1) is the current one; they cannot be named by index.
  VSTWrapperStoredProgramNames() {
    resetPrograms();
    open();
    effect.currentProgram = 1;
  }

  void resetPrograms() {
    effect.setPrograms({{"Soft", {0.125f, 0.25f}}, {"Loud", {0.5f, 0.75f}}, {"Warm", {1.0f, 0.0f}}});
  }
};

TEST_F(VSTWrapperStoredProgramNames, AreCollectedByTheseRequests) {
  effect.setText(effGetProgramNameIndexed, "By index");
  effect.answer(effGetProgramNameIndexed, 0);
  wrapper->updateStoredProgramNames();
  const Requests byIndex = {programNameIndexed(0)};
  const Requests store = inOrder({asksName(), readsParameters(2)});
  const Requests restored = inOrder({keepsName(), readsParameters(2)});
  EXPECT_EQ(effect.requests(), inOrder({byIndex, asksProgram(), store,                   //
                                        selects(0), asksName(), selects(1), asksName(),  //
                                        selects(2), asksName(), selects(1), restored}));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("Soft", "Loud", "Warm"));
  EXPECT_EQ(wrapper->getProgramName(0), "Soft");
}

TEST_F(VSTWrapperStoredProgramNames, AreNotCollectedWithAnyAnswerButZero) {
  effect.answer(effGetProgramNameIndexed, -1);
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requests(), ElementsAre(programNameIndexed(0)));
}

// This plug-in forgets all edits whenever a program is selected.
TEST_F(VSTWrapperStoredProgramNames, AreCollectedWithoutLosingNameAndValuesOfTheCurrentProgram) {
  wrapper->setParameter(1, 0.875f);
  wrapper->changeProgramName(1, "Edited");
  effect.forget();
  effect.onRequest = [this](const Request& request) {
    if (request.kind == Request::Kind::kDispatch && request.opcode == effSetProgram) resetPrograms();
  };
  wrapper->updateStoredProgramNames();
  EXPECT_EQ(effect.currentProgram, 1);
  EXPECT_EQ(effect.program(1).name, "Edited");
  EXPECT_THAT(effect.program(1).parameters, ElementsAre(0.5f, 0.875f));
  EXPECT_THAT(effect.requestsOf(effSetProgramName), ElementsAre(setProgramName("Edited")));
  EXPECT_EQ(effect.requests().back(), setParameterTo(1, 0.875f));
}

TEST_F(VSTWrapperStoredProgramNames, AreCollectedAsFarAsThePluginSwitches) {
  effect.ignore(effSetProgram);
  wrapper->updateStoredProgramNames();
  EXPECT_THAT(effect.requestsOf(effSetProgram), ElementsAre(setProgram(0), setProgram(2)));
  EXPECT_THAT(wrapper->storedProgramNames, ElementsAre("", "Loud"));
}

TEST_F(VSTWrapperStoredProgramNames, FollowTheNumberOfProgramsAsItIsDuringTheWalk) {
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
