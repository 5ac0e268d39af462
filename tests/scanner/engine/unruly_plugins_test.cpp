// SPDX-License-Identifier: MIT
// Plug-ins that take or leave what is not theirs, each between two that behave well.
#include <csignal>
#include <map>
#include <tuple>

#include <gmock/gmock.h>
#include <sys/shm.h>
#include <unistd.h>

#include "flight_recorder/flight_record.h"
#include "tests/scanner/engine/engine_fixture.h"
#include "tests/shared/sanitizer.h"

using namespace scanner;
using ::testing::AnyOf;
using ::testing::ElementsAre;

namespace {

constexpr std::size_t kSegmentSize = 54321;

/// Segments of the size that only the plug-in makes. Another test may have one for a moment.
int segments() {
  shmid_ds limits = {};
  const int highest = shmctl(0, IPC_INFO, &limits);
  int count = 0;
  for (int index = 0; index <= highest; ++index) {
    shmid_ds segment = {};
    if (shmctl(index, SHM_STAT, &segment) >= 0 && segment.shm_segsz == kSegmentSize) ++count;
  }
  return count;
}

bool areSegmentsGone() {
  for (int waited = 0; segments() > 0; ++waited) {
    if (waited == 1000) return false;
    usleep(10000);
  }
  return true;
}

class UnrulyPlugin : public EngineTest {
 protected:
  UnrulyPlugin() {
    options.jobs = 3;
    options.limits.stepInSeconds = 60;  // What these plug-ins do can take long on a busy machine.
    options.limits.outputInBytes = 8 << 20;
    options.limits.filesInBytes = 16 << 20;
    if (options.limits.memoryInBytes > 0) options.limits.memoryInBytes = 1 << 30;
  }

  /// What was seen of the plug-in. Its neighbours must pass, whatever it does.
  RunSeen runBetweenOthers(const std::string& kind) {
    const Job neighbour = workerJob("well_behaved_effect");
    const std::vector<RunSeen> all =
        run({neighbour, workerJob("unruly", {{"UNRULY", kind}, {"UNRULY_TOKEN", token()}}), neighbour});
    for (const RunSeen* one : {&all[0], &all[2]}) {
      EXPECT_TRUE(isPass(*one)) << one->end.signal << ' ' << textOf(*one, true);
      EXPECT_EQ(one->leftBehind.processes, 0U);
    }
    return all[1];
  }

  [[nodiscard]] static bool isPass(const RunSeen& seen) {
    return seen.end.kind == End::Kind::kExited && seen.end.status == 0 && seen.limitHit == LimitHit::kNone &&
           !seen.lines.empty() && seen.lines.back().number + 1 >= seen.lines.front().number &&
           seen.record.size() == sizeof(FlightRecord);
  }

  void expectPassAndOneKilled(const RunSeen& seen) const {
    EXPECT_TRUE(isPass(seen)) << textOf(seen, true);
    // In a sandbox the process ends with it.
    EXPECT_EQ(seen.leftBehind.processes, isSandboxed() ? 0U : 1U);
  }
};

}  // namespace

TEST_P(UnrulyPlugin, AChildThatIsLeftIsKilled) { expectPassAndOneKilled(runBetweenOthers("fork")); }

TEST_P(UnrulyPlugin, AChildInASessionOfItsOwnIsKilled) {
  expectPassAndOneKilled(runBetweenOthers("fork_in_own_session"));
}

TEST_P(UnrulyPlugin, AChildOfAChildIsKilled) { expectPassAndOneKilled(runBetweenOthers("fork_twice")); }

TEST_P(UnrulyPlugin, AChildWithoutEnvironmentIsKilledWhileOthersRun) {
  expectPassAndOneKilled(runBetweenOthers("fork_twice_without_environment"));
}

