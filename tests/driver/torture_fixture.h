// SPDX-License-Identifier: MIT
// What the tests of the driver start from: plug-ins in this process, and standard output as text.
#pragma once

#include <cstdint>
#include <initializer_list>
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

/// The requests of several parts of a conversation, one after the other.
inline Requests conversation(std::initializer_list<Requests> parts) {
  Requests whole;
  for (const Requests& part : parts) whole.insert(whole.end(), part.begin(), part.end());
  return whole;
}

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

  /// What was printed; to be called once.
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

/// A live wrapper on the first of the instances.
class InstanceFixture : public TortureFixture {
 protected:
  /// Closes the instance while the rest of the test still exists, and without what the test does to requests.
  void TearDown() override {
    first.onRequest = nullptr;
    second.onRequest = nullptr;
    wrapper.reset();
    TortureFixture::TearDown();
  }

  /// Creates the instance from `first` as it is now, and forgets the requests of the creation.
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
