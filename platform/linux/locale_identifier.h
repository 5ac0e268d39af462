// SPDX-License-Identifier: MIT
// Which locale the user's environment names.
#pragma once

#include <string>

namespace core_foundation {

/// The identifier, such as "ja_JP", from the values of the environment variables LC_ALL, LC_MESSAGES and
/// LANG; null stands for a variable that is not set. The first that is set and not empty decides; codeset and
/// modifier are cut off. "C", "POSIX", nothing at all and what is not UTF-8 give "en_US_POSIX".
std::string localeIdentifier(const char* lcAll, const char* lcMessages, const char* lang);

}  // namespace core_foundation
