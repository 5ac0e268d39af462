// SPDX-License-Identifier: MIT
// The integer types of the VST 2.x interface and its four-character codes.
#pragma once

#include <cstdint>

using VstInt16 = std::int16_t;
using VstInt32 = std::int32_t;

/// Signed and as wide as a pointer: the type of every argument and result that may carry one.
using VstIntPtr = std::intptr_t;

/// A four-character code: a number whose first character is the most significant byte.
constexpr VstInt32 fourCharacterCode(char a, char b, char c, char d) {
  const auto byte = [](char ch) { return static_cast<std::uint32_t>(static_cast<unsigned char>(ch)); };
  return static_cast<VstInt32>(byte(a) << 24 | byte(b) << 16 | byte(c) << 8 | byte(d));
}
