// SPDX-License-Identifier: MIT
// VSTWrapper::getNextShellPlugin: the children that a shell offers.
#include <climits>
#include <string>

#include "tests/shared/wrapper_fixture.h"

namespace {

using namespace doubles;
using testing::ElementsAre;

class VSTWrapperShellChildren : public host_tests::WrapperTest {
 protected:
  VSTWrapperShellChildren() { open(); }
  VST_ChildSpec child;
};

TEST_F(VSTWrapperShellChildren, ComeOneByOneUntilThereIsNoneLeft) {
  effect.setShellChildren({{1234, "Shimmer"}, {-7, "Delay"}});
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_TRUE(child.hasChildID);
  EXPECT_EQ(child.childID, 1234);
  EXPECT_EQ(child.childName, "Shimmer");
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childID, -7);
  EXPECT_EQ(child.childName, "Delay");
  EXPECT_FALSE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(effect.requests(), std::vector<Request>(3, request(effShellGetNextPlugin)));
}

TEST_F(VSTWrapperShellChildren, TheEndFillsTheRecordInTooAndClearsTheName) {
  child.childID = 5;
  child.childName = "Before";
  EXPECT_FALSE(wrapper->getNextShellPlugin(child));
  EXPECT_TRUE(child.hasChildID);
  EXPECT_EQ(child.childID, 0);
  EXPECT_EQ(child.childName, "");
}

TEST_F(VSTWrapperShellChildren, ANameAtTheEndIsTakenOver) {
  effect.setText(effShellGetNextPlugin, "No more");
  effect.answer(effShellGetNextPlugin, 0);
  EXPECT_FALSE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childName, "No more");
  EXPECT_TRUE(child.hasChildID);
}

TEST_F(VSTWrapperShellChildren, AnyIdButZeroIsAChild) {
  effect.answerNext(effShellGetNextPlugin, {1, -1, INT_MIN, INT_MAX});
  for (const VstInt32 id : {1, -1, INT_MIN, INT_MAX}) {
    EXPECT_TRUE(wrapper->getNextShellPlugin(child));
    EXPECT_EQ(child.childID, id);
    EXPECT_EQ(child.childName, "");
  }
}

TEST_F(VSTWrapperShellChildren, ANameWithoutAZeroByteRunsToTheEndOfTheBuffer) {
  effect.setUnterminatedText(effShellGetNextPlugin, 114, 'c');
  EXPECT_TRUE(wrapper->getNextShellPlugin(child));
  EXPECT_EQ(child.childName, std::string(114, 'c'));
}

TEST_F(VSTWrapperShellChildren, TheWrappersOwnChildStaysAsItIs) {
  effect.setShellChildren({{1234, "Shimmer"}});
  wrapper->getNextShellPlugin(child);
  EXPECT_FALSE(wrapper->childSpec.hasChildID);
  EXPECT_EQ(wrapper->childSpec.childName, "");
  EXPECT_EQ(VSTWrapper::gCurrentLoadID, 0);
}

}  // namespace
