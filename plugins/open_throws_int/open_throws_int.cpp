// SPDX-License-Identifier: MIT
// An effect that throws an int when it is opened.
// Used by end_to_end_tests: the program drops it and is left without an instance.
#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

class OpenThrowsInt : public SamplePlugin {
 public:
  explicit OpenThrowsInt(audioMasterCallback host)
      : SamplePlugin(host, {"Throws an int when opened", fourCharacterCode('O', 'p', 'T', 'i')}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effOpen) throw 5;
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<OpenThrowsInt>(host);
}
