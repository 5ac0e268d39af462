// SPDX-License-Identifier: MIT
// The well-behaved effect with one fault, chosen by FAULT_KIND and FAULT_PLACE (see faults.h and place.h),
// or by a file beside it (see settings.h).
// Used by end_to_end_tests for every way in which a plug-in can end or disturb its process. The requests that
// it receives are written to the file named in FAULT_LOG: "request OPCODE", one a line.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <limits>
#include <optional>
#include <string>

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

bool isAnsweredAtLength(VstInt32 opcode) {
  return opcode == longTextRequest || (longTextRequest == kEveryRequest && isTextRequest(opcode));
}

bool isWanted(VstInt32 opcode) { return longTextRequest == opcode || waitsForRequest(opcode); }

/// Some requests are made only after a certain answer to another one: the product's name when the effect has
/// none, a program's name by its number when the program cannot be selected, the next child of a shell, a new
/// name for a program whose name is another each time.
std::optional<VstIntPtr> answerThatLeadsToTheFault(VstInt32 opcode, void* ptr) {
  if (opcode == effGetEffectName && isWanted(effGetProductString)) return 0;
  if (opcode == effSetProgram && isWanted(effGetProgramNameIndexed)) return 0;
  if (opcode == effGetPlugCategory && isWanted(effShellGetNextPlugin)) return kPlugCategShell;
  if (opcode == effGetProgramName && isWanted(effSetProgramName)) {
    static int names = 0;
    putText(ptr, "Name " + std::to_string(++names), kProgramNameSize);
    return 0;
  }
  return std::nullopt;
}

/// Reports every place that it reaches.
class Faulty : public WellBehavedEffect {
 public:
  explicit Faulty(audioMasterCallback host) : WellBehavedEffect(host) {
    if (isWanted(effGetChunk) || isWanted(effSetChunk) || answersNullChunk)
      effect()->flags |= effFlagsProgramChunks;
  }

 protected:
  VstIntPtr dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float opt) override {
    logRequest(opcode);
    reach(Moment::dispatch, opcode);
    if (opcode == effGetChunk && answersNullChunk) {
      *static_cast<void**>(ptr) = nullptr;
      return 100;
    }
    if (const auto answer = answerThatLeadsToTheFault(opcode, ptr)) return *answer;
    if (isAnsweredAtLength(opcode)) {
      std::memset(ptr, 'x', 3999);
      static_cast<char*>(ptr)[3999] = '\0';
      return 1;
    }
    return WellBehavedEffect::dispatch(opcode, index, value, ptr, opt);
  }

  float getParameter(VstInt32 index) override {
    reach(Moment::getParameter);
    // A host that compares sees every value differ from this one, and sets it.
    if (waitsForSetParameter()) return std::numeric_limits<float>::quiet_NaN();
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
  if (yieldsNoInstance) return nullptr;
  return instantiate<Faulty>(host);
}
