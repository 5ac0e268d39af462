// VSTWrapper: parameters.
#include <mutex>

#include "host/vst_wrapper.h"
#include "support/text_buffer.h"
#include "vst2/dispatch.h"

namespace {

constexpr std::size_t kParameterNameBufferSize = 500;
constexpr std::size_t kParameterTextBufferSize = 256;

using Lock = std::lock_guard<const NiduCoreRecursiveMutex>;

/// Asks the instance itself. The answer goes through memory: where floats are returned in a wider register,
/// it would otherwise differ from the 32-bit value that the plug-in was given.
float askForValue(AEffect& effect, VstInt32 index) {
  const volatile float value = effect.getParameter(&effect, index);
  return value;
}

/// Names the parameter that is being set, for as long as it lives.
class ParamBeingSet {
 public:
  ParamBeingSet(VstInt32& slot, VstInt32 index) : paramBeingSet(slot) { paramBeingSet = index; }
  ~ParamBeingSet() { paramBeingSet = -1; }
  ParamBeingSet(const ParamBeingSet&) = delete;
  ParamBeingSet& operator=(const ParamBeingSet&) = delete;

 private:
  VstInt32& paramBeingSet;
};

}  // namespace

float VSTWrapper::getParameter(int index) {
  if (index < 0 || index >= parameterCount()) return 0.0f;
  try {
    const Lock guard(lock);
    return askForValue(*effect, index);
  } catch (...) {
    return 0.0f;
  }
}

void VSTWrapper::setParameter(int index, float value) {
  if (index < 0 || index >= parameterCount()) return;
  try {
    const Lock guard(lock);
    // On purpose: a value that the plug-in holds already is never sent.
    if (askForValue(*effect, index) == value) return;
    const ParamBeingSet being(paramBeingSet, index);
    effect->setParameter(effect, index, value);
  } catch (...) {  // The plug-in's own trouble: the parameter stays as it is.
  }
}

std::string VSTWrapper::getParameterName(int index) {
  char name[kParameterNameBufferSize];
  vst_zerostruct(name);
  dispatch(*effect, effGetParamName, index, 0, name);
  return textIn(name);
}

std::string VSTWrapper::getParameterLabel(int index) const {
  char label[kParameterTextBufferSize];
  vst_zerostruct(label);
  dispatch(*effect, effGetParamLabel, index, 0, label);
  return textIn(label);
}

std::string VSTWrapper::getParameterCurValueAsText(int index) {
  char display[kParameterTextBufferSize];
  vst_zerostruct(display);
  dispatch(*effect, effGetParamDisplay, index, 0, display);
  return textIn(display);
}

VstIntPtr VSTWrapper::setParameterCurValueFromText(int index, const char* text) {
  if (dispatch(*effect, effString2Parameter, index) == 0) return 0;
  return dispatch(*effect, effString2Parameter, index, 0, textArgument(text));
}

bool VSTWrapper::isParameterAutomatable(int index) const {
  return dispatch(*effect, effCanBeAutomated, index) != 0;
}

bool VSTWrapper::getParameterProps(int index, VstParameterProperties& props) {
  return dispatch(*effect, effGetParameterProperties, index, 0, &props) != 0;
}

VstInt32 VSTWrapper::parameterCount() const { return effect == nullptr ? 0 : effect->numParams; }
