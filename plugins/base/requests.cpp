// SPDX-License-Identifier: MIT
// A correct answer to every request that the program makes.
#include <cstdio>
#include <cstdlib>

#include "plugins/base/sample_plugin.h"
#include "vst2/speakers.h"

namespace sample_plugins {

VstIntPtr SamplePlugin::dispatch(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr, float) {
  switch (opcode) {
    case effSetProgram:
    case effGetProgram:
    case effSetProgramName:
    case effGetProgramName:
    case effGetProgramNameIndexed:
      return answerProgramRequest(opcode, index, value, ptr);
    case effGetParamLabel:
    case effGetParamDisplay:
    case effGetParamName:
    case effCanBeAutomated:
    case effString2Parameter:
    case effGetParameterProperties:
      return answerParameterRequest(opcode, index, ptr);
    case effIdentify:
      return fourCharacterCode('N', 'v', 'E', 'f');
    case effGetChunk:
      return saveChunk(index != 0, static_cast<void**>(ptr));
    case effSetChunk:
      return loadChunk(index != 0, ptr, static_cast<std::size_t>(value));
    case effGetInputProperties:
      return fillPin("In", index, record.numInputs, *static_cast<VstPinProperties*>(ptr));
    case effGetOutputProperties:
      return fillPin("Out", index, record.numOutputs, *static_cast<VstPinProperties*>(ptr));
    case effGetPlugCategory:
      return description.category;
    case effGetEffectName:
    case effGetProductString:
      putText(ptr, description.name, kEffectNameSize);
      return 1;
    case effGetVendorString:
      putText(ptr, "Sample Plug-ins", kVendorSize);
      return 1;
    case effGetVendorVersion:
      return record.version;
    case effCanDo:
      return canDo(static_cast<const char*>(ptr));
    case effGetVstVersion:
      return 2400;
    default:  // 0 means "nothing to do" as well as "not supported".
      return 0;
  }
}

VstIntPtr SamplePlugin::answerProgramRequest(VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr) {
  switch (opcode) {
    case effGetProgram:
      return current;
    case effSetProgram:
      if (value >= 0 && value < record.numPrograms) current = static_cast<VstInt32>(value);
      return 0;
    case effSetProgramName:
      currentProgram().name = static_cast<const char*>(ptr);
      return 0;
    case effGetProgramName:
      putText(ptr, currentProgram().name, kProgramNameSize);
      return 0;
    default:  // effGetProgramNameIndexed
      if (index < 0 || index >= record.numPrograms) return 0;
      putText(ptr, programs[static_cast<std::size_t>(index)].name, kProgramNameSize);
      return 1;
  }
}

VstIntPtr SamplePlugin::answerParameterRequest(VstInt32 opcode, VstInt32 index, void* ptr) {
  if (!isParameter(index)) return 0;
  const Parameter& parameter = description.parameters[static_cast<std::size_t>(index)];
  switch (opcode) {
    case effGetParamLabel:
      putText(ptr, parameter.label, kParameterTextSize);
      return 0;
    case effGetParamName:
      putText(ptr, parameter.name, kParameterTextSize);
      return 0;
    case effGetParamDisplay: {
      char text[kParameterTextSize];
      std::snprintf(text, sizeof text, "%.3f", static_cast<double>(SamplePlugin::getParameter(index)));
      putText(ptr, text, kParameterTextSize);
      return 0;
    }
    case effCanBeAutomated:
      return 1;
    case effString2Parameter:
      return setFromText(index, static_cast<const char*>(ptr));
    default:  // effGetParameterProperties
      return fillProperties(index, *static_cast<VstParameterProperties*>(ptr));
  }
}

/// With a null text the host asks whether this request is supported.
VstIntPtr SamplePlugin::setFromText(VstInt32 index, const char* text) {
  if (text == nullptr) return 1;
  char* end = nullptr;
  const float value = std::strtof(text, &end);
  if (end == text || *end != '\0') return 0;
  SamplePlugin::setParameter(index, value);
  return 1;
}

VstIntPtr SamplePlugin::fillProperties(VstInt32 index, VstParameterProperties& properties) const {
  const Parameter& parameter = description.parameters[static_cast<std::size_t>(index)];
  properties = {};
  putText(properties.label, parameter.name, sizeof properties.label);
  putText(properties.shortLabel, parameter.name, sizeof properties.shortLabel);
  if (parameter.highest > parameter.lowest) {
    properties.flags = kVstParameterUsesIntegerMinMax | kVstParameterUsesIntStep;
    properties.minInteger = parameter.lowest;
    properties.maxInteger = parameter.highest;
    properties.stepInteger = 1;
    properties.largeStepInteger = 1;
  }
  return 1;
}

VstIntPtr SamplePlugin::fillPin(const char* label, VstInt32 index, VstInt32 count,
                                VstPinProperties& pin) const {
  if (index < 0 || index >= count) return 0;
  pin = {};
  const std::string name = label + (' ' + std::to_string(index + 1));
  putText(pin.label, name, kPinLabelSize);
  putText(pin.shortLabel, name, sizeof pin.shortLabel);
  pin.flags = kVstPinIsActive;
  if (index % 2 == 0 && index + 1 < count) pin.flags |= kVstPinIsStereo;
  pin.arrangementType = count == 1 ? kSpeakerArrMono : kSpeakerArrStereo;
  return 1;
}

}  // namespace sample_plugins
