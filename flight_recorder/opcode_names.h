// SPDX-License-Identifier: MIT
// The names of the requests that a host and a plug-in make of each other, for those who read records.
#pragma once

#include <cstdint>

/// "effOpen" for 0 and so on up to 79; null for any other number.
const char* effectOpcodeName(std::int32_t opcode);

/// "audioMasterAutomate" for 0 and so on up to 49; null for 5, which the interface does not use, and any other number.
const char* hostOpcodeName(std::int32_t opcode);
