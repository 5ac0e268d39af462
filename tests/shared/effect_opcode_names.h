// SPDX-License-Identifier: MIT
// The names of the requests that a host makes of a plug-in, for messages of failing tests.
#pragma once

#include <string>

#include "vst2/basic_types.h"

namespace doubles {

/// "effOpen" for 0 and so on up to 79; "opcode N" for any other number.
std::string effectOpcodeName(VstInt32 opcode);

}  // namespace doubles
