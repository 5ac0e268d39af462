// SPDX-License-Identifier: MIT
// An effect with parameters and programs, without faults.
// Used by `./run` and by every test that needs a run that passes.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}
