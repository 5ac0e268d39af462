// SPDX-License-Identifier: MIT
/* What a run is made of: descriptions and numbered tests. */
#pragma once

#include "interface.h"

enum { kTests = 6 };

/* The text of each test's step line. */
extern const char* const testTexts[kTests];

void describeInstance(AEffect* effect);
void runTest(AEffect* effect, int number);
