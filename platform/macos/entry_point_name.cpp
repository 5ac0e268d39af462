// SPDX-License-Identifier: MIT
// On macOS the oldest plug-ins export "main_macho", which is asked for already.
#include "platform/entry_point_name.h"

CFStringRef systemEntryPointName() { return nullptr; }
