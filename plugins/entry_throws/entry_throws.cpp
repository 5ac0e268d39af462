// SPDX-License-Identifier: MIT
// A plug-in whose entry point throws a std::runtime_error.
// Used by the fault matrix: there is no instance, so the program ends with status 7.
#include <stdexcept>

#include "plugins/base/sample_plugin.h"

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback) {
  throw std::runtime_error("the entry point fails on purpose");
}
