// SPDX-License-Identifier: MIT
// A plug-in whose entry point throws a std::runtime_error.
// Used by end_to_end_tests: the program drops it and is left without an instance.
#include <stdexcept>

#include "plugins/base/sample_plugin.h"

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback) {
  throw std::runtime_error("the entry point fails on purpose");
}
