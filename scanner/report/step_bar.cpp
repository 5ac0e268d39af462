// SPDX-License-Identifier: MIT
#include "scanner/report/step_bar.h"

#include <algorithm>

namespace scanner {
namespace {

constexpr double kShareOfItsOwn = 0.03;
constexpr double kNarrowest = 0.6;
constexpr double kNarrowestMarked = 4;

}  // namespace

std::vector<BarPart> barParts(const std::vector<TimedStep>& steps, int marked) {
  double total = 0;
  for (const TimedStep& step : steps) total += std::max(0.0, step.seconds);
  std::vector<BarPart> parts;
  bool isOpen = false;  // The last part takes further short steps.
  for (std::size_t i = 0; i < steps.size(); ++i) {
    const double seconds = std::max(0.0, steps[i].seconds);
    const bool isMarked = marked != 0 && steps[i].number == marked;
    const bool isAlone = isMarked || seconds >= kShareOfItsOwn * total;
    if (isAlone || !isOpen) parts.push_back({i, i, 0, 0, 0, isMarked});
    parts.back().last = i;
    parts.back().seconds += seconds;
    isOpen = !isAlone;
  }
  double widths = 0;
  for (BarPart& part : parts) {
    const double share = total > 0 ? 100 * part.seconds / total : 0;
    part.width = std::max(share, part.isMarked ? kNarrowestMarked : kNarrowest);
    widths += part.width;
  }
  double begin = 0;
  for (BarPart& part : parts) {
    part.begin = begin;
    part.width *= 100 / widths;
    begin += part.width;
  }
  return parts;
}

}  // namespace scanner
