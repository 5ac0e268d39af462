// SPDX-License-Identifier: MIT
// The run of a plug-in that survives it: its random tests, and the short run of a shell. All lines of a run
// are in tests/end_to_end/golden/passing_run.txt and shell.txt.
#include <cstdint>
#include <string>
#include <vector>

#include "driver/run_plan.h"
#include "driver/torture_run.h"
#include "gmock/gmock.h"
#include "tests/driver/torture_fixture.h"
#include "vst2/host_opcodes.h"

namespace {

using namespace doubles;
using testing::ElementsAre;
using testing::EndsWith;
using testing::IsEmpty;
using testing::SizeIs;

TEST(TestNumberFor, DividesTheDrawsIntoFiveEqualParts) {
  struct Part {
    std::int64_t firstDraw;
    std::int64_t lastDraw;
  };
  const Part parts[] = {{0, 429496729},
                        {429496730, 858993459},
                        {858993460, 1288490188},
                        {1288490189, 1717986918},
                        {1717986919, 2147483647}};
  for (int number = 0; number < 5; ++number) {
    EXPECT_EQ(testNumberFor(parts[number].firstDraw), number);
    EXPECT_EQ(testNumberFor(parts[number].lastDraw), number);
  }
}

class TortureRun : public TortureFixture {
 protected:
  void SetUp() override {
    TortureFixture::SetUp();
    plugin.willCreate(first);
    plugin.willCreate(second);
  }
  bool run(VST_loadID loadID = {}) { return RunVSTTortureTest("/test.vst", loadID, isShellPlugin); }

  bool isShellPlugin = true;
};

TEST_F(TortureRun, SeedsOnceWithTheProcessorTimeAndDrawsFiftyTests) {
  scriptedClock = 123456;
  std::string randomLines;
  for (int step = 16; step < 66; step += 5) {
    scriptedDraws.insert(scriptedDraws.end(), {2147483647, 0, 429496730, 1288490189, 858993460});
    randomLines += std::to_string(step) + ", inspect latency\n";
    randomLines += std::to_string(step + 1) + ", inspect class info\n";
    randomLines += std::to_string(step + 2) + ", inspect preset info\n";
    randomLines += std::to_string(step + 3) + ", testing setting states\n";
    randomLines += std::to_string(step + 4) + ", inspect parameter info\n";
  }
  std::size_t seedsBeforeTheDescription = 0;
  first.onRequest = [&](const Request& received) {
    if (received.opcode == effGetVstVersion) seedsBeforeTheDescription = seeds.size();
  };
  EXPECT_TRUE(run());
  EXPECT_FALSE(isShellPlugin);
  EXPECT_THAT(output(), EndsWith("\n15, test gathering info\n" + randomLines));
  EXPECT_THAT(seeds, ElementsAre(123456U));
  EXPECT_EQ(seedsBeforeTheDescription, 1U);
  EXPECT_EQ(drawsMade, 50);
  EXPECT_EQ(plugin.instancesAlive(), 0);
}

TEST_F(TortureRun, StaysInTheFullPlanWhenTheNewInstanceIsAShell) {
  second.answer(effGetPlugCategory, 10);
  EXPECT_TRUE(run());
  EXPECT_FALSE(isShellPlugin);
  EXPECT_EQ(gStep, 65);
}

TEST_F(TortureRun, TellsThePluginTheWantedChildAtBothCreations) {
  std::vector<VstIntPtr> wanted;
  plugin.onEntry = [&](audioMasterCallback host) {
    wanted.push_back(host(nullptr, audioMasterCurrentId, 0, 0, nullptr, 0.0F));
  };
  EXPECT_TRUE(run({true, 4711}));
  EXPECT_THAT(wanted, ElementsAre(4711, 4711));
}

TEST_F(TortureRun, UsesTheLoaderOfAnEarlierRunAndItsStepCounter) {
  EXPECT_TRUE(run());
  plugin.willCreate(first);
  plugin.willCreate(second);
  EXPECT_TRUE(run());
  EXPECT_THAT(core_foundation.callsOf("CFBundleLoadExecutable"), SizeIs(1));
  EXPECT_THAT(core_foundation.callsOf("CFBundleUnloadExecutable"), IsEmpty());
  EXPECT_EQ(gStep, 130);
}

TEST_F(TortureRun, NamesTheBundleTest) {
  EXPECT_TRUE(run());
  ASSERT_EQ(VSTPluginLoader::fLoadedDLLs.size(), 1U);
  EXPECT_EQ((*VSTPluginLoader::fLoadedDLLs.begin())->info.effectName, "test");
}

// ---- Shells ----

TEST_F(TortureRun, OfAShellIsOneDescriptionWithoutTests) {
  first.answer(effGetPlugCategory, 10);
  first.setShellChildren({{7, "Seventh"}});
  isShellPlugin = false;
  EXPECT_TRUE(run());
  EXPECT_TRUE(isShellPlugin);
  EXPECT_STREQ(gCurTest, "gather info");
  std::vector<Request> asked = first.requests();
  asked.erase(asked.begin(), asked.end() - 3);
  EXPECT_THAT(asked,
              ElementsAre(request(effShellGetNextPlugin), request(effShellGetNextPlugin), request(effClose)));
  EXPECT_THAT(seeds, IsEmpty());
}

TEST_F(TortureRun, OfCategory9Or11IsTheFullPlan) {
  for (const VstIntPtr category : {9, 11}) {
    first.answer(effGetPlugCategory, category);
    EXPECT_TRUE(run());
    EXPECT_FALSE(isShellPlugin);
    plugin.willCreate(first);
    plugin.willCreate(second);
  }
  EXPECT_EQ(gStep, 130);
}

}  // namespace
