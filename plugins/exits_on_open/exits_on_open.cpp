// SPDX-License-Identifier: MIT
// An effect that ends the process with status 0 when it is opened.
// Used by the fault matrix: "unexpected exit" is the only output, which tells this run from a pass.
#include <cstdlib>

#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

class ExitsOnOpen : public SamplePlugin {
 public:
  explicit ExitsOnOpen(audioMasterCallback host)
      : SamplePlugin(host, {"Exits when opened", fourCharacterCode('O', 'p', 'E', 'x')}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effOpen) std::exit(0);
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<ExitsOnOpen>(host);
}
