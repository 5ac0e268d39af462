// SPDX-License-Identifier: MIT
// Runs of small programs: what they are given, what is seen of them, and how they are ended.
#include <csignal>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>

#include <gmock/gmock.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include "scanner/engine/run_engine.h"
#include "tests/scanner/engine/engine_fixture.h"
#include "tests/shared/program_run.h"

using namespace scanner;
using ::testing::AllOf;
using ::testing::ElementsAre;
using ::testing::EndsWith;
using ::testing::HasSubstr;
using ::testing::StartsWith;

namespace {

class RunEngineTest : public EngineTest {
 protected:
  void expectKilled(const RunSeen& seen, int signal) const {
    if (isSandboxed() && seen.end.kind == End::Kind::kExited) {
      EXPECT_EQ(seen.end.status, 128 + signal);
    } else {
      EXPECT_EQ(seen.end.kind, End::Kind::kSignalled);
      EXPECT_EQ(seen.end.signal, signal);
    }
  }
};

/// What "ulimit -v" says here, which is what the tests were started with.
std::string ownLimit() {
  rlimit limit = {};
  getrlimit(RLIMIT_AS, &limit);
  return limit.rlim_cur == RLIM_INFINITY ? "unlimited\n" : std::to_string(limit.rlim_cur / 1024) + "\n";
}

}  // namespace

TEST_P(RunEngineTest, OutputsAndStatusAreSeen) {
  const RunSeen seen = run(shellJob("echo out; echo err >&2; exit 3"));
  EXPECT_EQ(textOf(seen), "out\n");
  EXPECT_EQ(textOf(seen, true), "err\n");
  EXPECT_EQ(seen.end.kind, End::Kind::kExited);
  EXPECT_EQ(seen.end.status, 3);
  EXPECT_EQ(seen.outputBytes, 8U);
  EXPECT_EQ(seen.wasSandboxed, isSandboxed());
}

TEST_P(RunEngineTest, ASignalThatEndsARunIsSeen) { expectKilled(run(shellJob("kill -SEGV $$")), SIGSEGV); }

TEST_P(RunEngineTest, ARunReadsNothingDumpsNoCoreAndHasNoDescriptorOfOurs) {
  const RunSeen seen =
      run(shellJob("cat; grep -o 'core file size *1 *1 ' /proc/$$/limits | tr -s ' '; "
                   "for i in /proc/$$/fd/*; do echo ${i##*/}; done"));
  // 3 is the folder that the shell is just listing.
  EXPECT_EQ(textOf(seen), "core file size 1 1 \n0\n1\n2\n3\n");
}

TEST_P(RunEngineTest, HomeAndTemporaryFoldersAreScratch) {
  const RunSeen seen =
      run(shellJob("for i in \"$HOME\" \"$XDG_CONFIG_HOME\" \"$XDG_CACHE_HOME\" "
                   "\"$XDG_DATA_HOME\" \"$XDG_STATE_HOME\" \"$XDG_RUNTIME_DIR\" "
                   "\"$TMPDIR\"; do test -d \"$i\" && echo \"$i\"; done; pwd"));
  const std::vector<std::string> folders = lines(textOf(seen));
  EXPECT_THAT(folders, ElementsAre(EndsWith("/home"), EndsWith("/home/.config"), EndsWith("/home/.cache"),
                                   EndsWith("/home/.local/share"), EndsWith("/home/.local/state"),
                                   EndsWith("/run"), EndsWith("/tmp"), EndsWith("/home")));
  EXPECT_THAT(folders, ::testing::Each(StartsWith(options.scratchParent)));
}

TEST_P(RunEngineTest, AJobsVariableReplacesOursAndTheDisplayIsNotPassed) {
  setenv("DISPLAY", ":77", 1);
  setenv("ENGINE_TEST", "outside", 1);
  Job job = shellJob("echo \"$ENGINE_TEST,$DISPLAY,$TMPDIR\"");
  job.environment = {"ENGINE_TEST=job", "TMPDIR=job"};
  EXPECT_EQ(textOf(run(job)), "job,,job\n");
  unsetenv("DISPLAY");
  unsetenv("ENGINE_TEST");
}

TEST_P(RunEngineTest, AToolRunsTheProgramAndItsFilesAreReadAndGone) {
  Job job = shellJob("echo program \"$0\"");
  job.tool.emplace();
  job.tool->files = {"first", "second"};
  job.tool->command = [](const std::string& where) {
    const std::string script = "echo tool; echo a > $0/first; echo b > $0/second; \"$@\"";
    return std::vector<std::string>{"/bin/sh", "-c", script, where};
  };
  const RunSeen seen = run(job);
  EXPECT_EQ(textOf(seen), "tool\nprogram /bin/sh\n");
  EXPECT_THAT(seen.toolFiles, ElementsAre("a\n", "b\n"));
  EXPECT_EQ(seen.leftBehind.fileCount, 0U);
  EXPECT_EQ(seen.process, 0);
}

