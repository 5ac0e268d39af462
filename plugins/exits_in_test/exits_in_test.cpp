// SPDX-License-Identifier: MIT
// An effect that ends the process with status 42 when it is asked for its tail size.
// Used by the fault matrix: "unexpected exit" follows the line "6, inspect latency", and the status is 42.
#include <cstdlib>

#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

class ExitsInTest : public SamplePlugin {
 public:
  explicit ExitsInTest(audioMasterCallback host)
      : SamplePlugin(host, {"Exits in a test", fourCharacterCode('E', 'x', 'T', 'e')}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effGetTailSize) std::exit(42);
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<ExitsInTest>(host);
}
