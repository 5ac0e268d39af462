// SPDX-License-Identifier: MIT
// What the tests of the description start from: a live wrapper on an instance in this process.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/shared/in_process_plugin.h"

class DescribedPlugin : public testing::Test {
 protected:
  /// Closes the instance while the rest of the test still exists, and without what the test does to requests.
  void TearDown() override {
    effect.onRequest = nullptr;
    wrapper.reset();
  }

  /// Creates the instance from `effect` as it is now, and forgets the requests of the creation.
  VSTWrapper* open() {
    module.reset(new VSTPluginLoader(VST_DLL_Info("/described.vst", "test")), NiduCOM::AddRef::kAdopt);
    plugin.willCreate(effect);
    wrapper.reset(VSTWrapper::New(module, VST_ChildSpec(VST_loadID{}), nullptr));
    EXPECT_NE(wrapper, nullptr);
    effect.forget();
    return wrapper.get();
  }

  doubles::RecordingCoreFoundation core_foundation;
  doubles::InProcessPlugin plugin{core_foundation, "/described.vst"};
  doubles::RecordingEffect effect;
  NiduCOM::i_ptr<VSTPluginLoader> module;
  std::unique_ptr<VSTWrapper> wrapper;
};
