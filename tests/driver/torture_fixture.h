// SPDX-License-Identifier: MIT
// The fixtures of the driver's tests: plug-ins in this process, and standard output as text.
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "driver/report.h"
#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/driver/scripted_random.h"
#include "tests/shared/in_process_plugin.h"

using doubles::Request;
using Requests = std::vector<Request>;

class TortureFixture : public testing::Test {
 protected:
  void SetUp() override {
    gStep = 0;
    gCurTest = nullptr;
    resetRandom();
    VSTPluginLoader::fLoadedDLLs = decltype(VSTPluginLoader::fLoadedDLLs)();
    testing::internal::CaptureStdout();
  }
  void TearDown() override {
    if (!isOutputTaken) output();
    VSTPluginLoader::fLoadedDLLs = decltype(VSTPluginLoader::fLoadedDLLs)();
  }

  /// What was printed. Can be called once.
  std::string output() {
    isOutputTaken = true;
    return testing::internal::GetCapturedStdout();
  }

  doubles::RecordingCoreFoundation core_foundation;
  doubles::InProcessPlugin plugin{core_foundation, "/test.vst"};
  doubles::RecordingEffect first;
  doubles::RecordingEffect second;

 private:
  bool isOutputTaken = false;
};

/// A live wrapper around `first`.
class InstanceFixture : public TortureFixture {
 protected:
  /// Closes the instance before the test's other objects are destroyed, without the test's onRequest.
  void TearDown() override {
    first.onRequest = nullptr;
    second.onRequest = nullptr;
    wrapper.reset();
    TortureFixture::TearDown();
  }

  /// Creates the instance with the present settings of `first`, and forgets the requests of the creation.
  VSTWrapper* open() {
    module.reset(new VSTPluginLoader(VST_DLL_Info("/test.vst", "test")), NiduCOM::AddRef::kAdopt);
    plugin.willCreate(first);
    wrapper.reset(VSTWrapper::New(module, VST_ChildSpec(VST_loadID{}), nullptr));
    EXPECT_NE(wrapper, nullptr);
    first.forget();
    return wrapper.get();
  }

  NiduCOM::i_ptr<VSTPluginLoader> module;
  std::unique_ptr<VSTWrapper> wrapper;
};
