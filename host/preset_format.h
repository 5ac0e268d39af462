// SPDX-License-Identifier: MIT
// Reads and writes the fields of preset and bank data.
//
// The data is big-endian. This program runs on little-endian processors only, so the bytes of every field are
// reversed unconditionally, on reading and on writing. Pointers need no alignment.
#pragma once

#include <cstddef>
#include <cstring>
#include <string>

#include "support/endian.h"
#include "vst2/preset_data.h"

/// Reverses the four bytes of a value.
inline VstInt32 vst_swap(VstInt32 value) {
  Endian::Swap(&value, sizeof value);
  return value;
}

/// Reverses the four bytes of a float. The result is a word and not a float: the reversed pattern may be a
/// signalling NaN, which a floating-point register would change.
inline VstInt32 vst_swapFloat(float value) {
  VstInt32 word = 0;
  std::memcpy(&word, &value, sizeof word);
  return vst_swap(word);
}

/// Reads a 32-bit number.
inline VstInt32 readWord(const char* at) {
  VstInt32 word = 0;
  std::memcpy(&word, at, sizeof word);
  return vst_swap(word);
}

/// Writes a 32-bit number.
inline void writeWord(char* at, VstInt32 value) {
  const VstInt32 word = vst_swap(value);
  std::memcpy(at, &word, sizeof word);
}

/// Reads a 32-bit float.
inline float readFloat(const char* at) {
  const VstInt32 word = readWord(at);
  float value = 0.0f;
  std::memcpy(&value, &word, sizeof value);
  return value;
}

/// Writes a 32-bit float.
inline void writeFloat(char* at, float value) {
  const VstInt32 word = vst_swapFloat(value);
  std::memcpy(at, &word, sizeof word);
}

/// The name in a program's name field: up to its first zero byte, or all 28 bytes if there is none.
std::string readProgramName(const char* program);

/// Writes the first 27 characters of `name` and fills the rest of the 28 bytes with zero bytes.
void writeProgramName(char* program, const std::string& name);
