// SPDX-License-Identifier: MIT
// What a plug-in hears from its host, asked from a real shared object.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"

using testing::Contains;
using testing::ElementsAre;

namespace {

/// The answers of one round of questions, without the place where it was asked.
struct Round {
  std::string place;
  std::vector<std::string> answers;
};

/// A run in which the sample writes its answers between the lines of the program.
std::vector<Round> rounds(const std::map<std::string, std::string>& environment) {
  ProgramCall call;
  call.arguments = {samplePlugin("asks_host")};
  call.environment = environment;
  call.environment["ASKS_HOST_LOG"] = "/dev/stdout";
  const ProgramRun run = runVstTorture(call);
  EXPECT_EQ(run.end, "exit status 0");
  std::vector<Round> all;
  bool goesOn = false;
  for (const std::string& line : lines(run.standardOutput)) {
    const std::string place = line.substr(0, line.find(' '));
    const bool isAnswer = place == "entry" || place == "open" || place == "close";
    if (isAnswer && (!goesOn || all.back().place != place || line.substr(place.size()) == " 0 answers 0")) {
      all.push_back({place, {}});
    }
    if (isAnswer) all.back().answers.push_back(line.substr(place.size() + 1));
    goesOn = isAnswer;
  }
  return all;
}

TEST(HostCallback, AnswersTheSameInEveryPlaceAndForEveryInstance) {
  std::vector<std::string> places;
  for (const Round& round : rounds({{"LC_ALL", "C"}})) {
    places.push_back(round.place);
    EXPECT_TRUE(matchesGolden("host_callback", round.answers)) << round.place;
  }
  EXPECT_THAT(places, ElementsAre("entry", "open", "entry", "open", "close", "close"));
}

// A plug-in that got half the address would have crashed the program in the call.
TEST(HostCallback, HandsOutAFunctionThatCanBeCalled) {
  const std::vector<Round> all = rounds({});
  ASSERT_FALSE(all.empty());
  EXPECT_THAT(all[0].answers,
              Contains("service \"niduGetTrackSampleForCurBlock\" answers a function that answers 0"));
}

struct Language {
  std::string name;
  std::map<std::string, std::string> environment;
  std::string answer;
};

class UsersLanguage : public testing::TestWithParam<Language> {};

TEST_P(UsersLanguage, IsTheOnlyAnswerThatDependsOnTheLocale) {
  std::vector<std::string> expected = goldenLines("host_callback");
  for (std::string& line : expected) {
    if (line == "38 answers 1") line = "38 answers " + GetParam().answer;
  }
  const std::vector<Round> all = rounds(GetParam().environment);
  EXPECT_EQ(all.size(), 6u);
  for (const Round& round : all) EXPECT_EQ(firstDifference(expected, round.answers), "") << round.place;
}

INSTANTIATE_TEST_SUITE_P(
    Locales, UsersLanguage,
    testing::Values(Language{"Japanese", {{"LC_ALL", "ja_JP.UTF-8"}}, "6"},
                    Language{"German", {{"LC_ALL", "de"}}, "2"},
                    Language{"Brazilian", {{"LC_ALL", "pt_BR"}}, "1"}, Language{"C", {{"LC_ALL", "C"}}, "1"},
                    Language{"FrenchMessages", {{"LC_ALL", ""}, {"LC_MESSAGES", "fr_CA"}}, "3"},
                    Language{"Italian", {{"LC_ALL", ""}, {"LANG", "it_IT@euro"}}, "4"},
                    Language{"Spanish", {{"LC_ALL", "es_MX"}, {"LANG", "de_DE"}}, "5"}),
    [](const auto& instance) { return instance.param.name; });

}  // namespace
