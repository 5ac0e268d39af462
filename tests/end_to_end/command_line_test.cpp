// SPDX-License-Identifier: MIT
// What the arguments mean, and the bundles that are refused by name.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"
#include "tests/shared/temporary_directory.h"

using testing::ElementsAre;

namespace {

std::vector<std::string> linesAndEnd(const ProgramRun& run) {
  std::vector<std::string> all = lines(run.standardOutput);
  all.push_back(run.end);
  return all;
}

TEST(CommandLine, WithoutArgumentsShowsTheUsage) {
  const ProgramRun run = runVstTorture(std::vector<std::string>{});
  EXPECT_EQ(run.standardOutput, "!too few arguments. syntax is command pathtovst childID(optional)\n");
  EXPECT_EQ(run.standardError, "");
  EXPECT_EQ(run.end, "exit status 2");
}

TEST(CommandLine, IgnoresEverythingBehindTheSecondArgument) {
  const std::string shell = samplePlugin("shell");
  EXPECT_TRUE(matchesGolden("shell_child", linesAndEnd(runVstTorture({shell, "1234", "5"}))));
  EXPECT_TRUE(matchesGolden("shell_child", linesAndEnd(runVstTorture({shell, "1234", "", "--help", "/x"}))));
}

TEST(CommandLine, TakesTheFirstArgumentAsAPathWhateverItLooksLike) {
  EXPECT_THAT(linesAndEnd(runVstTorture({"--help"})),
              ElementsAre("!create and initialize failed -1", "exit status 3"));
}

TEST(CommandLine, TakesAPathRelativeToTheCurrentFolder) {
  const std::string path = samplePlugin("shell");
  ProgramCall call;
  call.workingDirectory = path.substr(0, path.rfind('/'));
  for (const char* relative : {"shell.so", "./shell.so"}) {
    call.arguments = {relative};
    EXPECT_THAT(linesAndEnd(runVstTorture(call)),
                ElementsAre("total, 51", "1, test gathering info", "exit status 1"));
  }
}

struct Identifier {
  std::string name;
  std::string text;
  std::string outcome;
};

/// The shell makes itself when the host names child 0, that child for a known number, and nothing else.
class ChildIdentifier : public testing::TestWithParam<Identifier> {};

TEST_P(ChildIdentifier, ReachesTheShell) {
  const ProgramRun run = runVstTorture({samplePlugin("shell"), GetParam().text});
  if (GetParam().outcome == "shell") {
    EXPECT_THAT(linesAndEnd(run), ElementsAre("total, 51", "1, test gathering info", "exit status 1"));
  } else if (GetParam().outcome == "child") {
    EXPECT_TRUE(matchesGolden("shell_child", linesAndEnd(run)));
  } else {
    EXPECT_THAT(linesAndEnd(run), ElementsAre("unexpected exit", "exit status 7"));
  }
}

INSTANTIATE_TEST_SUITE_P(
    Texts, ChildIdentifier,
    testing::Values(Identifier{"Decimal", "1001", "child"}, Identifier{"Another", "1234", "child"},
                    Identifier{"Negative", "-7", "child"}, Identifier{"Positive", "+1001", "child"},
                    Identifier{"BlanksBefore", "  1001", "child"}, Identifier{"TextBehind", "1234x", "child"},
                    Identifier{"LeadingZeros", "0001001", "child"}, Identifier{"Zero", "0", "shell"},
                    Identifier{"Hexadecimal", "0x3e9", "shell"},
                    Identifier{"NoNumber", "First child", "shell"}, Identifier{"Empty", "", "shell"},
                    Identifier{"Unknown", "5", "crash"}, Identifier{"UnknownNegative", "-1001", "crash"}),
    [](const auto& instance) { return instance.param.name; });

TEST(CommandLine, AnIdentifierIsNothingToAPluginThatIsNoShell) {
  EXPECT_TRUE(matchesGolden("well_behaved_effect",
                            linesAndEnd(runVstTorture({samplePlugin("well_behaved_effect"), "1234"}))));
}

class RefusedBundle : public testing::TestWithParam<std::string> {};

TEST_P(RefusedBundle, PrintsNothing) {
  for (const char* folder : {"/x/", "/", "relative/", "/Library/Audio/Plug-Ins/VST/"}) {
    const ProgramRun run = runVstTorture({folder + GetParam()});
    EXPECT_EQ(run.standardOutput, "");
    EXPECT_EQ(run.standardError, "");
    EXPECT_EQ(run.end, "exit status 5");
  }
}

// The rows of the list and the same in other letters. None of these files exists.
INSTANTIATE_TEST_SUITE_P(Names, RefusedBundle,
                         testing::Values("GroveSampler.vst", "grovesampler.vst", "Grove.vst", "GROVE.VST",
                                         "Ashkeys VST.vst", "aSHKEYS vst.VST", "Wexlo3.VST", "wexlo3.vst",
                                         "NIDU Parlo Instrument.vst", "nidu PARLO instrument.Vst",
                                         "Wexlo2 VST 5.1.vst", "WEXLO2 VST 5.1.VST", "Wexlo2 VST 7.1.vst",
                                         "wexlo2 vst 7.1.vst", "WeXlo2 VST. Quad.vst", "wexlo2 vst. quad.vst",
                                         "Wexlo2 VST.vst", "wEXLO2 vst.vst"));

TEST(RefusedBundles, AreRefusedWhateverTheyContain) {
  const TemporaryDirectory folder;
  const std::filesystem::path good = folder.path() / "Grove.VST";
  std::filesystem::copy_file(samplePlugin("well_behaved_effect"), good);
  const ProgramRun run = runVstTorture({good.string(), "1234"});
  EXPECT_EQ(run.standardOutput + run.standardError, "");
  EXPECT_EQ(run.end, "exit status 5");
}

class BundleThatIsNotRefused : public testing::TestWithParam<std::string> {};

TEST_P(BundleThatIsNotRefused, IsTriedOut) {
  EXPECT_THAT(linesAndEnd(runVstTorture({GetParam()})),
              ElementsAre("!create and initialize failed -1", "exit status 3"));
}

INSTANTIATE_TEST_SUITE_P(Paths, BundleThatIsNotRefused,
                         testing::Values("Grove.vst", "Wexlo2 VST.vst", "/x/Grove.vst/", "/x/Grove.vst/x",
                                         "/x/GroveSampler.vst.bak", "/x/Grove.vst ", "/x/ Grove.vst",
                                         "/x/My Grove.vst", "/x/Grove", "/x/Wexlo2 VST Quad.vst"));

TEST(BundlesThatAreNotRefused, PassWhenTheyAreGood) {
  const TemporaryDirectory folder;
  std::filesystem::copy_file(samplePlugin("shell"), folder.path() / "Grove.vst");
  std::filesystem::copy_file(samplePlugin("shell"), folder.path() / "GroveSampler.vst.bak");
  ProgramCall call;
  call.workingDirectory = folder.path().string();
  call.arguments = {"Grove.vst"};
  EXPECT_EQ(runVstTorture(call).end, "exit status 1");
  EXPECT_EQ(runVstTorture({(folder.path() / "GroveSampler.vst.bak").string()}).end, "exit status 1");
}

}  // namespace
