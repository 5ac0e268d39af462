// SPDX-License-Identifier: MIT
// A plug-in whose entry point throws an int.
// Used by end_to_end_tests: the program drops it and is left without an instance.
#include "plugins/base/sample_plugin.h"

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback) { throw 5; }
