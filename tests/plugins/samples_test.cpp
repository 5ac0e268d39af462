// SPDX-License-Identifier: MIT
// Each sample does its one thing, in a host that is a process of its own.
#include <fstream>
#include <iterator>

#include <gmock/gmock.h>

#include "tests/shared/program_run.h"
#include "tests/shared/temporary_directory.h"

using testing::AllOf;
using testing::Contains;
using testing::ElementsAre;
using testing::EndsWith;
using testing::HasSubstr;
using testing::SizeIs;
using testing::StartsWith;

namespace {

ProgramRun drive(const std::string& plugin, ProgramCall call = {}) {
  call.arguments.insert(call.arguments.begin(), samplePlugin(plugin));
  return runProgram(TINY_HOST, call);
}

ProgramRun driveChild(const std::string& child) {
  ProgramCall call;
  call.arguments = {"VSTPluginMain", child};
  return drive("shell", call);
}

std::string textOfFile(const std::filesystem::path& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

struct Exports {
  std::string plugin;
  std::vector<std::string> names;
};

class ExportedNames : public testing::TestWithParam<Exports> {};

TEST_P(ExportedNames, AreTheEntryPointsAndNoMore) {
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
    testing::Values(Exports{"well_behaved_effect", {"VSTPluginMain"}},
                    Exports{"well_behaved_instrument", {"VSTPluginMain"}},
                    Exports{"shell", {"VSTPluginMain"}}, Exports{"older_entry", {"main"}},
                    Exports{"main_macho_entry", {"main_macho"}},
                    Exports{"both_entries", {"VSTPluginMain", "main_macho"}}, Exports{"no_entry", {}},
                    Exports{"null_instance", {"VSTPluginMain"}}, Exports{"entry_throws", {"VSTPluginMain"}},
                    Exports{"asks_host", {"VSTPluginMain"}}, Exports{"records_requests", {"VSTPluginMain"}},
                    Exports{"undefined_symbol", {"VSTPluginMain"}}, Exports{"faulty", {"VSTPluginMain"}}),
    [](const auto& instance) { return instance.param.plugin; });

struct Behaviour {
  std::string name;
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

INSTANTIATE_TEST_SUITE_P(
    Samples, SamplePlugin,
    testing::Values(
        Behaviour{"Effect", "well_behaved_effect", "VSTPluginMain", "closed", "exit status 0"},
        Behaviour{"Instrument", "well_behaved_instrument", "VSTPluginMain", "closed", "exit status 0"},
        Behaviour{"Shell", "shell", "VSTPluginMain", "closed", "exit status 0"},
        Behaviour{"OlderEntry", "older_entry", "main", "closed", "exit status 0"},
        Behaviour{"OlderEntryAlone", "older_entry", "VSTPluginMain", "no entry", "exit status 2"},
        Behaviour{"MachoEntry", "main_macho_entry", "main_macho", "closed", "exit status 0"},
        Behaviour{"BothEntriesFirst", "both_entries", "VSTPluginMain", "closed", "exit status 0"},
        Behaviour{"BothEntriesSecond", "both_entries", "main_macho", "no instance", "exit status 3"},
        Behaviour{"NoEntry", "no_entry", "VSTPluginMain", "no entry", "exit status 2"},
        Behaviour{"NullInstance", "null_instance", "VSTPluginMain", "no instance", "exit status 3"},
        Behaviour{"EntryThrowsInt", "entry_throws_int", "VSTPluginMain", "caught int 5", "exit status 9"},
        Behaviour{"EntryThrows", "entry_throws", "VSTPluginMain",
                  "caught exception the entry point fails on purpose", "exit status 9"},
        Behaviour{"OpenCrashes", "open_crashes", "VSTPluginMain", "made 1332757362", "signal 11"},
        Behaviour{"OpenThrowsInt", "open_throws_int", "VSTPluginMain", "caught int 5", "exit status 9"},
        Behaviour{"OpenThrows", "open_throws", "VSTPluginMain", "caught exception opening fails on purpose",
                  "exit status 9"},
        Behaviour{"ExitsOnOpen", "exits_on_open", "VSTPluginMain", "made 1332757880", "exit status 0"},
        Behaviour{"ExitsInTest", "exits_in_test", "VSTPluginMain", "text of 0", "exit status 42"},
        Behaviour{"UndefinedSymbol", "undefined_symbol", "VSTPluginMain", "not loaded", "exit status 1"}),
    [](const auto& instance) { return instance.param.name; });

TEST(Shell, MakesTheChildThatTheHostNames) {
  EXPECT_THAT(driveChild("0").standardOutput, HasSubstr("made 1399350636\n"));
  EXPECT_THAT(driveChild("1001").standardOutput, AllOf(HasSubstr("made 1001\n"), EndsWith("closed\n")));
  EXPECT_THAT(driveChild("1234").standardOutput, HasSubstr("made 1234\n"));
  EXPECT_THAT(driveChild("-7").standardOutput, HasSubstr("made -7\n"));
  EXPECT_THAT(driveChild("5").standardOutput, EndsWith("no instance\n"));
}

TEST(AsksHost, WritesDownEveryAnswerInThreePlaces) {
  const TemporaryDirectory folder;
  const std::string log = (folder.path() / "log").string();
  ProgramCall call;
  call.environment = {{"ASKS_HOST_LOG", log}};
  EXPECT_EQ(drive("asks_host", call).end, "exit status 0");

  const std::vector<std::string> answers = lines(textOfFile(log));
  EXPECT_THAT(answers, SizeIs(3 * (61 + 2 + 14 * 5 + 1 + 5 + 1)));
  for (const std::string place : {"entry", "open", "close"}) {
    EXPECT_THAT(answers, Contains(place + " 0 answers 0"));
    EXPECT_THAT(answers, Contains(place + " 1 answers 2400"));
    EXPECT_THAT(answers, Contains(place + " 32 answers 0, writes 5 bytes \"HOST\""));
    EXPECT_THAT(answers, Contains(place + " 33 answers 0, writes 64 bytes \"Tiny host\""));
    EXPECT_THAT(answers, Contains(place + " 1000 answers 0"));
    EXPECT_THAT(answers, Contains(place + " -1 answers 0"));
    EXPECT_THAT(answers, Contains(place + " canDo \"sizeWindow\" answers 1"));
    EXPECT_THAT(answers, Contains(place + " canDo \"SizeWindow\" answers 0"));
    EXPECT_THAT(answers, Contains(place + " canDo \"sizeWindow \" answers 0"));
    EXPECT_THAT(answers, Contains(place + " canDo \"sizeWindo\" answers 0"));
    EXPECT_THAT(answers, Contains(place + " canDo \"sizeWindows\" answers 0"));
    EXPECT_THAT(answers, Contains(place + " canDo \"\" answers 0"));
    EXPECT_THAT(answers, Contains(place + " service \"niduGetTrackSampleForCurBlock\""
                                          " answers a function that answers 1.5"));
    EXPECT_THAT(answers, Contains(place + " service \"niduGetTrackSampleForCurBloc\" answers 0"));
  }
}

TEST(RecordsRequests, WritesDownEverythingThatTheHostDoes) {
  const TemporaryDirectory folder;
  const std::string log = (folder.path() / "log").string();
  ProgramCall call;
  call.environment = {{"RECORDS_REQUESTS_LOG", log}};
  EXPECT_EQ(drive("records_requests", call).end, "exit status 0");
  EXPECT_THAT(lines(textOfFile(log)),
              ElementsAre("1 entry", "1 dispatch 0 index 0 value 0 ptr null opt 0",
                          "1 dispatch 45 index 0 value 0 ptr buffer zero opt 0",
                          "1 dispatch 7 index 0 value 0 ptr buffer zero opt 0",
                          "1 getParameter 0 answers 0.25", "1 setParameter 0 value 0.25",
                          "1 setParameter 0 value 0.75", "1 dispatch 52 index 0 value 0 ptr null opt 0",
                          "1 dispatch 1 index 0 value 0 ptr null opt 0"));
}

}  // namespace
