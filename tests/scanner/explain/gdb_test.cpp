// SPDX-License-Identifier: MIT
#include <csignal>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "scanner/explain/gdb.h"

namespace scanner {
namespace {

using testing::Contains;
using testing::ElementsAre;
using testing::IsEmpty;
using testing::SizeIs;

constexpr const char* kMappings =
    "process 77\n"
    "Mapped address spaces:\n"
    "\n"
    "          Start Addr           End Addr       Size     Offset  Perms  objfile\n"
    "      0x555500000000     0x555500001000     0x1000        0x0  rw-s   /tmp/record\n"
    "      0x555500001000     0x555500009000     0x8000     0x1000  r-xp   "
    "/usr/lib/vsttorture/vsttorture-worker\n"
    "      0x7fff00000000     0x7fff00004000     0x4000        0x0  r--p   /usr/lib/vst/a plug-in.so\n"
    "      0x7fff00004000     0x7fff00009000     0x5000     0x4000  r-xp   /usr/lib/vst/a plug-in.so\n"
    "      0x7fff10000000     0x7fff10009000     0x9000        0x0  r-xp   /lib/x86_64-linux-gnu/libc.so.6\n"
    "      0x7fff20000000     0x7fff20001000     0x1000        0x0  rw-s   /tmp/record\n";

Judgement ended(Verdict verdict, std::optional<int> signal = std::nullopt) {
  Judgement judgement;
  judgement.verdict = verdict;
  judgement.signal = signal;
  return judgement;
}

Diagnosis read(const std::string& log, const Judgement& judgement) {
  Diagnosis diagnosis;
  readGdb(log, judgement, diagnosis);
  return diagnosis;
}

TEST(ReadGdb, ASignalHasItsPlaceItsInstructionAndTheRegistersThatItReachesThrough) {
  const Diagnosis diagnosis =
      read(std::string("Program received signal SIGSEGV, Segmentation fault.\n"
                       "0x00007fff00004123 in ?? () from /usr/lib/vst/a plug-in.so\n"
                       "#0  0x00007fff00004123 in ?? () from /usr/lib/vst/a plug-in.so\n"
                       "#1  0x00007fff00004200 in Effect::dispatch(int, void*) (...) at effect.cpp:12\n"
                       "#2  0x0000555500001100 in (anonymous namespace)::run(int) ()\n"
                       "#3  0x0000555500001200 in main ()\n"
                       "=> 0x7fff00004123:\tmov    (%rdi,%rsi,8),%rax\n"
                       "rax            0x5                 5\n"
                       "rsi            0x2c                44\n"
                       "rdi            0x0                 0\n") +
               kMappings,
           ended(Verdict::kCrashed, SIGSEGV));
  ASSERT_EQ(diagnosis.findings.size(), 1U);
  const Diagnosis::Finding& finding = diagnosis.findings[0];
  EXPECT_EQ(finding.kind, "SIGSEGV");
  EXPECT_EQ(finding.text,
            "SIGSEGV in a plug-in.so+0x4123, at mov (%rdi,%rsi,8),%rax with rdi = 0x0, rsi = 0x2c");
  EXPECT_THAT(finding.frames,
              ElementsAre("a plug-in.so+0x4123", "Effect::dispatch(int, void*) (effect.cpp:12)",
                          "(anonymous namespace)::run(int) (vsttorture-worker+0x1100)"));
  EXPECT_TRUE(finding.isInPlugin);
  EXPECT_EQ(diagnosis.problem, "");
}

TEST(ReadGdb, AFileThatIsMappedBeforeAndBehindThePluginIsNotTakenForIt) {
  const std::string record = "     0x1000     0x0  rw-s   /var/tmp/scratch/record\n";
  const Diagnosis diagnosis = read(std::string("Program received signal SIGSEGV, Segmentation fault.\n"
                                               "#0  0x00007fff00004123 in Effect::bypass() ()\n"
                                               "=> 0x7fff00004123:\tud2\n") +
                                       kMappings + "      0x7ffe00000000     0x7ffe00001000" + record +
                                       "      0x7fff20000000     0x7fff20001000" + record,
                                   ended(Verdict::kCrashed, SIGSEGV));
  ASSERT_EQ(diagnosis.findings.size(), 1U);
  EXPECT_EQ(diagnosis.findings[0].text, "SIGSEGV in Effect::bypass() (a plug-in.so+0x4123), at ud2");
}

TEST(ReadGdb, AFrameAtTheBeginningOfALineGetsItsModuleFromTheProgramCounter) {
  const Diagnosis diagnosis =
      read(std::string("Catchpoint 1 (call to syscall exit_group), __GI__exit (...) at _exit.c:30\n"
                       "30\t_exit.c: No such file or directory.\n"
                       "#0  __GI__exit (...) at _exit.c:30\n"
                       "#1  inlined (...) at effect.h:3\n"
                       "#2  0x00007fff00004200 in leave() () from /usr/lib/vst/a plug-in.so\n"
                       "Thread 1 (Thread 0x7f (LWP 5) \"worker\"):\n"
                       "=> 0x7fff10000020 <__GI__exit+22>:\tcmp    $0xfffff000,%rax\n") +
               kMappings,
           ended(Verdict::kExited));
  ASSERT_EQ(diagnosis.findings.size(), 1U);
  EXPECT_EQ(diagnosis.findings[0].kind, "exit");
  EXPECT_EQ(diagnosis.findings[0].text, "The process was ended in inlined (effect.h:3)");
  EXPECT_THAT(diagnosis.findings[0].frames, ElementsAre("__GI__exit (_exit.c:30)", "inlined (effect.h:3)",
                                                        "leave() (a plug-in.so+0x4200)"));
}

TEST(ReadGdb, OfSeveralThreadsTheOneThatRunsTheTestsCounts) {
  const Diagnosis diagnosis =
      read(std::string("Thread 2 (Thread 0x1 (LWP 2) \"other\"):\n"
                       "#0  0x00007fff10000020 in poll () from /lib/x86_64-linux-gnu/libc.so.6\n"
                       "\n"
                       "Thread 1 (Thread 0x2 (LWP 1) \"vsttorture-work\"):\n"
                       "#0  0x00007fff10000030 in pause () from /lib/x86_64-linux-gnu/libc.so.6\n"
                       "#1  0x00007fff00004200 in wait() () from /usr/lib/vst/a plug-in.so\n") +
               kMappings,
           ended(Verdict::kHung));
  EXPECT_EQ(diagnosis.findings.at(0).text, "It was stopped at the limit in wait() (a plug-in.so+0x4200)");
}

TEST(ReadGdb, FramesBehindTheFirstThatAreNowhereAreLeftOut) {
  const Diagnosis diagnosis =
      read(std::string("#0  0x00007fff00004123 in ?? () from /usr/lib/vst/a plug-in.so\n"
                       "#1  0x00007ffc12345678 in ?? ()\n"
                       "#2  0x00007fff00004200 in ?? () from /usr/lib/vst/a plug-in.so\n"
                       "#3  0x0000000000000000 in ?? ()\n") +
               kMappings,
           ended(Verdict::kCrashed, SIGSEGV));
  EXPECT_THAT(diagnosis.findings.at(0).frames, ElementsAre("a plug-in.so+0x4123", "a plug-in.so+0x4200"));
  EXPECT_THAT(
      read("#0  0x0000000000001234 in ?? ()\n", ended(Verdict::kCrashed, SIGSEGV)).findings.at(0).frames,
      ElementsAre("0x1234"));
}

TEST(ReadGdb, ALogThatThePluginHasWrittenToTakesLittleTimeAndMemory) {
  std::string log;
  for (int i = 0; i < 15000; ++i) {
    const std::string number = std::to_string(100000 + i);
    log += "r" + number + " 0x0\n0x" + number + " 0x" + number + " 0x0 0x0 /" + number + "\n";
  }
  for (int i = 0; i < 15000; ++i) log += "#0  0x0000000000001234 in f ()\n";
  log += "#1  0x0000000000001234 in " + std::string(100000, 'g') + " ()\n";
  const Diagnosis diagnosis = read(log, ended(Verdict::kCrashed, SIGSEGV));
  EXPECT_THAT(diagnosis.findings.at(0).frames, SizeIs(100));
  EXPECT_LE(diagnosis.report.size(), 65536U);
  EXPECT_LE(read(std::string(100000, 'x'), ended(Verdict::kCrashed, SIGSEGV)).problem.size(), 5000U);
}

TEST(ReadGdb, ThrowsAndExitsOfTheWorkerItselfAreNoFindings) {
  const std::string log = std::string(
                              "#0  0x00007fff10000020 in __cxa_throw () from /lib/libstdc++.so.6\n"
                              "#1  0x0000555500001200 in main ()\n") +
                          kMappings;
  for (const Verdict verdict : {Verdict::kFailed, Verdict::kNoInstance, Verdict::kExited}) {
    const Diagnosis diagnosis = read(log, ended(verdict));
    EXPECT_THAT(diagnosis.findings, IsEmpty());
    EXPECT_NE(diagnosis.problem, "");
  }
}

TEST(ReadGdb, ARunThatWasNotStoppedIsAProblem) {
  EXPECT_EQ(read("[Inferior 1 (process 5) exited normally]\nNo stack.\n", ended(Verdict::kCrashed, SIGSEGV))
                .problem,
            "the run under gdb ended otherwise: [Inferior 1 (process 5) exited normally]");
  EXPECT_EQ(
      read("warning: Could not trace the inferior process.\n", ended(Verdict::kCrashed, SIGSEGV)).problem,
      "gdb could not run it: warning: Could not trace the inferior process.");
}

TEST(CanStopAt, NeitherAtWhatIsRightNorAtWhatNoSignalTells) {
  std::string whyNot;
  EXPECT_FALSE(canStopAt(ended(Verdict::kPassed), whyNot));
  EXPECT_EQ(whyNot, "");
  EXPECT_TRUE(canStopAt(ended(Verdict::kKilled, SIGTERM), whyNot));
  EXPECT_FALSE(canStopAt(ended(Verdict::kKilled, SIGKILL), whyNot));
  EXPECT_NE(whyNot, "");
}

TEST(GdbCommand, StopsAtTheSignalThatEndedTheRun) {
  const std::vector<std::string> command = gdbCommand("gdb", ended(Verdict::kCrashed, SIGFPE));
  EXPECT_EQ(command.front(), "gdb");
  EXPECT_EQ(command.back(), "--args");
  EXPECT_THAT(command, Contains("handle SIGFPE stop print pass"));
  EXPECT_THAT(gdbCommand("gdb", ended(Verdict::kKilled, 40)), Contains("handle SIG40 stop print pass"));
}

}  // namespace
}  // namespace scanner
