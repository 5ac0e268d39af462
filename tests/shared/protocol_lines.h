// SPDX-License-Identifier: MIT
// The lines that every run of an ordinary plug-in begins with, and how long an end may take.
#pragma once

#include <array>
#include <string>

/// "total, 64" and the first `steps` step lines, at most 15, each with its line end.
inline std::string beginningOfRun(std::size_t steps) {
  constexpr std::array<const char*, 15> kSteps = {
      "1, test gathering info",     "2, inspect class info",
      "3, inspect preset info",     "4, inspect parameter info",
      "5, testing setting states",  "6, inspect latency",
      "7, inspect stream format",   "8, inspect stream format",
      "9, inspect latency",         "10, testing setting states",
      "11, inspect parameter info", "12, inspect preset info",
      "13, inspect class info",     "14, initialize",
      "15, test gathering info",
  };
  std::string text = "total, 64\n";
  for (std::size_t i = 0; i < steps; ++i) text += std::string(kSteps.at(i)) + '\n';
  return text;
}

/// From the start of the program to its end, with whatever its plug-in does. A sanitizer takes longer.
#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
constexpr double kEndLimitInSeconds = 15;
#else
constexpr double kEndLimitInSeconds = 2;
#endif
