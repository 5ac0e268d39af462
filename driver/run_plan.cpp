// SPDX-License-Identifier: MIT
#include "driver/run_plan.h"

#include <cstdlib>
#include <ctime>

#include "describe/vst_info.h"
#include "driver/catalogue.h"
#include "driver/instance.h"
#include "driver/report.h"

namespace {

constexpr int kAnnouncedForPlugin = 64;
constexpr int kAnnouncedForShell = 51;
constexpr int kOrderedTests[] = {0, 1, 2, 3, 4, 5, 5, 4, 3, 2, 1, 0};
constexpr int kRandomTests = 50;
constexpr std::int64_t kDrawnTests = 5;
constexpr std::int64_t kDraws = std::int64_t{1} << 31;

void announceDescription() {
  gCurTest = "gather info";
  printStep("test gathering info");
}

}  // namespace

void torturePlugin(const NiduCOM::i_ptr<VSTPluginLoader>& loader, const VST_loadID& loadID,
                   const VST_Class_Spec& classSpec, std::unique_ptr<VSTWrapper>& wrapper) {
  std::srand(static_cast<unsigned>(std::clock()));
  printTotal(kAnnouncedForPlugin);

  announceDescription();
  const KelVSTInfoCache::VSTInfo first(wrapper.get(), classSpec);

  for (const int testNumber : kOrderedTests) runOneTest(testNumber, wrapper.get());

  gCurTest = "delete, create and initialize";
  deleteAndNew(loader, loadID, wrapper, true);

  announceDescription();
  const KelVSTInfoCache::VSTInfo second(wrapper.get(), classSpec);

  for (int i = 0; i < kRandomTests; ++i) runOneTest(testNumberFor(std::rand()), wrapper.get());
}

void torturePluginWith(const std::vector<int>& tests, const VST_Class_Spec& classSpec, VSTWrapper& wrapper) {
  printTotal(1 + static_cast<int>(tests.size()));
  announceDescription();
  const KelVSTInfoCache::VSTInfo description(&wrapper, classSpec);
  for (const int testNumber : tests) runOneTest(testNumber, &wrapper);
}

void tortureShell(const VSTPluginLoader& loader, VSTWrapper& wrapper) {
  printTotal(kAnnouncedForShell);
  announceDescription();
  const VST_Class_Spec classSpec(loader.info, VST_ChildSpec(0));
  const KelVSTInfoCache::VSTInfo info(&wrapper, classSpec);
}

int testNumberFor(std::int64_t draw) { return static_cast<int>(kDrawnTests * draw / kDraws); }
