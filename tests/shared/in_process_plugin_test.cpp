// SPDX-License-Identifier: MIT
// The in-process plug-in: that its entry point does what was prepared, once each and in order.
#include <stdexcept>

#include "gmock/gmock.h"
#include "gtest/gtest-spi.h"
#include "gtest/gtest.h"
#include "platform/core_foundation.h"
#include "tests/shared/in_process_plugin.h"
#include "vst2/dispatch.h"
#include "vst2/host_opcodes.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

VstIntPtr aHost(AEffect*, VstInt32 opcode, VstInt32, VstIntPtr, void*, float) {
  return opcode == audioMasterCurrentId ? 1234 : 0;
}
VstIntPtr anotherHost(AEffect*, VstInt32, VstInt32, VstIntPtr, void*, float) { return 0; }

// The address that a host finds in the bundle at `path`, as the host finds it.
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

TEST_F(InProcessPluginTest, IsFoundInItsBundle) {
  plugin.willCreate(first);
  const PluginEntryProc entry = entryIn("/b.vst", CFSTR("VSTPluginMain"));
  ASSERT_NE(entry, nullptr);
  EXPECT_EQ(entry(aHost), &first.aeffect);
  EXPECT_EQ(entryIn("/b.vst", CFSTR("main")), nullptr);
}

TEST_F(InProcessPluginTest, ExportsTheNamesThatItWasGiven) {
  InProcessPlugin old(core_foundation, "/old.vst", {"main_macho", "main"});
  EXPECT_EQ(entryIn("/old.vst", CFSTR("VSTPluginMain")), nullptr);
  EXPECT_EQ(entryIn("/old.vst", CFSTR("main_macho")), old.entryPoint());
  EXPECT_EQ(entryIn("/old.vst", CFSTR("main")), old.entryPoint());
}

TEST_F(InProcessPluginTest, CanExportNothing) {
  InProcessPlugin empty(core_foundation, "/empty.vst", {});
  EXPECT_EQ(entryIn("/empty.vst", CFSTR("VSTPluginMain")), nullptr);
}

TEST_F(InProcessPluginTest, DoesWhatWasPreparedInOrder) {
  plugin.willCreate(first);
  plugin.willRefuse();
  plugin.willThrow();
  plugin.willCreate(second);
  const PluginEntryProc entry = plugin.entryPoint();
  EXPECT_EQ(entry(aHost), &first.aeffect);
  EXPECT_EQ(entry(aHost), nullptr);
  EXPECT_THROW(entry(aHost), int);
  EXPECT_EQ(entry(anotherHost), &second.aeffect);
  EXPECT_THAT(plugin.entryCalls(), ElementsAre(aHost, aHost, aHost, anotherHost));
}

TEST_F(InProcessPluginTest, RunsTheTestsCodeDuringTheEntryCall) {
  plugin.willCreate(first);
  VstIntPtr currentId = 0;
  plugin.onEntry = [&](audioMasterCallback host) {
    EXPECT_EQ(plugin.instancesAlive(), 0);
    currentId = host(nullptr, audioMasterCurrentId, 0, 0, nullptr, 0.0f);
  };
  EXPECT_EQ(plugin.entryPoint()(aHost), &first.aeffect);
  EXPECT_EQ(currentId, 1234);
}

TEST_F(InProcessPluginTest, LetsTheTestsCodeThrow) {
  plugin.willCreate(first);
  plugin.onEntry = [](audioMasterCallback) { throw std::runtime_error("from the entry point"); };
  EXPECT_THROW(plugin.entryPoint()(aHost), std::runtime_error);
  EXPECT_EQ(plugin.instancesAlive(), 0);
}

TEST_F(InProcessPluginTest, CountsTheInstancesThatAreNotClosed) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  plugin.willCreate(first);
  const PluginEntryProc entry = plugin.entryPoint();
  entry(aHost);
  entry(aHost);
  EXPECT_EQ(plugin.instancesAlive(), 2);
  dispatch(first.aeffect, effClose);
  EXPECT_EQ(plugin.instancesAlive(), 1);
  entry(aHost);
  EXPECT_EQ(plugin.instancesAlive(), 2);
  dispatch(first.aeffect, effClose);
  dispatch(second.aeffect, effClose);
  EXPECT_EQ(plugin.instancesAlive(), 0);
}

TEST_F(InProcessPluginTest, CountsAnInstanceAsOftenAsItWasHandedOut) {
  dispatch(first.aeffect, effClose);  // Before it was handed out: does not count.
  plugin.willCreate(first);
  plugin.willCreate(first);
  plugin.entryPoint()(aHost);
  plugin.entryPoint()(aHost);
  dispatch(first.aeffect, effClose);
  EXPECT_EQ(plugin.instancesAlive(), 1);
}

TEST_F(InProcessPluginTest, LivesBesideOthers) {
  InProcessPlugin other(core_foundation, "/other.vst");
  plugin.willCreate(first);
  other.willCreate(second);
  EXPECT_EQ(entryIn("/other.vst", CFSTR("VSTPluginMain"))(aHost), &second.aeffect);
  EXPECT_EQ(entryIn("/b.vst", CFSTR("VSTPluginMain"))(aHost), &first.aeffect);
  EXPECT_THAT(plugin.entryCalls(), ElementsAre(aHost));
}

TEST(InProcessPluginFailures, ACallThatNobodyPreparedFailsTheTest) {
  static RecordingCoreFoundation core_foundation;
  static InProcessPlugin plugin(core_foundation);
  EXPECT_NONFATAL_FAILURE(EXPECT_EQ(plugin.entryPoint()(aHost), nullptr), "more often than prepared");
}

TEST(InProcessPluginFailures, ACallAfterThePluginIsGoneFailsTheTest) {
  static PluginEntryProc entry = nullptr;
  {
    RecordingCoreFoundation core_foundation;
    entry = InProcessPlugin(core_foundation).entryPoint();
  }
  EXPECT_NONFATAL_FAILURE(EXPECT_EQ(entry(aHost), nullptr), "a plug-in that is gone");
}

}  // namespace
