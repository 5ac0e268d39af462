// SPDX-License-Identifier: MIT
// The names of the requests that a host makes of a plug-in, for those who read records.
#pragma once

#include <cstdint>

/// "effOpen" for 0 and so on up to 79; null for any other number.
const char* effectOpcodeName(std::int32_t opcode);
