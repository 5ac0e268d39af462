// Faults that a sanitizer takes from the program, so that it cannot show what it does about them.
#pragma once

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
