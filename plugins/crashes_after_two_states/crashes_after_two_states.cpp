// SPDX-License-Identifier: MIT
// An effect that crashes after a certain sequence of tests alone: when it is asked for its tail size (test 4)
// and its state has been tested (3) at least twice since the names (0), the parameters (2) or the tail size
// (4) last were asked for. The fixed part of a run never comes to that, the random part does in about every
// second run. Used by worker_tests.
#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

class CrashesAfterTwoStates : public SamplePlugin {
 public:
  explicit CrashesAfterTwoStates(audioMasterCallback host) : SamplePlugin(host, describe()) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effMainsChanged && value == 0) ++statesTested;
    if (opcode == effGetVendorString || opcode == effCanBeAutomated) statesTested = 0;
    if (opcode == effGetTailSize) {
      if (statesTested >= 2) crash();
      statesTested = 0;
    }
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }

 private:
  static Description describe() {
    Description description{"Crashes after two states", fourCharacterCode('C', 'r', '2', 'S')};
    description.parameters = {{"Only", "", 0.5f}};
    return description;
  }

  static void crash() {
    volatile int* volatile nowhere = nullptr;
    *nowhere = 0;
  }

  int statesTested = 0;
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<CrashesAfterTwoStates>(host);
}
