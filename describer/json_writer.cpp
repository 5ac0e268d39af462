// SPDX-License-Identifier: MIT
#include "describer/json_writer.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "platform/utf8.h"

namespace {

std::string utf8FromLatin1(std::string_view bytes) {
  std::string text;
  for (const char c : bytes) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte < 0x80) {
      text += c;
    } else {
      text += static_cast<char>(0xC0U | byte >> 6U);
      text += static_cast<char>(0x80U | (byte & 0x3FU));
    }
  }
  return text;
}

}  // namespace

void JsonWriter::beginObject() { open('{', false); }
void JsonWriter::endObject() { close('}'); }
void JsonWriter::beginArray() { open('[', true); }
void JsonWriter::endArray() { close(']'); }

void JsonWriter::key(std::string_view name) {
  Level& level = levels.back();
  if (level.elements++ > 0) out += ',';
  newLine();
  level.lastKey = name;
  quote(name);
  out += ": ";
}

void JsonWriter::text(std::string_view value) {
  beginValue();
  if (isValidUtf8(value)) {
    quote(value);
    return;
  }
  latin1.push_back(pointerToHere());
  quote(utf8FromLatin1(value));
}

void JsonWriter::integer(std::int64_t value) {
  beginValue();
  out += std::to_string(value);
}

void JsonWriter::real(float value) {
  if (!std::isfinite(value)) {
    null();
    return;
  }
  beginValue();
  char digits[32];
  // 9 digits always give a 32-bit float back; most need fewer.
  for (int precision = 1; precision <= 9; ++precision) {
    std::snprintf(digits, sizeof digits, "%.*g", precision, static_cast<double>(value));
    if (std::strtof(digits, nullptr) == value) break;
  }
  // A plug-in may have set a locale whose decimal point is another character.
  for (const char* c = digits; *c != '\0'; ++c) out += std::strchr("0123456789+-e", *c) != nullptr ? *c : '.';
}

void JsonWriter::boolean(bool value) {
  beginValue();
  out += value ? "true" : "false";
}

void JsonWriter::null() {
  beginValue();
  out += "null";
}

/// In an array each value begins a new line; in an object it follows its key.
void JsonWriter::beginValue() {
  if (levels.empty() || !levels.back().isArray) return;
  if (levels.back().elements++ > 0) out += ',';
  newLine();
}

void JsonWriter::open(char bracket, bool isArray) {
  beginValue();
  out += bracket;
  levels.push_back({isArray});
}

void JsonWriter::close(char bracket) {
  const bool isEmpty = levels.back().elements == 0;
  levels.pop_back();
  if (!isEmpty) newLine();
  out += bracket;
}

void JsonWriter::newLine() {
  out += '\n';
  out.append(2 * levels.size(), ' ');
}

void JsonWriter::quote(std::string_view utf8) {
  out += '"';
  for (const char c : utf8) {
    const auto byte = static_cast<unsigned char>(c);
    if (c == '"' || c == '\\') {
      out += '\\';
      out += c;
    } else if (byte < 0x20 || byte == 0x7F) {
      char escape[8];
      std::snprintf(escape, sizeof escape, "\\u%04x", unsigned{byte});
      out += escape;
    } else {
      out += c;
    }
  }
  out += '"';
}

std::string JsonWriter::pointerToHere() const {
  std::string pointer;
  for (const Level& level : levels) {
    pointer += '/';
    pointer += level.isArray ? std::to_string(level.elements - 1) : level.lastKey;
  }
  return pointer;
}
