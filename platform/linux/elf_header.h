// SPDX-License-Identifier: MIT
// For which architecture a shared object was made.
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace core_foundation {

/// The architecture in the ELF header at the beginning of a file, such as "x86_64" or "i386"; "machine N" for
/// one without a name here. Nothing when `beginning` (20 bytes are enough) is no ELF header.
std::optional<std::string> architectureOfElf(std::string_view beginning);

/// The architecture that this program was built for, in the same words.
const char* architectureOfProgram();

/// Says "PATH is for A, this program is for B" when the file at `path` is for another architecture than this
/// program; otherwise nothing.
std::optional<std::string> architectureMismatch(const std::string& path);

}  // namespace core_foundation
