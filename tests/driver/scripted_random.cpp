// SPDX-License-Identifier: MIT
#include "tests/driver/scripted_random.h"

#include <cstddef>
#include <cstdlib>

std::clock_t scriptedClock = 0;
std::vector<int> scriptedDraws;
std::vector<unsigned> seeds;
int drawsMade = 0;

void resetRandom() {
  scriptedClock = 0;
  scriptedDraws.clear();
  seeds.clear();
  drawsMade = 0;
}

extern "C" {

std::clock_t clock() noexcept { return scriptedClock; }

void srand(unsigned seed) noexcept { seeds.push_back(seed); }

int rand() noexcept {
  const auto draw = static_cast<std::size_t>(drawsMade++);
  return draw < scriptedDraws.size() ? scriptedDraws[draw] : 0;
}

}  // extern "C"
