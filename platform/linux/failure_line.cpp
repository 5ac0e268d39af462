// SPDX-License-Identifier: MIT
// How a failed service tells its reason.
#include "platform/linux/failure_line.h"

#include <cstdio>

#include "platform/linux/utf8.h"

namespace core_foundation {

std::string asOneLine(std::string_view reason) {
  constexpr char kHexDigits[] = "0123456789abcdef";
  const bool isText = isValidUtf8(reason);
  std::string line;
  for (const char c : reason) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte < 0x20 || byte == 0x7F) {
      line += ' ';
    } else if (byte >= 0x80 && !isText) {
      line += "\\x";
      line += kHexDigits[byte >> 4U];
      line += kHexDigits[byte & 0xFU];
    } else {
      line += c;
    }
  }
  return line;
}

void logFailure(std::string_view reason) {
  // One call, one write: lines of other threads do not get in between.
  const std::string line = "vsttorture: " + asOneLine(reason) + "\n";
  std::fputs(line.c_str(), stderr);
}

}  // namespace core_foundation
