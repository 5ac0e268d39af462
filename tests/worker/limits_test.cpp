// SPDX-License-Identifier: MIT
// What the process may take. Each limit is read in a child of this process that takes it.
#include <csignal>

#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include "tests/shared/sanitizer.h"
#include "tests/worker/worker_run.h"
#include "worker/limits.h"

namespace {

/// Takes the limits in a child of this process, whose limit of the resource is `before`, and tells the one that it
/// has then: the same as soft and as hard limit, or 1.
rlim_t limitInAChild(const WorkerOptions& options, int resource, rlim_t before = RLIM_INFINITY) {
  int ends[2];
  if (pipe(ends) != 0) return 1;
  const pid_t child = fork();
  if (child == 0) {
    std::string whyNot;
    struct rlimit limit = {before, before};
    if (before != RLIM_INFINITY) setrlimit(resource, &limit);
    if (!limitThisProcess(options, whyNot) || getrlimit(resource, &limit) != 0) _exit(1);
    if (limit.rlim_cur != limit.rlim_max) limit.rlim_cur = 1;
    const bool isTold = write(ends[1], &limit.rlim_cur, sizeof limit.rlim_cur) == sizeof limit.rlim_cur;
    _exit(isTold ? 0 : 1);
  }
  close(ends[1]);
  rlim_t told = 1;
  const bool isRead = read(ends[0], &told, sizeof told) == sizeof told;
  close(ends[0]);
  waitpid(child, nullptr, 0);
  return isRead ? told : 1;
}

TEST(LimitThisProcess, LowersBothLimitsOfEachResourceAndRaisesNone) {
  WorkerOptions options;
  options.fileSizeLimit = 1000000;
  EXPECT_EQ(limitInAChild(options, RLIMIT_FSIZE), 1000000u);
  EXPECT_EQ(limitInAChild(options, RLIMIT_FSIZE, 500000), 500000u);
  options.memoryLimit = std::uint64_t{1} << 31;
  EXPECT_EQ(limitInAChild(options, RLIMIT_AS), std::uint64_t{1} << 31);
  options.withoutCore = true;
  EXPECT_EQ(limitInAChild(options, RLIMIT_CORE), 0u);
}

// A plug-in that overruns the limit of memory gets none, and a run without a limit of its own is none the
// wiser.
TEST(WorkerLimits, HoldForTheWholeRun) {
  ProgramCall call;
  call.arguments = {"--memory-limit",
                    "200000000",
                    "--file-size-limit",
                    "100000000",
                    "--no-core",
                    "--die-with-parent",
                    samplePlugin("well_behaved_effect")};
  if (kWithAddressSanitizer || kWithThreadSanitizer)
    GTEST_SKIP() << "a sanitizer needs more address space than any limit";
  EXPECT_EQ(runWorker(call).end, "exit status 0");
  call.arguments[1] = "1000000";
  EXPECT_NE(runWorker(call).end, "exit status 0");
}

/// Starts a worker that hangs, from a process that then ends, and tells whether the worker has ended too.
TEST(WorkerLimits, EndTheRunWithItsParent) {
  int ends[2];
  ASSERT_EQ(pipe(ends), 0);
  setenv("FAULT_KIND", "hang", 1);
  setenv("FAULT_PLACE", "dispatch:52", 1);
  const std::string plugin = samplePlugin("faulty");
  const pid_t parent = fork();
  if (parent == 0) {
    if (fork() == 0) {
      // Standard output is the pipe: its end is the worker's end.
      dup2(ends[1], STDOUT_FILENO);
      close(ends[0]);
      close(ends[1]);
      execl(VSTTORTURE_WORKER, VSTTORTURE_WORKER, "--die-with-parent", plugin.c_str(), nullptr);
      _exit(127);
    }
    for (;;) pause();
  }
  close(ends[1]);
  unsetenv("FAULT_KIND");
  unsetenv("FAULT_PLACE");
  std::string output;
  char c = 0;
  while (output.find("6, inspect latency\n") == std::string::npos && read(ends[0], &c, 1) == 1) output += c;
  EXPECT_NE(output.find("6, inspect latency\n"), std::string::npos);
  kill(parent, SIGKILL);
  waitpid(parent, nullptr, 0);
  alarm(30);
  EXPECT_EQ(read(ends[0], &c, 1), 0);
  alarm(0);
  close(ends[0]);
}

TEST(WorkerLimits, EndARunWhoseParentHasEndedBefore) {
  const ProgramRun run = runWorker({"--die-with-parent=1", samplePlugin("well_behaved_effect")});
  EXPECT_EQ(run.standardOutput, "");
  EXPECT_EQ(run.end, "signal 9");
  const std::string self = std::to_string(getpid());
  EXPECT_EQ(runWorker({"--die-with-parent=" + self, samplePlugin("shell")}).end, "exit status 1");
}

}  // namespace
