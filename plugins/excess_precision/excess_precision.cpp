// SPDX-License-Identifier: MIT
// An effect that answers 1/3 for its parameters, with the precision of the register that holds the quotient:
// on 32-bit x86 that is more than a float has. Used by end_to_end_tests. It writes "getParameter INDEX" or
// "setParameter INDEX" for each call to the file named in EXCESS_PRECISION_LOG.
#include <cstdio>
#include <cstdlib>

#include "plugins/base/sample_plugin.h"

using namespace sample_plugins;

namespace {

void writeDown(const char* event, VstInt32 index) {
  static const char* const path = std::getenv("EXCESS_PRECISION_LOG");
  static std::FILE* const log = path == nullptr ? nullptr : std::fopen(path, "a");
  if (log == nullptr) return;
  std::fprintf(log, "%s %d\n", event, static_cast<int>(index));
  std::fflush(log);
}

/// The host calls this directly: code in between could round the quotient.
float getThird(AEffect*, VstInt32 index) {
  writeDown("getParameter", index);
  const volatile float one = 1.0f;
  const volatile float three = 3.0f;
  return one / three;
}

class ExcessPrecision : public SamplePlugin {
 public:
  explicit ExcessPrecision(audioMasterCallback host) : SamplePlugin(host, describe()) {
    effect()->getParameter = getThird;
  }

 protected:
  void setParameter(VstInt32 index, float) override { writeDown("setParameter", index); }

 private:
  static Description describe() {
    Description description{"Excess precision", fourCharacterCode('E', 'x', 'P', 'r')};
    description.parameters = {{"Third", "", 0.0f}, {"Other third", "", 0.0f}};
    return description;
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  return instantiate<ExcessPrecision>(host);
}
