// SPDX-License-Identifier: MIT
// One sample plug-in, loaded into the test program.
#pragma once

#include <array>
#include <stdexcept>
#include <string>

#include <dlfcn.h>

#include "tests/shared/program_run.h"
#include "vst2/dispatch.h"
#include "vst2/host_opcodes.h"

namespace sample_plugins_test {

inline VstIntPtr answerPlugin(AEffect*, VstInt32 opcode, VstInt32, VstIntPtr, void*, float) {
  return opcode == audioMasterVersion ? 2400 : 0;
}

/// Loads the module in its constructor. It stays loaded.
class LoadedPlugin {
 public:
  /// Throws std::runtime_error with the reason when `name` cannot be loaded.
  explicit LoadedPlugin(const std::string& name)
      : module(dlopen(samplePlugin(name).c_str(), RTLD_NOW | RTLD_LOCAL)) {
    if (module == nullptr) throw std::runtime_error(dlerror());
  }

  /// Calls the entry point, which must exist. Null when the plug-in returns no instance.
  AEffect* callEntry(const char* name = "VSTPluginMain") const {
    const auto entry = reinterpret_cast<PluginEntryProc>(dlsym(module, name));
    if (entry == nullptr) throw std::logic_error(dlerror());
    return entry(answerPlugin);
  }

 private:
  void* module;
};

/// The text that the plug-in writes for a request.
inline std::string textOf(AEffect& effect, VstEffectOpcode opcode, VstInt32 index = 0) {
  std::array<char, 114> text{};
  dispatch(effect, opcode, index, -1, text.data());
  return text.data();
}

}  // namespace sample_plugins_test
