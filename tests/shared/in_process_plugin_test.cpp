// SPDX-License-Identifier: MIT
// The in-process plug-in cannot hide an instance that is left open, or a call that no test expects.
#include "gtest/gtest-spi.h"
#include "tests/shared/in_process_plugin.h"
#include "vst2/dispatch.h"

namespace {

using namespace doubles;

VstIntPtr aHost(AEffect*, VstInt32, VstInt32, VstIntPtr, void*, float) { return 0; }

class InProcessPluginTest : public testing::Test {
 protected:
  RecordingCoreFoundation core_foundation;
  InProcessPlugin plugin{core_foundation, "/b.vst"};
  RecordingEffect first;
  RecordingEffect second;
};

TEST_F(InProcessPluginTest, CountsTheInstancesThatAreNotClosed) {
  dispatch(first.aeffect, effClose);  // Not yet created: does not count.
  for (RecordingEffect* effect : {&first, &second, &first}) plugin.willCreate(*effect);
  const PluginEntryProc entry = plugin.entryPoint();
  entry(aHost);
  entry(aHost);
  entry(aHost);
  EXPECT_EQ(plugin.instancesAlive(), 3);
  dispatch(first.aeffect, effClose);
  EXPECT_EQ(plugin.instancesAlive(), 2);
  dispatch(first.aeffect, effClose);
  dispatch(second.aeffect, effClose);
  EXPECT_EQ(plugin.instancesAlive(), 0);
}

TEST(InProcessPluginFailures, ACallThatNobodyPreparedFailsTheTest) {
  static RecordingCoreFoundation core_foundation;
  static InProcessPlugin plugin(core_foundation);
  EXPECT_NONFATAL_FAILURE(EXPECT_EQ(plugin.entryPoint()(aHost), nullptr), "more often than prepared");
}

TEST(InProcessPluginFailures, ACallAfterThePluginWasDestroyedFailsTheTest) {
  static PluginEntryProc entry = nullptr;
  {
    RecordingCoreFoundation core_foundation;
    entry = InProcessPlugin(core_foundation).entryPoint();
  }
  EXPECT_NONFATAL_FAILURE(EXPECT_EQ(entry(aHost), nullptr), "a plug-in that was destroyed");
}

}  // namespace
