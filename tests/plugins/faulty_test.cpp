// SPDX-License-Identifier: MIT
// The faulty sample, where neither the fault matrix nor its flight records show what it does: a mistake in its
// settings is no fault that passes, and the faults that change no line of a run happen.
#include <algorithm>
#include <cctype>
#include <cfenv>
#include <clocale>
#include <cstdlib>
#include <filesystem>

#include <gmock/gmock.h>

#include "tests/plugins/loaded_plugin.h"

namespace {

struct Mistake {
  std::string kind;
  std::string place;
  std::string problem;
};

class MistakenFault : public testing::TestWithParam<Mistake> {};

TEST_P(MistakenFault, EndsTheProcessWith125) {
  const ProgramRun run = runVstTorture(faultyPlugin(GetParam().kind, GetParam().place));
  EXPECT_EQ(run.end, "exit status 125");
  EXPECT_EQ(run.standardError, "faulty: " + GetParam().problem + '\n');
}

INSTANTIATE_TEST_SUITE_P(
    Faulty, MistakenFault,
    testing::Values(Mistake{"no_such_fault", "dispatch:52", "no such fault: no_such_fault"},
                    Mistake{"raise:SIGNOTHING", "dispatch:52", "no such signal: SIGNOTHING"},
                    Mistake{"abort", "elsewhere", "no such place: elsewhere"},
                    Mistake{"abort", "dispatch", "no such place: dispatch"},
                    Mistake{"abort", "dispatch:open", "no such place: dispatch:open"},
                    Mistake{"abort", "entry:0", "no such place: entry:0"},
                    Mistake{"abort", "getParameter:1x", "no such place: getParameter:1x"}),
    [](const auto& instance) {
      std::string name = instance.param.kind + '_' + instance.param.place;
      std::replace_if(
          name.begin(), name.end(), [](unsigned char letter) { return std::isalnum(letter) == 0; }, '_');
      return name;
    });

TEST(FaultOfTheProcess, ChangesTheDirectoryAndTrapsFloatingPoint) {
  const std::filesystem::path before = std::filesystem::current_path();
  setenv("FAULT_KIND", "change_locale_and_directory+trap_floating_point", 1);
  setenv("FAULT_PLACE", "entry", 1);
  AEffect* const effect = sample_plugins_test::LoadedPlugin("faulty").callEntry();
  const std::filesystem::path during = std::filesystem::current_path();
  const int trapped = fegetexcept();
  fedisableexcept(FE_ALL_EXCEPT);
  std::filesystem::current_path(before);
  std::setlocale(LC_ALL, "C");
  dispatch(*effect, effClose);
  unsetenv("FAULT_KIND");
  unsetenv("FAULT_PLACE");
  EXPECT_EQ(during, "/");
  EXPECT_NE(trapped & FE_DIVBYZERO, 0);
}

}  // namespace
