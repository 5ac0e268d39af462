// SPDX-License-Identifier: MIT
#include "driver/catalogue.h"

#include <algorithm>

#include "describe/vst_info.h"
#include "driver/crash_guard.h"
#include "driver/report.h"
#include "support/auto_buffer.h"
#include "vst2/dispatch.h"

namespace {

constexpr const char* kCapabilitiesAsked[] = {
    "sendVstMidiEvent", "receiveVstMidiEvent", "receiveVstTimeInfo", "offline", "midiProgramNames", "bypass",
};

void inspectClassInfo(VSTWrapper& wrapper) {
  AEffect& effect = *wrapper.effect;
  wrapper.getEffectName();
  wrapper.getManufacturerName();
  wrapper.getEffectCategory();
  VstPinProperties pin;
  for (VstInt32 i = 0; i < effect.numInputs; ++i) {
    pin = {};
    wrapper.getInputProperties(i, pin);
  }
  // On purpose: a plug-in without outputs is still asked about output 0, but not about input 0.
  for (VstInt32 i = 0; i < std::max(effect.numOutputs, 1); ++i) {
    pin = {};
    wrapper.getOutputProperties(i, pin);
  }
  for (const char* capability : kCapabilitiesAsked)
    dispatch(effect, effCanDo, 0, 0, textArgument(capability));
}

/// On purpose: the plug-in stays on its last program.
void inspectPresetInfo(VSTWrapper& wrapper) {
  const VstInt32 programs = wrapper.effect->numPrograms;
  dispatch(*wrapper.effect, effGetProgram);
  wrapper.getCurrentProgramName();
  for (VstInt32 i = 0; i < programs; ++i) {
    wrapper.setCurrentProgram(i);
    const std::string name = wrapper.getProgramName(i);
    wrapper.changeProgramName(i, name);
  }
}

void inspectParameterInfo(VSTWrapper& wrapper) {
  for (VstInt32 i = 0; i < wrapper.effect->numParams; ++i) {
    const float value = wrapper.getParameter(i);
    wrapper.setParameter(i, value);
    wrapper.getParameterName(i);
    wrapper.getParameterLabel(i);
    const std::string text = wrapper.getParameterCurValueAsText(i);
    wrapper.setParameterCurValueFromText(i, text.c_str());
    wrapper.isParameterAutomatable(i);
    VstParameterProperties props = {};
    wrapper.getParameterProps(i, props);
  }
}

/// Saves the state, reads the saved data's header and loads the data back.
void saveAndLoad(VSTWrapper& wrapper, AutoBuffer<char>& buffer, bool asBank) {
  if (!wrapper.saveToFXBData(buffer, asBank)) return;
  VSTWrapper::getEffectIDFromPresetData(buffer.data());
  VSTWrapper::presetDataIsBankFormat(buffer.data());
  wrapper.loadFromFXBData(buffer.data(), buffer.size());
}

void testSettingState(VSTWrapper& wrapper) {
  AEffect& effect = *wrapper.effect;
  wrapper.setSampleRate(44100.0);
  wrapper.setBufferSize(512);
  AutoBuffer<char> buffer;
  saveAndLoad(wrapper, buffer, false);
  saveAndLoad(wrapper, buffer, true);
  dispatch(effect, effMainsChanged, 0, 1);
  wrapper.mainsOn = true;
  // On purpose: the flag changes before the request is made, here and below.
  wrapper.bypassed = true;
  dispatch(effect, effSetBypass, 0, 1);
  wrapper.bypassed = false;
  dispatch(effect, effSetBypass, 0, 0);
  dispatch(effect, effMainsChanged, 0, 0);
  wrapper.mainsOn = false;
}

/// On purpose: the test is named after the latency and asks for the tail size.
void inspectLatency(VSTWrapper& wrapper) { dispatch(*wrapper.effect, effGetTailSize); }

void inspectStreamFormat(VSTWrapper& wrapper) {
  const bool isSynth = (wrapper.effect->flags & effFlagsIsSynth) != 0;
  offerVariants(wrapper, KelVSTInfoCache::VSTInfo::BuildVariants(&wrapper, isSynth));
}

struct Test {
  const char* name;      ///< In the failure line.
  const char* stepText;  ///< In the step line. On purpose: differs from the name.
  void (*run)(VSTWrapper& wrapper);
};

constexpr Test kTests[] = {
    {"inspect class info test", "inspect class info", inspectClassInfo},
    {"inspect preset info test", "inspect preset info", inspectPresetInfo},
    {"inspect parameter info test", "inspect parameter info", inspectParameterInfo},
    {"test setting state", "testing setting states", testSettingState},
    {"inspect latency test", "inspect latency", inspectLatency},
    {"inspect io config", "inspect stream format", inspectStreamFormat},
};
constexpr int kTestCount = sizeof kTests / sizeof kTests[0];

}  // namespace

void runOneTest(int testNumber, VSTWrapper* wrapper) {
  if (testNumber < 0 || testNumber >= kTestCount) return;
  const Test& test = kTests[testNumber];
  gCurTest = test.name;
  printStep(test.stepText);
  if (wrapper == nullptr) crashOnPurpose();
  test.run(*wrapper);
}

void offerVariants(VSTWrapper& wrapper, const std::vector<VSTVariant>& variants) {
  for (const VSTVariant& variant : variants) {
    if (!variant.accepted) continue;
    const OwnedSpeakerArrangement in = variant.getInArrangement();
    const OwnedSpeakerArrangement out = variant.getOutArrangement();
    wrapper.setSpeakerArrangement(in.get(), out.get());
  }
}
