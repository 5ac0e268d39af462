// SPDX-License-Identifier: MIT
// What is different in a build with a sanitizer: cases that do not apply, the leak check, longer times.
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

/// The longest that a run may take from its start, or from a signal, to its end, also where the machine is busy. A run
/// that does not end by itself takes as long as its host lets it.
constexpr double kEndLimitInSeconds = 15;

/// Environment variables that switch off the leak check at the end of a run.
inline const std::map<std::string, std::string> kNoLeakCheck = {{"LSAN_OPTIONS", "detect_leaks=0"}};

/// Why a case does not apply in a build with a sanitizer; empty where it does.
struct NotWith {
  std::string address = {};
  std::string thread = {};

  /// The reason to skip the case in this build; empty to run it.
  std::string reason() const {
    if (kWithAddressSanitizer) return address;
    return kWithThreadSanitizer ? thread : "";
  }
};
