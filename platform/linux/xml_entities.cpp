// SPDX-License-Identifier: MIT
// Entities and character references in the text of an XML document.
#include "platform/linux/xml_entities.h"

#include <charconv>
#include <cstddef>
#include <cstdint>
#include <system_error>

namespace core_foundation {
namespace {

bool startsWith(std::string_view text, std::string_view start) {
  return text.substr(0, start.size()) == start;
}

void appendUtf8(std::string& text, std::uint32_t codePoint) {
  const auto append = [&](std::uint32_t byte) { text += static_cast<char>(byte); };
  const auto appendFollowing = [&](unsigned shift) { append(0x80U | ((codePoint >> shift) & 0x3FU)); };
  if (codePoint < 0x80) return append(codePoint);
  if (codePoint < 0x800) {
    append(0xC0U | codePoint >> 6U);
  } else {
    if (codePoint < 0x10000) {
      append(0xE0U | codePoint >> 12U);
    } else {
      append(0xF0U | codePoint >> 18U);
      appendFollowing(12);
    }
    appendFollowing(6);
  }
  appendFollowing(0);
}

// The character of "#65" or "#x41"; 0 for none, and for what is no character of XML.
std::uint32_t referencedCharacter(std::string_view reference) {
  const bool hexadecimal = startsWith(reference, "#x");
  reference.remove_prefix(hexadecimal ? 2 : 1);
  std::uint32_t codePoint = 0;
  const char* const end = reference.data() + reference.size();
  const auto [stop, error] = std::from_chars(reference.data(), end, codePoint, hexadecimal ? 16 : 10);
  const bool surrogate = codePoint >= 0xD800 && codePoint <= 0xDFFF;
  return error == std::errc() && stop == end && !surrogate && codePoint <= 0x10FFFF ? codePoint : 0;
}

// The character that the entity between '&' and ';' stands for; 0 for an unknown one.
std::uint32_t entityCharacter(std::string_view name) {
  if (startsWith(name, "#")) return referencedCharacter(name);
  if (name == "amp") return '&';
  if (name == "lt") return '<';
  if (name == "gt") return '>';
  if (name == "quot") return '"';
  if (name == "apos") return '\'';
  return 0;
}

}  // namespace

std::optional<std::string> resolveEntities(std::string_view raw) {
  std::string text;
  while (!raw.empty()) {
    const std::size_t ampersand = raw.find('&');
    text += raw.substr(0, ampersand);
    if (ampersand == std::string_view::npos) break;
    raw.remove_prefix(ampersand + 1);
    const std::size_t semicolon = raw.find(';');
    if (semicolon == std::string_view::npos) return std::nullopt;
    const std::uint32_t character = entityCharacter(raw.substr(0, semicolon));
    if (character == 0) return std::nullopt;
    appendUtf8(text, character);
    raw.remove_prefix(semicolon + 1);
  }
  return text;
}

}  // namespace core_foundation
