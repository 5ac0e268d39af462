// SPDX-License-Identifier: MIT
// The record that the host gets, and its C functions.
#include "plugins/base/sample_plugin.h"

#include <algorithm>
#include <memory>

namespace sample_plugins {

/// What the host calls. The record's `object` field points to the sample.
struct CFunctions {
  static SamplePlugin& plugin(AEffect* effect) { return *static_cast<SamplePlugin*>(effect->object); }

  static VstIntPtr dispatcher(AEffect* effect, VstInt32 opcode, VstInt32 index, VstIntPtr value, void* ptr,
                              float opt) {
    const std::unique_ptr<SamplePlugin> closing(opcode == effClose ? &plugin(effect) : nullptr);
    return plugin(effect).dispatch(opcode, index, value, ptr, opt);
  }
  static void setParameter(AEffect* effect, VstInt32 index, float value) {
    plugin(effect).setParameter(index, value);
  }
  static float getParameter(AEffect* effect, VstInt32 index) { return plugin(effect).getParameter(index); }
  static void process(AEffect* effect, float** inputs, float** outputs, VstInt32 frames) {
    plugin(effect).process(inputs, outputs, frames);
  }
};

SamplePlugin::SamplePlugin(audioMasterCallback host, const Description& itsDescription)
    : hostCallback(host), record(), description(itsDescription) {
  std::vector<float> values;
  for (const Parameter& parameter : description.parameters) values.push_back(parameter.value);
  for (const std::string& name : description.programNames) programs.push_back({name, values});
  if (programs.empty()) programs.push_back({"", values});

  record.magic = kEffectMagic;
  record.dispatcher = CFunctions::dispatcher;
  record.setParameter = CFunctions::setParameter;
  record.getParameter = CFunctions::getParameter;
  record.processReplacing = CFunctions::process;
  record.numPrograms = static_cast<VstInt32>(description.programNames.size());
  record.numParams = static_cast<VstInt32>(description.parameters.size());
  record.numInputs = description.numInputs;
  record.numOutputs = description.numOutputs;
  record.flags = effFlagsCanReplacing | description.flags;
  record.ioRatio = 1.0f;
  record.object = this;
  record.uniqueID = description.uniqueID;
  record.version = 1000;
}

float SamplePlugin::getParameter(VstInt32 index) {
  return isParameter(index) ? currentProgram().values[static_cast<std::size_t>(index)] : 0.0f;
}

void SamplePlugin::setParameter(VstInt32 index, float value) {
  if (isParameter(index)) currentProgram().values[static_cast<std::size_t>(index)] = value;
}

void SamplePlugin::process(float** inputs, float** outputs, VstInt32 frames) {
  for (VstInt32 i = 0; i < record.numOutputs; ++i) {
    if (i < record.numInputs) {
      std::copy_n(inputs[i], frames, outputs[i]);
    } else {
      std::fill_n(outputs[i], frames, 0.0f);
    }
  }
}

VstIntPtr SamplePlugin::canDo(const std::string&) { return 0; }

bool SamplePlugin::isParameter(VstInt32 index) const { return index >= 0 && index < record.numParams; }

void putText(void* buffer, const std::string& text, std::size_t size) {
  const std::size_t length = std::min(text.size(), size - 1);
  *std::copy_n(text.begin(), length, static_cast<char*>(buffer)) = '\0';
}

}  // namespace sample_plugins
