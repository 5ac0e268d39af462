// SPDX-License-Identifier: MIT
#include "tests/shared/recording_core_foundation.h"

#include <algorithm>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <deque>
#include <set>
#include <utility>

#include "gtest/gtest.h"
#include "platform/entry_point_name.h"

using doubles::RecordingCoreFoundation;
using doubles::Step;
using doubles::SymbolTable;

namespace {

enum class Kind { kString, kUrl, kBundle, kLocale };
enum class Owner { kCaller, kOther, kReleased };

// One object behind the opaque pointers of CoreFoundation.
struct Object {
  Kind kind;
  std::string text;  // A string's text, a path, a locale's identifier.
  Owner owner = Owner::kCaller;
  bool loaded = false;           // Of a bundle.
  Object* identifier = nullptr;  // Of a locale.
};

std::string described(const Object* object) {
  static constexpr const char* kNames[] = {"string", "URL", "bundle", "locale"};
  if (object == nullptr) return "null";
  return std::string(kNames[static_cast<int>(object->kind)]) + " \"" + object->text + '"';
}

// The objects of every test; never freed and never moved, so that a use after the release is found.
Object* make(Kind kind, const std::string& text, Owner owner = Owner::kCaller) {
  static auto& objects = *new std::deque<Object>;
  return &objects.emplace_back(Object{kind, text, owner, false, nullptr});
}

}  // namespace

struct RecordingCoreFoundation::State {
  explicit State(State* stateBefore) : previous(stateBefore) {}

  bool fails(Step step) const { return failing.count(step) > 0; }

  // Records a call; an empty result stands for a function without one.
  void record(const std::string& function, const std::string& arguments, const std::string& result = "") {
    calls.push_back(function + "(" + arguments + ")" + (result.empty() ? "" : " -> " + result));
  }

  // The object that a function of this test made; null and unrecorded when it did not.
  Object* made(Object* object) {
    if (object != nullptr) objects.push_back(object);
    return object;
  }

  // An argument of `function` as an object. Null, with a note of the misuse, when it cannot be used.
  Object* use(const char* function, CFTypeRef reference, std::optional<Kind> kind = std::nullopt) {
    auto* const object = static_cast<Object*>(const_cast<void*>(reference));
    const char* problem = nullptr;
    if (object == nullptr) {
      problem = " of ";
    } else if (object->owner == Owner::kReleased) {
      problem = " of a released ";
    } else if (kind && object->kind != *kind) {
      problem = " of a ";
    }
    if (problem == nullptr) return object;
    misuses.push_back(function + (problem + described(object)));
    return nullptr;
  }

  std::map<std::string, SymbolTable> bundles;
  std::set<Step> failing;
  std::string locale = "en_US";
  std::optional<std::string> entryPointName = "main";
  std::vector<std::string> calls;
  std::vector<const Object*> objects;
  std::vector<std::string> misuses;
  State* const previous;
};

namespace {

RecordingCoreFoundation::State* current = nullptr;

RecordingCoreFoundation::State& world() {
  if (current != nullptr) return *current;
  std::fputs("CoreFoundation called while no RecordingCoreFoundation exists\n", stderr);
  std::abort();
}

const Object* argument(CFTypeRef reference) { return static_cast<const Object*>(reference); }

template <typename Reference>
Reference referenceTo(Object* object) {
  return reinterpret_cast<Reference>(object);
}

std::string quoted(const std::string& text) { return '"' + text + '"'; }
std::string textOf(CFTypeRef object) { return object == nullptr ? "null" : quoted(argument(object)->text); }
std::string shown(bool yes) { return yes ? "true" : "false"; }
std::string shown(CFAllocatorRef allocator) { return allocator == nullptr ? "" : ", another allocator"; }

// The published numbers, not the constants of the header that callers use.
constexpr CFStringEncoding kUtf8 = 0x08000100;
constexpr CFStringEncoding kAscii = 0x0600;

std::string encodingName(CFStringEncoding encoding) {
  if (encoding == kUtf8) return "UTF-8";
  return encoding == kAscii ? "ASCII" : "encoding " + std::to_string(encoding);
}

bool fitsEncoding(CFStringEncoding encoding, const std::string& text) {
  const auto isAscii = [](char c) { return static_cast<unsigned char>(c) < 0x80; };
  return encoding == kUtf8 || (encoding == kAscii && std::all_of(text.begin(), text.end(), isAscii));
}

}  // namespace

