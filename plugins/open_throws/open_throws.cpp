// SPDX-License-Identifier: MIT
// An effect that throws a std::runtime_error when it is opened.
// Used by end_to_end_tests: the program drops it and is left without an instance.
#include <stdexcept>

#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

class OpenThrows : public SamplePlugin {
 public:
  explicit OpenThrows(audioMasterCallback host)
      : SamplePlugin(host, {"Throws when opened", fourCharacterCode('O', 'p', 'T', 'h')}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effOpen) throw std::runtime_error("opening fails on purpose");
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<OpenThrows>(host);
}
