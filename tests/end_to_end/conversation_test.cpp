// SPDX-License-Identifier: MIT
// What a plug-in is asked, request by request, between which lines: the whole conversation of a run.
//
// The recording sample writes the requests to the program's own standard output, so each stands behind the
// step line that announced it. The random pass is checked block by block: the requests of a drawn test are
// those of the same test in the ordered pass, as long as the plug-in is in the same state. Until the first
// "inspect preset info" of the second instance, which leaves the plug-in on its last program, two tests go
// otherwise; their requests have a golden file of their own.
#include <algorithm>
#include <map>
#include <optional>

#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"
#include "tests/shared/sanitizer.h"

using testing::ElementsAre;

namespace {

using Lines = std::vector<std::string>;

constexpr const char* kPresetTest = "inspect preset info";
constexpr const char* kStateDependentTests[] = {"inspect parameter info", "testing setting states"};

/// One step with the requests that follow it, without the instance's number.
struct Step {
  int number;
  std::string text;
  Lines requests;
};

struct Conversation {
  Lines frame;  ///< All lines, but of the drawn tests only their step lines.
  std::vector<Step> ordered;
  std::vector<Step> drawn;
};

std::optional<Step> stepOf(const std::string& line) {
  const std::size_t comma = line.find(", ");
  if (comma == std::string::npos || line.find_first_not_of("0123456789") != comma) return std::nullopt;
  return Step{std::stoi(line), line.substr(comma + 2), {}};
}

Conversation parse(const Lines& all) {
  Conversation conversation;
  std::vector<Step>* steps = nullptr;
  for (const std::string& line : all) {
    const bool isClose = line.find(" dispatch 1 index") == 1;
    if (const std::optional<Step> step = stepOf(line)) {
      steps = step->number >= 16 ? &conversation.drawn : &conversation.ordered;
      steps->push_back(*step);
    } else if (steps != nullptr && !isClose) {
      steps->back().requests.push_back(line.substr(line.find(' ') + 1));
      if (steps == &conversation.drawn) {
        EXPECT_EQ(line.substr(0, 2), "2 ") << line;
        continue;
      }
    }
    conversation.frame.push_back(line);
  }
  return conversation;
}

/// Plays the run through in one of the sample's two states.
class ConversationOfARun : public testing::TestWithParam<const char*> {
 protected:
  static Conversation run() {
    ProgramCall call;
    call.arguments = {samplePlugin("records_requests")};
    call.environment = {{"RECORDS_REQUESTS_LOG", "/dev/stdout"},
                        {"RECORDS_REQUESTS_CHUNKS", std::string(GetParam()) == "chunks" ? "1" : "0"}};
    const ProgramRun run = runVstTorture(call);
    Lines all = lines(run.standardOutput);
    Conversation conversation = parse(all);
    conversation.frame.push_back(run.end);
    return conversation;
  }

  static std::string goldenName() { return std::string("conversation_") + GetParam(); }
  static std::string firstProgramName() { return goldenName() + "_on_first_program"; }

  /// The requests of the last step of this text in the ordered pass, which ran on the last program.
  static Lines onLastProgram(const Conversation& conversation, const std::string& text) {
    Lines requests;
    for (const Step& step : conversation.ordered) {
      if (step.text == text && step.number > 7) requests = step.requests;
    }
    return requests;
  }

  static Lines onFirstProgram(const Conversation& conversation, const std::string& text) {
    if (text == kPresetTest) return conversation.ordered.at(2).requests;
    for (const char* dependent : kStateDependentTests) {
      if (text == dependent) return block(goldenLines(firstProgramName()), text);
    }
    return onLastProgram(conversation, text);
  }

  /// The lines behind the one that reads `heading`, up to the next that is no request.
  static Lines block(const Lines& all, const std::string& heading) {
    Lines found;
    bool inside = false;
    for (const std::string& line : all) {
      const bool isRequest =
          line.find("dispatch ") == 0 || line.find("getParameter ") == 0 || line.find("setParameter ") == 0;
      if (!isRequest) inside = line == heading;
      if (isRequest && inside) found.push_back(line);
    }
    return found;
  }