TEST_P(RunEngineTest, AJobsLimitsCountInsteadOfTheEngines) {
  options.limits.runInSeconds = 60;
  Job job = shellJob("exec sleep 30");
  job.limits = options.limits;
  job.limits->runInSeconds = 0.2;
  EXPECT_EQ(run(job).limitHit, LimitHit::kRun);
}

TEST_P(RunEngineTest, AtATimeLimitAToolGetsItsSignalAndItsPatience) {
  options.limits.runInSeconds = 2;  // Time to set the trap on a busy machine, too.
  Job job = shellJob("true");
  job.tool.emplace();
  job.tool->endSignal = SIGINT;
  job.tool->patienceInSeconds = 20;
  job.tool->command = [](const std::string&) {
    const std::string script = "trap 'kill $!; sleep 2.5; echo interrupted; exit 4' INT; sleep 30 & wait";
    return std::vector<std::string>{"/bin/sh", "-c", script};
  };
  const RunSeen seen = run(job);
  EXPECT_EQ(textOf(seen), "interrupted\n");
  EXPECT_EQ(seen.end.status, 4);
}

TEST_P(RunEngineTest, WhatAToolTakesToStartTheWorkerIsNoStep) {
  options.limits.stepInSeconds = 2;
  Job job = workerJob("well_behaved_effect");
  job.tool.emplace();
  job.tool->needsAddressSpace = true;
  job.tool->command = [](const std::string&) {
    return std::vector<std::string>{"/bin/sh", "-c", "sleep 3; exec \"$@\"", "sh"};
  };
  const RunSeen seen = run(job);
  EXPECT_EQ(seen.limitHit, LimitHit::kNone);
  EXPECT_EQ(seen.end.status, 0);
}

TEST_P(RunEngineTest, AToolMayHaveMoreAddressSpaceThanTheLimit) {
  options.limits.memoryInBytes = std::uint64_t{64} << 20;
  Job job = shellJob("ulimit -v");
  EXPECT_EQ(textOf(run(job)), "65536\n");
  job.tool.emplace();
  job.tool->needsAddressSpace = true;
  job.tool->command = [](const std::string&) { return std::vector<std::string>{"/usr/bin/env"}; };
  EXPECT_EQ(textOf(run(job)), ownLimit());
}

TEST_P(RunEngineTest, FilesThatAreLeftAreListedAndRemoved) {
  const RunSeen seen =
      run(shellJob("echo 1 > \"$HOME/.config/a\"; mkdir \"$TMPDIR/d\"; echo 2 > \"$TMPDIR/d/b\"; "
                   // Nobody looks so deep.
                   "cd \"$TMPDIR/d\"; for i in $(seq 100); do mkdir d; cd d; done; echo 3 > c"));
  EXPECT_THAT(seen.leftBehind.files, ElementsAre("home/.config/a", "tmp/d/b"));
  EXPECT_EQ(seen.leftBehind.fileCount, 2U);
}

TEST_P(RunEngineTest, AFolderServesTheNextRunOnlyWhenItIsAsNew) {
  const std::vector<RunSeen> seen = run(
      {shellJob("rmdir \"$HOME/.cache\"; mkdir \"$HOME/other\""), shellJob("chmod 500 \"$HOME\""),
       shellJob("ls -A \"$HOME\"; echo 1 > \"$HOME/a\"; ls -A \"$HOME/.cache\""), shellJob("ls \"$HOME\"")});
  EXPECT_EQ(textOf(seen[2]), ".cache\n.config\n.local\n");
  EXPECT_EQ(textOf(seen[3]), "");
  EXPECT_EQ(seen[3].leftBehind.fileCount, 0U);
}

TEST_P(RunEngineTest, FoldersWithoutPermissionsAndOfAnyDepthAreRemoved) {
  const RunSeen seen =
      run(shellJob("cd \"$TMPDIR\" && python3 -c 'import os\nfor _ in range(1100): os.mkdir(\"dddd\"); "
                   "os.chdir(\"dddd\")' && cd \"$HOME\" && mkdir a && echo > a/b && chmod 0 a && chmod 0 ."));
  EXPECT_EQ(seen.end.status, 0);
}

TEST_P(RunEngineTest, AProgramThatIsMissingIsNotStartedAndOthersAre) {
  Job missing = shellJob("");
  missing.program = "/nonexistent/program";
  const std::vector<RunSeen> seen = run({missing, shellJob("echo fine")});
  if (isSandboxed()) {
    EXPECT_THAT(textOf(seen[0], true), HasSubstr("/nonexistent/program"));
  } else {
    EXPECT_EQ(seen[0].end.kind, End::Kind::kNotStarted);
    EXPECT_EQ(seen[0].end.reason, "/nonexistent/program: No such file or directory");
  }
  EXPECT_EQ(textOf(seen[1]), "fine\n");
}

TEST_P(RunEngineTest, TheLimitOfARunEndsItWithSigterm) {
  options.limits.runInSeconds = 2;  // Time to fall asleep on a busy machine, too.
  const RunSeen seen = run(shellJob("exec sleep 100"));
  EXPECT_EQ(seen.limitHit, LimitHit::kRun);
  expectKilled(seen, SIGTERM);
  ASSERT_TRUE(seen.activity);
  EXPECT_EQ(seen.activity->state, 'S');
  EXPECT_EQ(seen.activity->sockets, 0U);
}

