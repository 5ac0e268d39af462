// SPDX-License-Identifier: MIT
// What the host answers to a plug-in, asked from a real shared object.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/protocol.h"

using testing::ElementsAre;

namespace {

/// The answers that the plug-in got in one place, without the place in front of each.
struct Round {
  std::string place;
  std::vector<std::string> answers;
};

/// A run in which the sample writes the answers to standard output.
std::vector<Round> rounds(const std::map<std::string, std::string>& environment) {
  ProgramCall call;
  call.arguments = {samplePlugin("asks_host")};
  call.environment = environment;
  call.environment["ASKS_HOST_LOG"] = "/dev/stdout";
  const ProgramRun run = runVstTorture(call);
  EXPECT_EQ(run.end, "exit status 0");
  std::vector<Round> all;
  for (const Section& section : sections(run.standardOutput)) {
    for (const std::string& line : section.pluginLines) {
      const std::size_t blank = line.find(' ');
      const std::string answer = line.substr(blank + 1);
      if (answer == "0 answers 0") all.push_back({line.substr(0, blank), {}});  // The first question of each.
      if (all.empty() || line.substr(0, blank) != all.back().place) {
        ADD_FAILURE() << "not expected here: " << line;
      } else {
        all.back().answers.push_back(answer);
      }
    }
  }
  return all;
}

struct Locale {
  std::string name;
  std::map<std::string, std::string> environment;
  std::string language;  ///< The answer to audioMasterGetLanguage (38).
};

class HostCallback : public testing::TestWithParam<Locale> {};

TEST_P(HostCallback, AnswersTheSameInEveryPlaceExceptForTheLanguage) {
  std::vector<std::string> places;
  for (Round& round : rounds(GetParam().environment)) {
    places.push_back(round.place);
    for (std::string& line : round.answers) {
      if (line == "38 answers " + GetParam().language) line = "38 answers the user's language";
    }
    EXPECT_TRUE(matchesGolden("host_callback", round.answers)) << round.place;
  }
  EXPECT_THAT(places, ElementsAre("entry", "open", "entry", "open", "close", "close"));
}

INSTANTIATE_TEST_SUITE_P(
    Locales, HostCallback,
    testing::Values(Locale{"Japanese", {{"LC_ALL", "ja_JP.UTF-8"}}, "6"},
                    Locale{"FrenchMessages", {{"LC_ALL", ""}, {"LC_MESSAGES", "fr_CA"}}, "3"}),
    [](const auto& instance) { return instance.param.name; });

}  // namespace
