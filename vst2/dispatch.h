// SPDX-License-Identifier: MIT
// The one door through which a request leaves the host.
#pragma once

#include "vst2/aeffect.h"
#include "vst2/effect_opcodes.h"

/// Makes one request of the plug-in and returns its answer unchanged. Whatever the plug-in throws passes
/// through.
inline VstIntPtr dispatch(AEffect& effect, VstEffectOpcode opcode, VstInt32 index = 0, VstIntPtr value = 0,
                          void* ptr = nullptr, float opt = 0.0f) {
  return effect.dispatcher(&effect, opcode, index, value, ptr, opt);
}

/// A text that the plug-in only reads, as the interface's untyped pointer.
inline void* textArgument(const char* text) { return const_cast<char*>(text); }
