// SPDX-License-Identifier: MIT
#include "scanner/report/html_text.h"

#include <algorithm>
#include <cmath>
#include <ctime>

#include <fmt/format.h>

#include "scanner/events/event_json.h"
#include "scanner/report/characters.h"

namespace scanner {
namespace {

bool isPlain(unsigned char byte) {
  return byte >= 0x20 && byte < 0x7F && byte != '&' && byte != '<' && byte != '>' && byte != '"' &&
         byte != '\'';
}

void appendCharacter(std::string& out, char32_t character, LineBreaks lineBreaks) {
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
    out += codeOf(character);
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
  for (std::size_t at = 0; at < text.size();) appendCharacter(out, nextCharacter(text, at), lineBreaks);
  return out;
}

std::string clipped(std::string_view text, std::size_t most) {
  std::size_t at = 0;
  for (std::size_t count = 0; at < text.size() && count < most; ++count) nextCharacter(text, at);
  if (at >= text.size()) return std::string(text);
  return std::string(text.substr(0, at)) + "\xE2\x80\xA6";
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

std::string timeInWords(double secondsSince1970) { return calendar(secondsSince1970, " ", " UTC"); }

std::string timeForMachines(double secondsSince1970) { return calendar(secondsSince1970, "T", "Z"); }

}  // namespace scanner
