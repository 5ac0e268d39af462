// SPDX-License-Identifier: MIT
#include "host/preset_format.h"

#include <algorithm>
#include <cstring>

std::string readProgramName(const char* program) {
  const char* name = program + kProgramNameAt;
  return {name, strnlen(name, kProgramNameSize)};
}

void writeProgramName(char* program, const std::string& name) {
  char* field = program + kProgramNameAt;
  std::memset(field, 0, kProgramNameSize);
  std::memcpy(field, name.c_str(), std::min(name.size(), kProgramNameSize - 1));
}
