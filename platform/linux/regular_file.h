// SPDX-License-Identifier: MIT
// Reading the beginning of a file that may turn out to be anything.
#pragma once

#include <cstddef>
#include <optional>
#include <string>

namespace core_foundation {

/// The first bytes of the regular file at `path`, at most `limitInBytes`. Nothing when it cannot be read or
/// is not a regular file. Never waits: pipes and devices are not opened.
std::optional<std::string> beginningOfFile(const std::string& path, std::size_t limitInBytes);

}  // namespace core_foundation
