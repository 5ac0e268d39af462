// SPDX-License-Identifier: MIT
// What a file that does not load was made for.
#pragma once

#include <optional>
#include <string>

namespace core_foundation {

/// The architecture that this program was built for, such as "x86_64" or "i386".
const char* architectureOfProgram();

/// Why the regular file at `path` cannot be a shared object for this program, for people to read: "PATH is
/// for i386, this program is for x86_64", or "PATH is a module for macOS, not a shared object for Linux".
/// Nothing when its first bytes give no reason, or when it cannot be read.
std::optional<std::string> whyNotForThisProgram(const std::string& path);

}  // namespace core_foundation
