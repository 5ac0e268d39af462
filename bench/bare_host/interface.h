// SPDX-License-Identifier: MIT
/* The part of the VST 2.x interface that the bare host uses, in C. Independent of vst2/, so that an error
 * there shows up as a difference between the requests of the two programs. */
#pragma once

#include <stdint.h>

typedef struct AEffect AEffect;
typedef intptr_t HostCallback(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr,
                              float opt);
typedef AEffect* EntryPoint(HostCallback* host);

struct AEffect {
  int32_t magic;
  intptr_t (*dispatcher)(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr,
                         float opt);
  void (*process)(AEffect* effect, float** inputs, float** outputs, int32_t frames);
  void (*setParameter)(AEffect* effect, int32_t index, float value);
  float (*getParameter)(AEffect* effect, int32_t index);
  int32_t numPrograms;
  int32_t numParams;
  int32_t numInputs;
  int32_t numOutputs;
  int32_t flags;
  intptr_t resvd1;
  intptr_t resvd2;
  int32_t initialDelay;
  int32_t realQualities;
  int32_t offQualities;
  float ioRatio;
  void* object;
  void* user;
  int32_t uniqueID;
  int32_t version;
  void (*processReplacing)(AEffect* effect, float** inputs, float** outputs, int32_t frames);
};

enum { kProgramChunks = 1 << 5, kShellCategory = 10, kPinBytes = 128 };

typedef struct {
  char steps[12];
  char label[64];
  int32_t flags;
  int32_t minInteger;
  int32_t maxInteger;
  int32_t stepInteger;
  char rest[60];
} ParameterProperties;

enum { kHasIntegerRange = 1 << 1, kHasIntegerStep = 1 << 3 };

enum {
  effOpen = 0,
  effClose = 1,
  effSetProgram = 2,
  effGetProgram = 3,
  effSetProgramName = 4,
  effGetProgramName = 5,
  effGetParamLabel = 6,
  effGetParamDisplay = 7,
  effGetParamName = 8,
  effSetSampleRate = 10,
  effSetBlockSize = 11,
  effMainsChanged = 12,
  effIdentify = 22,
  effGetChunk = 23,
  effSetChunk = 24,
  effCanBeAutomated = 26,
  effString2Parameter = 27,
  effGetProgramNameIndexed = 29,
  effConnectInput = 31,
  effConnectOutput = 32,
  effGetInputProperties = 33,
  effGetOutputProperties = 34,
  effGetPlugCategory = 35,
  effSetBypass = 44,
  effGetEffectName = 45,
  effGetVendorString = 47,
  effGetProductString = 48,
  effCanDo = 51,
  effGetTailSize = 52,
  effGetParameterProperties = 56,
  effGetVstVersion = 58,
  effShellGetNextPlugin = 70
};
