// SPDX-License-Identifier: MIT
// The sample's answers are more precise than a float where the processor allows it. Otherwise the test of the
// host, which must round them, would prove nothing.
#include <cstring>

#include <gtest/gtest.h>

#include "tests/plugins/loaded_plugin.h"

using namespace sample_plugins_test;

namespace {

TEST(ExcessPrecisionSample, AnswersOneThirdWithThePrecisionOfTheRegister) {
  AEffect* effect = LoadedPlugin("excess_precision").callEntry();
  const volatile float rounded = effect->getParameter(effect, 0);
  EXPECT_EQ(rounded, 0.333333343f);
#if defined(__i386__)
  // The same function, declared with the type of the register that holds its answer.
  long double (*wide)(AEffect*, VstInt32) = nullptr;
  static_assert(sizeof wide == sizeof effect->getParameter);
  std::memcpy(&wide, &effect->getParameter, sizeof wide);
  EXPECT_EQ(wide(effect, 0), 1.0L / 3.0L);
#endif
  dispatch(*effect, effClose);
}

}  // namespace
