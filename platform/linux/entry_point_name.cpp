// SPDX-License-Identifier: MIT
// On Linux the oldest plug-ins export "main".
#include "platform/entry_point_name.h"

CFStringRef systemEntryPointName() { return CFSTR("main"); }