RecordingCoreFoundation::RecordingCoreFoundation() : state(std::make_unique<State>(current)) {
  current = state.get();
}

RecordingCoreFoundation::~RecordingCoreFoundation() {
  for (const std::string& misuse : state->misuses) ADD_FAILURE() << misuse;
  current = state->previous;
}

void RecordingCoreFoundation::addBundle(const std::string& path, SymbolTable symbols) {
  state->bundles[path] = std::move(symbols);
}

void RecordingCoreFoundation::failStep(Step step) { state->failing.insert(step); }

void RecordingCoreFoundation::mendStep(Step step) { state->failing.erase(step); }

void RecordingCoreFoundation::setLocale(const std::string& identifier) { state->locale = identifier; }

void RecordingCoreFoundation::setSystemEntryPointName(std::optional<std::string> name) {
  state->entryPointName = std::move(name);
}

const std::vector<std::string>& RecordingCoreFoundation::calls() const { return state->calls; }

std::vector<std::string> RecordingCoreFoundation::callsOf(const std::string& function) const {
  std::vector<std::string> chosen;
  for (const std::string& call : state->calls)
    if (call.rfind(function + '(', 0) == 0) chosen.push_back(call);
  return chosen;
}

void RecordingCoreFoundation::forgetCalls() { state->calls.clear(); }

std::vector<std::string> RecordingCoreFoundation::aliveObjects() const {
  std::vector<std::string> alive;
  for (const Object* object : state->objects)
    if (object->owner == Owner::kCaller) alive.push_back(described(object));
  return alive;
}

void CFRelease(CFTypeRef object) {
  world().record("CFRelease", described(argument(object)));
  Object* const used = world().use("CFRelease", object);
  if (used == nullptr) return;
  if (used->owner == Owner::kOther) {
    world().misuses.push_back("CFRelease of another owner's " + described(used));
    return;
  }
  used->owner = Owner::kReleased;
  if (used->identifier != nullptr) used->identifier->owner = Owner::kReleased;
}

CFStringRef __CFStringMakeConstantString(const char* text) {
  static auto& constants = *new std::map<std::string, Object>;
  return referenceTo<CFStringRef>(
      &constants.try_emplace(text, Object{Kind::kString, text, Owner::kOther, false, nullptr}).first->second);
}

CFStringRef CFStringCreateWithCString(CFAllocatorRef allocator, const char* text, CFStringEncoding encoding) {
  Object* const made = world().made(world().fails(Step::kCreateString) ? nullptr : make(Kind::kString, text));
  world().record("CFStringCreateWithCString", quoted(text) + ", " + encodingName(encoding) + shown(allocator),
                 made == nullptr ? "null" : "string");
  return referenceTo<CFStringRef>(made);
}

Boolean CFStringGetCString(CFStringRef string, char* buffer, CFIndex bufferSize, CFStringEncoding encoding) {
  const Object* const used = world().use("CFStringGetCString", string, Kind::kString);
  const bool converted = used != nullptr && !world().fails(Step::kGetCString) &&
                         static_cast<CFIndex>(used->text.size()) < bufferSize &&
                         fitsEncoding(encoding, used->text);
  // After a failure too, so that a caller that uses the buffer all the same gets a text that looks right.
  if (used != nullptr && bufferSize > 0) {
    const std::size_t copied = used->text.copy(buffer, static_cast<std::size_t>(bufferSize - 1));
    buffer[copied] = '\0';
  }
  world().record("CFStringGetCString",
                 textOf(string) + ", " + std::to_string(bufferSize) + " bytes, " + encodingName(encoding),
                 shown(converted));
  return converted;
}

