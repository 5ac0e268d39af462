// SPDX-License-Identifier: MIT
// An instrument that takes MIDI, has no inputs and saves its state in chunks, without faults.
// Used by end_to_end_tests for a run of an instrument that passes.
#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

Description describe() {
  Description description{"Well-behaved instrument", fourCharacterCode('W', 'b', 'I', 'n'), kPlugCategSynth};
  description.numInputs = 0;
  description.flags = effFlagsIsSynth | effFlagsProgramChunks;
  description.parameters = {{"Pitch", "Hz", 0.5f}, {"Decay", "s", 0.75f}};
  description.programNames = {"Bell", "Drum"};
  return description;
}

class WellBehavedInstrument : public SamplePlugin {
 public:
  explicit WellBehavedInstrument(audioMasterCallback host) : SamplePlugin(host, describe()) {}

 protected:
  VstIntPtr canDo(const std::string& capability) override {
    return capability == "receiveVstEvents" || capability == "receiveVstMidiEvent" ? 1 : -1;
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<WellBehavedInstrument>(host);
}
