// SPDX-License-Identifier: MIT
// CoreFoundation's counting, strings, file URLs and locale. Its bundles are in bundle.cpp.
#include "platform/core_foundation.h"

#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>

#include "platform/linux/core_foundation_objects.h"
#include "platform/linux/failure_line.h"
#include "platform/linux/locale_identifier.h"
#include "platform/linux/utf8.h"

// NOLINTBEGIN(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes): the system's own
// name, and a record that only this file sees
struct __CFLocale final : core_foundation::CountedObject {
  explicit __CFLocale(std::string name) : identifier(new __CFString(std::move(name))) {}
  ~__CFLocale() override { identifier->release(); }
  const __CFString* const identifier;  ///< Owned: one reference.
};
// NOLINTEND(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes)

namespace {

using core_foundation::CountedObject;

const CountedObject& counted(CFTypeRef object) { return *static_cast<const CountedObject*>(object); }

// Says whether `text` can stand in `encoding`; encodings that nobody here asks for hold nothing.
bool fitsEncoding(std::string_view text, CFStringEncoding encoding) {
  switch (encoding) {
    case kCFStringEncodingUTF8:
      return core_foundation::isValidUtf8(text);
    case kCFStringEncodingASCII:
      return core_foundation::isAscii(text);
    default:
      return false;
  }
}

// Objects found again by their text, made on first use. Never destroyed, because code that runs while the
// process ends may still ask; still reachable then, so not a leak.
template <typename Object>
class Interned {
 public:
  template <typename Make>
  const Object* find(const std::string& text, Make make) {
    const std::lock_guard<std::mutex> guard(lock);
    std::unique_ptr<const Object>& slot = objects[text];
    if (!slot) slot.reset(make(text));
    return slot.get();
  }

 private:
  std::mutex lock;
  std::map<std::string, std::unique_ptr<const Object>> objects;
};

}  // namespace

CFTypeRef CFRetain(CFTypeRef object) {
  counted(object).retain();
  return object;
}

void CFRelease(CFTypeRef object) { counted(object).release(); }

CFIndex CFGetRetainCount(CFTypeRef object) { return counted(object).retainCount(); }

CFStringRef __CFStringMakeConstantString(const char* text) {  // NOLINT(bugprone-reserved-identifier)
  static auto& constants = *new Interned<__CFString>;
  return constants.find(text, [](const std::string& literal) {
    return new __CFString(literal, CountedObject::Lifetime::kConstant);
  });
}

CFStringRef CFStringCreateWithCString(CFAllocatorRef, const char* text, CFStringEncoding encoding) {
  if (fitsEncoding(text, encoding)) return new __CFString(text);
  const char* const wanted = encoding == kCFStringEncodingUTF8 ? "UTF-8: " : "in the encoding asked for: ";
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

CFLocaleRef CFLocaleCopyCurrent() {
  // One object for each identifier, as a locale that is copied and never released must not grow the process.
  static auto& locales = *new Interned<__CFLocale>;
  // NOLINTNEXTLINE(concurrency-mt-unsafe): the environment is only read here
  const auto environment = [](const char* variable) { return std::getenv(variable); };
  const std::string identifier = core_foundation::localeIdentifier(
      environment("LC_ALL"), environment("LC_MESSAGES"), environment("LANG"));
  const __CFLocale* locale =
      locales.find(identifier, [](const std::string& name) { return new __CFLocale(name); });
  locale->retain();
  return locale;
}

CFStringRef CFLocaleGetIdentifier(CFLocaleRef locale) { return locale->identifier; }
