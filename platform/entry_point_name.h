// SPDX-License-Identifier: MIT
// The name under which the oldest plug-ins of this system export their entry point.
#pragma once

#include "platform/core_foundation.h"

/// The name to look for after those that all systems share: "main" on Linux, null (no such name) on macOS. A
/// constant string.
CFStringRef systemEntryPointName();