TEST_P(RunEngineTest, NotMoreRunAtATimeThanAllowedAndUrgentOnesGoFirst) {
  RunEngine engine(options);
  std::string order;
  const auto note = [&](const RunSeen& seen) {
    EXPECT_EQ(engine.running(), 0U);
    order += textOf(seen);
  };
  engine.add(shellJob("printf 1"), [&](const RunSeen& seen) {
    note(seen);
    engine.add(shellJob("printf 4"), note);
    engine.add(shellJob("printf 2"), note, true);
  });
  engine.add(shellJob("printf 3"), note);
  EXPECT_TRUE(engine.run());
  EXPECT_EQ(order, "1234");
}

TEST_P(RunEngineTest, AnInterruptEndsWhatRunsAndStartsNothingNew) {
  RunEngine engine(options);
  std::vector<RunSeen> ended;
  const auto note = [&](const RunSeen& seen) { ended.push_back(seen); };
  engine.add(shellJob("trap '' TERM; while :; do sleep 0.1; done"), note, false, {});
  engine.add(shellJob("echo never"), note);
  engine.onTick([] { std::raise(SIGINT); });
  EXPECT_FALSE(engine.run());
  ASSERT_EQ(ended.size(), 1U);
  EXPECT_EQ(ended[0].limitHit, LimitHit::kInterrupted);
  EXPECT_EQ(engine.queued(), 0U);
}

TEST_P(RunEngineTest, AHangUpThatWasIgnoredBeforeDoesNotInterrupt) {
  const auto before = std::signal(SIGHUP, SIG_IGN);  // As nohup does.
  RunEngine engine(options);
  engine.add(shellJob("sleep 0.5"), [](const RunSeen& seen) { EXPECT_EQ(seen.end.status, 0); });
  engine.onTick([] { std::raise(SIGHUP); });
  EXPECT_TRUE(engine.run());
  std::signal(SIGHUP, before);
}

TEST_P(RunEngineTest, TimeInWhichTheEngineCouldNotLookCountsAgainstNoRun) {
  options.jobs = 2;
  options.limits.runInSeconds = 2;
  RunEngine engine(options);
  engine.add(shellJob("true"), [](const RunSeen&) { sleep(3); });
  RunSeen waiting;
  // More than a pipe holds, so that it cannot end before the engine looks again.
  engine.add(shellJob("sleep 0.5; head -c 200000 /dev/zero"), [&](const RunSeen& seen) { waiting = seen; });
  EXPECT_TRUE(engine.run());
  EXPECT_EQ(waiting.limitHit, LimitHit::kNone);
  EXPECT_EQ(waiting.outputBytes, 200000U);
}

TEST_P(RunEngineTest, WhatOnEndThrowsComesOutOfRunWhenTheOthersHaveEnded) {
  options.jobs = 2;
  RunEngine engine(options);
  bool hasOtherEnded = false;
  engine.add(shellJob("true"), [](const RunSeen&) { throw std::runtime_error("from OnEnd"); });
  engine.add(shellJob("sleep 100"), [&](const RunSeen&) { hasOtherEnded = true; });
  EXPECT_THROW(engine.run(), std::runtime_error);
  EXPECT_TRUE(hasOtherEnded);
}

TEST_P(RunEngineTest, ProcessesThatAreNotOfARunAreLeftAlone) {
  const pid_t other = fork();
  if (other == 0) {
    for (;;) pause();
  }
  run({shellJob("sleep 100 &"), shellJob("true")});
  EXPECT_EQ(waitpid(other, nullptr, WNOHANG), 0);
  kill(other, SIGKILL);
  EXPECT_EQ(waitpid(other, nullptr, 0), other);
}

TEST_P(RunEngineTest, WhatAKilledProcessWithAnEngineHasStartedIsGoneSoon) {
  const pid_t scan = fork();
  if (scan == 0) {
    RunEngine engine(options);
    Job orphan = shellJob("setsid env -i sh -c 'while :; do sleep 0.1; done' " + token() + " & sleep 100");
    engine.add(orphan, [](const RunSeen&) {});
    engine.run();
    _exit(1);
  }
  for (int waited = 0; processesNamed(token()).empty() && waited < 1000; ++waited) usleep(10000);
  kill(scan, SIGKILL);
  waitpid(scan, nullptr, 0);
  EXPECT_TRUE(haveGone(token(), 10));  // Milliseconds, unless the machine is busy.
  // The folder goes last. TearDown() demands that it has.
  for (int waited = 0; !std::filesystem::is_empty(options.scratchParent) && waited < 1000; ++waited)
    usleep(10000);
}

INSTANTIATE_TEST_SUITE_P(Sandbox, RunEngineTest, ::testing::Values(SandboxUse::kOff, SandboxUse::kRequired),
                         sandboxName);
