// SPDX-License-Identifier: MIT
/* Saving and loading the state, as one program or as a bank. */
#pragma once

#include <stddef.h>

#include "interface.h"

typedef struct {
  char* bytes;
  size_t size;
} State;

/* The state in memory of its own. */
State saveState(AEffect* effect, int asBank);
/* Gives it back to the plug-in that it was taken from. */
void loadState(AEffect* effect, const State* state, int isBank);
