// SPDX-License-Identifier: MIT
/* Saving and loading the state, as one program or as a bank. */
#pragma once

#include <stddef.h>

#include "interface.h"

typedef struct {
  char* bytes;
  size_t size;
} State;

/* Returns the state in a block that the caller frees. */
State saveState(AEffect* effect, int asBank);
/* Loads a state into the plug-in that it was saved from. */
void loadState(AEffect* effect, const State* state, int isBank);
