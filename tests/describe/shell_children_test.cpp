// SPDX-License-Identifier: MIT
// The description of a shell: its children, and whether they have changed.
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "describe/vst_info.h"
#include "gmock/gmock.h"
#include "tests/describe/described_plugin.h"
#include "tests/shared/thrown.h"

namespace {

using namespace doubles;
using KelVSTInfoCache::VSTInfo;
using testing::ElementsAreArray;
using testing::IsEmpty;
using testing::SizeIs;

using Children = std::vector<ShellChild>;

class Shell : public DescribedPlugin {
 protected:
  Shell() { effect.answer(effGetPlugCategory, 10); }

  static void expectChildren(const VSTInfo& info, const Children& expected) {
    std::vector<std::pair<std::int32_t, std::string>> actualPairs;
    std::vector<std::pair<std::int32_t, std::string>> expectedPairs;
    for (const VST_ChildSpec& child : info.childIDs) {
      EXPECT_TRUE(child.hasChildID);
      actualPairs.emplace_back(child.childID, child.childName);
    }
    for (const ShellChild& child : expected) expectedPairs.emplace_back(child.id, child.name);
    EXPECT_THAT(actualPairs, ElementsAreArray(expectedPairs));
  }

  /// A record without a plug-in, whose list of children is empty.
  VSTInfo info{nullptr, bundleSpec()};
};

TEST_F(Shell, IsAskedForItsChildrenAndForNoParameter) {
  effect.setText(effGetEffectName, "Shell");
  effect.setParameters({0.5F, 0.25F});
  effect.setShellChildren({{7, "Seventh"}, {-2, "Minus second"}});
  const VSTInfo shell(open(), bundleSpec());
  EXPECT_THAT(shell.params, IsEmpty());
  expectChildren(shell, {{7, "Seventh"}, {-2, "Minus second"}});
  EXPECT_THAT(
      effect.requests(),
      ElementsAreArray({request(effGetEffectName), request(effGetVendorString), request(effGetVstVersion),
                        request(effGetPlugCategory), canDo("receiveVstMidiEvent"), canDo("sendVstMidiEvent"),
                        request(effShellGetNextPlugin), request(effShellGetNextPlugin),
                        request(effShellGetNextPlugin)}));
}

struct RefreshCase {
  const char* name;
  Children before;
  Children after;
  bool isChange;
};

class RefreshChildIDs : public Shell, public testing::WithParamInterface<RefreshCase> {};

TEST_P(RefreshChildIDs, KeepsTheNewListAndTellsWhetherItIsAChange) {
  open();
  effect.setShellChildren(GetParam().before);
  info.refreshChildIDs(wrapper.get());
  expectChildren(info, GetParam().before);
  effect.setShellChildren(GetParam().after);
  EXPECT_EQ(info.refreshChildIDs(wrapper.get()), GetParam().isChange);
  expectChildren(info, GetParam().after);
}

INSTANTIATE_TEST_SUITE_P(
    Lists, RefreshChildIDs,
    testing::ValuesIn(std::vector<RefreshCase>{
        {"FirstChildren", {}, {{9, "A"}, {3, "B"}}, true},
        {"NoChildrenTwice", {}, {}, false},
        {"TheSameChildren", {{9, "A"}, {3, "B"}}, {{9, "A"}, {3, "B"}}, false},
        {"ADroppedChild", {{1, "A"}, {2, "B"}}, {{1, "A"}}, true},
        {"ANewChild", {{1, "A"}}, {{1, "A"}, {2, "B"}}, true},
        {"AReplacedChild", {{1, "A"}, {2, "B"}}, {{1, "A"}, {3, "B"}}, true},
        {"AnotherOrder", {{1, "A"}, {2, "B"}}, {{2, "B"}, {1, "A"}}, false},
        {"AnotherName", {{1, "A"}}, {{1, "Renamed"}}, false},
        {"AChildWithoutANameAfterANamedOne", {}, {{1, "A"}, {2, ""}}, true},
        // The old children count once each, the new ones as often as the plug-in names them.
        {"TheSameDuplicates", {{1, "A"}, {1, "C"}}, {{1, "A"}, {1, "C"}}, true},
        {"DuplicatesThatBecomeOneChild", {{1, "A"}, {1, "A"}}, {{1, "A"}}, false},
    }),
    [](const auto& tested) { return tested.param.name; });

// ---- Shells with so many children that the requests are not recorded ----

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

TEST_F(LargeShell, MayHave1048576Children) {
  childrenLeft = 1048576;
  EXPECT_TRUE(info.refreshChildIDs(wrapper.get()));
  EXPECT_THAT(info.childIDs, SizeIs(1048576));
}

TEST_F(LargeShell, ThrowsMinusOneWithOneChildMore) {
  childrenLeft = 1048577;
  EXPECT_EQ(thrownInt([&] { info.refreshChildIDs(wrapper.get()); }), -1);
  EXPECT_EQ(childrenLeft, 0);
}

}  // namespace
