// SPDX-License-Identifier: MIT
// Every request that a run makes of a plug-in, and between which lines of the program.
//
// The recording sample writes each request to the program's standard output, so it follows the line of
// the step that made it. The golden files hold the conversation of the steps in fixed order; a step that
// makes the same requests as an earlier one is one line there. The requests of a drawn test must be those of
// the same test in the fixed order. Two tests depend on the current program, and the fixed order runs them on
// the last program only: until "inspect preset info" is drawn, which selects the last program, their requests
// are compared with a golden file for the first program.
#include <algorithm>
#include <map>

#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/protocol.h"
#include "tests/shared/sanitizer.h"

using testing::ElementsAreArray;

namespace {

using Lines = std::vector<std::string>;

constexpr const char* kPresetTest = "inspect preset info";
constexpr const char* kTestsOfTheCurrentProgram[] = {"inspect parameter info", "testing setting states"};

bool dependsOnTheCurrentProgram(const std::string& test) {
  return std::find(std::begin(kTestsOfTheCurrentProgram), std::end(kTestsOfTheCurrentProgram), test) !=
         std::end(kTestsOfTheCurrentProgram);
}

/// One step with its requests, each without the number of the instance in front.
struct Step {
  int number;
  std::string test;
  Lines requests;
};

struct Conversation {
  Lines golden;  ///< In the form of the golden file.
  std::vector<Step> ordered;
  std::vector<Step> drawn;
};

/// The line that replaces the requests of `step` in a golden file when an earlier step makes the same; empty
/// when none does.
std::string earlierStep(const std::vector<Step>& steps, const Step& step, char instance) {
  for (const Step& earlier : steps) {
    if (!step.requests.empty() && earlier.requests == step.requests) {
      return std::string(1, instance) + " as in step " + std::to_string(earlier.number);
    }
  }
  return "";
}

/// Steps 1 to 13 must be made of instance 1, steps 15 and later of instance 2.
Conversation conversationOf(const ProgramRun& run) {
  Conversation conversation;
  Lines& golden = conversation.golden;
  for (const Section& section : sections(run.standardOutput)) {
    const int number = section.line.number;
    if (!section.line.whole.empty()) golden.push_back(section.line.whole);
    if (section.line.kind != ProtocolLine::Kind::kStep || number == 14) {
      golden.insert(golden.end(), section.pluginLines.begin(), section.pluginLines.end());
      continue;
    }
    const char instance = number < 14 ? '1' : '2';
    Step step{number, section.line.text, {}};
    Lines close;  // Made after the last step, and no part of it.
    for (const std::string& line : section.pluginLines) {
      EXPECT_EQ(line.substr(0, 2), std::string(1, instance) + ' ') << number << ": " << line;
      if (line.find(" dispatch 1 index") == 1) {
        close.push_back(line);
      } else {
        step.requests.push_back(line.substr(2));
      }
    }
    if (number < 16) {
      const std::string earlier = earlierStep(conversation.ordered, step, instance);
      if (!earlier.empty()) golden.push_back(earlier);
      for (std::size_t i = 0; earlier.empty() && i < step.requests.size(); ++i) {
        golden.push_back(std::string(1, instance) + ' ' + step.requests[i]);
      }
    }
    golden.insert(golden.end(), close.begin(), close.end());
    (number < 16 ? conversation.ordered : conversation.drawn).push_back(step);
  }
  golden.push_back(run.end);
  return conversation;
}

/// Runs the recording sample, whose state is either parameter values or chunks.
class ConversationOfARun : public testing::TestWithParam<const char*> {
 protected:
  static Conversation run() {
    ProgramCall call;
    call.arguments = {samplePlugin("records_requests")};
    call.environment = {{"RECORDS_REQUESTS_LOG", "/dev/stdout"},
                        {"RECORDS_REQUESTS_CHUNKS", std::string(GetParam()) == "chunks" ? "1" : "0"}};
    return conversationOf(runVstTorture(call));
  }

  static std::string goldenName() { return std::string("conversation_") + GetParam(); }
  static std::string firstProgramName() { return goldenName() + "_on_first_program"; }

  /// The requests of a test on the last program, which is selected from step 3 on.
  static Lines onLastProgram(const Conversation& conversation, const std::string& test) {
    const auto step = std::find_if(conversation.ordered.rbegin(), conversation.ordered.rend(),
                                   [&](const Step& candidate) { return candidate.test == test; });
    return step->requests;
  }

  static Lines onFirstProgram(const Conversation& conversation, const std::string& test) {
    if (test == kPresetTest) return conversation.ordered.at(2).requests;
    return dependsOnTheCurrentProgram(test) ? firstProgramGolden(test) : onLastProgram(conversation, test);
  }

