// SPDX-License-Identifier: MIT
#include "scanner/report/html_text.h"

#include <algorithm>
#include <cmath>
#include <ctime>

#include <fmt/format.h>

#include "scanner/events/event_json.h"

namespace scanner {
namespace {

struct Range {
  char32_t first;
  char32_t last;
};

/// Characters that show nothing, or change how their neighbours are shown.
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

bool isInvisible(char32_t character) {
  return std::any_of(std::begin(kInvisible), std::end(kInvisible), [character](const Range& range) {
    return character >= range.first && character <= range.last;
  });
}

bool isPlain(unsigned char byte) {
  return byte >= 0x20 && byte < 0x7F && byte != '&' && byte != '<' && byte != '>' && byte != '"' &&
         byte != '\'';
}

/// How many bytes the character takes that begins with this one; the text is valid UTF-8.
std::size_t lengthFrom(unsigned char lead) {
  if (lead < 0xC0) return 1;
  if (lead < 0xE0) return 2;
  return lead < 0xF0 ? 3 : 4;
}

char32_t characterOf(std::string_view bytes) {
  const auto lead = static_cast<unsigned char>(bytes[0]);
  if (bytes.size() == 1) return lead;
  char32_t character = lead & (0x7FU >> bytes.size());
  for (const char byte : bytes.substr(1))
    character = (character << 6U) | (static_cast<unsigned char>(byte) & 0x3FU);
  return character;
}

void appendCharacter(std::string& out, std::string_view bytes, LineBreaks lineBreaks) {
  const char32_t character = characterOf(bytes);
  const bool isKept = lineBreaks == LineBreaks::kKept && (character == '\n' || character == '\t');
  if (character == '&') {
    out += "&amp;";
  } else if (character == '<') {
    out += "&lt;";
  } else if (character == '>') {
    out += "&gt;";
  } else if (character == '"') {
    out += "&quot;";
  } else if (character == '\'') {
    out += "&#39;";
  } else if (character < 0x20 && !isKept) {
    out += fmt::format("&#x{:x};", 0x2400 + static_cast<unsigned>(character));  // U+2400 is the sign for NUL
  } else if (character == 0x7F) {
    out += "&#x2421;";
  } else if (isInvisible(character)) {
    out += fmt::format("[U+{:04X}]", static_cast<unsigned>(character));
  } else if (character >= 0x80) {
    out += fmt::format("&#x{:x};", static_cast<unsigned>(character));
  } else {
    out += static_cast<char>(character);
  }
}

/// Date and time with what stands between them and behind.
std::string calendar(double secondsSince1970, const char* between, const char* behind) {
  // The last second of the year 9999.
  constexpr double kLatest = 253402300799;
  if (!(secondsSince1970 >= 0 && secondsSince1970 <= kLatest)) return {};
  const auto whole = static_cast<std::time_t>(secondsSince1970);
  std::tm parts = {};
  if (gmtime_r(&whole, &parts) == nullptr) return {};
  return fmt::format("{:04}-{:02}-{:02}{}{:02}:{:02}:{:02}{}", parts.tm_year + 1900, parts.tm_mon + 1,
                     parts.tm_mday, between, parts.tm_hour, parts.tm_min, parts.tm_sec, behind);
}

}  // namespace

std::string isolated(std::string_view bytes) {
  const std::string html = escaped(bytes);
  return html.find("&#x") == std::string::npos ? html : "<bdi>" + html + "</bdi>";
}

std::string escaped(std::string_view bytes, LineBreaks lineBreaks) {
  std::string out;
  out.reserve(bytes.size());
  if (std::all_of(bytes.begin(), bytes.end(), [](char c) { return isPlain(static_cast<unsigned char>(c)); }))
    return out.append(bytes);
  const std::string text = validUtf8(bytes);
  for (std::size_t at = 0; at < text.size();) {
    const std::size_t length = lengthFrom(static_cast<unsigned char>(text[at]));
    appendCharacter(out, std::string_view(text).substr(at, length), lineBreaks);
    at += length;
  }
  return out;
}

std::string clipped(std::string_view text, std::size_t most) {
  std::size_t at = 0;
  for (std::size_t count = 0; at < text.size() && count < most; ++count)
    at += lengthFrom(static_cast<unsigned char>(text[at]));
  if (at >= text.size()) return std::string(text);
  return std::string(text.substr(0, at)) + "\xE2\x80\xA6";
}

std::string durationInWords(double seconds) {
  if (!(seconds > 0)) return "0 s";
  if (seconds < 1e-6) return fmt::format("{:.0f} ns", seconds * 1e9);
  if (seconds < 1e-3) return fmt::format("{:.0f} µs", seconds * 1e6);
  if (seconds < 0.00995) return fmt::format("{:.1f} ms", seconds * 1e3);
  if (seconds < 0.9995) return fmt::format("{:.0f} ms", seconds * 1e3);
  if (seconds < 9.95) return fmt::format("{:.1f} s", seconds);
  if (seconds < 59.5) return fmt::format("{:.0f} s", seconds);
  if (seconds > 1e15) return fmt::format("{:.1g} s", seconds);
  const auto whole = std::llround(seconds);
  if (whole < 3600) return fmt::format("{} min {} s", whole / 60, whole % 60);
  return fmt::format("{} h {} min", whole / 3600, whole % 3600 / 60);
}

std::string sizeInWords(std::uint64_t bytes) {
  if (bytes == 1) return "1 byte";
  if (bytes < 1024) return fmt::format("{} bytes", bytes);
  const char* const units[] = {"KiB", "MiB", "GiB", "TiB", "PiB", "EiB"};
  double size = static_cast<double>(bytes) / 1024;
  std::size_t unit = 0;
  while (size >= 1023.95 && unit + 1 < std::size(units)) {
    size /= 1024;
    ++unit;
  }
  const bool isWhole = size >= 99.95 || size == std::floor(size);
  return isWhole ? fmt::format("{:.0f} {}", size, units[unit]) : fmt::format("{:.1f} {}", size, units[unit]);
}

std::string countInWords(std::uint64_t count, std::string_view thing) {
  return fmt::format("{} {}{}", count, thing, count == 1 ? "" : "s");
}

std::string timeInWords(double secondsSince1970) { return calendar(secondsSince1970, " ", " UTC"); }

std::string timeForMachines(double secondsSince1970) { return calendar(secondsSince1970, "T", "Z"); }

}  // namespace scanner
