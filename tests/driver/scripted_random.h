// SPDX-License-Identifier: MIT
// The system's random generator and processor clock, as the test scripts them: this test program defines
// srand, rand and clock itself.
#pragma once

#include <ctime>
#include <vector>

/// The processor time that clock() answers.
extern std::clock_t scriptedClock;

/// What rand() answers, in order; 0 from then on.
extern std::vector<int> scriptedDraws;

/// The seeds that srand() got, and how often rand() was asked.
extern std::vector<unsigned> seedsSown;
extern int drawsMade;

/// As at the start of the program: clock 0, no draws, nothing seen.
void resetRandom();
