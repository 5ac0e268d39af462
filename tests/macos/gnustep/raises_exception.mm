// SPDX-License-Identifier: MIT
// An effect that raises an exception of Foundation when it is asked for its vendor.
// Used by check_exception_handler.py: the exception reaches the exception handler's delegate.
#import <Foundation/Foundation.h>

#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

class RaisesException : public SamplePlugin {
 public:
  explicit RaisesException(audioMasterCallback host)
      : SamplePlugin(host, {"Raises an exception", 0x52614578}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effGetVendorString) [NSException raise:@"NobodyCatchesThis" format:@"raised on purpose"];
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<RaisesException>(host);
}
