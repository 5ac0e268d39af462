// SPDX-License-Identifier: MIT
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "scanner/explain/explain_tool.h"
#include "scanner/explain/explainer.h"

namespace scanner {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(SplitCommand, BlanksPartWordsUnlessTheyAreQuoted) {
  EXPECT_THAT(splitCommand("strace -f"), ElementsAre("strace", "-f"));
  EXPECT_THAT(splitCommand("  a\t'b  c' \"d 'e'\" f\\ g h'i j'k ''"),
              ElementsAre("a", "b  c", "d 'e'", "f g", "hi jk", ""));
  EXPECT_THAT(splitCommand("'a\\b' \"a\\\"b\""), ElementsAre("a\\b", "a\"b"));
  EXPECT_THAT(splitCommand(" "), IsEmpty());
}

TEST(SplitCommand, AQuoteThatIsNotClosedIsAMistake) {
  EXPECT_THROW(splitCommand("perf 'stat"), UnusableTool);
}

TEST(FindTool, AProgramThatIsNotThereOrNoneAtAllIsAMistake) {
  EXPECT_THROW(findTool("there-is-no-such-program -x"), UnusableTool);
  EXPECT_THROW(findTool("/usr/lib"), UnusableTool);
  EXPECT_THROW(findTool(""), UnusableTool);
}

TEST(FindTool, ACommandIsNamedAfterItsProgram) {
  const ExplainTool tool = findTool("sh -c 'exec \"$@\"' x");
  EXPECT_EQ(tool.kind, ExplainTool::Kind::kCommand);
  EXPECT_EQ(tool.name, "sh");
  EXPECT_EQ(tool.command.front().front(), '/');
  EXPECT_EQ(tool.command.size(), 4U);
}

// ---- The same way -----------------------------------------------------------------------------------------

Judgement crashed(const char* requestKind, int opcode, int signal, const char* module) {
  Judgement judgement;
  judgement.verdict = Verdict::kCrashed;
  if (requestKind != nullptr) {
    judgement.request.emplace();
    judgement.request->kind = requestKind;
    judgement.request->opcode = opcode;
  }
  judgement.signal = signal;
  judgement.place = Place{module, 0x10, 0};
  return judgement;
}

TEST(FailsInTheSameWay, TheVerdictAndTheRequestDecide) {
  const Judgement first = crashed("dispatcher", 44, 11, "plugin.so");
  EXPECT_TRUE(failsInTheSameWay(first, crashed("dispatcher", 44, 6, "libc.so.6")));
  EXPECT_FALSE(failsInTheSameWay(first, crashed("dispatcher", 12, 11, "plugin.so")));
  EXPECT_FALSE(failsInTheSameWay(first, crashed("getParameter", 44, 11, "plugin.so")));
  EXPECT_FALSE(failsInTheSameWay(first, crashed(nullptr, 0, 11, "plugin.so")));
  Judgement hung = first;
  hung.verdict = Verdict::kHung;
  EXPECT_FALSE(failsInTheSameWay(first, hung));
}

TEST(FailsInTheSameWay, WithoutARequestTheSignalAndTheModuleDecide) {
  const Judgement first = crashed(nullptr, 0, 11, "plugin.so");
  EXPECT_TRUE(failsInTheSameWay(first, crashed(nullptr, 0, 11, "plugin.so")));
  EXPECT_FALSE(failsInTheSameWay(first, crashed(nullptr, 0, 6, "plugin.so")));
  EXPECT_FALSE(failsInTheSameWay(first, crashed(nullptr, 0, 11, "libc.so.6")));
}

TEST(FailsInTheSameWay, AnExitHasItsStatus) {
  Judgement first;
  first.verdict = Verdict::kExited;
  first.status = 3;
  Judgement again = first;
  EXPECT_TRUE(failsInTheSameWay(first, again));
  again.status = 0;
  EXPECT_FALSE(failsInTheSameWay(first, again));
}

}  // namespace
}  // namespace scanner
