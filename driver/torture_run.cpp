// SPDX-License-Identifier: MIT
#include "driver/torture_run.h"

#include <memory>

#include "driver/crash_guard.h"
#include "driver/instance.h"
#include "driver/report.h"
#include "driver/run_plan.h"

namespace {

void createAndTorture(const std::string& path, const VST_loadID& loadID, bool& isShellPlugin) {
  const VST_DLL_Info dllInfo(path, "test");
  const NiduCOM::i_ptr<VSTPluginLoader> loader = VSTPluginLoader::demandLoadedPlugin(dllInfo);
  std::unique_ptr<VSTWrapper> wrapper;
  deleteAndNew(loader, loadID, wrapper, false);
  if (wrapper == nullptr) crashOnPurpose();
  const VstInt32 category = wrapper->getEffectCategory();
  const VST_Class_Spec classSpec(dllInfo, VST_ChildSpec(loadID));
  isShellPlugin = category == kPlugCategShell;
  if (isShellPlugin) {
    tortureShell(*loader, *wrapper);
  } else {
    torturePlugin(loader, loadID, classSpec, wrapper);
  }
  closeInstance(wrapper);
}

}  // namespace

bool RunVSTTortureTest(const std::string& path, const VST_loadID& loadID, bool& isShellPlugin) {
  isShellPlugin = false;
  gCurTest = "create and initialize";
  try {
    createAndTorture(path, loadID, isShellPlugin);
    return true;
  } catch (int code) {
    printFailure(code);
  } catch (...) {
    printFailure();
  }
  return false;
}
