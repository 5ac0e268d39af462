// SPDX-License-Identifier: MIT
// An effect that stores to address zero when it is opened.
// Used by the fault matrix: "unexpected exit" is the only output, and the status is 7.
#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

// The pointer and its target are both volatile: otherwise the compiler may remove the store.
volatile int* volatile nowhere = nullptr;

class OpenCrashes : public SamplePlugin {
 public:
  explicit OpenCrashes(audioMasterCallback host)
      : SamplePlugin(host, {"Crashes when opened", fourCharacterCode('O', 'p', 'C', 'r')}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effOpen) *nowhere = 0;
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<OpenCrashes>(host);
}
