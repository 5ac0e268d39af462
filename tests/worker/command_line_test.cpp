// SPDX-License-Identifier: MIT
// Options that cannot be followed: a line on standard error, a status of its own, and no plug-in has been
// loaded.
#include <fstream>

#include <gmock/gmock.h>
#include <sys/stat.h>

#include "tests/worker/worker_run.h"

using testing::StartsWith;

namespace {

/// A plug-in that would leave its mark in the output as soon as it is loaded.
const std::string kPlugin = samplePlugin("exits_on_open");

struct Mistake {
  std::string name;
  std::vector<std::string> arguments;
  std::string says;
};

class WrongUse : public testing::TestWithParam<Mistake> {};

TEST_P(WrongUse, IsSaidBeforeAnythingIsLoaded) {
  std::vector<std::string> arguments = GetParam().arguments;
  if (GetParam().says.find("needs an argument") == std::string::npos) arguments.push_back(kPlugin);
  const ProgramRun run = runWorker(arguments);
  EXPECT_EQ(run.standardOutput, "");
  EXPECT_EQ(run.standardError, "vsttorture-worker: " + GetParam().says + "\n");
  EXPECT_EQ(run.end, "exit status 64");
}

INSTANTIATE_TEST_SUITE_P(
    Mistakes, WrongUse,
    testing::Values(
        Mistake{"UnknownOption", {"--recrd", "x"}, "there is no option --recrd"},
        Mistake{"UnknownLetter", {"-r"}, "there is no option -r"},
        Mistake{"RecordWithoutName", {"--record"}, "--record needs an argument"},
        Mistake{"EmptyName", {"--record", ""}, "the record has no name"},
        Mistake{"RecordInNoFolder",
                {"--record", "/proc/nowhere/record"},
                "cannot keep a record in /proc/nowhere/record: No such file or directory"},
        Mistake{"RecordIsAFolder", {"--record", "/"}, "cannot keep a record in /: Is a directory"},
        Mistake{"RecordIsADevice",
                {"--record", "/dev/null"},
                "cannot keep a record in /dev/null: Not a regular file"},
        Mistake{"NoTests", {"--tests"}, "--tests needs an argument"},
        Mistake{"EmptyTests", {"--tests", ""}, "the list of tests is empty"},
        Mistake{"BlankTests", {"--tests", " ,"}, "the list of tests is empty"},
        Mistake{"Test9", {"--tests", "0,9"}, "there is no test 9; they are numbered 0 to 5"},
        Mistake{"Test6", {"--tests=6"}, "there is no test 6; they are numbered 0 to 5"},
        Mistake{"HugeTest",
                {"--tests", "99999999999999999999"},
                "there is no test 99999999999999999999; they are numbered 0 to 5"},
        Mistake{
            "TestsInNoFile", {"--tests", "0;1"}, "cannot read the tests from 0;1: No such file or directory"},
        Mistake{"TestsInAFolder", {"--tests", "/"}, "cannot read the tests from /: Is a directory"},
        Mistake{"NoBytes", {"--memory-limit", "1G"}, "1G is no number of bytes"},
        Mistake{"ZeroBytes", {"--file-size-limit", "0"}, "0 is no number of bytes"},
        Mistake{"NoProcess", {"--die-with-parent=x"}, "x is no number of a process"},
        Mistake{"ArgumentTooMany", {"--no-core=1"}, "--no-core takes no argument"}),
    [](const auto& instance) { return instance.param.name; });

TEST(WrongUse, IsARecordOfAnotherSizeWhichStaysAsItIs) {
  const RecordOnDisk record;
  for (const std::size_t size : {1, 4095, 4097}) {
    const std::string content(size, 'x');
    std::ofstream(record.path()) << content;
    const ProgramRun run = runWorker({"--record", record.path(), kPlugin});
    EXPECT_EQ(run.standardError, "vsttorture-worker: cannot keep a record in " + record.path() +
                                     ": The file has " + std::to_string(size) +
                                     " bytes, a record has 4096\n");
    EXPECT_EQ(run.end, "exit status 64");
    EXPECT_EQ(record.bytes(), content);
  }
}

TEST(WrongUse, IsAFileOfTestsThatHoldsNone) {
  const TemporaryDirectory folder;
  const std::string path = (folder.path() / "tests").string();
  const std::pair<const char*, const char*> cases[] = {
      {"", "the list of tests is empty"},
      {"\n", "the list of tests is empty"},
      {"0 1 x", "there is no test x; they are numbered 0 to 5"}};
  for (const auto& [content, mistake] : cases) {
    std::ofstream(path) << content;
    const ProgramRun run = runWorker({"--tests", path, kPlugin});
    EXPECT_EQ(run.standardError, std::string("vsttorture-worker: ") + mistake + "\n");
    EXPECT_EQ(run.end, "exit status 64");
  }
}

TEST(WorkerCommandLine, WithoutABundleShowsTheUsageOfTheProgram) {
  for (const std::vector<std::string>& arguments : {std::vector<std::string>{}, {"--tests", "0"}, {"--"}}) {
    const ProgramRun run = runWorker(arguments);
    EXPECT_EQ(run.standardOutput, "!too few arguments. syntax is command pathtovst childID(optional)\n");
    EXPECT_EQ(run.end, "exit status 2");
  }
}

TEST(WorkerCommandLine, TakesTheFirstOperandAsTheBundleAndTheNextAsTheChild) {
  const std::string shell = samplePlugin("shell");
  const std::string output = runWorker({"--no-core", shell, "--tests", "0"}).standardOutput;
  EXPECT_EQ(output, "total, 51\n1, test gathering info\n");
  EXPECT_THAT(runWorker({"--tests", "4", "--", shell, "-7", "--help"}).standardOutput,
              StartsWith("total, 2\n1, test gathering info\n2, inspect latency\n"));
  EXPECT_EQ(runWorker({"--", "--help"}).standardOutput, "!create and initialize failed -1\n");
}

TEST(WorkerCommandLine, RefusesWhatTheProgramRefuses) {
  const RecordOnDisk record;
  const ProgramRun run = runWorker({"--record", record.path(), "/x/Grove.vst"});
  EXPECT_EQ(run.standardOutput, "");
  EXPECT_EQ(run.end, "exit status 5");
  EXPECT_EQ(record.report().verdict, kFlightRefused);
}

TEST(WorkerCommandLine, HelpAndVersionLoadNothing) {
  const ProgramRun help = runWorker({"--help", kPlugin});
  EXPECT_THAT(help.standardOutput, StartsWith("usage: vsttorture-worker [OPTION]... BUNDLE [CHILD_ID]\n"));
  EXPECT_EQ(help.end, "exit status 0");
  const ProgramRun version = runWorker({"--version", kPlugin});
  EXPECT_THAT(version.standardOutput, StartsWith("vsttorture-worker 0."));
  EXPECT_EQ(version.end, "exit status 0");
}

}  // namespace
