// SPDX-License-Identifier: MIT
/* The bare host's answers to a plug-in, which are the same as the program's. */
#pragma once

#include "interface.h"

/* The child that a shell is asked to create; 0 for none. */
extern int32_t hostCurrentChild;

HostCallback hostCallback;
