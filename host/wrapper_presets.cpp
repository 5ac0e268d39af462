// SPDX-License-Identifier: MIT
// VSTWrapper: preset and bank data.
//
// There are four forms: one program or a bank of all programs, each with parameter values or with the
// plug-in's own chunk. vst2/preset_data.h has the layout; host/preset_format.h reads and writes the fields.
#include <algorithm>
#include <cstring>
#include <limits>

#include "host/locked_values.h"
#include "host/preset_format.h"
#include "host/vst_wrapper.h"
#include "support/data_sizes.h"
#include "vst2/dispatch.h"

namespace {

constexpr VstInt32 kFormatVersion = 1;
constexpr int kSmallestData = 28;
constexpr std::int64_t kChunkSizeField = 4;

/// The size in bytes of an 'FxCk' block with this many parameter values.
/// On purpose: a negative count is not corrected, so the block comes out smaller than its header or negative.
constexpr std::int64_t programSize(VstInt32 parameters) {
  return std::int64_t{kProgramContentAt} + parameters * std::int64_t{sizeof(float)};
}

/// Makes room for `fixed` + `count` x `each` bytes, and at least for the header. Throws the int -1 for a
/// negative sum, and where there is no memory.
void makeRoom(AutoBuffer<char>& out, std::size_t headerSize, std::int64_t fixed, VstInt32 count,
              std::int64_t each) {
  out.setSize(std::max(sizeOrFail(fixed, count, each), static_cast<int>(headerSize)));
}

/// On purpose: the pointer is not checked. A null chunk with a size crashes, as a bad pointer does. Volatile, since
/// the compiler may take an argument of memcpy() for not null.
__attribute__((no_sanitize("undefined"))) void copyChunk(char* to, const void* chunk, std::size_t size) {
  const void* volatile from = chunk;
  std::memcpy(to, from, size);
}

/// Writes the 28 bytes that all forms begin with.
/// On purpose: the byte-size field is 0 and not the size.
void writeHeader(char* at, VstInt32 formMagic, const AEffect* effect, VstInt32 count) {
  writeWord(at + kChunkMagicAt, kPresetChunkMagic);
  writeWord(at + kByteSizeAt, 0);
  writeWord(at + kFormMagicAt, formMagic);
  writeWord(at + kFormatVersionAt, kFormatVersion);
  writeWord(at + kPluginIdAt, effect->uniqueID);
  writeWord(at + kPluginVersionAt, effect->version);
  writeWord(at + kCountAt, count);
}

/// The offset of program `index` in a parameter bank. All programs are taken to be as long as the first one's
/// parameter count says; a negative count can give an offset before the data. The stride is limited to plus
/// or minus INT_MAX, beyond which no program but the first is inside anyway, so that the product cannot
/// overflow.
std::int64_t bankProgramAt(const char* bank, VstInt32 index) {
  constexpr std::int64_t kFarthest = std::numeric_limits<VstInt32>::max();
  const std::int64_t parameters = readWord(bank + kBankContentAt + kCountAt);
  const std::int64_t stride = parameters * std::int64_t{sizeof(float)} + std::int64_t{kProgramContentAt};
  return std::int64_t{kBankContentAt} + index * std::clamp(stride, -kFarthest, kFarthest);
}

}  // namespace

bool VSTWrapper::hasChunks() const {
  return effect != nullptr && (effect->flags & effFlagsProgramChunks) != 0;
}

void VSTWrapper::getChunkData(AutoBuffer<char>& out, bool isPreset) const {
  if (!hasChunks()) return;
  void* chunk = nullptr;
  const VstIntPtr size = dispatch(*effect, effGetChunk, isPreset ? 1 : 0, 0, &chunk);
  if (size > std::numeric_limits<int>::max() || size < 0) throw -1;
  out.setSize(static_cast<int>(size));
  if (size > 0) copyChunk(out.data(), chunk, static_cast<std::size_t>(size));
}

