// SPDX-License-Identifier: MIT
// A module that exports the entry points that its build asks for; each answers a number of its own. For the
// tests of VSTPluginLoader on real modules.
extern "C" {
#ifdef EXPORTS_VST_PLUGIN_MAIN
int VSTPluginMain() __attribute__((visibility("default")));
int VSTPluginMain() { return 1; }
#endif
#ifdef EXPORTS_MAIN_MACHO
int main_macho() __attribute__((visibility("default")));
int main_macho() { return 2; }
#endif
#ifdef EXPORTS_MAIN
// A function of C++ cannot be called main.
int oldestEntryPoint() __asm__("main") __attribute__((visibility("default")));
int oldestEntryPoint() { return 3; }
#endif
int justAFunction() __attribute__((visibility("default")));
int justAFunction() { return 4; }
}
