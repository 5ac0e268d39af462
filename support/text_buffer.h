// SPDX-License-Identifier: MIT
// The fixed text buffers that are cleared, handed to the plug-in and read back.
//
// Their sizes (114 bytes for the names of plug-ins and manufacturers, 500 for a parameter's name, 256 for
// other texts of parameters and programs) are far above the interface's own limits, because plug-ins exceed
// those.
#pragma once

#include <cstddef>
#include <cstring>
#include <string>

/// Fills the whole array with zero bytes.
template <std::size_t size>
void vst_zerostruct(char (&text)[size]) {
  std::memset(text, 0, size);
}

/// The text in the buffer up to its first zero byte, or the whole buffer when there is none.
template <std::size_t size>
std::string textIn(const char (&text)[size]) {
  const void* end = std::memchr(text, '\0', size);
  return end == nullptr ? std::string(text, size) : std::string(text, static_cast<const char*>(end));
}
