// SPDX-License-Identifier: MIT
// The effect without faults: a volume control.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

namespace sample_plugins {
namespace {

Description describe() {
  Description description{"Well-behaved effect", fourCharacterCode('W', 'b', 'E', 'f')};
  description.parameters = {
      {"Volume", "x", 0.5f},
      {"Width", "%", 0.25f},
      {"Shape", "", 0.0f, 0, 3},
  };
  description.programNames = {"Plain", "Wide", "Narrow", "Loud"};
  return description;
}

}  // namespace

WellBehavedEffect::WellBehavedEffect(audioMasterCallback host) : SamplePlugin(host, describe()) {}

void WellBehavedEffect::process(float** inputs, float** outputs, VstInt32 frames) {
  SamplePlugin::process(inputs, outputs, frames);
  const float volume = getParameter(0);
  for (int channel = 0; channel < 2; ++channel) {
    for (VstInt32 i = 0; i < frames; ++i) outputs[channel][i] *= volume;
  }
}

VstIntPtr WellBehavedEffect::canDo(const std::string& capability) { return capability == "bypass" ? 1 : 0; }

}  // namespace sample_plugins
