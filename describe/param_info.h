// SPDX-License-Identifier: MIT
// The description of one parameter.
#pragma once

#include <string>
#include <vector>

#include "support/string_obj.h"
#include "vst2/properties.h"

class VSTWrapper;

namespace KelVSTInfoCache {

/// A plain value; it owns its texts.
struct ParamInfo {
  /// Asks the plug-in about the parameter with this index. Throws what the plug-in throws.
  /// On purpose: a parameter with up to 100 integer steps is set to each of them, as the integer itself and
  /// not as a value from 0 to 1, and stays at the last.
  ParamInfo(VSTWrapper* wrapper, int index);

  VstInt32 paramIndex;
  VstParameterProperties props;  ///< The plug-in's, with its texts terminated; zeros when it has none.
  double minValue = 0.0;         ///< The lowest integer where the properties have an integer range.
  double maxValue = 1.0;         ///< The highest integer where the properties have an integer range.
  double currentValue;           ///< Read before any step is tried.
  bool automatable = false;
  NiduStringObj paramName;
  NiduStringObj paramLabel;             ///< The unit.
  std::vector<std::string> valueTexts;  ///< The display text of each integer step; empty without such steps.

 private:
  [[nodiscard]] bool hasFewIntegerSteps() const;
};

}  // namespace KelVSTInfoCache
