// SPDX-License-Identifier: MIT
#include "describe/param_info.h"

#include <cstdint>

#include "host/vst_wrapper.h"

namespace KelVSTInfoCache {
namespace {

constexpr std::int64_t kWidestSteppedRange = 99;

template <std::size_t size>
void endText(char (&text)[size]) {
  text[size - 1] = '\0';
}

VstParameterProperties propertiesOf(VSTWrapper& wrapper, int index, bool automatable) {
  VstParameterProperties props = {};
  if (!wrapper.getParameterProps(index, props)) {
    props = {};
    if (automatable) props.flags = kVstParameterCanRamp;
  }
  endText(props.label);
  endText(props.shortLabel);
  endText(props.categoryLabel);
  return props;
}

}  // namespace

ParamInfo::ParamInfo(VSTWrapper* wrapper, int index)
    : paramIndex(index), props{}, currentValue(wrapper->getParameter(index)) {
  paramName = NiduStringObj(wrapper->getParameterName(index).c_str(), 0);
  paramLabel = NiduStringObj(wrapper->getParameterLabel(index).c_str(), 0);
  automatable = wrapper->isParameterAutomatable(index);
  props = propertiesOf(*wrapper, index, automatable);
  if ((props.flags & kVstParameterUsesIntegerMinMax) == 0) return;
  minValue = props.minInteger;
  maxValue = props.maxInteger;
  if (!hasFewIntegerSteps()) return;
  for (std::int64_t v = props.minInteger; v <= props.maxInteger; ++v) {
    wrapper->setParameter(index, static_cast<float>(v));
    valueTexts.push_back(wrapper->getParameterCurValueAsText(index));
  }
}

bool ParamInfo::hasFewIntegerSteps() const {
  return (props.flags & kVstParameterUsesIntStep) != 0 && props.stepInteger == 1 &&
         std::int64_t{props.maxInteger} - props.minInteger <= kWidestSteppedRange;
}

}  // namespace KelVSTInfoCache
