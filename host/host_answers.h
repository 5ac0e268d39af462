// SPDX-License-Identifier: MIT
// Those answers of the host callback that are computed or looked up in a table.
#pragma once

#include <cstdint>

#include "host/host_identity.h"
#include "vst2/basic_types.h"
#include "vst2/host_opcodes.h"

/// Whether the host claims a capability (audioMasterCanDo, 37): 1 or 0, never -1. The whole text is compared,
/// case-sensitively.
VstInt32 hostCanDo(const char* capability);

/// The language for a locale identifier such as "de_CH", by its first two characters; English for any other.
VstHostLanguage languageFor(const char* localeIdentifier);

/// The language of the current user's locale (audioMasterGetLanguage, 38); English if it cannot be read.
VstHostLanguage currentLanguage();

/// A version as one number: major x 2^24, minor x 2^16, third part.
VstInt32 packedVersion(const KelClientVersion& version);
