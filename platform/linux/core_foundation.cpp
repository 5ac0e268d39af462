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
#include "platform/utf8.h"

namespace {

bool isAscii(std::string_view bytes) {
  return std::all_of(bytes.begin(), bytes.end(), [](char c) { return static_cast<unsigned char>(c) < 0x80; });
}

// True when `text` can be written in `encoding`; false for every encoding but the two of the header.
bool fitsEncoding(std::string_view text, CFStringEncoding encoding) {
  switch (encoding) {
    case kCFStringEncodingUTF8:
      return isValidUtf8(text);
    case kCFStringEncodingASCII:
      return isAscii(text);
    default:
      return false;
  }
}

}  // namespace

namespace core_foundation {

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
