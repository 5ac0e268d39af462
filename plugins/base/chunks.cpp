// SPDX-License-Identifier: MIT
// The state of a sample as a chunk of 32-bit floats in the machine's byte order. The chunk of a program is
// its parameter values; that of a bank is the number of the current program, then the values of all programs.
#include <cstring>

#include "plugins/base/sample_plugin.h"

namespace sample_plugins {

VstIntPtr SamplePlugin::saveChunk(bool isProgram, void** data) {
  if ((record.flags & effFlagsProgramChunks) == 0) return 0;
  chunk.clear();
  if (isProgram) {
    chunk = currentProgram().values;
  } else {
    chunk.push_back(static_cast<float>(current));
    for (const Program& program : programs) {
      chunk.insert(chunk.end(), program.values.begin(), program.values.end());
    }
  }
  *data = chunk.data();
  return static_cast<VstIntPtr>(chunk.size() * sizeof(float));
}

VstIntPtr SamplePlugin::loadChunk(bool isProgram, const void* data, std::size_t sizeInBytes) {
  const std::size_t width = description.parameters.size();
  const std::size_t expected = isProgram ? width : 1 + width * programs.size();
  if ((record.flags & effFlagsProgramChunks) == 0 || sizeInBytes != expected * sizeof(float)) return 0;

  std::vector<float> values(expected);
  if (expected != 0) std::memcpy(values.data(), data, sizeInBytes);
  if (isProgram) {
    currentProgram().values = values;
    return 1;
  }
  if (!(values[0] >= 0.0f && values[0] < static_cast<float>(programs.size()))) return 0;
  current = static_cast<VstInt32>(values[0]);
  auto next = values.cbegin() + 1;
  for (Program& program : programs) {
    program.values.assign(next, next + static_cast<std::ptrdiff_t>(width));
    next += static_cast<std::ptrdiff_t>(width);
  }
  return 1;
}

}  // namespace sample_plugins
