// SPDX-License-Identifier: MIT
#include "driver/torture_run.h"

#include <memory>

#include "driver/crash_guard.h"
#include "driver/instance.h"
#include "driver/report.h"
#include "driver/run_plan.h"
#include "flight_recorder/flight_recorder.h"

namespace {

/// `tests`: null for the full plan.
void createAndTorture(const std::string& path, const VST_loadID& loadID, const std::vector<int>* tests,
                      bool& isShellPlugin) {
  noteBundle(path);
  notePhase(kFlightLoading);
  const VST_DLL_Info dllInfo(path, "test");
  const NiduCOM::i_ptr<VSTPluginLoader> loader = VSTPluginLoader::demandLoadedPlugin(dllInfo);
  std::unique_ptr<VSTWrapper> wrapper;
  notePhase(kFlightCreating);
  deleteAndNew(loader, loadID, wrapper, false);
  if (wrapper == nullptr) crashOnPurpose();
  const VstInt32 category = wrapper->getEffectCategory();
  const VST_Class_Spec classSpec(dllInfo, VST_ChildSpec(loadID));
  isShellPlugin = category == kPlugCategShell;
  notePhase(kFlightRunning);
  if (isShellPlugin) {
    tortureShell(*loader, *wrapper);
  } else if (tests == nullptr) {
    torturePlugin(loader, loadID, classSpec, wrapper);
  } else {
    torturePluginWith(*tests, classSpec, *wrapper);
  }
  notePhase(kFlightClosing);
  closeInstance(wrapper);
}

bool run(const std::string& path, const VST_loadID& loadID, const std::vector<int>* tests,
         bool& isShellPlugin) {
  isShellPlugin = false;
  gCurTest = "create and initialize";
  try {
    createAndTorture(path, loadID, tests, isShellPlugin);
    return true;
  } catch (int code) {
    noteFailure(code);
    printFailure(code);
  } catch (...) {
    noteVerdict(kFlightFailedForUnknown);
    printFailure();
  }
  return false;
}

}  // namespace

bool RunVSTTortureTest(const std::string& path, const VST_loadID& loadID, bool& isShellPlugin) {
  return run(path, loadID, nullptr, isShellPlugin);
}

bool runListedTests(const std::string& path, const VST_loadID& loadID, const std::vector<int>& tests,
                    bool& isShellPlugin) {
  return run(path, loadID, &tests, isShellPlugin);
}
