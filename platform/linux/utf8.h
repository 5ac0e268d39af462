// SPDX-License-Identifier: MIT
// What is text: UTF-8 and its ASCII part.
#pragma once

#include <string_view>

namespace core_foundation {

/// True when `bytes` are whole, shortest-form UTF-8 sequences of U+0000 to U+10FFFF without surrogates.
bool isValidUtf8(std::string_view bytes);

/// True when all `bytes` are below 0x80.
bool isAscii(std::string_view bytes);

}  // namespace core_foundation
