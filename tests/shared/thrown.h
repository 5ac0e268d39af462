// SPDX-License-Identifier: MIT
// What a call throws, as a value that a test can compare.
#pragma once

#include <optional>

/// The int that `action` throws; nothing when it throws none. Any other exception passes.
template <class Action>
std::optional<int> thrownInt(Action action) {
  try {
    action();
  } catch (int code) {
    return code;
  }
  return std::nullopt;
}
