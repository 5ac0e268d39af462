// SPDX-License-Identifier: MIT
// The effect without faults. Other samples derive from it and add one.
#pragma once

#include "plugins/base/sample_plugin.h"

namespace sample_plugins {

/// Two inputs, two outputs, three parameters (the last one stepped, 0 to 3), four programs, no chunks.
class WellBehavedEffect : public SamplePlugin {
 public:
  explicit WellBehavedEffect(audioMasterCallback host);

 protected:
  void process(float** inputs, float** outputs, VstInt32 frames) override;
  VstIntPtr canDo(const std::string& capability) override;
};

}  // namespace sample_plugins
