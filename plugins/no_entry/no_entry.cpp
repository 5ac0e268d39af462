// SPDX-License-Identifier: MIT
// A module that loads and shows no entry point: its one function stays hidden.
// Used by end_to_end_tests: there is no instance, so the program ends itself as if it had crashed.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

extern "C" AEffect* makeInstance(audioMasterCallback host) {
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}
