// SPDX-License-Identifier: MIT
// Whole runs of plug-ins that do nothing wrong: the exact lines and the end.
#include <gmock/gmock.h>

#include "tests/end_to_end/golden_file.h"
#include "tests/shared/program_run.h"
#include "tests/shared/protocol_lines.h"

using testing::SizeIs;
using testing::StartsWith;

namespace {

struct WholeRun {
  std::string name;
  std::string plugin;
  std::vector<std::string> furtherArguments = {};
};

class WellBehaved : public testing::TestWithParam<WholeRun> {};

TEST_P(WellBehaved, PluginGivesItsGoldenLines) {
  std::vector<std::string> arguments = GetParam().furtherArguments;
  arguments.insert(arguments.begin(), samplePlugin(GetParam().plugin));
  const ProgramRun run = runVstTorture(arguments);
  std::vector<std::string> actual = lines(run.standardOutput);
  actual.push_back(run.end);
  EXPECT_TRUE(matchesGolden(GetParam().name, actual));
  EXPECT_EQ(run.standardOutput.back(), '\n');
  EXPECT_EQ(run.standardError, "");
}

INSTANTIATE_TEST_SUITE_P(
    Samples, WellBehaved,
    testing::Values(WholeRun{"well_behaved_effect", "well_behaved_effect"},
                    WholeRun{"well_behaved_instrument", "well_behaved_instrument"},
                    WholeRun{"shell", "shell"}, WholeRun{"shell_child", "shell", {"1234"}},
                    WholeRun{"older_entry", "older_entry"}, WholeRun{"main_macho_entry", "main_macho_entry"},
                    WholeRun{"both_entries", "both_entries"}, WholeRun{"asks_host", "asks_host"}),
    [](const auto& instance) { return instance.param.name; });

TEST(RandomPass, DiffersFromRunToRunAndTheBeginningDoesNot) {
  const std::string beginning = beginningOfRun(15);
  const std::string first = runVstTorture({samplePlugin("well_behaved_effect")}).standardOutput;
  EXPECT_THAT(first, StartsWith(beginning));
  // The seed is the processor time used so far: now and then two runs agree, never nine.
  bool differs = false;
  for (int i = 0; i < 8; ++i) {
    const std::string other = runVstTorture({samplePlugin("well_behaved_effect")}).standardOutput;
    EXPECT_THAT(other, StartsWith(beginning));
    EXPECT_THAT(lines(other), SizeIs(66));
    differs = differs || other != first;
  }
  EXPECT_TRUE(differs);
}

}  // namespace
