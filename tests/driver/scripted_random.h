// SPDX-License-Identifier: MIT
// A random generator and a processor clock that do what a test tells them: this test program defines srand(),
// rand() and clock() itself.
#pragma once

#include <ctime>
#include <vector>

/// The processor time that clock() returns.
extern std::clock_t scriptedClock;

/// What rand() returns, in order; then 0.
extern std::vector<int> scriptedDraws;

/// The seeds passed to srand(), and how often rand() was called.
extern std::vector<unsigned> seeds;
extern int drawsMade;

/// Clock 0, no scripted draws, no seeds and no calls.
void resetRandom();
