// SPDX-License-Identifier: MIT
// The description of one parameter.
#pragma once

#include <string>
#include <vector>

#include "support/string_obj.h"
#include "vst2/properties.h"

class VSTWrapper;

namespace KelVSTInfoCache {

/// A plain value.
struct ParamInfo {
  /// Asks the plug-in.
  /// On purpose: a parameter with up to 100 integer steps is set to each of them, as the integer itself and
  /// not as a value from 0 to 1, and stays at the last.
  ParamInfo(VSTWrapper* wrapper, int index);

  VstInt32 paramIndex;
  VstParameterProperties
      props;  ///< As the plug-in filled it in, its texts ended within their fields; or zeros.
  double minValue = 0.0;
  double maxValue = 1.0;  ///< The range is the integer range where the plug-in has one.
  double currentValue;    ///< When the entry was made, before any step was tried.
  bool automatable = false;
  NiduStringObj paramName;
  NiduStringObj paramLabel;             ///< The unit.
  std::vector<std::string> valueTexts;  ///< Of every integer step; empty for all other parameters.

 private:
  [[nodiscard]] bool hasFewIntegerSteps() const;
};

}  // namespace KelVSTInfoCache
