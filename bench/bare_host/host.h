// SPDX-License-Identifier: MIT
/* What the bare host answers to a plug-in: the same as the program. */
#pragma once

#include "interface.h"

/* The child that a shell is asked to become; 0 for none. */
extern int32_t hostCurrentChild;

HostCallback hostCallback;
