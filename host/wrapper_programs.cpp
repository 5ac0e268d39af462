// SPDX-License-Identifier: MIT
// VSTWrapper: programs, and the store that saves the current program while others are visited.
//
// A temporary parameter store holds the program's name (64 bytes, zero-terminated), then one 32-bit float for
// each parameter in the machine's own byte order.
#include <algorithm>
#include <cstring>

#include "host/locked_values.h"
#include "host/vst_wrapper.h"
#include "support/data_sizes.h"
#include "support/text_buffer.h"
#include "vst2/dispatch.h"

namespace {

constexpr std::size_t kProgramNameBufferSize = 256;
constexpr std::size_t kMaxSentNameLength = 24;
constexpr std::size_t kStoreNameSize = 64;

/// How many values a store holds, whatever the number of parameters is now.
VstInt32 valuesInStore(const AutoBuffer<char>& store) {
  return (store.size() - VstInt32{kStoreNameSize}) / VstInt32{sizeof(float)};
}

char* valueInStore(char* store, VstInt32 index) {
  return store + kStoreNameSize + sizeof(float) * static_cast<std::size_t>(index);
}

}  // namespace

void VSTWrapper::setCurrentProgram(int index) {
  if (programCount() <= 0) return;
  // On purpose: compared as given, before it is clamped.
  if (index == currentProgram()) return;
  // The count is read again, since the plug-in may have changed it while it was asked.
  const std::int64_t last = std::int64_t{programCount()} - 1;
  const std::int64_t program = index < 0 ? 0 : std::min<std::int64_t>(index, last);
  dispatch(*effect, effSetProgram, 0, static_cast<VstIntPtr>(program));
}

std::string VSTWrapper::getCurrentProgramName() {
  char buffer[kProgramNameBufferSize];
  vst_zerostruct(buffer);
  dispatch(*effect, effGetProgramName, 0, 0, buffer);
  std::string name = textIn(buffer);
  const VstInt32 current = currentProgram();
  if (current < 0) return name;
  const auto program = static_cast<std::size_t>(current);
  if (program >= storedProgramNames.size()) {
    allocateOrFail([&] { storedProgramNames.resize(program + 1); });
  }
  // On purpose: a stored name is never replaced, even when the plug-in renames the program.
  if (storedProgramNames[program].empty()) storedProgramNames[program] = name;
  return name;
}

std::string VSTWrapper::getProgramName(int index) {
  if (index == currentProgram()) return getCurrentProgramName();
  char buffer[kProgramNameBufferSize];
  vst_zerostruct(buffer);
  // On purpose: the upper bound is one past the last program.
  const VstInt32 program = index < 0 ? 0 : std::min(index, programCount());
  if (dispatch(*effect, effGetProgramNameIndexed, program, -1, buffer) != 0) return textIn(buffer);
  const bool isStored = program >= 0 && static_cast<std::size_t>(program) < storedProgramNames.size();
  return isStored ? storedProgramNames[static_cast<std::size_t>(program)] : std::string();
}

void VSTWrapper::changeProgramName(int index, const std::string& name) {
  if (effect == nullptr || index != currentProgram() || programCount() <= 0) return;
  if (getCurrentProgramName() == name) return;
  std::string sent = name.substr(0, kMaxSentNameLength);
  dispatch(*effect, effSetProgramName, 0, 0, sent.data());
}

void VSTWrapper::updateStoredProgramNames() {
  if (programCount() < 1) return;
  char buffer[kProgramNameBufferSize];
  vst_zerostruct(buffer);
  if (dispatch(*effect, effGetProgramNameIndexed, 0, -1, buffer) != 0) return;
  const VstInt32 current = currentProgram();
  AutoBuffer<char> store;
  createTempParameterStore(store);
  for (VstInt32 i = 0; i < programCount(); ++i) {
    setCurrentProgram(i);
    getCurrentProgramName();
  }
  setCurrentProgram(current);
  restoreFromTempParameterStore(store);
}

void VSTWrapper::createTempParameterStore(AutoBuffer<char>& store) {
  // On purpose: a negative count is not corrected. The size is then that of the name, or a failed allocation.
  const VstInt32 parameters = parameterCount();
  const int size = sizeOrFail(kStoreNameSize, parameters, sizeof(float));
  store.setSize(std::max(size, static_cast<int>(kStoreNameSize)));
  std::memset(store.data(), 0, static_cast<std::size_t>(store.size()));
  const std::string name = getCurrentProgramName();
  std::memcpy(store.data(), name.c_str(), std::min(name.size(), kStoreNameSize - 1));
  LockedValues values(*this);
  for (VstInt32 i = 0; i < parameters; ++i) {
    const float value = values.get(i);
    std::memcpy(valueInStore(store.data(), i), &value, sizeof value);
  }
}

void VSTWrapper::restoreFromTempParameterStore(const AutoBuffer<char>& store) {
  changeProgramName(currentProgram(), store.data());
  // The plug-in may have more parameters than when the store was made; only the stored ones are set.
  LockedValues values(*this);
  for (VstInt32 i = 0; i < valuesInStore(store) && values.has(i); ++i) {
    float value = 0.0f;
    std::memcpy(&value, valueInStore(const_cast<char*>(store.data()), i), sizeof value);
    values.set(i, value);
  }
}

VstInt32 VSTWrapper::currentProgram() const {
  return static_cast<VstInt32>(dispatch(*effect, effGetProgram));
}

VstInt32 VSTWrapper::programCount() const { return effect == nullptr ? 0 : effect->numPrograms; }
