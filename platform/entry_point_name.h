// SPDX-License-Identifier: MIT
// The name under which the oldest plug-ins of this system export their entry point.
#pragma once

#include "platform/core_foundation.h"

/// The third and last name to look for, after those that all systems share; null when this system has no name
/// of its own. A constant string, owned by nobody.
CFStringRef systemEntryPointName();
