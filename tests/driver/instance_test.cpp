// SPDX-License-Identifier: MIT
// Creating the instance, replacing it by a new one and closing it: the order, and what is thrown.
#include <string>
#include <vector>

#include "driver/instance.h"
#include "gmock/gmock.h"
#include "tests/driver/torture_fixture.h"
#include "tests/shared/thrown.h"
#include "vst2/host_opcodes.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

class DeleteAndNew : public InstanceFixture {
 protected:
  void throwFromCloseOfFirst() {
    first.onRequest = [](const Request& received) {
      if (received.opcode == effClose) throw 5;
    };
  }
};

TEST_F(DeleteAndNew, PrintsTheStepThenCreatesTheNewInstanceThenClosesTheOld) {
  open();
  const std::uint32_t references = module->refCount;
  plugin.willCreate(second);
  gStep = 13;
  std::vector<std::string> events;
  plugin.onEntry = [&](audioMasterCallback) { events.push_back("entry in step " + std::to_string(gStep)); };
  second.onRequest = [&](const Request& received) {
    if (received == canDo("hasCockosExtensions")) events.emplace_back("second is created");
  };
  first.onRequest = [&](const Request& received) {
    if (received.opcode != effClose) return;
    EXPECT_EQ(wrapper->effect, &second.aeffect);
    events.emplace_back("first is closed");
  };
  deleteAndNew(module, VST_loadID{}, wrapper, true);
  EXPECT_THAT(events, ElementsAre("entry in step 14", "second is created", "first is closed"));
  EXPECT_EQ(output(), "14, initialize\n");
  EXPECT_EQ(module->refCount, references);
}

TEST_F(DeleteAndNew, CreatesTheFirstInstanceOfAChildWithoutAStepLine) {
  module.reset(new VSTPluginLoader(VST_DLL_Info("/test.vst", "test")), NiduCOM::AddRef::kAdopt);
  plugin.willCreate(first);
  VstIntPtr wanted = 0;
  plugin.onEntry = [&](audioMasterCallback host) {
    wanted = host(nullptr, audioMasterCurrentId, 0, 0, nullptr, 0.0F);
  };
  deleteAndNew(module, VST_loadID{true, -77}, wrapper, false);
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(wanted, -77);
  EXPECT_TRUE(wrapper->childSpec.hasChildID);
  EXPECT_EQ(wrapper->childSpec.childName, "");
  EXPECT_EQ(wrapper->supportEffect, nullptr);
  EXPECT_EQ(output(), "");
  EXPECT_EQ(gStep, 0);
}

TEST_F(DeleteAndNew, KeepsTheNewInstanceWhenClosingTheOldOneThrows) {
  open();
  plugin.willCreate(second);
  throwFromCloseOfFirst();
  EXPECT_EQ(thrownInt([&] { deleteAndNew(module, VST_loadID{}, wrapper, false); }), 5);
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(wrapper->effect, &second.aeffect);
  EXPECT_EQ(first.timesClosed(), 1);
}

TEST_F(DeleteAndNew, CloseInstanceForgetsAnInstanceThatThrowsAndThenDoesNothing) {
  open();
  throwFromCloseOfFirst();
  EXPECT_EQ(thrownInt([&] { closeInstance(wrapper); }), 5);
  EXPECT_EQ(wrapper, nullptr);
  closeInstance(wrapper);
  EXPECT_THAT(first.requests(), ElementsAre(request(effClose)));
}

}  // namespace
