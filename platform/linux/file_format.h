// SPDX-License-Identifier: MIT
// What a file is that is no shared object of this system.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace core_foundation {

/// What the first bytes of a file (8 are enough) show it to be, such as "a module for macOS"; nothing for ELF
/// and for what has no name here.
std::optional<std::string> foreignFormat(std::string_view beginning);

/// Says "PATH is a module for macOS, not a shared object for Linux" and the like; nothing when the file at
/// `path` is of no format that is known here.
std::optional<std::string> formatMismatch(const std::string& path);

}  // namespace core_foundation