void VSTWrapper::setChunkData(const char* data, int size, bool isPreset) {
  if (size < 1 || !hasChunks()) return;
  dispatch(*effect, effSetChunk, isPreset ? 1 : 0, size, const_cast<char*>(data));
  if (!isPreset) updateStoredProgramNames();
}

void VSTWrapper::setParamsInProgramBlock(fxProgram* block) {
  writeProgramBlock(reinterpret_cast<char*>(block), parameterCount());
}

void VSTWrapper::writeProgramBlock(char* block, VstInt32 parameters) {
  writeHeader(block, kPresetParameterProgramMagic, effect, parameters);
  writeProgramName(block, getCurrentProgramName());
  char* value = block + kProgramContentAt;
  LockedValues values(*this);
  for (VstInt32 i = 0; i < parameters; ++i, value += sizeof(float)) writeFloat(value, values.get(i));
}

bool VSTWrapper::saveToFXBData(AutoBuffer<char>& out, bool asBank) {
  if (hasChunks()) {
    saveChunk(out, asBank);
  } else if (asBank) {
    saveParameterBank(out);
  } else {
    const VstInt32 parameters = parameterCount();
    makeRoom(out, kProgramContentAt, programSize(parameters), 0, 0);
    writeProgramBlock(out.data(), parameters);
  }
  return true;
}

void VSTWrapper::saveChunk(AutoBuffer<char>& out, bool asBank) {
  AutoBuffer<char> chunk;
  getChunkData(chunk, !asBank);
  const std::size_t contentAt = asBank ? kBankContentAt : kProgramContentAt;
  const std::int64_t fixedSize = static_cast<std::int64_t>(contentAt) + kChunkSizeField;
  out.setSize(sizeOrFail(fixedSize, chunk.size(), 1));
  std::memset(out.data(), 0, contentAt);
  // On purpose: the count of a single program, too, is the number of programs and not of parameters.
  writeHeader(out.data(), asBank ? kPresetChunkBankMagic : kPresetChunkProgramMagic, effect,
              effect->numPrograms);
  if (!asBank) writeProgramName(out.data(), getCurrentProgramName());
  writeWord(out.data() + contentAt, chunk.size());
  if (chunk.size() > 0) {
    std::memcpy(out.data() + fixedSize, chunk.data(), static_cast<std::size_t>(chunk.size()));
  }
}

void VSTWrapper::saveParameterBank(AutoBuffer<char>& out) {
  // The counts are read once: a plug-in that changes them meanwhile cannot move a block out of the buffer.
  const VstInt32 parameters = parameterCount();
  const VstInt32 programs = programCount();
  const VstInt32 blocks = std::max(programs, 1);
  const std::int64_t blockSize = programSize(parameters);
  makeRoom(out, kBankContentAt, kBankContentAt, blocks, blockSize);
  // Each program fills its block. Only in a bank without programs can the one block stay unwritten.
  const std::int64_t unwritten = programs > 0 ? 0 : std::max<std::int64_t>(blockSize, 0);
  std::memset(out.data(), 0, kBankContentAt + static_cast<std::size_t>(unwritten));
  writeHeader(out.data(), kPresetParameterBankMagic, effect, programs);

  const auto writeBlock = [&](VstInt32 program) {
    const std::int64_t at = std::int64_t{kBankContentAt} + program * blockSize;
    if (parameters >= 0) return writeProgramBlock(out.data() + at, parameters);
    // A negative count leaves a block less room than its header takes. Only what has room is written.
    char header[kProgramContentAt];
    writeProgramBlock(header, parameters);
    if (blockSize > 0) std::memcpy(out.data() + at, header, static_cast<std::size_t>(blockSize));
  };
  const VstInt32 current = currentProgram();
  AutoBuffer<char> store;
  createTempParameterStore(store);
  // A current program outside the bank has no block of its own.
  if (current >= 0 && current < blocks) writeBlock(current);
  for (VstInt32 i = 0; i < programs; ++i) {
    if (i == current) continue;
    setCurrentProgram(i);
    writeBlock(i);
  }
  setCurrentProgram(current);
  restoreFromTempParameterStore(store);
}

