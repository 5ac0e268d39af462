// SPDX-License-Identifier: MIT
// A module that loads but exports no entry point: its one function is hidden.
// Used by the fault matrix: there is no instance, so the program ends with status 7.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

extern "C" AEffect* makeInstance(audioMasterCallback host) {
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}
