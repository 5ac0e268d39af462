// SPDX-License-Identifier: MIT
// ~VSTWrapper: switching off, closing, and what the plug-in throws meanwhile.
#include <cstdint>
#include <memory>
#include <stdexcept>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

class VSTWrapperDestruction : public host_tests::WrapperTest {};

TEST_F(VSTWrapperDestruction, OnlyClosesAnInstanceThatIsOff) {
  effect.aeffect.numInputs = 2;
  open();
  close();
  EXPECT_THAT(effect.requests(), ElementsAre(request(effClose)));
}

TEST_F(VSTWrapperDestruction, SwitchesAnInstanceOffBeforeItClosesIt) {
  open();
  wrapper->mainsOn = true;
  close();
  EXPECT_THAT(effect.requests(), ElementsAre(request(effMainsChanged, 0, 0), request(effClose)));
}

TEST_F(VSTWrapperDestruction, LeavesABypassedInstanceBypassed) {
  open();
  wrapper->bypassed = true;
  close();
  EXPECT_THAT(effect.requests(), ElementsAre(request(effClose)));
}

TEST_F(VSTWrapperDestruction, ClearsMainsOnBeforeItCloses) {
  open();
  wrapper->mainsOn = true;
  const VSTWrapper* const dying = wrapper.get();
  bool onAtClose = true;
  effect.onRequest = [&](const Request& request) {
    if (request.opcode == effClose) onAtClose = dying->mainsOn;
  };
  close();
  EXPECT_FALSE(onAtClose);
}

TEST_F(VSTWrapperDestruction, GivesTheModuleBackAfterItClosed) {
  open();
  std::uint32_t usersAtClose = 0;
  effect.onRequest = [&](const Request&) { usersAtClose = module->refCount; };
  close();
  EXPECT_EQ(usersAtClose, 2u);
  EXPECT_EQ(module->refCount, 1u);
}

TEST_F(VSTWrapperDestruction, LetsWhatEffCloseThrowsPass) {
  open();
  throwAt(effClose);
  EXPECT_THROW(close(), int);
  EXPECT_EQ(effect.timesClosed(), 1);
  EXPECT_EQ(module->refCount, 1u);
}

TEST_F(VSTWrapperDestruction, LetsWhatEffMainsChangedThrowsPass) {
  open();
  wrapper->mainsOn = true;
  throwAt(effMainsChanged);
  EXPECT_THROW(close(), int);
  EXPECT_EQ(module->refCount, 1u);
}

// A second exception would end the process.
TEST_F(VSTWrapperDestruction, SwallowsWhatEffCloseThrowsWhileAnotherExceptionIsUnderWay) {
  open();
  throwAt(effClose);
  const auto failWithAWrapperInScope = [this] {
    const std::unique_ptr<VSTWrapper> owner(wrapper.release());
    throw std::runtime_error("the first failure");
  };
  EXPECT_THROW(failWithAWrapperInScope(), std::runtime_error);
  EXPECT_EQ(effect.timesClosed(), 1);
  EXPECT_EQ(module->refCount, 1u);
}

}  // namespace
