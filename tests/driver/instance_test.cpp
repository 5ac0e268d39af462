// SPDX-License-Identifier: MIT
// Deleting and creating the instance anew: the order of opening and closing, and what is thrown on the way.
#include <memory>
#include <string>
#include <vector>

#include "driver/instance.h"
#include "gmock/gmock.h"
#include "tests/driver/torture_fixture.h"
#include "vst2/host_opcodes.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::IsEmpty;

class DeleteAndNew : public InstanceFixture {
 protected:
  // What both instances and the entry point go through, in order.
  void logEvents() {
    plugin.onEntry = [this](audioMasterCallback) { events.emplace_back("entry"); };
    first.onRequest = [this](const Request& received) { log("first", received); };
    second.onRequest = [this](const Request& received) { log("second", received); };
  }
  void log(const std::string& instance, const Request& received) {
    if (received.kind != Request::Kind::kDispatch) return;
    if (received.opcode == effOpen) events.push_back(instance + " opened");
    if (received.opcode == effClose) events.push_back(instance + " closed");
  }

  std::vector<std::string> events;
};

TEST_F(DeleteAndNew, OpensTheNewInstanceBeforeItClosesTheOld) {
  open();
  plugin.willCreate(second);
  logEvents();
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  EXPECT_THAT(events, ElementsAre("entry", "second opened", "first closed"));
  EXPECT_EQ(wrapper->effect, &second.aeffect);
}

TEST_F(DeleteAndNew, HoldsTheNewInstanceAlreadyWhileTheOldIsClosed) {
  open();
  plugin.willCreate(second);
  first.onRequest = [this](const Request& received) {
    if (received.opcode != effClose) return;
    EXPECT_EQ(wrapper->effect, &second.aeffect);
    EXPECT_EQ(second.requests().back(), canDo("hasCockosExtensions"));
  };
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  EXPECT_TRUE(first.closed());
}

TEST_F(DeleteAndNew, AnnouncesTheStepBeforeTheEntryPointIsCalled) {
  open();
  plugin.willCreate(second);
  gStep = 13;
  plugin.onEntry = [](audioMasterCallback) { EXPECT_EQ(gStep, 14); };
  deleteAndNew(module, VST_loadID{}, wrapper, true);
  EXPECT_EQ(output(), "14, initialize\n");
}

TEST_F(DeleteAndNew, IsSilentUnlessToldToAnnounce) {
  open();
  plugin.willCreate(second);
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  EXPECT_EQ(output(), "");
  EXPECT_EQ(gStep, 0);
}

TEST_F(DeleteAndNew, CreatesTheFirstInstanceToo) {
  module.reset(new VSTPluginLoader(VST_DLL_Info("/test.vst", "test")), NiduCOM::AddRef::kAdopt);
  plugin.willCreate(first);
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(wrapper->effect, &first.aeffect);
  EXPECT_EQ(wrapper->supportEffect, nullptr);
  EXPECT_FALSE(wrapper->childSpec.hasChildID);
}

TEST_F(DeleteAndNew, CreatesTheChildWithoutAName) {
  open();
  plugin.willCreate(second);
  VstIntPtr wanted = 0;
  plugin.onEntry = [&](audioMasterCallback host) {
    wanted = host(nullptr, audioMasterCurrentId, 0, 0, nullptr, 0.0F);
  };
  deleteAndNew(module, VST_loadID{true, -77}, wrapper, false);
  EXPECT_EQ(wanted, -77);
  EXPECT_TRUE(wrapper->childSpec.hasChildID);
  EXPECT_EQ(wrapper->childSpec.childID, -77);
  EXPECT_EQ(wrapper->childSpec.childName, "");
}

TEST_F(DeleteAndNew, LeavesNothingWhereThePluginYieldsNoInstance) {
  open();
  plugin.willRefuse();
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  EXPECT_EQ(wrapper, nullptr);
  EXPECT_TRUE(first.closed());
}

TEST_F(DeleteAndNew, LeavesNothingWhereThePluginThrowsDuringItsCreation) {
  open();
  plugin.willThrow();
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  EXPECT_EQ(wrapper, nullptr);
  EXPECT_TRUE(first.closed());
}

TEST_F(DeleteAndNew, LetsThroughWhatTheOldInstanceThrowsAndKeepsTheNew) {
  open();
  plugin.willCreate(second);
  first.onRequest = [](const Request& received) {
    if (received.opcode == effClose) throw 5;
  };
  EXPECT_THROW(deleteAndNew(module, VST_loadID{}, wrapper, false), int);
  ASSERT_NE(wrapper, nullptr);
  EXPECT_EQ(wrapper->effect, &second.aeffect);
  EXPECT_EQ(first.timesClosed(), 1);
}

TEST_F(DeleteAndNew, SwitchesAnInstanceOffThatIsLeftOn) {
  open()->mainsOn = true;
  plugin.willCreate(second);
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  EXPECT_THAT(first.requests(), ElementsAre(mainsChanged(0), request(effClose)));
}

TEST_F(DeleteAndNew, GivesTheReferencesToTheModuleBack) {
  open();
  plugin.willCreate(second);
  const std::uint32_t references = module->refCount;
  deleteAndNew(module, VST_loadID{}, wrapper, false);
  EXPECT_EQ(module->refCount, references);
}

TEST_F(InstanceFixture, ClosingNoInstanceDoesNothing) {
  closeInstance(wrapper);
  EXPECT_EQ(wrapper, nullptr);
}

TEST_F(InstanceFixture, ClosingAnInstanceThatThrowsForgetsItAllTheSame) {
  open();
  first.onRequest = [](const Request& received) {
    if (received.opcode == effClose) throw 5;
  };
  EXPECT_THROW(closeInstance(wrapper), int);
  EXPECT_EQ(wrapper, nullptr);
  EXPECT_THAT(first.requests(), ElementsAre(request(effClose)));
}

}  // namespace
