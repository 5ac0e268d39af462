// SPDX-License-Identifier: MIT
// CoreFoundation's strings and file URLs. Bundles are in module.cpp, the locale is in locale.cpp.
#include "platform/core_foundation.h"

#include <algorithm>
#include <cstddef>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>

#include "platform/linux/core_foundation_objects.h"

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

bool isAscii(std::string_view bytes) {
  return std::all_of(bytes.begin(), bytes.end(), [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

// True when `text` can be written in `encoding`; false for every encoding but the two of the header.
bool fitsEncoding(std::string_view text, CFStringEncoding encoding) {
  switch (encoding) {
    case kCFStringEncodingUTF8:
      return core_foundation::isValidUtf8(text);
    case kCFStringEncodingASCII:
      return isAscii(text);
    default:
      return false;
  }
}

}  // namespace

namespace core_foundation {

bool isValidUtf8(std::string_view bytes) {
  while (!bytes.empty()) {
    const std::size_t length = sequenceLength(bytes);
    if (length == 0) return false;
    bytes.remove_prefix(length);
  }
  return true;
}

void logFailure(std::string_view reason) {
  constexpr char kHexDigits[] = "0123456789abcdef";
  const bool isText = isValidUtf8(reason);
  std::string line = "vsttorture: ";
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
  line += '\n';
  // One call writes the whole line, so that other threads cannot write into it.
  std::fputs(line.c_str(), stderr);
}

}  // namespace core_foundation

void CFRelease(CFTypeRef reference) {
  const auto* const object = static_cast<const core_foundation::Object*>(reference);
  if (object->lifetime == core_foundation::Object::Lifetime::kOwned) delete object;
}

CFStringRef __CFStringMakeConstantString(const char* text) {  // NOLINT(bugprone-reserved-identifier)
  static auto& strings = *new core_foundation::ConstantTable<__CFString>;
  return strings.intern(text);
}

CFStringRef CFStringCreateWithCString(CFAllocatorRef, const char* text, CFStringEncoding encoding) {
  if (fitsEncoding(text, encoding)) return new __CFString(text);
  const char* const wanted = encoding == kCFStringEncodingUTF8 ? "UTF-8: " : "in the requested encoding: ";
  core_foundation::logFailure(std::string("not valid ") + wanted + text);
  return nullptr;
}

Boolean CFStringGetCString(CFStringRef string, char* buffer, CFIndex bufferSize, CFStringEncoding encoding) {
  const std::size_t sizeInBytes = string->text.size() + 1;
  if (bufferSize < 0 || static_cast<std::size_t>(bufferSize) < sizeInBytes) return 0;
  if (!fitsEncoding(string->text, encoding)) return 0;
  std::memcpy(buffer, string->text.c_str(), sizeInBytes);
  return 1;
}

CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef, CFStringRef path, CFURLPathStyle style, Boolean) {
  if (path->text.empty() || style != kCFURLPOSIXPathStyle) {
    core_foundation::logFailure(path->text.empty() ? "the path is empty" : "not a POSIX path: " + path->text);
    return nullptr;
  }
  std::error_code error;
  std::string absolute = std::filesystem::absolute(path->text, error).string();
  if (error) {
    core_foundation::logFailure(path->text + ": no current directory: " + error.message());
    return nullptr;
  }
  while (absolute.size() > 1 && absolute.back() == '/') absolute.pop_back();
  return new __CFURL(std::move(absolute));
}
