// SPDX-License-Identifier: MIT
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "scanner/explain/memcheck.h"

namespace scanner {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::SizeIs;

constexpr const char* kWorker = "/usr/lib/vsttorture/vsttorture-worker";
constexpr const char* kPlugin = "/usr/lib/vst/a&amp;b.so";

std::string frame(const std::string& address, const std::string& module, const std::string& function = "",
                  const std::string& file = "") {
  std::string text = "<frame><ip>" + address + "</ip><obj>" + module + "</obj>";
  if (!function.empty()) text += "<fn>" + function + "</fn>";
  if (!file.empty()) text += "<dir>/home/maker</dir><file>" + file + "</file><line>12</line>";
  return text + "</frame>";
}

std::string error(const std::string& kind, const std::string& what, const std::string& frames,
                  const std::string& more = "") {
  return "<error><unique>0x0</unique><tid>1</tid><kind>" + kind + "</kind><what>" + what + "</what><stack>" +
         frames + "</stack>" + more + "</error>";
}

std::string document(const std::string& errors) {
  return "<?xml version=\"1.0\"?><valgrindoutput><protocolversion>4</protocolversion>"
         "<status><state>RUNNING</state></status>" +
         errors + "<status><state>FINISHED</state></status></valgrindoutput>";
}

/// The code of the plug-in, which begins at 0x1000 in it, lies at 0x5001000.
constexpr const char* kLog =
    "--1-- Reading syms from /usr/lib/vst/a&b.so\n"
    "--1--    svma 0x0000001000, avma 0x0005001000\n"
    "--1-- Reading syms from /usr/lib/vsttorture/vsttorture-worker\n"
    "--1--    svma 0x0000004820, avma 0x000010c820\n";

Diagnosis read(const std::string& xml, const std::string& log = kLog) {
  Diagnosis diagnosis;
  readMemcheck(xml, log, diagnosis);
  return diagnosis;
}

TEST(ReadMemcheck, AnErrorBecomesAFindingWithFramesUpToTheWorker) {
  const Diagnosis diagnosis = read(document(
      error("InvalidRead", "Invalid read of size 1",
            frame("0x4847794", "/usr/libexec/valgrind/vgpreload_memcheck-amd64-linux.so", "strlen") +
                frame("0x5001fa7", kPlugin) + frame("0x5001800", kPlugin, "setChunk") +
                frame("0x5001900", kPlugin, "dispatch", "plugin.cpp") + frame("0x1198e5", kWorker, "call") +
                frame("0x10e9d0", kWorker, "main"),
            "<auxwhat>Address 0x773e961 is 0 bytes after a block of size 1,233 alloc'd</auxwhat><stack>" +
                frame("0x4843000", "/usr/libexec/valgrind/vgpreload_memcheck-amd64-linux.so", "malloc") +
                "</stack>")));
  ASSERT_EQ(diagnosis.findings.size(), 1U);
  const Diagnosis::Finding& finding = diagnosis.findings[0];
  EXPECT_EQ(finding.kind, "InvalidRead");
  EXPECT_EQ(finding.text, "Invalid read of size 1: 0 bytes after a block of size 1,233 alloc'd");
  EXPECT_THAT(finding.frames, ElementsAre("strlen", "a&b.so+0x1fa7", "setChunk (a&b.so+0x1800)",
                                          "dispatch (plugin.cpp:12)", "call (vsttorture-worker+0x118e5)"));
  EXPECT_TRUE(finding.isInPlugin);
  EXPECT_EQ(diagnosis.problem, "");
  EXPECT_THAT(diagnosis.report, HasSubstr("main (vsttorture-worker+0x69d0)"));
}

TEST(ReadMemcheck, WithoutALogAModuleHasNoOffset) {
  const Diagnosis diagnosis =
      read(document(error("InvalidRead", "Invalid", frame("0x5001fa7", kPlugin))), "");
  EXPECT_THAT(diagnosis.findings.at(0).frames, ElementsAre("a&b.so"));
}

TEST(ReadMemcheck, ErrorsOfOneKindAtOnePlaceOfThePluginAreOneFinding) {
  const auto printed = [](const char* address) {
    return error("UninitCondition", "Conditional jump",
                 frame(address, "/lib/libc.so.6", "printf") + frame("0x5001fa7", kPlugin));
  };
  const Diagnosis diagnosis =
      read(document(printed("0x4000001") + printed("0x4000002") + printed("0x4000003") +
                    error("InvalidRead", "Invalid read", frame("0x5001fa7", kPlugin))));
  ASSERT_EQ(diagnosis.findings.size(), 2U);
  EXPECT_EQ(diagnosis.findings[0].text, "Conditional jump (one of 3 there)");
  EXPECT_EQ(diagnosis.findings[1].kind, "InvalidRead");
}

TEST(ReadMemcheck, AFileThatThePluginHasWrittenToMakesNoEndlessFindings) {
  std::string stack;
  for (int i = 0; i < 120; ++i) stack += frame("0x5001fa7", kPlugin, std::string(1500, 'f'));
  std::string errors;
  for (int i = 0; i < 20; ++i) errors += error("Kind" + std::to_string(i), std::string(1500, 'w'), stack);
  const Diagnosis diagnosis = read(document(errors));
  ASSERT_THAT(diagnosis.findings, SizeIs(6));
  EXPECT_THAT(diagnosis.findings[0].frames, SizeIs(100));
  EXPECT_LT(diagnosis.findings[0].frames[0].size(), 1100U);
  EXPECT_EQ(diagnosis.findings[0].text.size(), 1024U);
  EXPECT_EQ(diagnosis.problem, "14 more findings are in the report only");
  EXPECT_EQ(diagnosis.report.size(), 65536U);
}

TEST(ReadMemcheck, LeaksAreNoFindings) {
  const Diagnosis diagnosis =
      read(document("<error><kind>Leak_DefinitelyLost</kind><xwhat><text>8 bytes are "
                    "lost</text></xwhat><stack></stack></error>"));
  EXPECT_THAT(diagnosis.findings, IsEmpty());
}

TEST(ReadMemcheck, AnErrorWithoutThePluginSaysSo) {
  const std::string ours = frame("0x4000001", "/lib/x86_64-linux-gnu/libc.so.6", "strlen") +
                           frame("0x1198e5", kWorker, "readName") + frame("0x10e9d0", kWorker, "main");
  const Diagnosis alone = read(document(error("UninitCondition", "Conditional jump", ours)));
  EXPECT_FALSE(alone.findings.at(0).isInPlugin);
  EXPECT_FALSE(alone.hasFindings());
  EXPECT_EQ(alone.findings.at(0).frames.size(), 3U);
  // The worker has stumbled over memory that the plug-in left unset.
  const Diagnosis given = read(document(error("UninitCondition", "Conditional jump", ours,
                                              "<auxwhat>Uninitialised value was created by a heap "
                                              "allocation</auxwhat><stack>" +
                                                  frame("0x5001fa7", kPlugin) + "</stack>")));
  EXPECT_TRUE(given.hasFindings());
  EXPECT_EQ(given.findings.at(0).text,
            "Conditional jump: uninitialised value was created by a heap allocation in a&b.so+0x1fa7");
}

TEST(ReadMemcheck, CodeThatLiesInNoModuleIsThePlugins) {
  EXPECT_TRUE(read(document(error("InvalidJump", "Jump", "<frame><ip>0x1234</ip></frame>"))).hasFindings());
}

TEST(ReadMemcheck, WhatARunHadWrittenBeforeItWasKilledCounts) {
  const std::string whole =
      document(error("InvalidRead", "Invalid read", frame("0x5001fa7", kPlugin)) +
               error("InvalidWrite", "Invalid write", frame("0x5001fb7", kPlugin, "", "plugin.cpp")));
  const Diagnosis diagnosis = read(whole.substr(0, whole.find("<file>")));
  ASSERT_FALSE(diagnosis.findings.empty());
  EXPECT_EQ(diagnosis.findings[0].kind, "InvalidRead");
  EXPECT_EQ(diagnosis.problem, "memcheck was ended before the run was");
}

TEST(ReadMemcheck, WhereMemcheckHasNotStartedItsReasonIsTheProblem) {
  EXPECT_EQ(read("", "").problem, "memcheck has found nothing out");
  EXPECT_EQ(read("", "==1== first\n==1== Cannot continue.\n\n").problem,
            "memcheck has found nothing out: ==1== Cannot continue.");
}

}  // namespace
}  // namespace scanner
