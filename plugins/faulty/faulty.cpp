// The well-behaved effect with one fault, chosen by FAULT_KIND and FAULT_PLACE (see faults.h and place.h).
// Used by end_to_end_tests for every way in which a plug-in can end or disturb its process. The requests that
// it receives are written to the file named in FAULT_LOG: "request OPCODE", one a line.
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "plugins/faulty/faults.h"
#include "plugins/faulty/place.h"
#include "plugins/well_behaved_effect/well_behaved_effect.h"

using namespace sample_plugins;

namespace {

struct Loading {
  Loading() { reach(Moment::load); }
} loading;

void logRequest(VstInt32 opcode) {
  static std::FILE* const log = [] {
    const char* path = std::getenv("FAULT_LOG");
    std::FILE* opened = path == nullptr ? nullptr : std::fopen(path, "a");
    if (path != nullptr && opened == nullptr) complain("no such log");
    return opened;
  }();
  if (log == nullptr) return;
  std::fprintf(log, "request %d\n", opcode);
  std::fflush(log);
}

bool isTextRequest(VstInt32 opcode) {
  switch (opcode) {
    case effGetProgramName:
    case effGetParamLabel:
    case effGetParamDisplay:
    case effGetParamName:
    case effGetProgramNameIndexed:
    case effGetEffectName:
    case effGetVendorString:
    case effGetProductString:
      return true;
    default:
      return false;
  }
}

/// Counts the places that it gets to.
class Faulty : public WellBehavedEffect {
 public:
  using WellBehavedEffect::WellBehavedEffect;

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    logRequest(opcode);
    reach(Moment::dispatch, opcode);
    if (answersLongTexts && isTextRequest(opcode)) {
      std::memset(ptr, 'x', 3999);
      static_cast<char*>(ptr)[3999] = '\0';
      return 1;
    }
    return WellBehavedEffect::dispatch(opcode, index, value, ptr, opt);
  }

  float getParameter(VstInt32 index) override {
    reach(Moment::getParameter);
    return WellBehavedEffect::getParameter(index);
  }

  void setParameter(VstInt32 index, float value) override {
    reach(Moment::setParameter);
    WellBehavedEffect::setParameter(index, value);
  }
};

}  // namespace

SAMPLE_PLUGIN_EXPORT AEffect* VSTPluginMain(audioMasterCallback host) {
  reach(Moment::entry);
  return instantiate<Faulty>(host);
}
