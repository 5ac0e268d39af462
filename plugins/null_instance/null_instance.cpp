// SPDX-License-Identifier: MIT
// A plug-in whose entry point returns null.
// Used by the fault matrix: there is no instance, so the program ends with status 7.
#include "plugins/base/sample_plugin.h"

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback) { return nullptr; }
