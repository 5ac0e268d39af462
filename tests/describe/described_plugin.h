// SPDX-License-Identifier: MIT
// The fixture of the tests of describe/: a live wrapper around an instance in this process.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/shared/in_process_plugin.h"

/// The bundle's identity, without a child.
inline VST_Class_Spec bundleSpec() { return {VST_DLL_Info("/described.vst", "bundle"), VST_ChildSpec()}; }

class DescribedPlugin : public testing::Test {
 protected:
  /// Closes the instance before the test's other objects are destroyed, without the test's onRequest.
  void TearDown() override {
    effect.onRequest = nullptr;
    wrapper.reset();
  }

  /// Creates the instance with the present settings of `effect`, and forgets the requests of the creation.
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
