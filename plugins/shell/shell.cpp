// SPDX-License-Identifier: MIT
// A shell with three children. The entry point makes the child that the host names as the current one, or the
// shell itself. Used by end_to_end_tests for runs of the shell, of a child, and of a child that it does not
// have.
#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

struct Child {
  VstInt32 uniqueID;
  const char* name;
};

constexpr Child kChildren[] = {{1001, "First child"}, {1234, "Second child"}, {-7, "Third child"}};

class Shell : public SamplePlugin {
 public:
  explicit Shell(audioMasterCallback host)
      : SamplePlugin(host, {"Shell", fourCharacterCode('S', 'h', 'e', 'l'), kPlugCategShell, 0, 0}) {}

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode != effShellGetNextPlugin) return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
    if (next == std::end(kChildren)) {
      next = std::begin(kChildren);
      return 0;
    }
    putText(ptr, next->name, kEffectNameSize);
    return (next++)->uniqueID;
  }

 private:
  const Child* next = std::begin(kChildren);
};

class ChildPlugin : public SamplePlugin {
 public:
  ChildPlugin(audioMasterCallback host, const Child& child)
      : SamplePlugin(host, {child.name, child.uniqueID, kPlugCategEffect, 2, 2, 0, {{"Gain", "x", 1.0f}}}) {}
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  const VstIntPtr wanted = host(nullptr, audioMasterCurrentId, 0, 0, nullptr, 0.0f);
  if (wanted == 0) return instantiate<Shell>(host);
  for (const Child& child : kChildren) {
    if (child.uniqueID == static_cast<VstInt32>(wanted)) return (new ChildPlugin(host, child))->effect();
  }
  return nullptr;
}
