// SPDX-License-Identifier: MIT
// Which locale the user's environment names.
#include "platform/linux/locale_identifier.h"

#include <string_view>

#include "platform/linux/utf8.h"

namespace core_foundation {

std::string localeIdentifier(const char* lcAll, const char* lcMessages, const char* lang) {
  std::string_view locale;
  for (const char* value : {lcAll, lcMessages, lang}) {
    if (value != nullptr && *value != '\0') {
      locale = value;
      break;
    }
  }
  locale = locale.substr(0, locale.find_first_of(".@"));
  if (locale.empty() || locale == "C" || locale == "POSIX" || !isValidUtf8(locale)) return "en_US_POSIX";
  return std::string(locale);
}

}  // namespace core_foundation
