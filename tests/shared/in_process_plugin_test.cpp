// SPDX-License-Identifier: MIT
// The in-process plug-in's entry point does what was prepared, and its counts are right.
#include "gmock/gmock.h"
#include "gtest/gtest-spi.h"
#include "platform/core_foundation.h"
#include "tests/shared/in_process_plugin.h"
#include "vst2/dispatch.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

VstIntPtr aHost(AEffect*, VstInt32, VstInt32, VstIntPtr, void*, float) { return 0; }
VstIntPtr anotherHost(AEffect*, VstInt32, VstInt32, VstIntPtr, void*, float) { return 1; }

/// The address that a host finds in the bundle at `path`; null when it exports no such name.
PluginEntryProc entryIn(const char* path, CFStringRef name) {
  CFURLRef url = CFURLCreateWithFileSystemPath(
      nullptr, CFStringCreateWithCString(nullptr, path, kCFStringEncodingUTF8), kCFURLPOSIXPathStyle, false);
  CFBundleRef bundle = CFBundleCreate(nullptr, url);
  if (!CFBundleLoadExecutable(bundle)) return nullptr;
  return reinterpret_cast<PluginEntryProc>(CFBundleGetFunctionPointerForName(bundle, name));
}

class InProcessPluginTest : public testing::Test {
 protected:
  RecordingCoreFoundation core_foundation;
  InProcessPlugin plugin{core_foundation, "/b.vst"};
  RecordingEffect first;
  RecordingEffect second;
};

TEST_F(InProcessPluginTest, IsFoundUnderTheNamesThatItExports) {
  InProcessPlugin other(core_foundation, "/old.vst", {"main"});
  plugin.willCreate(first);
  other.willCreate(second);
  EXPECT_EQ(entryIn("/old.vst", CFSTR("VSTPluginMain")), nullptr);
  EXPECT_EQ(entryIn("/old.vst", CFSTR("main"))(aHost), &second.aeffect);
  EXPECT_EQ(entryIn("/b.vst", CFSTR("VSTPluginMain"))(aHost), &first.aeffect);
}

TEST_F(InProcessPluginTest, DoesWhatWasPreparedInOrder) {
  plugin.willCreate(first);
  plugin.willRefuse();
  plugin.willThrow();
  plugin.willCreate(second);
  VstIntPtr answers = 0;
  plugin.onEntry = [&](audioMasterCallback host) { answers += host(nullptr, 0, 0, 0, nullptr, 0.0f); };
  const PluginEntryProc entry = plugin.entryPoint();
  EXPECT_EQ(entry(aHost), &first.aeffect);
  EXPECT_EQ(entry(aHost), nullptr);
  EXPECT_THROW(entry(aHost), int);
  EXPECT_EQ(entry(anotherHost), &second.aeffect);
  EXPECT_THAT(plugin.entryCalls(), ElementsAre(aHost, aHost, aHost, anotherHost));
  EXPECT_EQ(answers, 1);
}

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
