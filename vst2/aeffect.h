// SPDX-License-Identifier: MIT
// The record that stands for a plug-in instance, shared by the plug-in and its host.
//
// A plug-in may have allocated less than the whole record: in some it ends behind processReplacing. Read
// single fields through the pointer; never copy, compare or clear an AEffect.
#pragma once

#include "vst2/basic_types.h"

extern "C" {

struct AEffect;

/// What the plug-in calls to reach its host. `effect` may be null while the entry point runs.
using audioMasterCallback = VstIntPtr (*)(AEffect* effect, VstInt32 opcode, VstInt32 index, VstIntPtr value,
                                          void* ptr, float opt);
/// What the host calls to make a request of the plug-in.
using AEffectDispatcherProc = VstIntPtr (*)(AEffect* effect, VstInt32 opcode, VstInt32 index, VstIntPtr value,
                                            void* ptr, float opt);
using AEffectProcessProc = void (*)(AEffect* effect, float** inputs, float** outputs, VstInt32 frames);
using AEffectProcessDoubleProc = void (*)(AEffect* effect, double** inputs, double** outputs,
                                          VstInt32 frames);
using AEffectSetParameterProc = void (*)(AEffect* effect, VstInt32 index, float value);
using AEffectGetParameterProc = float (*)(AEffect* effect, VstInt32 index);

/// A module's entry point. Null means that the plug-in refuses this host.
using PluginEntryProc = AEffect* (*)(audioMasterCallback host);

/// One plug-in instance. The plug-in owns it until effClose (1), after which it is gone.
struct AEffect {
  VstInt32 magic;  ///< 'VstP'
  AEffectDispatcherProc dispatcher;
  AEffectProcessProc process;  ///< Deprecated, accumulating; null in some plug-ins.
  AEffectSetParameterProc setParameter;
  AEffectGetParameterProc getParameter;
  VstInt32 numPrograms;  ///< May be 0.
  VstInt32 numParams;    ///< May be 0.
  VstInt32 numInputs;
  VstInt32 numOutputs;
  VstInt32 flags;         ///< VstAEffectFlags
  VstIntPtr resvd1;       ///< For the host's use; not used here.
  VstIntPtr resvd2;       ///< For the host's use; this host stores the wrapper's address.
  VstInt32 initialDelay;  ///< Latency in samples.
  VstInt32 realQualities;
  VstInt32 offQualities;
  float ioRatio;
  void* object;  ///< For the plug-in's use.
  void* user;    ///< For the plug-in's use.
  VstInt32 uniqueID;
  VstInt32 version;  ///< In the plug-in's own format.
  AEffectProcessProc processReplacing;
  AEffectProcessDoubleProc processDoubleReplacing;  ///< Valid only with effFlagsCanDoubleReplacing.
  char future[56];                                  ///< May not exist in memory.
};

}  // extern "C"

constexpr VstInt32 kEffectMagic = fourCharacterCode('V', 's', 't', 'P');

/// Bits of AEffect::flags.
enum VstAEffectFlags : VstInt32 {
  effFlagsHasEditor = 1 << 0,
  effFlagsCanReplacing = 1 << 4,
  effFlagsProgramChunks = 1 << 5,
  effFlagsIsSynth = 1 << 8,
  effFlagsNoSoundInStop = 1 << 9,
  effFlagsCanDoubleReplacing = 1 << 12,
};

/// Answers to effGetPlugCategory (35).
enum VstPlugCategory : VstInt32 {
  kPlugCategUnknown = 0,
  kPlugCategEffect = 1,
  kPlugCategSynth = 2,
  kPlugCategAnalysis = 3,
  kPlugCategMastering = 4,
  kPlugCategSpacializer = 5,
  kPlugCategRoomFx = 6,
  kPlugSurroundFx = 7,
  kPlugCategRestoration = 8,
  kPlugCategOfflineProcess = 9,
  kPlugCategShell = 10,
  kPlugCategGenerator = 11,
};
