// SPDX-License-Identifier: MIT
// What the arguments mean, and the bundles that are refused by name.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"
#include "tests/shared/temporary_directory.h"

using testing::ElementsAre;

namespace {

const auto kIsAShellsRun = ElementsAre("total, 51", "1, test gathering info", "exit status 1");
const auto kDoesNotLoad = ElementsAre("!create and initialize failed -1", "exit status 3");

TEST(CommandLine, WithoutArgumentsShowsTheUsage) {
  const ProgramRun run = runVstTorture(std::vector<std::string>{});
  EXPECT_EQ(run.standardOutput, "!too few arguments. syntax is command pathtovst childID(optional)\n");
  EXPECT_EQ(run.standardError, "");
  EXPECT_EQ(run.end, "exit status 2");
}

TEST(CommandLine, IgnoresEverythingAfterTheSecondArgument) {
  const ProgramRun run = runVstTorture({samplePlugin("shell"), "1234", "", "--help", "/x"});
  EXPECT_TRUE(matchesGolden("passing_run", linesAndEnd(run)));
}

TEST(CommandLine, HasNoOptions) { EXPECT_THAT(linesAndEnd(runVstTorture({"--help"})), kDoesNotLoad); }

TEST(CommandLine, TakesAPathRelativeToTheCurrentFolder) {
  const std::string path = samplePlugin("shell");
  ProgramCall call;
  call.workingDirectory = path.substr(0, path.rfind('/'));
  for (const char* relative : {"shell.so", "./shell.so"}) {
    call.arguments = {relative};
    EXPECT_THAT(linesAndEnd(runVstTorture(call)), kIsAShellsRun);
  }
}

struct ChildNumber {
  std::string name;
  std::string text;
  std::string outcome;
};

class ChildArgument : public testing::TestWithParam<ChildNumber> {};

TEST_P(ChildArgument, SelectsTheShellOrOneOfItsChildren) {
  const ProgramRun run = runVstTorture({samplePlugin("shell"), GetParam().text});
  if (GetParam().outcome == "shell") {
    EXPECT_THAT(linesAndEnd(run), kIsAShellsRun);
  } else if (GetParam().outcome == "child") {
    EXPECT_TRUE(matchesGolden("passing_run", linesAndEnd(run)));
  } else {
    EXPECT_THAT(linesAndEnd(run), ElementsAre("unexpected exit", "exit status 7"));
  }
}

INSTANTIATE_TEST_SUITE_P(
    Texts, ChildArgument,
    testing::Values(ChildNumber{"Decimal", "1001", "child"}, ChildNumber{"Negative", "-7", "child"},
                    ChildNumber{"PlusSign", "+1001", "child"}, ChildNumber{"BlanksBefore", "  1001", "child"},
                    ChildNumber{"TextAfterIt", "1234x", "child"},
                    ChildNumber{"LeadingZeros", "0001001", "child"}, ChildNumber{"Zero", "0", "shell"},
                    ChildNumber{"Hexadecimal", "0x3e9", "shell"},
                    ChildNumber{"NoNumber", "First child", "shell"}, ChildNumber{"Empty", "", "shell"},
                    ChildNumber{"NoChildOfTheShell", "5", "no instance"},
                    ChildNumber{"NegativeOfAChild", "-1001", "no instance"}),
    [](const auto& instance) { return instance.param.name; });

// Which names are refused is in tests/driver.
TEST(RefusedBundle, IsRefusedWhateverItContains) {
  const TemporaryDirectory folder;
  const std::filesystem::path good = folder.path() / "Grove.VST";
  std::filesystem::copy_file(samplePlugin("well_behaved_effect"), good);
  const ProgramRun run = runVstTorture({good.string(), "1234"});
  EXPECT_EQ(run.standardOutput + run.standardError, "");
  EXPECT_EQ(run.end, "exit status 5");
}

// A bare name is never refused.
TEST(RefusedBundle, IsLoadedWhenItsPathHasNoSlash) {
  const TemporaryDirectory folder;
  std::filesystem::copy_file(samplePlugin("shell"), folder.path() / "Grove.vst");
  ProgramCall call;
  call.workingDirectory = folder.path().string();
  call.arguments = {"Grove.vst"};
  EXPECT_THAT(linesAndEnd(runVstTorture(call)), kIsAShellsRun);
}

}  // namespace
