// SPDX-License-Identifier: MIT
// How a failed service tells its reason: one line on standard error.
#pragma once

#include <string>
#include <string_view>

namespace core_foundation {

/// `reason` as one line of valid UTF-8 without its end: control characters become blanks, and in a text that
/// is not UTF-8 every byte above 0x7F becomes \xNN.
std::string asOneLine(std::string_view reason);

/// Writes "vsttorture: ", `reason` as one line, and a line end to standard error.
void logFailure(std::string_view reason);

}  // namespace core_foundation
