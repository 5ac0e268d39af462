// SPDX-License-Identifier: MIT
/* The parts of a run: descriptions and numbered tests. */
#pragma once

#include "interface.h"

enum { kTests = 6 };

/* The text of each test's step line. */
extern const char* const testTexts[kTests];

void describeInstance(AEffect* effect);
void runTest(AEffect* effect, int number);
