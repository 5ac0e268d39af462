// SPDX-License-Identifier: MIT
#include "scanner/report/characters.h"

#include <algorithm>
#include <iterator>

#include <fmt/format.h>

namespace scanner {
namespace {

struct Range {
  char32_t first;
  char32_t last;
};

constexpr Range kInvisible[] = {
    {0x80, 0x9F},        // C1 control characters
    {0xAD, 0xAD},        // soft hyphen
    {0x34F, 0x34F},      // combining grapheme joiner
    {0x61C, 0x61C},      // Arabic letter mark
    {0x115F, 0x1160},    // Hangul fillers
    {0x17B4, 0x17B5},    // Khmer inherent vowels
    {0x180B, 0x180F},    // Mongolian selectors and vowel separator
    {0x200B, 0x200F},    // zero width, marks of direction
    {0x2028, 0x202E},    // separators of lines, embeddings and overrides of direction
    {0x2060, 0x206F},    // invisible operators, isolates of direction
    {0x3164, 0x3164},    // Hangul filler
    {0xFE00, 0xFE0F},    // variation selectors
    {0xFEFF, 0xFEFF},    // byte order mark
    {0xFFA0, 0xFFA0},    // Hangul filler, half width
    {0xFFF0, 0xFFFB},    // interlinear annotation
    {0xFFFE, 0xFFFF},    // no characters
    {0xE0000, 0xE0FFF},  // tags, further variation selectors
};

/// By blocks rather than by single characters: near enough for names and paths.
constexpr Range kWide[] = {
    {0x1100, 0x115E},    // Hangul, leading consonants
    {0x231A, 0x231B},    // watch, hourglass
    {0x23E9, 0x23EC},    // arrows of players
    {0x2E80, 0x303E},    // radicals, punctuation of Chinese and Japanese
    {0x3041, 0x4DBF},    // kana, bopomofo, compatibility forms, ideographs
    {0x4E00, 0xA4CF},    // ideographs, Yi
    {0xA960, 0xA97C},    // Hangul
    {0xAC00, 0xD7A3},    // Hangul syllables
    {0xF900, 0xFAFF},    // compatibility ideographs
    {0xFE30, 0xFE6F},    // vertical and small forms
    {0xFF01, 0xFF60},    // full width forms
    {0xFFE0, 0xFFE6},    // full width signs
    {0x17000, 0x18CFF},  // Tangut, Khitan
    {0x1B000, 0x1B2FF},  // kana, Nushu
    {0x1F300, 0x1F64F},  // pictographs, faces
    {0x1F680, 0x1F6FF},  // transport
    {0x1F900, 0x1F9FF},  // pictographs
    {0x1FA70, 0x1FAFF},  // pictographs
    {0x20000, 0x3FFFD},  // ideographs
};

constexpr Range kMarks[] = {
    {0x300, 0x36F},    // accents
    {0x483, 0x489},    // Cyrillic
    {0x591, 0x5BD},    // Hebrew points
    {0x610, 0x61A},    // Arabic
    {0x64B, 0x65F},    // Arabic vowels
    {0x670, 0x670},    // Arabic
    {0x6D6, 0x6DC},    // Arabic
    {0x93C, 0x93C},    // Devanagari
    {0x941, 0x948},    // Devanagari vowels
    {0x94D, 0x94D},    // Devanagari
    {0xE31, 0xE31},    // Thai
    {0xE34, 0xE3A},    // Thai vowels
    {0xE47, 0xE4E},    // Thai tones
    {0x1AB0, 0x1AFF},  // accents
    {0x1DC0, 0x1DFF},  // accents
    {0x20D0, 0x20F0},  // marks for symbols
    {0x302A, 0x302D},  // ideographic tones
    {0x3099, 0x309A},  // voiced kana
    {0xFE20, 0xFE2F},  // half marks
};

/// Whether one of the ranges, which are in order, has it.
template <std::size_t kCount>
bool isIn(const Range (&ranges)[kCount], char32_t character) {
  const Range* range = std::lower_bound(std::begin(ranges), std::end(ranges), character,
                                        [](const Range& one, char32_t wanted) { return one.last < wanted; });
  return range != std::end(ranges) && range->first <= character;
}

}  // namespace

char32_t nextCharacter(std::string_view text, std::size_t& at) {
  const auto lead = static_cast<unsigned char>(text[at++]);
  if (lead < 0xC0) return lead;
  const unsigned more = lead < 0xE0 ? 1 : lead < 0xF0 ? 2 : 3;
  char32_t character = lead & (0x3FU >> more);
  for (unsigned i = 0; i < more && at < text.size(); ++i)
    character = (character << 6U) | (static_cast<unsigned char>(text[at++]) & 0x3FU);
  return character;
}

bool isControl(char32_t character) { return character < 0x20 || (character >= 0x7F && character <= 0x9F); }

bool isInvisible(char32_t character) { return isIn(kInvisible, character); }

std::string codeOf(char32_t character) { return fmt::format("[U+{:04X}]", static_cast<unsigned>(character)); }

std::size_t widthOf(char32_t character) {
  if (character < 0x300) return 1;
  return isIn(kMarks, character) ? 0 : isIn(kWide, character) ? 2 : 1;
}

}  // namespace scanner
