// SPDX-License-Identifier: MIT
// The steps of a run as a bar whose parts are as wide as the steps were long.
#pragma once

#include <string>
#include <vector>

namespace scanner {

struct TimedStep {
  int number = 0;
  std::string text;
  double seconds = 0;  ///< Not a number where nobody knows.
};

/// One step, or several in a row that are too short to be told apart.
struct BarPart {
  std::size_t first = 0;  ///< Index of its first step,
  std::size_t last = 0;   ///< and of its last.
  double seconds = 0;
  double begin = 0;  ///< In percent of the bar's width,
  double width = 0;  ///< as is this. The widths add up to 100.
  bool isMarked = false;
};

/// Divides the bar. The step with number `marked` (0 for none) has a part of its own that is wide enough to be
/// seen, however short it was; other steps have one from 3 % of the whole time on.
std::vector<BarPart> barParts(const std::vector<TimedStep>& steps, int marked);

}  // namespace scanner
