// SPDX-License-Identifier: MIT
// The function through which the host makes every request of a plug-in.
#pragma once

#include "flight_recorder/flight_recorder.h"
#include "vst2/aeffect.h"
#include "vst2/effect_opcodes.h"

/// Makes one request of the plug-in and returns its answer unchanged. What the plug-in throws
/// reaches the caller. The flight record holds the request meanwhile.
inline VstIntPtr dispatch(AEffect& effect, VstEffectOpcode opcode, VstInt32 index = 0, VstIntPtr value = 0,
                          void* ptr = nullptr, float opt = 0.0f) {
  RequestUnderWay request(opcode, index, value, opt);
  const VstIntPtr answer = effect.dispatcher(&effect, opcode, index, value, ptr, opt);
  request.returned();
  return answer;
}

/// A text that the plug-in only reads, as the untyped pointer that the interface demands.
inline void* textArgument(const char* text) { return const_cast<char*>(text); }
