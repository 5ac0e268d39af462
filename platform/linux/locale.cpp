// SPDX-License-Identifier: MIT
// The user's locale, from the environment.
#include <cstdlib>
#include <string>
#include <string_view>

#include "platform/core_foundation.h"
#include "platform/linux/core_foundation_objects.h"
#include "platform/utf8.h"

// NOLINTBEGIN(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes): the system's own
// name, and a record that only this file sees
struct __CFLocale final : core_foundation::Object {
  __CFLocale(const std::string& name, Lifetime howLong) : Object(howLong), identifier(name) {}
  const __CFString identifier;
};
// NOLINTEND(bugprone-reserved-identifier,misc-non-private-member-variables-in-classes)

namespace {

// "ja_JP.UTF-8" gives "ja_JP".
std::string currentIdentifier() {
  std::string_view locale;
  for (const char* variable : {"LC_ALL", "LC_MESSAGES", "LANG"}) {
    const char* const value =
        std::getenv(variable);  // NOLINT(concurrency-mt-unsafe): the program never sets any
    if (value != nullptr) locale = value;
    if (!locale.empty()) break;
  }
  locale = locale.substr(0, locale.find_first_of(".@"));
  const bool namesNoLocale = locale.empty() || locale == "C" || locale == "POSIX";
  return namesNoLocale || !isValidUtf8(locale) ? "en_US_POSIX" : std::string(locale);
}

}  // namespace

CFLocaleRef CFLocaleCopyCurrent() {
  // Constants, so that a caller that never releases its locale does not grow the process.
  static auto& locales = *new core_foundation::ConstantTable<__CFLocale>;
  return locales.intern(currentIdentifier());
}

CFStringRef CFLocaleGetIdentifier(CFLocaleRef locale) { return &locale->identifier; }
