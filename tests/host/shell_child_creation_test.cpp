// SPDX-License-Identifier: MIT
// The child of a shell that is wanted: what plug-ins are told while VSTWrapper::New runs, and afterwards.
#include <climits>
#include <vector>

#include "tests/shared/wrapper_fixture.h"
#include "vst2/host_opcodes.h"

namespace {

using namespace doubles;
using testing::Each;
using testing::ElementsAre;

VstIntPtr currentId(audioMasterCallback host) { return host(nullptr, 2, 0, 0, nullptr, 0.0f); }

class VSTWrapperCurrentLoadID : public host_tests::WrapperTest {
 protected:
  VSTWrapperCurrentLoadID() {
    plugin.onEntry = [this](audioMasterCallback host) { inEntry.push_back(currentId(host)); };
    effect.onRequest = [this](const Request&) {
      inRequests.push_back(currentId(&VSTWrapper::masterCallback));
    };
  }

  std::vector<VstIntPtr> inEntry;     ///< audioMasterCurrentId's answers to the entry point
  std::vector<VstIntPtr> inRequests;  ///< and to every request since.
};

TEST_F(VSTWrapperCurrentLoadID, IsTheChildsThroughoutItsCreation) {
  open(VST_ChildSpec(1234));
  EXPECT_THAT(inEntry, ElementsAre(1234));
  EXPECT_THAT(inRequests, ElementsAre(1234, 1234, 1234, 1234, 1234, 1234));
  EXPECT_EQ(VSTWrapper::gCurrentLoadID, 0);
  EXPECT_EQ(currentId(plugin.entryCalls().at(0)), 0);
}

TEST_F(VSTWrapperCurrentLoadID, IsZeroInLaterRequestsAndAtTheEnd) {
  open(VST_ChildSpec(1234));
  inRequests.clear();
  wrapper->getEffectCategory();
  close();
  EXPECT_THAT(inRequests, ElementsAre(0, 0));
}

TEST_F(VSTWrapperCurrentLoadID, IsZeroForAPluginThatIsNoChild) {
  VST_ChildSpec child(99);
  child.hasChildID = false;
  open(child);
  EXPECT_THAT(inEntry, ElementsAre(0));
  EXPECT_THAT(inRequests, Each(0));
}

TEST_F(VSTWrapperCurrentLoadID, IsTheLatestChildsInASecondCreation) {
  plugin.willCreate(effect);
  plugin.willCreate(effect);
  plugin.willCreate(effect);
  create(VST_ChildSpec(1234));
  create(VST_ChildSpec(77));
  create();
  EXPECT_THAT(inEntry, ElementsAre(1234, 77, 0));
}

TEST_F(VSTWrapperCurrentLoadID, KeepsItsSign) {
  for (int i = 0; i < 3; ++i) plugin.willCreate(effect);
  create(VST_ChildSpec(-5));
  create(VST_ChildSpec(INT_MIN));
  create(VST_ChildSpec(0));
  EXPECT_THAT(inEntry, ElementsAre(-5, VstIntPtr{INT_MIN}, 0));
}

TEST_F(VSTWrapperCurrentLoadID, IsZeroAgainAfterAnEntryPointThatAnswersNullOrThrows) {
  plugin.willRefuse();
  plugin.willThrow();
  EXPECT_EQ(create(VST_ChildSpec(1234)), nullptr);
  EXPECT_EQ(VSTWrapper::gCurrentLoadID, 0);
  EXPECT_EQ(create(VST_ChildSpec(77)), nullptr);
  EXPECT_EQ(VSTWrapper::gCurrentLoadID, 0);
  EXPECT_THAT(inEntry, ElementsAre(1234, 77));
}

}  // namespace
