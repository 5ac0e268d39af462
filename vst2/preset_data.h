// SPDX-License-Identifier: MIT
// Preset and bank data: the big-endian layout of fxp and fxb files.
//
// What follows each record (parameter values, programs, or a size and a chunk) is found by the offsets below
// and not by sizeof, which depends on how a build packs records.
#pragma once

#include <cstddef>

#include "vst2/basic_types.h"

constexpr VstInt32 kPresetChunkMagic = fourCharacterCode('C', 'c', 'n', 'K');
constexpr VstInt32 kPresetParameterProgramMagic = fourCharacterCode('F', 'x', 'C', 'k');
constexpr VstInt32 kPresetParameterBankMagic = fourCharacterCode('F', 'x', 'B', 'k');
constexpr VstInt32 kPresetChunkProgramMagic = fourCharacterCode('F', 'P', 'C', 'h');
constexpr VstInt32 kPresetChunkBankMagic = fourCharacterCode('F', 'B', 'C', 'h');

/// The same numbers in the other byte order.
constexpr VstInt32 kReversedParameterBankMagic = fourCharacterCode('k', 'B', 'x', 'F');
constexpr VstInt32 kReversedChunkProgramMagic = fourCharacterCode('h', 'C', 'P', 'F');
constexpr VstInt32 kReversedChunkBankMagic = fourCharacterCode('h', 'C', 'B', 'F');

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

/// One program (preset). Parameter values, or the size of a chunk and the chunk, follow at byte 56.
struct fxProgram {
  VstInt32 chunkMagic;  ///< 'CcnK'
  VstInt32 byteSize;    ///< Size of what follows; this host writes 0.
  VstInt32 fxMagic;     ///< 'FxCk' with parameter values, 'FPCh' with a chunk.
  VstInt32 version;     ///< Of the format: 1.
  VstInt32 fxID;        ///< AEffect::uniqueID
  VstInt32 fxVersion;   ///< AEffect::version
  VstInt32 numParams;
  char prgName[28];
};

/// All programs (bank). fxProgram blocks, or the size of a chunk and the chunk, follow at byte 156.
struct fxBank {
  VstInt32 chunkMagic;  ///< 'CcnK'
  VstInt32 byteSize;
  VstInt32 fxMagic;  ///< 'FxBk' with parameter programs, 'FBCh' with a chunk.
  VstInt32 version;
  VstInt32 fxID;
  VstInt32 fxVersion;
  VstInt32 numPrograms;
  char future[128];
};
