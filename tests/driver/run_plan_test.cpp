// SPDX-License-Identifier: MIT
// The whole run of a plug-in that survives it: its lines, its order, its draws, and the short run of a shell.
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
using testing::AllOf;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;
using testing::StartsWith;

struct DrawCase {
  std::int64_t draw;
  int number;
};

void PrintTo(const DrawCase& tested, std::ostream* stream) { *stream << tested.draw; }

class TestNumberFor : public testing::TestWithParam<DrawCase> {};

TEST_P(TestNumberFor, IsAFifthOfTheRange) { EXPECT_EQ(testNumberFor(GetParam().draw), GetParam().number); }

INSTANTIATE_TEST_SUITE_P(Draws, TestNumberFor,
                         testing::Values(DrawCase{0, 0}, DrawCase{429496729, 0}, DrawCase{429496730, 1},
                                         DrawCase{858993459, 1}, DrawCase{858993460, 2},
                                         DrawCase{1288490188, 2}, DrawCase{1288490189, 3},
                                         DrawCase{1717986918, 3}, DrawCase{1717986919, 4},
                                         DrawCase{2147483647, 4}),
                         [](const auto& tested) { return "Draw" + std::to_string(tested.param.draw); });

const char* const kLinesBeforeTheRandomPass =
    "total, 64\n"
    "1, test gathering info\n"
    "2, inspect class info\n"
    "3, inspect preset info\n"
    "4, inspect parameter info\n"
    "5, testing setting states\n"
    "6, inspect latency\n"
    "7, inspect stream format\n"
    "8, inspect stream format\n"
    "9, inspect latency\n"
    "10, testing setting states\n"
    "11, inspect parameter info\n"
    "12, inspect preset info\n"
    "13, inspect class info\n"
    "14, initialize\n"
    "15, test gathering info\n";

std::string randomLines(const std::vector<std::string>& texts) {
  std::string lines;
  for (std::size_t i = 0; i < 50; ++i) {
    lines += std::to_string(16 + i) + ", " + texts[i % texts.size()] + "\n";
  }
  return lines;
}

class TortureRun : public TortureFixture {
 protected:
  bool run(VST_loadID loadID = {}) { return RunVSTTortureTest("/test.vst", loadID, isShellPlugin); }

  bool isShellPlugin = true;
};

TEST_F(TortureRun, PrintsTheseLines) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  for (int i = 0; i < 10; ++i) {
    scriptedDraws.insert(scriptedDraws.end(), {2147483647, 0, 429496730, 1288490189, 858993460});
  }
  EXPECT_TRUE(run());
  EXPECT_FALSE(isShellPlugin);
  EXPECT_EQ(gStep, 65);
  EXPECT_EQ(output(), kLinesBeforeTheRandomPass +
                          randomLines({"inspect latency", "inspect class info", "inspect preset info",
                                       "testing setting states", "inspect parameter info"}));
}

TEST_F(TortureRun, DrawsFiftyTimesAfterSeedingOnceWithTheProcessorTime) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  scriptedClock = 123456;
  // More draws than are made: the fifty-first would be seen.
  scriptedDraws.assign(60, 2147483647);
  EXPECT_TRUE(run());
  EXPECT_THAT(seedsSown, ElementsAre(123456U));
  EXPECT_EQ(drawsMade, 50);
  EXPECT_EQ(output(), kLinesBeforeTheRandomPass + randomLines({"inspect latency"}));
}

TEST_F(TortureRun, SeedsBeforeTheFirstRequestOfTheDescription) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  bool described = false;
  first.onRequest = [&](const Request& received) {
    if (received.opcode != effGetVstVersion) return;
    described = true;
    EXPECT_THAT(seedsSown, SizeIs(1));
    EXPECT_EQ(drawsMade, 0);
  };
  EXPECT_TRUE(run());
  EXPECT_TRUE(described);
}

TEST_F(TortureRun, NeverResetsTheStepCounter) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  gStep = 100;
  EXPECT_TRUE(run());
  EXPECT_EQ(gStep, 165);
  EXPECT_THAT(output(), StartsWith("total, 64\n101, test gathering info\n"));
}

