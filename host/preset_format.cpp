#include "host/preset_format.h"

#include <algorithm>
#include <cstring>

#include "support/endian.h"

VstInt32 vst_swap(VstInt32 value) {
  Endian::Swap(&value, sizeof value);
  return value;
}

VstInt32 vst_swapFloat(float value) {
  VstInt32 word = 0;
  std::memcpy(&word, &value, sizeof word);
  return vst_swap(word);
}

VstInt32 readWord(const char* at) {
  VstInt32 word = 0;
  std::memcpy(&word, at, sizeof word);
  return vst_swap(word);
}

void writeWord(char* at, VstInt32 value) {
  const VstInt32 word = vst_swap(value);
  std::memcpy(at, &word, sizeof word);
}

float readFloat(const char* at) {
  const VstInt32 word = readWord(at);
  float value = 0.0f;
  std::memcpy(&value, &word, sizeof value);
  return value;
}

void writeFloat(char* at, float value) {
  const VstInt32 word = vst_swapFloat(value);
  std::memcpy(at, &word, sizeof word);
}

std::string readProgramName(const char* program) {
  const char* name = program + kProgramNameAt;
  return {name, strnlen(name, kProgramNameSize)};
}

void writeProgramName(char* program, const std::string& name) {
  char* field = program + kProgramNameAt;
  std::memset(field, 0, kProgramNameSize);
  std::memcpy(field, name.c_str(), std::min(name.size(), kProgramNameSize - 1));
}
