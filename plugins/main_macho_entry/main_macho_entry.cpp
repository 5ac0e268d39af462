// SPDX-License-Identifier: MIT
// An effect whose only entry point is `main_macho`.
// Used by end_to_end_tests: it is the second name that the program looks for, and the run passes.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

SAMPLE_PLUGIN_EXPORT AEffect* main_macho(audioMasterCallback host) {
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}