// The first instance: creation, category, description, twelve tests, close. What each part asks is tested
// elsewhere; here each is known by one request that nothing else makes.
TEST_F(TortureRun, TheFirstInstanceGoesThroughThePlanInOrder) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  EXPECT_TRUE(run());
  EXPECT_THAT(first.requestsOf({effOpen, effGetVstVersion, effGetPlugCategory, effGetOutputProperties,
                                effSetSampleRate, effGetTailSize, effClose}),
              ElementsAre(setSampleRate(44100.0F), request(effOpen),                     //
                          request(effGetPlugCategory),                                   // of the driver
                          request(effGetVstVersion), request(effGetPlugCategory),        // of the description
                          request(effGetPlugCategory), request(effGetOutputProperties),  // test 0
                          setSampleRate(44100.0F),                                       // test 3
                          request(effGetTailSize), request(effGetTailSize),              // test 4, twice
                          setSampleRate(44100.0F),                                       // test 3
                          request(effGetPlugCategory), request(effGetOutputProperties),  // test 0
                          request(effClose)));
  EXPECT_EQ(first.requests().back(), request(effClose));
}

TEST_F(TortureRun, TheSecondInstanceIsDescribedAndGoesThroughTheRandomPass) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  scriptedDraws.assign(50, 2147483647);
  EXPECT_TRUE(run());
  const std::vector<Request> requests =
      second.requestsOf({effOpen, effGetVstVersion, effGetPlugCategory, effGetTailSize, effClose});
  ASSERT_THAT(requests, SizeIs(54));
  EXPECT_EQ(requests[0], request(effOpen));
  // On purpose: the category is asked only in the description; the new instance's plays no part in the plan.
  EXPECT_EQ(requests[1], request(effGetVstVersion));
  EXPECT_EQ(requests[2], request(effGetPlugCategory));
  for (std::size_t i = 3; i < 53; ++i) EXPECT_EQ(requests[i], request(effGetTailSize));
  EXPECT_EQ(requests[53], request(effClose));
  EXPECT_EQ(second.requests().back(), request(effClose));
  EXPECT_EQ(plugin.instancesAlive(), 0);
}

TEST_F(TortureRun, APluginThatBecomesAShellAtItsReCreationStaysInTheFullPlan) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  second.answer(effGetPlugCategory, 10);
  EXPECT_TRUE(run());
  EXPECT_FALSE(isShellPlugin);
  EXPECT_EQ(gStep, 65);
}

TEST_F(TortureRun, TellsThePluginWhichChildIsWantedAtBothCreations) {
  plugin.willCreate(first);
  plugin.willCreate(second);
  std::vector<VstIntPtr> wanted;
  plugin.onEntry = [&](audioMasterCallback host) {
    wanted.push_back(host(nullptr, audioMasterCurrentId, 0, 0, nullptr, 0.0F));
  };
  EXPECT_TRUE(run({true, 4711}));
  EXPECT_THAT(wanted, ElementsAre(4711, 4711));
}

TEST_F(TortureRun, ASecondRunOfTheSameBundleDoesNotLoadItAgain) {
  for (int i = 0; i < 2; ++i) {
    plugin.willCreate(first);
    plugin.willCreate(second);
    EXPECT_TRUE(run());
  }
  EXPECT_THAT(core_foundation.callsOf("CFBundleLoadExecutable"), SizeIs(1));
  EXPECT_THAT(core_foundation.callsOf("CFBundleUnloadExecutable"), IsEmpty());
}

// ---- Shells ----

TEST_F(TortureRun, OfAShellIsOneDescription) {
  plugin.willCreate(first);
  first.answer(effGetPlugCategory, 10);
  first.setText(effGetEffectName, "Shell");
  first.setParameters({0.5F});
  first.setShellChildren({{7, "Seventh"}});
  isShellPlugin = false;
  EXPECT_TRUE(run());
  EXPECT_TRUE(isShellPlugin);
  EXPECT_EQ(output(), "total, 51\n1, test gathering info\n");
  EXPECT_STREQ(gCurTest, "gather info");
  EXPECT_THAT(
      first.requests(),
      ElementsAre(request(effIdentify), setSampleRate(44100.0F), setBlockSize(512), request(effOpen),
                  setProgram(0), canDo("hasCockosExtensions"),  //
                  request(effGetPlugCategory),                  //
                  request(effGetEffectName), request(effGetVendorString), request(effGetVstVersion),
                  request(effGetPlugCategory), canDo("receiveVstMidiEvent"), canDo("sendVstMidiEvent"),
                  request(effShellGetNextPlugin), request(effShellGetNextPlugin),  //
                  request(effClose)));
  EXPECT_THAT(plugin.entryCalls(), SizeIs(1));
  EXPECT_THAT(seedsSown, IsEmpty());
}

TEST_F(TortureRun, ACategoryNextToTheShellsIsAnOrdinaryPlugin) {
  for (const VstIntPtr category : {9, 11, -10}) {
    first.answer(effGetPlugCategory, category);
    plugin.willCreate(first);
    plugin.willCreate(second);
    EXPECT_TRUE(run());
    EXPECT_FALSE(isShellPlugin);
  }
  EXPECT_EQ(gStep, 195);
}

}  // namespace
