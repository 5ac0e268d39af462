// SPDX-License-Identifier: MIT
// An effect that calls a function which is defined nowhere.
// Used by end_to_end_tests: loading the module must fail; the program must not crash later at the call.
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