bool VSTWrapper::restoreProgramSettings(const fxProgram* block) {
  const char* program = reinterpret_cast<const char*>(block);
  if (readWord(program + kChunkMagicAt) != kPresetChunkMagic) return false;
  if (readWord(program + kFormMagicAt) != kPresetParameterProgramMagic) return false;
  loadProgramValues(program);
  return true;
}

void VSTWrapper::loadProgramValues(const char* block) {
  changeProgramName(currentProgram(), readProgramName(block));
  const VstInt32 count = readWord(block + kCountAt);
  // On purpose: the values are not checked against the size of the data. Values beyond the plug-in's last
  // parameter are not read.
  const char* value = block + kProgramContentAt;
  LockedValues values(*this);
  for (VstInt32 i = 0; i < count && values.has(i); ++i, value += sizeof(float)) {
    values.set(i, readFloat(value));
  }
}

bool VSTWrapper::loadFromFXBData(const void* data, int size) {
  const char* bytes = static_cast<const char*>(data);
  if (size < kSmallestData) return false;
  const VstInt32 chunkMagic = readWord(bytes + kChunkMagicAt);
  const bool isReversed = chunkMagic == vst_swap(kPresetChunkMagic);
  if (chunkMagic != kPresetChunkMagic && !isReversed) return false;
  if (readWord(bytes + kFormatVersionAt) > kFormatVersion) return false;

  // On purpose: the parameter forms are recognised in their proper byte order only, the chunk forms in both.
  // On purpose: the chunk size is read without checking that the data reaches that far.
  switch (readWord(bytes + kFormMagicAt)) {
    case kPresetParameterBankMagic:
      return loadParameterBank(bytes, size);
    case kPresetParameterProgramMagic:
      // On purpose: this form alone is refused behind the reversed chunk magic.
      if (isReversed) return false;
      loadProgramValues(bytes);
      return true;
    case kPresetChunkBankMagic:
    case kReversedChunkBankMagic: {
      const VstInt32 chunkSize = readWord(bytes + kBankContentAt);
      if (chunkSize + std::int64_t{kBankContentAt} + kChunkSizeField > size) return false;
      setChunkData(bytes + kBankContentAt + kChunkSizeField, chunkSize, false);
      return true;
    }
    case kPresetChunkProgramMagic:
    case kReversedChunkProgramMagic: {
      const VstInt32 chunkSize = readWord(bytes + kProgramContentAt);
      if (chunkSize + std::int64_t{kProgramContentAt} + kChunkSizeField > size) return false;
      setChunkData(bytes + kProgramContentAt + kChunkSizeField, chunkSize, true);
      changeProgramName(currentProgram(), readProgramName(bytes));
      return true;
    }
    default:
      return false;
  }
}

bool VSTWrapper::loadParameterBank(const char* data, int size) {
  const VstInt32 count = readWord(data + kCountAt);
  if (count < 0) return true;
  const VstInt32 current = currentProgram();
  // On purpose: only the start of a block is checked against the size, not its end.
  const auto loadBlock = [&](VstInt32 program) {
    return restoreProgramSettings(reinterpret_cast<const fxProgram*>(data + bankProgramAt(data, program)));
  };
  const auto startsInside = [&](VstInt32 program) {
    const std::int64_t at = bankProgramAt(data, program);
    return at >= 0 && at < size;
  };
  for (VstInt32 i = 0; i < count; ++i) {
    if (i == current) continue;
    if (!startsInside(i)) return false;
    setCurrentProgram(i);
    if (!loadBlock(i)) return false;
  }
  if (count > 0) setCurrentProgram(current);
  return startsInside(current) && loadBlock(current);
}

bool VSTWrapper::presetDataIsBankFormat(const char* data) {
  switch (readWord(data + kFormMagicAt)) {
    case kPresetChunkBankMagic:
    case kReversedChunkBankMagic:
    case kPresetParameterBankMagic:
    case kReversedParameterBankMagic:
      return true;
    default:
      return false;
  }
}

VstInt32 VSTWrapper::getEffectIDFromPresetData(const char* data) { return readWord(data + kPluginIdAt); }
