// SPDX-License-Identifier: MIT
// The sample with the wide answers gives them: without that, the test of the host proves nothing.
#include <cstring>

#include <gtest/gtest.h>

#include "tests/plugins/loaded_plugin.h"

using namespace sample_plugins_test;

namespace {

TEST(ExcessPrecisionSample, ReadsAsOneThirdInAFloat) {
  AEffect* effect = LoadedPlugin("excess_precision").callEntry();
  const volatile float rounded = effect->getParameter(effect, 0);
  EXPECT_EQ(rounded, 0.333333343f);
  EXPECT_EQ(effect->numParams, 2);
  dispatch(*effect, effClose);
}

#if defined(__i386__)
TEST(ExcessPrecisionSample, AnswersWithMoreDigitsThanAFloatHas) {
  AEffect* effect = LoadedPlugin("excess_precision").callEntry();
  // The same function, declared with the type that the register of its answer has.
  long double (*wide)(AEffect*, VstInt32) = nullptr;
  static_assert(sizeof wide == sizeof effect->getParameter);
  std::memcpy(&wide, &effect->getParameter, sizeof wide);
  const long double answer = wide(effect, 0);
  EXPECT_NE(answer, static_cast<long double>(0.333333343f));
  EXPECT_EQ(answer, 1.0L / 3.0L);
  dispatch(*effect, effClose);
}
#endif

}  // namespace
