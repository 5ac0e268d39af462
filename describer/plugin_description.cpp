// SPDX-License-Identifier: MIT
#include "describer/plugin_description.h"

#include <cstring>

#include "support/text_buffer.h"
#include "vst2/dispatch.h"

namespace {

constexpr VstInt32 kMostPins = 1 << 16;
constexpr VstInt32 kMostPrograms = 1 << 20;
constexpr VstInt32 kMostParameters = 1 << 20;
constexpr std::size_t kNameBufferSize = 114;
constexpr std::size_t kProgramNameBufferSize = 256;

/// A count that a plug-in claims: 0 for a negative one. Throws the int -1 where nobody could mean it.
VstInt32 countOrFail(VstInt32 claimed, VstInt32 most) {
  if (claimed > most) throw -1;
  return claimed < 0 ? 0 : claimed;
}

std::vector<std::string> currentValueTexts(VSTWrapper& wrapper) {
  const VstInt32 count = countOrFail(wrapper.effect->numParams, kMostParameters);
  std::vector<std::string> texts;
  texts.reserve(static_cast<std::size_t>(count));
  for (VstInt32 i = 0; i < count; ++i) texts.push_back(wrapper.getParameterCurValueAsText(i));
  return texts;
}

std::optional<std::string> productOf(AEffect& effect) {
  char text[kNameBufferSize];
  vst_zerostruct(text);
  if (dispatch(effect, effGetProductString, 0, 0, text) == 0) return std::nullopt;
  return textIn(text);
}

PinDescription pinFrom(const VstPinProperties& answer) {
  PinDescription pin;
  pin.label = textIn(answer.label);
  pin.shortLabel = textIn(answer.shortLabel);
  pin.flags = answer.flags;
  if ((answer.flags & kVstPinUseSpeaker) != 0) pin.speakerArrangement = answer.arrangementType;
  return pin;
}

using AskForPin = bool (VSTWrapper::*)(int index, VstPinProperties& props);

std::vector<std::optional<PinDescription>> pinsOf(VSTWrapper& wrapper, VstInt32 count, AskForPin ask) {
  std::vector<std::optional<PinDescription>> pins;
  for (VstInt32 i = 0; i < count; ++i) {
    VstPinProperties answer = {};
    const bool isAnswered = (wrapper.*ask)(i, answer);
    pins.push_back(isAnswered ? std::optional(pinFrom(answer)) : std::nullopt);
  }
  return pins;
}

/// The names as far as the plug-in tells them without selecting a program, which would change its state: that
/// of the current program always, the others where it names programs by index.
std::vector<std::optional<std::string>> programNamesOf(AEffect& effect, VstInt32 current) {
  const VstInt32 count = countOrFail(effect.numPrograms, kMostPrograms);
  std::vector<std::optional<std::string>> names(static_cast<std::size_t>(count));
  for (VstInt32 i = 0; i < count; ++i) {
    char text[kProgramNameBufferSize];
    vst_zerostruct(text);
    bool isAnswered = true;
    if (i == current) {
      dispatch(effect, effGetProgramName, 0, 0, text);
    } else {
      isAnswered = dispatch(effect, effGetProgramNameIndexed, i, -1, text) != 0;
    }
    if (isAnswered) names[static_cast<std::size_t>(i)] = textIn(text);
  }
  return names;
}

}  // namespace

PluginDescription::PluginDescription(VSTWrapper& wrapper, const VST_Class_Spec& spec)
    : identity(spec),
      category(wrapper.getEffectCategory()),
      // Before the record is made, which sets parameters with integer steps to each of them.
      valueTexts(category == kPlugCategShell ? std::vector<std::string>() : currentValueTexts(wrapper)),
      info(&wrapper, spec),
      product(productOf(*wrapper.effect)),
      vendorVersion(static_cast<VstInt32>(dispatch(*wrapper.effect, effGetVendorVersion))),
      version(wrapper.effect->version),
      flags(wrapper.effect->flags),
      latencyInSamples(wrapper.effect->initialDelay),
      inputs(pinsOf(wrapper, countOrFail(wrapper.effect->numInputs, kMostPins),
                    &VSTWrapper::getInputProperties)),
      outputs(pinsOf(wrapper, countOrFail(wrapper.effect->numOutputs, kMostPins),
                     &VSTWrapper::getOutputProperties)) {
  if (info.isShell) return;
  currentProgram = static_cast<VstInt32>(dispatch(*wrapper.effect, effGetProgram));
  programs = programNamesOf(*wrapper.effect, currentProgram);
  // A plug-in may have got more parameters since its value texts were asked for.
  valueTexts.resize(info.params.size());
}
