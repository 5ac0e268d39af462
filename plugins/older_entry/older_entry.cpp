// SPDX-License-Identifier: MIT
// An effect whose only entry point is `main`, as older plug-ins export it.
// Used by end_to_end_tests: it is the last name that the program looks for, and the run passes.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

// C++ reserves a function named main for programs, so only the symbol has that name.
SAMPLE_PLUGIN_EXPORT AEffect* olderEntry(audioMasterCallback host) __asm__("main");

AEffect* olderEntry(audioMasterCallback host) {
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}