  /// Runs until both tests that depend on the program were drawn on the first one, and writes what they
  /// asked.
  static void updateFirstProgram() {
    std::map<std::string, Lines> found;
    while (found.size() < std::size(kStateDependentTests)) {
      for (const Step& step : run().drawn) {
        if (step.text == kPresetTest) break;
        for (const char* text : kStateDependentTests) {
          if (step.text == text && found.find(text) == found.end()) found[text] = step.requests;
        }
        if (!found.empty() && step.text == "testing setting states") break;
      }
    }
    Lines golden;
    for (const auto& [text, requests] : found) {
      golden.push_back(text);
      golden.insert(golden.end(), requests.begin(), requests.end());
    }
    writeGolden(firstProgramName(), golden);
  }
};

TEST_P(ConversationOfARun, IsTheGoldenOneAndDrawnTestsAskWhatTheOrderedOnesAsk) {
  if (goldenIsToBeUpdated()) updateFirstProgram();
  for (int i = 0; i < 5; ++i) {
    const Conversation conversation = run();
    ASSERT_TRUE(matchesGolden(goldenName(), conversation.frame));
    ASSERT_EQ(conversation.ordered.size(), 15u);
    ASSERT_EQ(conversation.drawn.size(), 50u);
    bool onLast = false;
    for (const Step& step : conversation.drawn) {
      const Lines expected =
          onLast ? onLastProgram(conversation, step.text) : onFirstProgram(conversation, step.text);
      EXPECT_EQ(firstDifference(expected, step.requests), "") << step.number << ", " << step.text;
      EXPECT_FALSE(expected.empty());
      onLast = onLast || step.text == kPresetTest;
    }
  }
}

TEST_P(ConversationOfARun, OpensTheNewInstanceBeforeTheOldOneIsClosed) {
  const Lines frame = run().frame;
  const auto at = [&](const std::string& line) {
    return std::find(frame.begin(), frame.end(), line) - frame.begin();
  };
  const auto entry = at("2 entry");
  const auto open = at("2 dispatch 0 index 0 value 0 ptr null opt 0");
  const auto close = at("1 dispatch 1 index 0 value 0 ptr null opt 0");
  EXPECT_LT(at("14, initialize"), entry);
  EXPECT_LT(entry, open);
  EXPECT_LT(open, close);
  EXPECT_LT(close, at("15, test gathering info"));
}

INSTANTIATE_TEST_SUITE_P(States, ConversationOfARun, testing::Values("parameters", "chunks"));

/// A run of the faulty sample, which tells its requests, from the line `first` to the end.
Lines faultyFrom(const std::string& first, const std::string& kind, const std::string& place) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  call.environment = kNoLeakCheck;  // On purpose: an instance that could not be opened is not closed.
  call.environment["FAULT_KIND"] = kind;
  call.environment["FAULT_PLACE"] = place;
  call.environment["FAULT_LOG"] = "/dev/stdout";
  const ProgramRun run = runVstTorture(call);
  Lines all = lines(run.standardOutput);
  all.erase(all.begin(), std::find(all.begin(), all.end(), first));
  all.push_back(run.end);
  return all;
}

TEST(ConversationAfterAFailure, IsTheCloseAndThenTheFailureLine) {
  EXPECT_THAT(faultyFrom("6, inspect latency", "throw_int", "dispatch:52"),
              ElementsAre("6, inspect latency", "request 52", "request 1", "!inspect latency test failed 5",
                          "exit status 3"));
}

TEST(ConversationAfterAFailure, BeginsWithSwitchingOffWhatIsOn) {
  EXPECT_THAT(faultyFrom("request 44", "throw_struct", "dispatch:44"),
              ElementsAre("request 44", "request 12", "request 1",
                          "!test setting state failed, unknown error", "exit status 3"));
}

TEST(ConversationAfterAFailure, ClosesTheInstanceWhoseCategoryCouldNotBeAsked) {
  EXPECT_THAT(faultyFrom("request 35", "throw_int", "dispatch:35"),
              ElementsAre("request 35", "request 1", "!create and initialize failed 5", "exit status 3"));
}

TEST(ConversationAfterAFailure, ClosesTheNewInstanceWhenClosingTheOldOneFails) {
  EXPECT_THAT(
      faultyFrom("request 1", "throw_int", "dispatch:1"),
      ElementsAre("request 1", "request 1", "!delete, create and initialize failed 5", "exit status 3"));
}

// The constructor that failed leaves nothing that could be closed.
TEST(ConversationAfterAFailure, IsNothingWhenOpeningFailed) {
  EXPECT_THAT(faultyFrom("request 0", "throw_int", "dispatch:0"),
              ElementsAre("request 0", "unexpected exit", "exit status 7"));
}

TEST(ConversationAfterACrash, IsNothing) {
  EXPECT_THAT(faultyFrom("6, inspect latency", "null_store", "dispatch:52"),
              ElementsAre("6, inspect latency", "request 52", "unexpected exit", "exit status 7"));
}

}  // namespace
