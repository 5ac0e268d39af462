// SPDX-License-Identifier: MIT
// The program's side of the recording CoreFoundation: all functions of platform/core_foundation.h and of
// platform/entry_point_name.h.
#include <algorithm>
#include <cstddef>
#include <limits>
#include <map>
#include <string>

#include "platform/core_foundation.h"
#include "platform/entry_point_name.h"
#include "tests/shared/core_foundation_world.h"
#include "tests/shared/recording_core_foundation.h"

using doubles::described;
using doubles::RecordingCoreFoundation;
using doubles::Step;
using Object = doubles::CoreFoundationObject;
using Kind = doubles::CoreFoundationObject::Kind;

namespace {

constexpr CFIndex kConstant = std::numeric_limits<CFIndex>::max();

const Object* argument(CFTypeRef reference) { return static_cast<const Object*>(reference); }

template <typename Reference>
Reference referenceTo(Object* object) {
  return reinterpret_cast<Reference>(object);
}

std::string quoted(const std::string& text) { return '"' + text + '"'; }
std::string textOf(const Object* object) { return object == nullptr ? "null" : quoted(object->text); }
std::string yesOrNo(bool yes) { return yes ? "true" : "false"; }
std::string extraFor(CFAllocatorRef allocator) { return allocator == nullptr ? "" : ", another allocator"; }

// The published numbers, not the constants of the header that callers use.
constexpr CFStringEncoding kUtf8 = 0x08000100;
constexpr CFStringEncoding kAscii = 0x0600;

std::string encodingName(CFStringEncoding encoding) {
  if (encoding == kUtf8) return "UTF-8";
  if (encoding == kAscii) return "ASCII";
  return "encoding " + std::to_string(encoding);
}

bool canBeSaidIn(CFStringEncoding encoding, const std::string& text) {
  const auto isAscii = [](char c) { return static_cast<unsigned char>(c) < 0x80; };
  return encoding == kUtf8 || (encoding == kAscii && std::all_of(text.begin(), text.end(), isAscii));
}

}  // namespace

CFTypeRef CFRetain(CFTypeRef object) {
  auto& world = RecordingCoreFoundation::currentWorld();
  world.record("CFRetain", described(argument(object)));
  Object* const used = world.use("CFRetain", object);
  if (used != nullptr && used->references != kConstant) ++used->references;
  return object;
}

void CFRelease(CFTypeRef object) {
  auto& world = RecordingCoreFoundation::currentWorld();
  world.record("CFRelease", described(argument(object)));
  Object* const used = world.use("CFRelease", object);
  if (used == nullptr || used->references == kConstant) return;
  if (used->isLent && used->references == 1) {
    world.misuses.push_back("CFRelease of a lent " + described(used));
    return;
  }
  --used->references;
  if (used->references > 0 || used->lent == nullptr) return;
  used->lent->isLent = false;
  --used->lent->references;
}

CFIndex CFGetRetainCount(CFTypeRef object) {
  auto& world = RecordingCoreFoundation::currentWorld();
  Object* const used = world.use("CFGetRetainCount", object);
  const CFIndex count = used == nullptr ? 0 : used->references;
  world.record("CFGetRetainCount", described(argument(object)), std::to_string(count));
  return count;
}

CFStringRef __CFStringMakeConstantString(const char* text) {
  static auto& constants = *new std::map<std::string, Object>;
  const auto position = constants.try_emplace(text, Object{Kind::kString, text, kConstant}).first;
  return referenceTo<CFStringRef>(&position->second);
}

CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, const char* text, CFStringEncoding encoding) {
  auto& world = RecordingCoreFoundation::currentWorld();
  Object* const made = world.fails(Step::kCreateString) ? nullptr : world.make(Kind::kString, text);
  world.record("CFStringCreateWithCString",
               quoted(text) + ", " + encodingName(encoding) + extraFor(allocator),
               made == nullptr ? "null" : "string");
  return referenceTo<CFStringRef>(made);
}

Boolean CFStringGetCString(CFStringRef string, char* buffer, CFIndex bufferSize, CFStringEncoding encoding) {
  auto& world = RecordingCoreFoundation::currentWorld();
  const Object* const used = world.use("CFStringGetCString", string, Kind::kString);
  const bool converted = used != nullptr && !world.fails(Step::kGetCString) &&
                         static_cast<CFIndex>(used->text.size()) < bufferSize &&
                         canBeSaidIn(encoding, used->text);
  // Also after a failure: a buffer that must not be used then had better look usable.
  if (used != nullptr && bufferSize > 0) {
    const std::size_t copied = used->text.copy(buffer, static_cast<std::size_t>(bufferSize - 1));
    buffer[copied] = '\0';
  }
  world.record(
      "CFStringGetCString",
      textOf(argument(string)) + ", " + std::to_string(bufferSize) + " bytes, " + encodingName(encoding),
      yesOrNo(converted));
  return converted;
}

CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path, CFURLPathStyle style,
                                       Boolean isDirectory) {
  auto& world = RecordingCoreFoundation::currentWorld();
  const Object* const used = world.use("CFURLCreateWithFileSystemPath", path, Kind::kString);
  const bool possible = used != nullptr && !used->text.empty() && !world.fails(Step::kCreateUrl);
  Object* const made = possible ? world.make(Kind::kUrl, used->text) : nullptr;
  world.record("CFURLCreateWithFileSystemPath",
               textOf(argument(path)) + ", " + (style == 0 ? "POSIX" : "style " + std::to_string(style)) +
                   ", " + (isDirectory != 0 ? "directory" : "file") + extraFor(allocator),
               made == nullptr ? "null" : "URL");
  return referenceTo<CFURLRef>(made);
}

CFBundleRef CFBundleCreate(CFAllocatorRef allocator, CFURLRef url) {
  auto& world = RecordingCoreFoundation::currentWorld();
  const Object* const used = world.use("CFBundleCreate", url, Kind::kUrl);
  const bool possible =
      used != nullptr && world.bundles.count(used->text) > 0 && !world.fails(Step::kCreateBundle);
  Object* const made = possible ? world.make(Kind::kBundle, used->text) : nullptr;
  world.record("CFBundleCreate", textOf(argument(url)) + extraFor(allocator),
               made == nullptr ? "null" : "bundle");
  return referenceTo<CFBundleRef>(made);
}

Boolean CFBundleLoadExecutable(CFBundleRef bundle) {
  auto& world = RecordingCoreFoundation::currentWorld();
  Object* const used = world.use("CFBundleLoadExecutable", bundle, Kind::kBundle);
  if (used != nullptr && !used->loaded) {
    const auto found = world.bundles.find(used->text);
    used->loaded =
        found != world.bundles.end() && found->second.hasExecutable && !world.fails(Step::kLoadExecutable);
  }
  const bool loaded = used != nullptr && used->loaded;
  world.record("CFBundleLoadExecutable", textOf(argument(bundle)), yesOrNo(loaded));
  return loaded;
}

void* CFBundleGetFunctionPointerForName(CFBundleRef bundle, CFStringRef name) {
  auto& world = RecordingCoreFoundation::currentWorld();
  const Object* const used = world.use("CFBundleGetFunctionPointerForName", bundle, Kind::kBundle);
  const Object* const symbol = world.use("CFBundleGetFunctionPointerForName", name, Kind::kString);
  void* address = nullptr;
  if (used != nullptr && used->loaded && symbol != nullptr) {
    const auto found = world.bundles.find(used->text);
    if (found != world.bundles.end()) {
      const auto entry = found->second.symbols.find(symbol->text);
      if (entry != found->second.symbols.end()) address = entry->second.get();
    }
  }
  world.record("CFBundleGetFunctionPointerForName", textOf(argument(bundle)) + ", " + textOf(argument(name)),
               address == nullptr ? "null" : "function");
  return address;
}

void CFBundleUnloadExecutable(CFBundleRef bundle) {
  auto& world = RecordingCoreFoundation::currentWorld();
  world.record("CFBundleUnloadExecutable", textOf(argument(bundle)));
  Object* const used = world.use("CFBundleUnloadExecutable", bundle, Kind::kBundle);
  if (used != nullptr) used->loaded = false;
}

CFLocaleRef CFLocaleCopyCurrent() {
  auto& world = RecordingCoreFoundation::currentWorld();
  Object* const locale = world.make(Kind::kLocale, world.locale);
  locale->lent = world.make(Kind::kString, world.locale);
  locale->lent->isLent = true;
  world.record("CFLocaleCopyCurrent", "", "locale");
  return referenceTo<CFLocaleRef>(locale);
}

CFStringRef CFLocaleGetIdentifier(CFLocaleRef locale) {
  auto& world = RecordingCoreFoundation::currentWorld();
  const Object* const used = world.use("CFLocaleGetIdentifier", locale, Kind::kLocale);
  world.record("CFLocaleGetIdentifier", textOf(argument(locale)), used == nullptr ? "null" : "string");
  return used == nullptr ? nullptr : referenceTo<CFStringRef>(used->lent);
}

CFStringRef systemEntryPointName() {
  const auto& name = RecordingCoreFoundation::currentWorld().entryPointName;
  return name ? __CFStringMakeConstantString(name->c_str()) : nullptr;
}
