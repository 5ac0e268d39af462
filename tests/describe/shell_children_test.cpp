// SPDX-License-Identifier: MIT
// The description of a shell: its children, and whether they have changed.
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "describe/vst_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"

namespace {

using namespace doubles;
using KelVSTInfoCache::VSTInfo;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::Pair;
using testing::SizeIs;

VST_Class_Spec anySpec() { return {VST_DLL_Info("/described.vst", "bundle"), VST_ChildSpec(0)}; }

std::vector<std::pair<std::int32_t, std::string>> childrenOf(const VSTInfo& info) {
  std::vector<std::pair<std::int32_t, std::string>> children;
  for (const VST_ChildSpec& child : info.childIDs) {
    EXPECT_TRUE(child.hasChildID);
    children.emplace_back(child.childID, child.childName);
  }
  return children;
}

class Shell : public DescribedPlugin {
 protected:
  Shell() { effect.answer(effGetPlugCategory, 10); }

  // A record of no plug-in, whose list of children is empty.
  VSTInfo empty{nullptr, anySpec()};

  bool refreshWith(VSTInfo& info, std::vector<ShellChild> children) {
    if (wrapper == nullptr) open();
    effect.setShellChildren(std::move(children));
    return info.refreshChildIDs(wrapper.get());
  }
};

TEST_F(Shell, IsAskedForItsChildrenAndForNoParameter) {
  effect.setText(effGetEffectName, "Shell");
  effect.setParameters({0.5F, 0.25F});
  effect.setShellChildren({{7, "Seventh"}, {-2, "Minus second"}});
  const VSTInfo info(open(), anySpec());
  EXPECT_TRUE(info.isShell);
  EXPECT_FALSE(info.isSynth);
  EXPECT_THAT(info.params, IsEmpty());
  EXPECT_THAT(childrenOf(info), ElementsAre(Pair(7, "Seventh"), Pair(-2, "Minus second")));
  EXPECT_THAT(effect.requests(),
              ElementsAre(request(effGetEffectName), request(effGetVendorString), request(effGetVstVersion),
                          request(effGetPlugCategory), canDo("receiveVstMidiEvent"),
                          canDo("sendVstMidiEvent"), request(effShellGetNextPlugin),
                          request(effShellGetNextPlugin), request(effShellGetNextPlugin)));
}

TEST_F(Shell, OnlyAShellIsAskedForChildren) {
  effect.answer(effGetPlugCategory, 1);
  effect.setShellChildren({{7, "Seventh"}});
  const VSTInfo info(open(), anySpec());
  EXPECT_FALSE(info.isShell);
  EXPECT_THAT(info.childIDs, IsEmpty());
  EXPECT_THAT(effect.requestsOf(effShellGetNextPlugin), IsEmpty());
}

TEST_F(Shell, KeepsDuplicatesInThePluginsOrder) {
  effect.setShellChildren({{9, "A"}, {3, "B"}, {9, "C"}, {3, "B"}});
  const VSTInfo info(open(), anySpec());
  EXPECT_THAT(childrenOf(info), ElementsAre(Pair(9, "A"), Pair(3, "B"), Pair(9, "C"), Pair(3, "B")));
}

TEST_F(Shell, AChildWithoutANameDoesNotInheritThePreviousOne) {
  EXPECT_TRUE(refreshWith(empty, {{1, "First"}, {2, ""}}));
  EXPECT_THAT(childrenOf(empty), ElementsAre(Pair(1, "First"), Pair(2, "")));
}

TEST_F(Shell, FirstChildrenAreAChange) { EXPECT_TRUE(refreshWith(empty, {{1, "A"}, {2, "B"}})); }

TEST_F(Shell, TheSameChildrenAreNoChange) {
  refreshWith(empty, {{1, "A"}, {2, "B"}});
  EXPECT_FALSE(refreshWith(empty, {{1, "A"}, {2, "B"}}));
  EXPECT_THAT(childrenOf(empty), ElementsAre(Pair(1, "A"), Pair(2, "B")));
}

TEST_F(Shell, ADroppedChildIsAChange) {
  refreshWith(empty, {{1, "A"}, {2, "B"}});
  EXPECT_TRUE(refreshWith(empty, {{1, "A"}}));
  EXPECT_THAT(childrenOf(empty), ElementsAre(Pair(1, "A")));
}

TEST_F(Shell, AReplacedChildIsAChange) {
  refreshWith(empty, {{1, "A"}, {2, "B"}});
  EXPECT_TRUE(refreshWith(empty, {{1, "A"}, {3, "B"}}));
}

TEST_F(Shell, AnotherOrderIsNoChange) {
  refreshWith(empty, {{1, "A"}, {2, "B"}});
  EXPECT_FALSE(refreshWith(empty, {{2, "B"}, {1, "A"}}));
  EXPECT_THAT(childrenOf(empty), ElementsAre(Pair(2, "B"), Pair(1, "A")));
}

TEST_F(Shell, AnotherNameIsNoChange) {
  refreshWith(empty, {{1, "A"}});
  EXPECT_FALSE(refreshWith(empty, {{1, "Renamed"}}));
  EXPECT_THAT(childrenOf(empty), ElementsAre(Pair(1, "Renamed")));
}

TEST_F(Shell, NoChildrenTwiceAreNoChange) {
  EXPECT_FALSE(refreshWith(empty, {}));
  EXPECT_THAT(effect.requestsOf(effShellGetNextPlugin), SizeIs(1));
}

// The former children count once each, the new ones as often as they are named.
TEST_F(Shell, DuplicatesAreAChangeEveryTime) {
  refreshWith(empty, {{1, "A"}, {1, "A"}});
  EXPECT_TRUE(refreshWith(empty, {{1, "A"}, {1, "A"}}));
}

TEST_F(Shell, DuplicatesThatBecomeOneAreNoChange) {
  refreshWith(empty, {{1, "A"}, {1, "A"}});
  EXPECT_FALSE(refreshWith(empty, {{1, "A"}}));
}

// ---- Shells of many children, whose requests are not recorded ----

std::int64_t childrenLeft = 0;

VstIntPtr nameNextChild(AEffect*, VstInt32 opcode, VstInt32, VstIntPtr, void*, float) {
  return opcode == effShellGetNextPlugin && childrenLeft-- > 0 ? 1 : 0;
}

class LargeShell : public Shell {
 protected:
  LargeShell() {
    open();
    recordingDispatcher = effect.aeffect.dispatcher;
    effect.aeffect.dispatcher = nameNextChild;
  }
  void TearDown() override {
    effect.aeffect.dispatcher = recordingDispatcher;
    Shell::TearDown();
  }

  AEffectDispatcherProc recordingDispatcher;
};

TEST_F(LargeShell, MayHaveAHundredThousandChildren) {
  childrenLeft = 100000;
  EXPECT_TRUE(empty.refreshChildIDs(wrapper.get()));
  EXPECT_THAT(empty.childIDs, SizeIs(100000));
}

TEST_F(LargeShell, ThatNeverStopsIsMinusOne) {
  childrenLeft = INT64_MAX;
  try {
    empty.refreshChildIDs(wrapper.get());
    ADD_FAILURE() << "nothing was thrown";
  } catch (int thrown) {
    EXPECT_EQ(thrown, -1);
  }
}

}  // namespace
