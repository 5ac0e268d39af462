// SPDX-License-Identifier: MIT
// An effect whose only entry point is `main`, as older plug-ins export it.
// Used by end_to_end_tests: the program finds that name last, and the run passes.
#include "plugins/well_behaved_effect/well_behaved_effect.h"

// A C++ function of that name would have to be a program's: the symbol is named past the compiler.
SAMPLE_PLUGIN_EXPORT AEffect* olderEntry(audioMasterCallback host) __asm__("main");

AEffect* olderEntry(audioMasterCallback host) {
  return sample_plugins::instantiate<sample_plugins::WellBehavedEffect>(host);
}
