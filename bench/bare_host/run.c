// SPDX-License-Identifier: MIT
#include "run.h"

#include <stdlib.h>

#include "instance.h"
#include "presets.h"

const char* const testTexts[kTests] = {"inspect class info",     "inspect preset info",
                                       "inspect parameter info", "testing setting states",
                                       "inspect latency",        "inspect stream format"};

static void describeParameter(AEffect* effect, int32_t index) {
  char name[kParameterNameBuffer];
  char text[kTextBuffer];
  ParameterProperties properties;
  getParameter(effect, index);
  askText(effect, effGetParamName, index, name, sizeof name);
  askText(effect, effGetParamLabel, index, text, sizeof text);
  request(effect, effCanBeAutomated, index, 0, NULL, 0.0f);
  memset(&properties, 0, sizeof properties);
  if (request(effect, effGetParameterProperties, index, 0, &properties, 0.0f) == 0) return;
  if ((properties.flags & kHasIntegerRange) == 0 || (properties.flags & kHasIntegerStep) == 0) return;
  const int64_t first = properties.minInteger;
  const int64_t last = properties.maxInteger;
  if (properties.stepInteger != 1 || last - first > 99) return;
  for (int64_t value = first; value <= last; ++value) {
    setParameter(effect, index, (float)value);
    askText(effect, effGetParamDisplay, index, text, sizeof text);
  }
}

void describeInstance(AEffect* effect) {
  effectName(effect);
  vendorName(effect);
  ask(effect, effGetVstVersion);
  const int32_t category = (int32_t)ask(effect, effGetPlugCategory);
  canDo(effect, "receiveVstMidiEvent");
  canDo(effect, "sendVstMidiEvent");
  if (category == kShellCategory) {
    char name[kNameBuffer];
    while ((int32_t)askText(effect, effShellGetNextPlugin, 0, name, sizeof name) != 0) continue;
    return;
  }
  for (int32_t i = 0; i < effect->numParams; ++i) describeParameter(effect, i);
}

static void inspectClass(AEffect* effect) {
  static const char* const kAsked[] = {"sendVstMidiEvent", "receiveVstMidiEvent", "receiveVstTimeInfo",
                                       "offline",          "midiProgramNames",    "bypass"};
  char pin[kPinBytes];
  effectName(effect);
  vendorName(effect);
  ask(effect, effGetPlugCategory);
  for (int32_t i = 0; i < effect->numInputs; ++i) askText(effect, effGetInputProperties, i, pin, sizeof pin);
  const int32_t outputs = effect->numOutputs > 1 ? effect->numOutputs : 1;
  for (int32_t i = 0; i < outputs; ++i) askText(effect, effGetOutputProperties, i, pin, sizeof pin);
  for (size_t i = 0; i < sizeof kAsked / sizeof *kAsked; ++i) canDo(effect, kAsked[i]);
}

static void inspectPrograms(AEffect* effect) {
  char name[kTextBuffer];
  ask(effect, effGetProgram);
  currentProgramName(effect, name);
  for (int32_t i = 0; i < effect->numPrograms; ++i) {
    selectProgram(effect, i);
    nameOfProgram(effect, i, name);
    renameProgram(effect, i, name);
  }
}

static void inspectParameters(AEffect* effect) {
  for (int32_t i = 0; i < effect->numParams; ++i) {
    char name[kParameterNameBuffer];
    char text[kTextBuffer];
    char properties[sizeof(ParameterProperties)];
    setParameter(effect, i, getParameter(effect, i));
    askText(effect, effGetParamName, i, name, sizeof name);
    askText(effect, effGetParamLabel, i, text, sizeof text);
    askText(effect, effGetParamDisplay, i, text, sizeof text);
    if (request(effect, effString2Parameter, i, 0, NULL, 0.0f) != 0) {
      request(effect, effString2Parameter, i, 0, text, 0.0f);
    }
    request(effect, effCanBeAutomated, i, 0, NULL, 0.0f);
    askText(effect, effGetParameterProperties, i, properties, sizeof properties);
  }
}

static void testState(AEffect* effect) {
  request(effect, effSetSampleRate, 0, 0, NULL, 44100.0f);
  request(effect, effSetBlockSize, 0, 512, NULL, 0.0f);
  for (int asBank = 0; asBank <= 1; ++asBank) {
    State state = saveState(effect, asBank);
    loadState(effect, &state, asBank);
    free(state.bytes);
  }
  request(effect, effMainsChanged, 0, 1, NULL, 0.0f);
  request(effect, effSetBypass, 0, 1, NULL, 0.0f);
  request(effect, effSetBypass, 0, 0, NULL, 0.0f);
  request(effect, effMainsChanged, 0, 0, NULL, 0.0f);
}

void runTest(AEffect* effect, int number) {
  switch (number) {
    case 0:
      inspectClass(effect);
      break;
    case 1:
      inspectPrograms(effect);
      break;
    case 2:
      inspectParameters(effect);
      break;
    case 3:
      testState(effect);
      break;
    case 4:
      ask(effect, effGetTailSize);
      break;
    default: /* Test 5 makes no request: the host selects its variants by the plug-in's channel counts. */
      break;
  }
}
