// SPDX-License-Identifier: MIT
// The answers of the host callback that need a little arithmetic or a table.
#pragma once

#include <cstdint>

#include "host/host_identity.h"
#include "vst2/basic_types.h"
#include "vst2/host_opcodes.h"

/// Whether the host says that it has a capability (audioMasterCanDo, 37): 1 or 0, never -1. The whole text
/// counts, case included.
VstInt32 hostCanDo(const char* capability);

/// The language for a locale identifier such as "de_CH", by its first two characters; English for any other.
VstHostLanguage languageFor(const char* localeIdentifier);

/// The language of the current user's locale (audioMasterGetLanguage, 38).
VstHostLanguage currentLanguage();

/// A version as one number: major x 2^24, minor x 2^16, third part.
VstInt32 packedVersion(const KelClientVersion& version);
