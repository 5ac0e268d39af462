// Reading and writing the fields of preset and bank data.
//
// The data is big-endian and this program runs on little-endian processors only, so every field is reversed,
// unconditionally, on the way in and on the way out. Pointers need no alignment.
#pragma once

#include <cstddef>
#include <string>

#include "vst2/basic_types.h"

/// Offsets in bytes from the start of a program, a bank or both.
enum PresetOffset : std::size_t {
  kChunkMagicAt = 0,
  kByteSizeAt = 4,
  kFormMagicAt = 8,
  kFormatVersionAt = 12,
  kPluginIdAt = 16,
  kPluginVersionAt = 20,
  kCountAt = 24,
  kProgramNameAt = 28,
  kProgramContentAt = 56,
  kBankContentAt = 156,
};

/// Room for the name in a program, its terminating zero byte included.
constexpr std::size_t kProgramNameSize = 28;

/// Reverses the four bytes of a value.
VstInt32 vst_swap(VstInt32 value);

/// Reverses the four bytes of a float. The result is a word and not a float: the reversed pattern may be a
/// signalling NaN, which a floating-point register would change.
VstInt32 vst_swapFloat(float value);

VstInt32 readWord(const char* at);
void writeWord(char* at, VstInt32 value);
float readFloat(const char* at);
void writeFloat(char* at, float value);

/// The name field of a program up to its first zero byte.
std::string readProgramName(const char* program);
/// Writes the first 27 characters and fills the rest of the field with zero bytes.
void writeProgramName(char* program, const std::string& name);
