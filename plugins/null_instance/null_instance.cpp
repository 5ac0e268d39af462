// SPDX-License-Identifier: MIT
// A plug-in whose entry point refuses every host.
// Used by end_to_end_tests: there is no instance, so the program ends itself as if it had crashed.
#include "plugins/base/sample_plugin.h"

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback) { return nullptr; }
