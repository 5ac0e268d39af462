// SPDX-License-Identifier: MIT
#include "platform/utf8.h"

#include <cstddef>

namespace {

unsigned char byteAt(std::string_view bytes, std::size_t i) { return static_cast<unsigned char>(bytes[i]); }

// The well-formed sequences of UTF-8 by their first byte. The bounds of the second byte exclude overlong
// forms, surrogates and everything above U+10FFFF; further bytes are 80..BF.
struct SequenceForm {
  unsigned char lowestFirst, highestFirst, length, lowestSecond, highestSecond;
};
constexpr SequenceForm kSequenceForms[] = {
    {0x00, 0x7F, 1, 0x00, 0x00},  //
    {0xC2, 0xDF, 2, 0x80, 0xBF},  //
    {0xE0, 0xE0, 3, 0xA0, 0xBF},  //
    {0xE1, 0xEC, 3, 0x80, 0xBF},  //
    {0xED, 0xED, 3, 0x80, 0x9F},  //
    {0xEE, 0xEF, 3, 0x80, 0xBF},  //
    {0xF0, 0xF0, 4, 0x90, 0xBF},  //
    {0xF1, 0xF3, 4, 0x80, 0xBF},  //
    {0xF4, 0xF4, 4, 0x80, 0x8F},
};

// The length in bytes of the well-formed sequence at the front of `bytes`, or 0.
std::size_t sequenceLength(std::string_view bytes) {
  const unsigned char first = byteAt(bytes, 0);
  for (const SequenceForm& form : kSequenceForms) {
    if (first < form.lowestFirst || first > form.highestFirst) continue;
    if (form.length > bytes.size()) return 0;
    for (std::size_t i = 1; i < form.length; ++i) {
      const unsigned char lowest = i == 1 ? form.lowestSecond : 0x80;
      const unsigned char highest = i == 1 ? form.highestSecond : 0xBF;
      if (byteAt(bytes, i) < lowest || byteAt(bytes, i) > highest) return 0;
    }
    return form.length;
  }
  return 0;
}

}  // namespace

bool isValidUtf8(std::string_view bytes) {
  while (!bytes.empty()) {
    const std::size_t length = sequenceLength(bytes);
    if (length == 0) return false;
    bytes.remove_prefix(length);
  }
  return true;
}
