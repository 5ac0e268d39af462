// SPDX-License-Identifier: MIT
// An effect that calls a function which nobody defines.
// Used by end_to_end_tests: the module must fail to load, and not crash later at the call.
#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

__attribute__((visibility("default"))) VstInt32 numberThatNobodyDefines();

namespace {

class UndefinedSymbol : public SamplePlugin {
 public:
  explicit UndefinedSymbol(audioMasterCallback host)
      : SamplePlugin(host, {"Undefined symbol", numberThatNobodyDefines()}) {}
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<UndefinedSymbol>(host);
}
