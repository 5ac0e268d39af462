// SPDX-License-Identifier: MIT
// An effect that depends on memory that it has never set: it crashes when it is asked for its tail size (test 4) and
// a fresh block does not happen to hold zeros. Such a large block comes straight from the system, which does clear
// it; with MALLOC_PERTURB_ in the environment it is filled with something else. Used by scanner_explain.
#include <cstddef>
#include <cstdlib>

#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

constexpr std::size_t kSizeInBytes = std::size_t{1} << 20;
constexpr std::size_t kSomewhere = 1000;

class UsesFreshMemory : public SamplePlugin {
 public:
  explicit UsesFreshMemory(audioMasterCallback host)
      : SamplePlugin(host, describe()), block(static_cast<volatile char*>(std::malloc(kSizeInBytes))) {}
  ~UsesFreshMemory() override { std::free(const_cast<char*>(block)); }

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    if (opcode == effGetTailSize) lookAtTheBlock();
    return SamplePlugin::dispatch(opcode, index, value, ptr, opt);
  }

 private:
  static Description describe() { return {"Uses fresh memory", fourCharacterCode('U', 's', 'F', 'M')}; }

  __attribute__((noinline)) void lookAtTheBlock() const {
    volatile int* volatile nowhere = nullptr;
    if (block[kSomewhere] != 0) *nowhere = 0;
  }

  volatile char* block;
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<UsesFreshMemory>(host);
}