  /// The lines of the golden file between the name of the test and the next name.
  static Lines firstProgramGolden(const std::string& test) {
    Lines found;
    bool inside = false;
    for (const std::string& line : goldenLines(firstProgramName())) {
      if (dependsOnTheCurrentProgram(line)) {
        inside = line == test;
      } else if (inside) {
        found.push_back(line);
      }
    }
    return found;
  }

  /// Repeats the run until each of the tests was drawn while the first program was selected, and writes their
  /// requests.
  static void updateFirstProgram() {
    std::map<std::string, Lines> found;
    while (found.size() < std::size(kTestsOfTheCurrentProgram)) {
      for (const Step& step : run().drawn) {
        if (step.test == kPresetTest) break;
        if (dependsOnTheCurrentProgram(step.test)) found.emplace(step.test, step.requests);
      }
    }
    Lines golden;
    for (const auto& [test, requests] : found) {
      golden.push_back(test);
      golden.insert(golden.end(), requests.begin(), requests.end());
    }
    writeGolden(firstProgramName(), golden);
  }
};

TEST_P(ConversationOfARun, IsTheGoldenOneAndDrawnTestsAskWhatTheOrderedOnesAsk) {
  if (goldenIsToBeUpdated()) updateFirstProgram();
  for (int i = 0; i < 5; ++i) {
    const Conversation conversation = run();
    ASSERT_TRUE(matchesGolden(goldenName(), conversation.golden));
    ASSERT_EQ(conversation.drawn.size(), 50u);
    bool isOnLast = false;
    for (const Step& step : conversation.drawn) {
      const Lines expected =
          isOnLast ? onLastProgram(conversation, step.test) : onFirstProgram(conversation, step.test);
      EXPECT_EQ(firstDifference(expected, step.requests), "") << step.number << ", " << step.test;
      EXPECT_FALSE(expected.empty());
      isOnLast = isOnLast || step.test == kPresetTest;
    }
  }
}

INSTANTIATE_TEST_SUITE_P(States, ConversationOfARun, testing::Values("parameters", "chunks"));

struct Fault {
  std::string name;
  std::string kind;
  std::string place;
  Lines lastLines;  ///< All lines from the first of these on, then how the run ended.
};

/// Runs with the faulty sample, which writes its requests to the program's standard output.
class RequestsAfterAFault : public testing::TestWithParam<Fault> {};

TEST_P(RequestsAfterAFault, AreTheExpectedOnes) {
  ProgramCall call = faultyPlugin(GetParam().kind, GetParam().place);
  call.environment["FAULT_LOG"] = "/dev/stdout";
  // On purpose: an instance that could not be opened is not closed.
  call.environment.insert(kNoLeakCheck.begin(), kNoLeakCheck.end());
  Lines all = linesAndEnd(runVstTorture(call));
  all.erase(all.begin(), std::find(all.begin(), all.end(), GetParam().lastLines.front()));
  EXPECT_THAT(all, ElementsAreArray(GetParam().lastLines));
}

INSTANTIATE_TEST_SUITE_P(
    Faults, RequestsAfterAFault,
    testing::Values(Fault{"TheCloseAndThenTheFailureLine",
                          "throw_int",
                          "dispatch:52",
                          {"6, inspect latency", "request 52", "request 1", "!inspect latency test failed 5",
                           "exit status 3"}},
                    Fault{"SwitchingOffWhatIsOn",
                          "throw_struct",
                          "dispatch:44",
                          {"request 44", "request 12", "request 1",
                           "!test setting state failed, unknown error", "exit status 3"}},
                    Fault{"TheCloseOfAnInstanceWithoutCategory",
                          "throw_int",
                          "dispatch:35",
                          {"request 35", "request 1", "!create and initialize failed 5", "exit status 3"}},
                    Fault{"TheCloseOfTheNewInstanceWhenThatOfTheOldOneFails",
                          "throw_int",
                          "dispatch:1",
                          {"request 1", "request 1", "!delete, create and initialize failed 5",
                           "exit status 3"}},
                    Fault{"TheCloseOfTheNewInstanceWhenItsDescriptionFails",
                          "throw_int",
                          "dispatch:58:2",
                          {"15, test gathering info", "request 45", "request 47", "request 58", "request 1",
                           "!gather info failed 5", "exit status 3"}},
                    Fault{"NoCloseOfAnInstanceThatFailedToOpen",
                          "throw_int",
                          "dispatch:0",
                          {"request 0", "unexpected exit", "exit status 7"}},
                    Fault{"NoRequestAfterACrash",
                          "null_store",
                          "dispatch:52",
                          {"6, inspect latency", "request 52", "unexpected exit", "exit status 7"}}),
    [](const auto& instance) { return instance.param.name; });

}  // namespace
