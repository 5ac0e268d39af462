// VSTWrapper::New where memory runs out: each of its allocations fails once, and that of every double on its
// way. A program of its own, since it replaces operator new.
#include <cstdlib>
#include <memory>
#include <new>
#include <optional>

#include "gtest/gtest.h"
#include "host/vst_wrapper.h"
#include "tests/doubles/in_process_plugin.h"
#include "tests/doubles/recording_core_foundation.h"
#include "tests/doubles/recording_effect.h"

namespace {

/// How many more allocations succeed; unset: all.
std::optional<int> allocationsLeft;

}  // namespace

void* operator new(std::size_t size) {
  if (allocationsLeft && (*allocationsLeft)-- <= 0) {
    allocationsLeft.reset();
    throw std::bad_alloc();
  }
  if (void* const block = std::malloc(size == 0 ? 1 : size)) return block;
  throw std::bad_alloc();
}
// Does not count: who asks in this way lives without. The lock does, while its semaphore is never needed.
void* operator new(std::size_t size, const std::nothrow_t&) noexcept {
  return std::malloc(size == 0 ? 1 : size);
}
void operator delete(void* block) noexcept { std::free(block); }
void operator delete(void* block, std::size_t) noexcept { std::free(block); }
void operator delete(void* block, const std::nothrow_t&) noexcept { std::free(block); }

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

    allocationsLeft = failures;
    std::unique_ptr<VSTWrapper> wrapper(VSTWrapper::New(module, child, nullptr));
    const bool allSucceeded = allocationsLeft.has_value();
    allocationsLeft.reset();

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
