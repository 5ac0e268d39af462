// SPDX-License-Identifier: MIT
// An effect with two entry points: `VSTPluginMain` makes the instance, `main_macho` returns null.
// Used by end_to_end_tests: the program calls `VSTPluginMain`, so the run passes.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}

SAMPLE_PLUGIN_EXPORT AEffect* main_macho(audioMasterCallback) { return nullptr; }
