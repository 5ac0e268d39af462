// SPDX-License-Identifier: MIT
// What goes otherwise in a build with a sanitizer: faults that it takes from the program, leaks that it
// counts.
#pragma once

#include <map>
#include <string>

#ifdef __SANITIZE_ADDRESS__
constexpr bool kWithAddressSanitizer = true;
#else
constexpr bool kWithAddressSanitizer = false;
#endif
#ifdef __SANITIZE_THREAD__
constexpr bool kWithThreadSanitizer = true;
#else
constexpr bool kWithThreadSanitizer = false;
#endif

/// Added to the environment of a run without the leak check at its end, in a build that has one.
inline const std::map<std::string, std::string> kNoLeakCheck = {{"LSAN_OPTIONS", "detect_leaks=0"}};

/// Why a case does not apply in a build with a sanitizer; empty where it does.
struct NotWith {
  std::string address = {};
  std::string thread = {};

  /// The reason not to run the case in this build; empty to run it.
  std::string reason() const {
    if (kWithAddressSanitizer) return address;
    return kWithThreadSanitizer ? thread : "";
  }
};
