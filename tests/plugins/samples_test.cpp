// SPDX-License-Identifier: MIT
// Each sample does the one thing that it is for, in a host that is a process of its own.
#include <fstream>
#include <iterator>

#include <gmock/gmock.h>

#include "tests/plugins/loaded_plugin.h"
#include "tests/shared/program_run.h"
#include "tests/shared/temporary_directory.h"

using testing::Contains;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::SizeIs;

namespace {

ProgramRun drive(const std::string& plugin, ProgramCall call = {}) {
  call.arguments.insert(call.arguments.begin(), samplePlugin(plugin));
  return runProgram(TINY_HOST, call);
}

/// The lines that the sample writes to the file whose name it finds in `variable`.
std::vector<std::string> logOf(const std::string& plugin, const std::string& variable) {
  const TemporaryDirectory folder;
  const std::string path = (folder.path() / "log").string();
  ProgramCall call;
  call.environment = {{variable, path}};
  EXPECT_EQ(drive(plugin, call).end, "exit status 0");
  std::ifstream log(path);
  return lines({std::istreambuf_iterator<char>(log), {}});
}

struct Exports {
  std::string plugin;
  std::vector<std::string> names;
};

class ExportedNames : public testing::TestWithParam<Exports> {};

TEST_P(ExportedNames, AreTheEntryPointsOnly) {
  ProgramCall call;
  call.arguments = {"-D", "--defined-only", "--format=posix", samplePlugin(GetParam().plugin)};
  const ProgramRun run = runProgram(PROGRAM_NM, call);
  ASSERT_EQ(run.end, "exit status 0") << run.standardError;
  std::vector<std::string> names;
  for (const std::string& line : lines(run.standardOutput)) names.push_back(line.substr(0, line.find(' ')));
  EXPECT_EQ(names, GetParam().names);
}

INSTANTIATE_TEST_SUITE_P(
    Samples, ExportedNames,
    testing::Values(Exports{"older_entry", {"main"}}, Exports{"main_macho_entry", {"main_macho"}},
                    Exports{"both_entries", {"VSTPluginMain", "main_macho"}}, Exports{"no_entry", {}},
                    Exports{"well_behaved_effect", {"VSTPluginMain"}}, Exports{"faulty", {"VSTPluginMain"}}),
    [](const auto& instance) { return instance.param.plugin; });

struct Behaviour {
  std::string plugin;
  std::string entry;
  std::string lastLine;
  std::string end;
};

class SamplePlugin : public testing::TestWithParam<Behaviour> {};

TEST_P(SamplePlugin, DoesItsOneThing) {
  ProgramCall call;
  call.arguments = {GetParam().entry};
  const ProgramRun run = drive(GetParam().plugin, call);
  EXPECT_EQ(run.end, GetParam().end);
  ASSERT_FALSE(lines(run.standardOutput).empty());
  EXPECT_EQ(lines(run.standardOutput).back(), GetParam().lastLine);
}

// Samples without a fault are tested by the passing runs of end_to_end_tests.
INSTANTIATE_TEST_SUITE_P(
    Samples, SamplePlugin,
    testing::Values(Behaviour{"both_entries", "main_macho", "no instance", "exit status 3"},
                    Behaviour{"null_instance", "VSTPluginMain", "no instance", "exit status 3"},
                    Behaviour{"entry_throws", "VSTPluginMain",
                              "caught exception the entry point fails on purpose", "exit status 9"},
                    Behaviour{"open_crashes", "VSTPluginMain", "made 1332757362", "signal 11"},
                    Behaviour{"exits_on_open", "VSTPluginMain", "made 1332757880", "exit status 0"},
                    Behaviour{"exits_in_test", "VSTPluginMain", "text of 0", "exit status 42"},
                    Behaviour{"undefined_symbol", "VSTPluginMain", "not loaded", "exit status 1"}),
    [](const auto& instance) { return instance.param.plugin; });

TEST(Shell, MakesTheChildThatTheHostNames) {
  const std::map<std::string, std::string> made = {{"0", "made 1399350636"},
                                                   {"1001", "made 1001"},
                                                   {"1234", "made 1234"},
                                                   {"-7", "made -7"},
                                                   {"5", "no instance"}};
  for (const auto& [child, line] : made) {
    ProgramCall call;
    call.arguments = {"VSTPluginMain", child};
    EXPECT_THAT(lines(drive("shell", call).standardOutput), Contains(line)) << child;
  }
}

TEST(Shell, ListsItsChildrenAgainAfterTheLast) {
  AEffect& shell = *sample_plugins_test::LoadedPlugin("shell").callEntry();
  EXPECT_EQ(dispatch(shell, effGetPlugCategory), 10);
  for (int round = 0; round < 2; ++round) {
    std::string listed;
    char name[114] = {};
    while (const VstIntPtr child = dispatch(shell, effShellGetNextPlugin, 0, 0, name)) {
      listed += std::to_string(child) + ' ' + name + ", ";
    }
    EXPECT_EQ(listed, "1001 First child, 1234 Second child, -7 Third child, ");
  }
  dispatch(shell, effClose);
}

TEST(AsksHost, WritesEveryAnswerInThreePlaces) {
  const std::vector<std::string> answers = logOf("asks_host", "ASKS_HOST_LOG");
  EXPECT_THAT(answers, SizeIs(3 * (61 + 2 + 14 * 5 + 1 + 5 + 1)));
  for (const std::string place : {"entry", "open", "close"}) {
    for (const std::string answer :
         {"1 answers 2400", "32 answers 0, writes 5 bytes \"HOST\"",
          "33 answers 0, writes 64 bytes \"Tiny host\"", "-1 answers 0", "canDo \"sizeWindow\" answers 1",
          "canDo \"sizeWindows\" answers 0",
          "service \"niduGetTrackSampleForCurBlock\" answers a function that answers 1.5",
          "service \"niduGetTrackSampleForCurBloc\" answers 0"}) {
      EXPECT_THAT(answers, Contains(place + ' ' + answer));
    }
  }
}

TEST(RecordsRequests, WritesEverythingThatTheHostDoes) {
  EXPECT_THAT(logOf("records_requests", "RECORDS_REQUESTS_LOG"),
              ElementsAre("1 entry", "1 dispatch 0 index 0 value 0 ptr null opt 0",
                          "1 dispatch 45 index 0 value 0 ptr buffer zero opt 0",
                          "1 dispatch 7 index 0 value 0 ptr buffer zero opt 0",
                          "1 getParameter 0 answers 0.25", "1 setParameter 0 value 0.25",
                          "1 setParameter 0 value 0.75", "1 dispatch 52 index 0 value 0 ptr null opt 0",
                          "1 dispatch 1 index 0 value 0 ptr null opt 0"));
}

}  // namespace