TEST_P(UnrulyPlugin, OneThatIgnoresTerminationIsKilledAfterIt) {
  options.limits.stepInSeconds = 3;
  const RunSeen seen = runBetweenOthers("ignore_termination");
  EXPECT_EQ(seen.limitHit, LimitHit::kStep);
  EXPECT_EQ(seen.end.kind, End::Kind::kSignalled);
  EXPECT_EQ(seen.end.signal, SIGKILL);
  ASSERT_TRUE(seen.activity);
  EXPECT_EQ(seen.activity->state, 'S');
  EXPECT_EQ(seen.activity->systemCall, "pause");
  EXPECT_LT(seen.activity->processorSeconds, 0.2 * seen.activity->wallSeconds);
}

TEST_P(UnrulyPlugin, OneThatIsBusyIsSeenBusy) {
  options.limits.stepInSeconds = 3;
  const RunSeen seen = runBetweenOthers("burn");
  EXPECT_EQ(seen.limitHit, LimitHit::kStep);
  ASSERT_TRUE(seen.activity);
  EXPECT_EQ(seen.activity->state, 'R');
  // Other processes may take most of a busy machine.
  EXPECT_GT(seen.activity->processorSeconds, 0);
}

TEST_P(UnrulyPlugin, ManyFilesThatExceedTheLimitTogetherEndTheRun) {
  const RunSeen seen = runBetweenOthers("fill_home");
  EXPECT_EQ(seen.limitHit, LimitHit::kFiles);
  EXPECT_GE(seen.leftBehind.fileBytes, options.limits.filesInBytes);
}

TEST_P(UnrulyPlugin, OneFileCannotExceedTheLimit) {
  const RunSeen seen = runBetweenOthers("large_file");
  EXPECT_EQ(seen.limitHit, LimitHit::kFiles);
  EXPECT_LE(seen.leftBehind.fileBytes, options.limits.filesInBytes + 4096);
}

TEST_P(UnrulyPlugin, AFloodOfOutputEndsTheRun) {
  const RunSeen seen = runBetweenOthers("flood");
  EXPECT_EQ(seen.limitHit, LimitHit::kOutput);
  EXPECT_LT(seen.outputBytes, 2 * options.limits.outputInBytes);
}

TEST_P(UnrulyPlugin, TenThousandDescriptorsAreItsOwnAffair) {
  EXPECT_TRUE(isPass(runBetweenOthers("descriptors")));
}

TEST_P(UnrulyPlugin, AllocatingWithoutEndMeetsTheLimitOfMemory) {
  if (options.limits.memoryInBytes == 0) GTEST_SKIP() << "no limit of memory with this sanitizer";
  options.limits.memoryInBytes = 256 << 20;  // Not every machine has much more.
  const RunSeen seen = runBetweenOthers("allocate");
  EXPECT_EQ(seen.limitHit, LimitHit::kMemory);
  EXPECT_GT(seen.peakMemoryInBytes, options.limits.memoryInBytes / 2);
}

TEST_P(UnrulyPlugin, AThousandThreadsAreItsOwnAffair) { EXPECT_TRUE(isPass(runBetweenOthers("threads"))); }

TEST_P(UnrulyPlugin, ASegmentOfSystemVSharedMemoryIsRemoved) {
  const RunSeen seen = runBetweenOthers("system_v_segment");
  EXPECT_TRUE(isPass(seen));
  EXPECT_EQ(seen.leftBehind.sharedMemory, isSandboxed() ? 0U : 1U);
  EXPECT_TRUE(areSegmentsGone());
}

TEST_P(UnrulyPlugin, PosixSharedMemoryOfASandboxIsAFileOfTheRun) {
  if (!isSandboxed()) GTEST_SKIP() << "without a sandbox nothing tells whose segment it is";
  const RunSeen seen = runBetweenOthers("posix_segment");
  EXPECT_TRUE(isPass(seen));
  EXPECT_THAT(seen.leftBehind.files, ElementsAre("shm/vsttorture-unruly"));
}

INSTANTIATE_TEST_SUITE_P(Sandbox, UnrulyPlugin, ::testing::Values(SandboxUse::kOff, SandboxUse::kRequired),
                         sandboxName);
