// SPDX-License-Identifier: MIT
// What a plug-in throws: from where it is caught, and which line tells of it.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"
#include "tests/shared/protocol_lines.h"
#include "tests/shared/sanitizer.h"

using testing::SizeIs;

namespace {

/// Where the sample throws, and what is printed up to there.
struct Place {
  std::string name;
  std::string place;
  std::string printed;
  std::string phase;  ///< In the failure line; empty when the program crashes for want of an instance.
};

const Place kPlaces[] = {
    {"StaticConstructor", "load", "", "create and initialize"},
    {"Entry", "entry", "", ""},
    {"Open", "dispatch:0", "", ""},
    {"Category", "dispatch:35", "", "create and initialize"},
    {"Description", "dispatch:58", beginningOfRun(1), "gather info"},
    {"ClassInfo", "dispatch:33", beginningOfRun(2), "inspect class info test"},
    {"PresetInfo", "dispatch:5", beginningOfRun(3), "inspect preset info test"},
    {"ParameterInfo", "dispatch:27", beginningOfRun(4), "inspect parameter info test"},
    {"SettingState", "dispatch:12", beginningOfRun(5), "test setting state"},
    {"Latency", "dispatch:52", beginningOfRun(6), "inspect latency test"},
    {"LatencyAgain", "dispatch:52:2", beginningOfRun(9), "inspect latency test"},
    {"CloseOfTheOldInstance", "dispatch:1", beginningOfRun(14), "delete, create and initialize"},
    {"SecondDescription", "dispatch:58:2", beginningOfRun(15), "gather info"},
};

struct Thrown {
  std::string name;
  std::string kind;
  std::string failure;  ///< What the failure line says behind the phase.
};

const Thrown kThrown[] = {
    {"Int", "throw_int", " failed 5\n"},
    {"RuntimeError", "throw_runtime_error", " failed, unknown error\n"},
    {"Struct", "throw_struct", " failed, unknown error\n"},
};

ProgramRun runFaulty(const std::string& kind, const std::string& place) {
  ProgramCall call;
  call.arguments = {samplePlugin("faulty")};
  call.environment = kNoLeakCheck;  // On purpose: an instance that could not be opened is not closed.
  call.environment["FAULT_KIND"] = kind;
  call.environment["FAULT_PLACE"] = place;
  return runVstTorture(call);
}

class ThrownFromAPlugin : public testing::TestWithParam<std::tuple<Place, Thrown>> {};

TEST_P(ThrownFromAPlugin, BecomesAFailureLine) {
  const auto& [place, thrown] = GetParam();
  const ProgramRun run = runFaulty(thrown.kind, place.place);
  if (place.phase.empty()) {
    EXPECT_EQ(run.standardOutput, place.printed + "unexpected exit");
    EXPECT_EQ(run.end, "exit status 7");
  } else {
    EXPECT_EQ(run.standardOutput, place.printed + '!' + place.phase + thrown.failure);
    EXPECT_EQ(run.end, "exit status 3");
  }
  EXPECT_EQ(run.standardError, "");
}

INSTANTIATE_TEST_SUITE_P(Everywhere, ThrownFromAPlugin,
                         testing::Combine(testing::ValuesIn(kPlaces), testing::ValuesIn(kThrown)),
                         [](const auto& instance) {
                           return std::get<0>(instance.param).name + std::get<1>(instance.param).name;
                         });

class ThrownByAParameter : public testing::TestWithParam<Thrown> {};

// On purpose: the value then counts as 0, or as set.
TEST_P(ThrownByAParameter, DoesNotStopTheRun) {
  for (const char* place : {"getParameter", "setParameter"}) {
    const ProgramRun run = runFaulty(GetParam().kind, place);
    std::vector<std::string> actual = lines(run.standardOutput);
    actual.push_back(run.end);
    EXPECT_TRUE(matchesGolden("well_behaved_effect", actual)) << place;
  }
}

INSTANTIATE_TEST_SUITE_P(Kinds, ThrownByAParameter, testing::ValuesIn(kThrown),
                         [](const auto& instance) { return instance.param.name; });

class ThrownByTheLastClose : public testing::TestWithParam<Thrown> {};

// The phase is still that of the last test drawn.
TEST_P(ThrownByTheLastClose, NamesTheLastTest) {
  const ProgramRun run = runFaulty(GetParam().kind, "dispatch:1:2");
  const std::vector<std::string> printed = lines(run.standardOutput);
  ASSERT_THAT(printed, SizeIs(67));
  const std::string last = printed[65].substr(4);
  const std::string phase = last == "testing setting states" ? "test setting state" : last + " test";
  EXPECT_EQ(printed[66] + '\n', '!' + phase + GetParam().failure);
  EXPECT_EQ(run.end, "exit status 3");
}

INSTANTIATE_TEST_SUITE_P(Kinds, ThrownByTheLastClose, testing::ValuesIn(kThrown),
                         [](const auto& instance) { return instance.param.name; });

}  // namespace
