// SPDX-License-Identifier: MIT
// What the tests of entry points need of their samples: they export the names that are tried and no others, and fail in
// the way that they are for.
#include <stdexcept>

#include <gmock/gmock.h>

#include "tests/plugins/loaded_plugin.h"

using sample_plugins_test::LoadedPlugin;

namespace {

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

TEST(BothEntries, MakesNoInstanceThroughTheOlderEntry) {
  const LoadedPlugin plugin("both_entries");
  EXPECT_EQ(plugin.callEntry("main_macho"), nullptr);
  AEffect* const effect = plugin.callEntry();
  ASSERT_NE(effect, nullptr);
  dispatch(*effect, effClose);
}

TEST(SampleWithoutAnInstance, AnswersNullOrThrows) {
  EXPECT_EQ(LoadedPlugin("null_instance").callEntry(), nullptr);
  EXPECT_THROW(LoadedPlugin("entry_throws").callEntry(), std::runtime_error);
}

}  // namespace
