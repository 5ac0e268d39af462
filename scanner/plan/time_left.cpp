// SPDX-License-Identifier: MIT
#include "scanner/plan/time_left.h"

#include <algorithm>

namespace scanner {

void TimeLeft::expect(double earlier) {
  if (earlier <= 0) {
    ++unknownToCome;
    return;
  }
  knownToCome += earlier;
  sumOfKnown += earlier;
  ++knownInAll;
}

void TimeLeft::ended(double earlier, double took) {
  if (earlier <= 0) {
    --unknownToCome;
  } else {
    knownToCome = std::max(knownToCome - earlier, 0.0);
    earlierOfEnded += earlier;
    tookOfKnown += took;
  }
  tookOfAll += took;
  ++endedInAll;
}

double TimeLeft::seconds(unsigned jobs) const {
  // The machine may be faster or slower today than it was then.
  const double pace = earlierOfEnded > 0 ? tookOfKnown / earlierOfEnded : 1;
  const double average = endedInAll > 0   ? tookOfAll / static_cast<double>(endedInAll)
                         : knownInAll > 0 ? sumOfKnown / static_cast<double>(knownInAll)
                                          : 0;
  return (knownToCome * pace + static_cast<double>(unknownToCome) * average) / std::max(jobs, 1U);
}

}  // namespace scanner
