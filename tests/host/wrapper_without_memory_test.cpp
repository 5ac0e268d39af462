// SPDX-License-Identifier: MIT
// VSTWrapper::New where memory runs out: each of its allocations fails once, and that of every double on its
// way.
#include <memory>

#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/shared/failing_new.h"
#include "tests/shared/in_process_plugin.h"
#include "tests/shared/recording_core_foundation.h"
#include "tests/shared/recording_effect.h"

namespace {

using namespace doubles;

TEST(VSTWrapperWithoutMemory, NewGivesNullAndLeavesNothingBehind) {
  VST_ChildSpec child(1234);
  child.childName = "A name that is too long for a string's own room";
  int failures = 0;
  for (bool made = false; !made;) {
    ASSERT_LT(failures, 1000);
    RecordingCoreFoundation core_foundation;
    InProcessPlugin plugin(core_foundation);
    RecordingEffect effect;
    effect.aeffect.numInputs = 2;
    plugin.willCreate(effect);
    NiduCOM::i_ptr<VSTPluginLoader> module;
    module.reset(new VSTPluginLoader(VST_DLL_Info("/test.vst", "test")), NiduCOM::AddRef::kAdopt);

    host_tests::failAfterAllocations(failures);
    std::unique_ptr<VSTWrapper> wrapper(VSTWrapper::New(module, child, nullptr));
    const bool allSucceeded = host_tests::stopFailing();

    made = wrapper != nullptr;
    EXPECT_EQ(made, allSucceeded) << "allocation " << failures;
    EXPECT_EQ(VSTWrapper::gCurrentLoadID, 0);
    wrapper.reset();
    EXPECT_EQ(module->refCount, 1u) << "allocation " << failures;
    if (!made) ++failures;
  }
  // At least the wrapper, its semaphore and the child's name.
  EXPECT_GE(failures, 3);
}

}  // namespace
