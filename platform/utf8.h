// SPDX-License-Identifier: MIT
// What is UTF-8. The same on every system: the services that are written here for Linux need it, and so does
// whoever prints the texts of a plug-in.
#pragma once

#include <string_view>

/// True when `bytes` are whole, shortest-form UTF-8 sequences of U+0000 to U+10FFFF without surrogates.
bool isValidUtf8(std::string_view bytes);
