// SPDX-License-Identifier: MIT
// VSTWrapper and the memory of an instance: some plug-ins own only part of the record, and all of them free
// it when they are closed. The address sanitizer sees a host that reads elsewhere.
#include <cstddef>
#include <cstdlib>
#include <cstring>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;

// The last of an instance that such a plug-in has.
constexpr std::size_t kOwnedSize = offsetof(AEffect, processDoubleReplacing);

AEffect* instanceToHandOut = nullptr;
AEffect* handOut(audioMasterCallback) { return instanceToHandOut; }

class VSTWrapperShortInstance : public host_tests::WrapperTest {
 protected:
  VSTWrapperShortInstance() {
    effect.setPrograms({{"Soft", {0.25f}}, {"Loud", {0.75f}}});
    effect.aeffect.numInputs = 1;
    effect.aeffect.numOutputs = 1;
    memory = std::malloc(kOwnedSize);
    std::memcpy(memory, &effect.aeffect, kOwnedSize);
    instanceToHandOut = static_cast<AEffect*>(memory);
    core_foundation.addBundle("/test.vst", {{"VSTPluginMain", handOut}});
    effect.onRequest = [this](const Request& request) {
      if (request.kind != Request::Kind::kDispatch || request.opcode != effClose) return;
      std::memset(memory, 0xEE, kOwnedSize);
      std::free(memory);
    };
  }

  void* memory;
};

TEST_F(VSTWrapperShortInstance, IsCreatedAskedAndClosedWithinItsMemory) {
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(wrapper->effect, memory);
  wrapper->setParameter(0, 0.5f);
  EXPECT_EQ(wrapper->getParameter(0), 0.5f);
  wrapper->updateStoredProgramNames();
  EXPECT_EQ(wrapper->getProgramName(1), "Loud");
  wrapper->mainsOn = true;
  close();
  EXPECT_EQ(effect.timesClosed(), 1);
}

TEST_F(VSTWrapperShortInstance, IsNotLookedAtAfterItWasClosed) {
  wrapper = create();
  ASSERT_NE(wrapper, nullptr);
  close();
  EXPECT_EQ(effect.requests().back(), request(effClose));
}

}  // namespace
