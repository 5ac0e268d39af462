// SPDX-License-Identifier: MIT
// Whole runs of plug-ins that do nothing wrong: the exact lines and the exit status.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"

namespace {

struct WholeRun {
  std::string name;
  std::string golden;
  std::vector<std::string> arguments;
};

class WellBehaved : public testing::TestWithParam<WholeRun> {};

TEST_P(WellBehaved, PluginGivesTheGoldenLines) {
  const ProgramRun run = runVstTorture(GetParam().arguments);
  EXPECT_TRUE(matchesGolden(GetParam().golden, linesAndEnd(run)));
  EXPECT_EQ(run.standardOutput.back(), '\n');
  EXPECT_EQ(run.standardError, "");
}

INSTANTIATE_TEST_SUITE_P(
    Samples, WellBehaved,
    testing::Values(
        WholeRun{"Effect", "passing_run", {samplePlugin("well_behaved_effect")}},
        WholeRun{"EffectWithAChildNumber", "passing_run", {samplePlugin("well_behaved_effect"), "1234"}},
        WholeRun{"Instrument", "passing_run", {samplePlugin("well_behaved_instrument")}},
        WholeRun{"Shell", "shell", {samplePlugin("shell")}},
        WholeRun{"ShellChild", "passing_run", {samplePlugin("shell"), "1234"}},
        WholeRun{"OlderEntry", "passing_run", {samplePlugin("older_entry")}},
        WholeRun{"MainMachoEntry", "passing_run", {samplePlugin("main_macho_entry")}},
        WholeRun{"BothEntries", "passing_run", {samplePlugin("both_entries")}},
        WholeRun{"AsksHost", "passing_run", {samplePlugin("asks_host")}}),
    [](const auto& instance) { return instance.param.name; });

// The seed is the processor time used so far: now and then two runs agree, but nine never do.
TEST(RandomPass, DiffersFromRunToRun) {
  const std::string first = runVstTorture({samplePlugin("well_behaved_effect")}).standardOutput;
  bool differs = false;
  for (int i = 0; i < 8; ++i) {
    differs = differs || runVstTorture({samplePlugin("well_behaved_effect")}).standardOutput != first;
  }
  EXPECT_TRUE(differs);
}

}  // namespace
