// SPDX-License-Identifier: MIT
// A text with three integers: the form of the texts in the description of a plug-in.
#pragma once

#include <cstdint>
#include <string>

struct NiduStringObj {
  /// Empty, all words 0.
  NiduStringObj() = default;
  /// Copies the text; `n` becomes the first word, the others are 0.
  NiduStringObj(const char* s, int n) : text(s), firstWord(n) {}

  std::string text;
  std::int32_t firstWord = 0;  ///< Given at construction; every use in this program passes 0.
  std::int32_t secondWord = 0;
  std::int32_t thirdWord = 0;
};
