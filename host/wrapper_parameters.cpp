// SPDX-License-Identifier: MIT
// VSTWrapper: parameters.
#include "host/locked_values.h"
#include "host/vst_wrapper.h"
#include "support/text_buffer.h"
#include "vst2/dispatch.h"

namespace {

constexpr std::size_t kParameterNameBufferSize = 500;
constexpr std::size_t kParameterTextBufferSize = 256;

}  // namespace

float VSTWrapper::getParameter(int index) { return LockedValues(*this).get(index); }

void VSTWrapper::setParameter(int index, float value) { LockedValues(*this).set(index, value); }

std::string VSTWrapper::getParameterName(int index) {
  char name[kParameterNameBufferSize];
  vst_zerostruct(name);
  dispatch(*effect, effGetParamName, index, 0, name);
  return textIn(name);
}

std::string VSTWrapper::getParameterLabel(int index) const {
  char label[kParameterTextBufferSize];
  vst_zerostruct(label);
  dispatch(*effect, effGetParamLabel, index, 0, label);
  return textIn(label);
}

std::string VSTWrapper::getParameterCurValueAsText(int index) {
  char display[kParameterTextBufferSize];
  vst_zerostruct(display);
  dispatch(*effect, effGetParamDisplay, index, 0, display);
  return textIn(display);
}

VstIntPtr VSTWrapper::setParameterCurValueFromText(int index, const char* text) {
  if (dispatch(*effect, effString2Parameter, index) == 0) return 0;
  return dispatch(*effect, effString2Parameter, index, 0, textArgument(text));
}

bool VSTWrapper::isParameterAutomatable(int index) const {
  return dispatch(*effect, effCanBeAutomated, index) != 0;
}

bool VSTWrapper::getParameterProps(int index, VstParameterProperties& props) {
  return dispatch(*effect, effGetParameterProperties, index, 0, &props) != 0;
}