CFURLRef CFURLCreateWithFileSystemPath(CFAllocatorRef allocator, CFStringRef path, CFURLPathStyle style,
                                       Boolean isDirectory) {
  const Object* const used = world().use("CFURLCreateWithFileSystemPath", path, Kind::kString);
  const bool possible = used != nullptr && !used->text.empty() && !world().fails(Step::kCreateUrl);
  Object* const made = world().made(possible ? make(Kind::kUrl, used->text) : nullptr);
  world().record("CFURLCreateWithFileSystemPath",
                 textOf(path) + ", " + (style == 0 ? "POSIX" : "style " + std::to_string(style)) + ", " +
                     (isDirectory != 0 ? "directory" : "file") + shown(allocator),
                 made == nullptr ? "null" : "URL");
  return referenceTo<CFURLRef>(made);
}

CFBundleRef CFBundleCreate(CFAllocatorRef allocator, CFURLRef url) {
  const Object* const used = world().use("CFBundleCreate", url, Kind::kUrl);
  const bool possible =
      used != nullptr && world().bundles.count(used->text) > 0 && !world().fails(Step::kCreateBundle);
  Object* const made = world().made(possible ? make(Kind::kBundle, used->text) : nullptr);
  world().record("CFBundleCreate", textOf(url) + shown(allocator), made == nullptr ? "null" : "bundle");
  return referenceTo<CFBundleRef>(made);
}

Boolean CFBundleLoadExecutable(CFBundleRef bundle) {
  Object* const used = world().use("CFBundleLoadExecutable", bundle, Kind::kBundle);
  if (used != nullptr && !used->loaded) {
    used->loaded = world().bundles.count(used->text) > 0 && !world().fails(Step::kLoadExecutable);
  }
  const bool loaded = used != nullptr && used->loaded;
  world().record("CFBundleLoadExecutable", textOf(bundle), shown(loaded));
  return loaded;
}

void* CFBundleGetFunctionPointerForName(CFBundleRef bundle, CFStringRef name) {
  const Object* const used = world().use("CFBundleGetFunctionPointerForName", bundle, Kind::kBundle);
  const Object* const symbol = world().use("CFBundleGetFunctionPointerForName", name, Kind::kString);
  void* address = nullptr;
  if (used != nullptr && used->loaded && symbol != nullptr) {
    const SymbolTable& symbols = world().bundles[used->text];
    const auto found = symbols.find(symbol->text);
    if (found != symbols.end()) address = found->second.get();
  }
  world().record("CFBundleGetFunctionPointerForName", textOf(bundle) + ", " + textOf(name),
                 address == nullptr ? "null" : "function");
  return address;
}

void CFBundleUnloadExecutable(CFBundleRef bundle) {
  world().record("CFBundleUnloadExecutable", textOf(bundle));
  Object* const used = world().use("CFBundleUnloadExecutable", bundle, Kind::kBundle);
  if (used != nullptr) used->loaded = false;
}

CFLocaleRef CFLocaleCopyCurrent() {
  Object* const locale = world().made(make(Kind::kLocale, world().locale));
  locale->identifier = make(Kind::kString, world().locale, Owner::kOther);
  world().record("CFLocaleCopyCurrent", "", "locale");
  return referenceTo<CFLocaleRef>(locale);
}

CFStringRef CFLocaleGetIdentifier(CFLocaleRef locale) {
  const Object* const used = world().use("CFLocaleGetIdentifier", locale, Kind::kLocale);
  world().record("CFLocaleGetIdentifier", textOf(locale), used == nullptr ? "null" : "string");
  return used == nullptr ? nullptr : referenceTo<CFStringRef>(used->identifier);
}

CFStringRef systemEntryPointName() {
  const auto& name = world().entryPointName;
  return name ? __CFStringMakeConstantString(name->c_str()) : nullptr;
}
