// SPDX-License-Identifier: MIT
#include <gmock/gmock.h>

#include "scanner/report/terminal.h"

using namespace scanner;
using ::testing::HasSubstr;
using ::testing::Not;

namespace {

PluginResult result(Verdict verdict, const std::string& bundle, const std::string& cause = "") {
  PluginResult one;
  one.run.bundle = bundle;
  one.judgement.verdict = verdict;
  one.judgement.cause = cause;
  one.isWanted = rowOf(verdict).isGood;
  if (verdict != Verdict::kSkipped && verdict != Verdict::kWrongArchitecture) {
    one.seen = RunSeen{};
    one.seen->wallSeconds = 1.25;
    one.command = {"/usr/lib/vsttorture-worker", bundle};
  }
  return one;
}

PluginResult child(std::int32_t id, const std::string& name) {
  PluginResult one = result(Verdict::kPassed, "/lib/shell.so");
  one.run.child = id;
  one.run.childName = name;
  return one;
}

/// A report whose output is kept.
struct Terminal {
  explicit Terminal(unsigned columns = 80) {
    options.isTerminal = true;
    options.showsProgress = true;
    options.columns = columns;
  }
  TerminalReport& report() {
    if (!made)
      made = std::make_unique<TerminalReport>(options, [this](const std::string& text) {
        written += text;
        return true;
      });
    return *made;
  }
  /// What was written since the last call.
  std::string take() { return std::exchange(written, {}); }

  TerminalOptions options;
  std::string written;
  std::unique_ptr<TerminalReport> made;
};

/// A scan with something of everything.
std::string wholeReport(Terminal& terminal) {
  TerminalReport& report = terminal.report();
  ScanStarted started;
  started.plugins = 5;
  started.jobs = 2;
  started.sandbox = "bubblewrap";
  started.notes = {"not searched: /lib/closed: Permission denied"};
  report.started(started);
  report.ended(result(Verdict::kPassed, "/usr/lib/vst/effect.so"));
  report.ended(child(-7, "Third child"));
  PluginResult crashed = result(Verdict::kCrashed, "/usr/lib/vst/with blank/oscilloscope.so",
                                "step 5, testing setting states: SIGSEGV in effSetBypass (44) value 1, in "
                                "oscilloscope.so+0x43480c, through a null pointer");
  report.ended(crashed);
  PluginResult unmet = result(Verdict::kPassed, "/usr/lib/vst/mended.so");
  unmet.expected = Expectation{"crashed", 5, "known", false};
  unmet.isWanted = false;
  report.ended(unmet);
  PluginResult met = result(Verdict::kFailed, "/usr/lib/vst/known.so", "threw");
  met.expected = Expectation{"failed", {}, "known", true};
  met.isWanted = true;
  report.ended(met);
  PluginResult flaky = result(Verdict::kExited, "/usr/lib/vst/flaky.so", "ended the process with status 0");
  flaky.repetitions = Repetitions{3, {{"passed", 2}, {"exited at 4", 1}}};
  report.ended(flaky);
  report.ended(result(Verdict::kSkipped, "/usr/lib/vst/skipped.so", "slow"));
  report.ended(
      result(Verdict::kWrongArchitecture, "/usr/lib/vst/a_folder/arm.so", "built for Linux on aarch64"));
  ScanEnded ended;
  ended.wallSeconds = 75;
  ended.counts = {{"passed", 3}, {"crashed", 1}, {"failed", 1},
                  {"exited", 1}, {"skipped", 1}, {"wrong_architecture", 1}};
  report.ended(ended);
  return terminal.take();
}

TEST(TerminalReport, TellsEverythingAt80Columns) {
  Terminal terminal(80);
  EXPECT_EQ(wholeReport(terminal),
            R"(not searched: /lib/closed: Permission denied
5 plug-ins, 2 at a time, sandbox: bubblewrap
passed          1.2 s  /usr/lib/vst/effect.so
passed          1.2 s  /lib/shell.so #-7 Third child
crashed         1.2 s  /usr/lib/vst/with blank/oscilloscope.so
passed          1.2 s  /usr/lib/vst/mended.so
failed          1.2 s  /usr/lib/vst/known.so  as expected
flaky           1.2 s  /usr/lib/vst/flaky.so
skipped                /usr/lib/vst/skipped.so
wrong_architecture            /usr/lib/vst/a_folder/arm.so

crashed  /usr/lib/vst/with blank/oscilloscope.so
  step 5, testing setting states: SIGSEGV in effSetBypass (44) value 1, in
  oscilloscope.so+0x43480c, through a null pointer
  again: /usr/lib/vsttorture-worker '/usr/lib/vst/with blank/oscilloscope.so'
passed  /usr/lib/vst/mended.so
  expected: crashed at 5
  again: /usr/lib/vsttorture-worker /usr/lib/vst/mended.so
exited  /usr/lib/vst/flaky.so
  ended the process with status 0
  flaky: 33 % of the runs failed: 1 of 3 exited at 4, 2 of 3 passed
  again: /usr/lib/vsttorture-worker /usr/lib/vst/flaky.so
wrong_architecture  /usr/lib/vst/a_folder/arm.so
  built for Linux on aarch64

8 results: 3 passed, 1 failed, 1 crashed, 1 exited, 1 wrong_architecture, 1
  skipped, in 1 min 15 s
)");
}

TEST(TerminalReport, FitsInto40ColumnsButForCommands) {
  Terminal terminal(40);
  const std::string text = wholeReport(terminal);
  for (std::size_t at = 0; at < text.size();) {
    const std::size_t end = text.find('\n', at);
    const std::string line = text.substr(at, end - at);
    if (line.find("again: ") == std::string::npos) {
      EXPECT_LE(line.size(), 40U) << line;
    }
    at = end + 1;
  }
  EXPECT_THAT(text, HasSubstr("crashed     oscilloscope.so\n"));
  EXPECT_THAT(text, HasSubstr("wrong_architecture arm.so\n"));
  EXPECT_THAT(text, HasSubstr("\nwrong_architecture\n  /usr/lib/vst/a_folder/arm.so\n"));
}

TEST(TerminalReport, ShowsWhatAToolFoundInAPluginThatPassed) {
  Terminal terminal(70);
  PluginResult one = result(Verdict::kPassed, "/lib/vst/a.so");
  one.isWanted = false;
  one.diagnosis.emplace();
  one.diagnosis->tool = "memcheck";
  one.diagnosis->command = {"valgrind", "worker", "/lib/vst/a b.so"};
  one.diagnosis->findings = {
      {"InvalidRead",
       "Invalid read of size 1: 0 bytes after a block",
       {"strlen", "a.so+0x1", "b", "c", "d", "e"}},
      {"UninitValue", "Use", {"clearsAVeryLargeBlockOfMemoryByALengthThatWasNeverSet (file.cpp:123)"}, false},
      {"UninitValue", "Use", {}},
      {"UninitValue", "Use", {}}};
  one.diagnosis->problem = "memcheck was ended before the run was";
  terminal.report().ended(one);
  EXPECT_EQ(terminal.take(), "passed          1.2 s  /lib/vst/a.so  with findings of memcheck\n");
  terminal.report().ended(ScanEnded());
  EXPECT_EQ(terminal.take(),
            R"(
passed  /lib/vst/a.so
  memcheck: Invalid read of size 1: 0 bytes after a block
    strlen
    a.so+0x1
    b
    c
    d
  memcheck, not in the plug-in: Use
    clearsAVeryLargeBlock...oryByALengthThatWasNeverSet (file.cpp:123)
  memcheck: Use
  memcheck: 1 more of them
  memcheck: memcheck was ended before the run was
  under memcheck: valgrind worker '/lib/vst/a b.so'
  again: /usr/lib/vsttorture-worker /lib/vst/a.so

0 results, in 0 s
)");
}

TEST(TerminalReport, ShowsTheShortestListOfTestsAndItsCommand) {
  Terminal terminal(60);
  PluginResult one = result(Verdict::kCrashed, "/lib/vst/a.so", "cause");
  one.shrunk = Shrunk{"0,1,2,3,3,4", "3,3,4", 11, true, {"worker", "--tests", "3,3,4", "/lib/vst/a.so"}};
  terminal.report().ended(one);
  one.shrunk = Shrunk{"0,3", "0,3", 2, false, one.command, "it did not fail again"};
  terminal.report().ended(one);
  terminal.take();
  terminal.report().ended(ScanEnded());
  EXPECT_EQ(terminal.take(),
            R"(
crashed  /lib/vst/a.so
  cause
  shortest list of tests: 3 of 6, found in 11 runs
  shortest: worker --tests 3,3,4 /lib/vst/a.so
  again: /usr/lib/vsttorture-worker /lib/vst/a.so
crashed  /lib/vst/a.so
  cause
  shortest list of tests: it did not fail again
  again: /usr/lib/vsttorture-worker /lib/vst/a.so

0 results, in 0 s
)");
}

TEST(TerminalReport, ShowsOnlyWhatIsNotAsWantedWhenQuiet) {
  Terminal terminal;
  terminal.options.isQuiet = true;
  const std::string text = wholeReport(terminal);
  for (const char* name : {"effect.so", "Third child", "skipped.so", "known.so", "at a time"})
    EXPECT_THAT(text, Not(HasSubstr(name)));
  for (const char* name : {"oscilloscope.so", "mended.so", "flaky.so", "arm.so", "8 results", "not searched"})
    EXPECT_THAT(text, HasSubstr(name));
}

TEST(TerminalReport, ColoursWordsOnly) {
  Terminal terminal;
  terminal.options.hasColours = true;
  terminal.report().ended(result(Verdict::kPassed, "/a"));
  EXPECT_EQ(terminal.take(), "\x1b[32mpassed      \x1b[0m    1.2 s  /a\n");
  terminal.report().ended(result(Verdict::kCrashed, "/a"));
  EXPECT_EQ(terminal.take(), "\x1b[31mcrashed     \x1b[0m    1.2 s  /a\n");
  PluginResult known = result(Verdict::kCrashed, "/a");
  known.isWanted = true;
  terminal.report().ended(known);
  EXPECT_EQ(terminal.take(), "\x1b[33mcrashed     \x1b[0m    1.2 s  /a\n");
}

TEST(TerminalReport, WritesNoControlCodesWithoutATerminal) {
  Terminal terminal;
  terminal.options.isTerminal = false;
  terminal.report().progress(1, 2, 3, {"a"});
  EXPECT_THAT(wholeReport(terminal), Not(HasSubstr("\x1b")));
}

// ---- What has changed -------------------------------------------------------------------------------------

PluginResult changed(Verdict verdict, Comparison::Change change, const std::string& earlier) {
  PluginResult one = result(verdict, "/lib/a.so", "step 5: SIGSEGV");
  if (verdict == Verdict::kCrashed) one.judgement.step = 5;
  one.command.clear();
  one.comparison.emplace();
  one.comparison->change = change;
  if (!earlier.empty()) one.comparison->earlier = Comparison::Earlier{earlier, 5, 1700000000};
  return one;
}

struct ChangeCase {
  const char* name;
  Verdict verdict;
  Comparison::Change change;
  const char* earlier;
  const char* line;
};
class TerminalReportChanges : public ::testing::TestWithParam<ChangeCase> {};

TEST_P(TerminalReportChanges, AreToldInOneLine) {
  Terminal terminal;
  const ChangeCase& row = GetParam();
  terminal.report().ended(changed(row.verdict, row.change, row.earlier));
  terminal.take();
  terminal.report().ended(ScanEnded());
  EXPECT_EQ(terminal.take(), std::string("\n") + rowOf(row.verdict).word +
                                 "  /lib/a.so\n  step 5: SIGSEGV\n" + row.line + "\n0 results, in 0 s\n");
}

using C = Comparison::Change;
INSTANTIATE_TEST_SUITE_P(
    Table, TerminalReportChanges,
    ::testing::Values(
        ChangeCase{"New", Verdict::kCrashed, C::kNew, "passed", "  new: it was \"passed\" before\n"},
        ChangeCase{"NewInAnotherWay", Verdict::kCrashed, C::kNew, "hung",
                   "  new: it was \"hung at 5\" before\n"},
        ChangeCase{"NewForTheFirstTime", Verdict::kCrashed, C::kNew, "", "  new: it was not there before\n"},
        ChangeCase{"StillFailing", Verdict::kCrashed, C::kStillFailing, "crashed", "  still failing\n"},
        ChangeCase{"StillFailingAtAnotherStep", Verdict::kHung, C::kStillFailing, "hung",
                   "  still failing: it was \"hung at 5\" before\n"},
        ChangeCase{"Flaky", Verdict::kCrashed, C::kFlaky, "passed",
                   "  flaky: it was \"passed\" before, and nothing has changed since\n"},
        ChangeCase{"FlakyAndNowGood", Verdict::kPassed, C::kFlaky, "crashed",
                   "  flaky: it was \"crashed at 5\" before, and nothing has changed since\n"},
        ChangeCase{"NoChange", Verdict::kCrashed, C::kNone, "crashed", ""}),
    [](const auto& parameter) { return std::string(parameter.param.name); });

TEST(TerminalReport, SaysWhetherFindingsOfWhatPassedAreNew) {
  for (const auto& [change, line] :
       {std::pair(C::kNew, "  new: memcheck did not find all of this before\n"),
        std::pair(C::kStillFailing, "  still failing\n"),
        std::pair(C::kFlaky, "  flaky: memcheck does not find the same each time\n")}) {
    Terminal terminal;
    PluginResult one = changed(Verdict::kPassed, change, "passed");
    one.comparison->earlier->step.reset();
    one.isWanted = false;
    one.diagnosis.emplace();
    one.diagnosis->tool = "memcheck";
    one.diagnosis->findings = {{"InvalidRead", "Invalid read", {}}};
    terminal.report().ended(one);
    terminal.take();
    terminal.report().ended(ScanEnded());
    EXPECT_THAT(terminal.take(),
                HasSubstr(std::string("  step 5: SIGSEGV\n") + line + "  memcheck: Invalid read\n"));
  }
}

TEST(TerminalReport, NamesTheFirstTenThatAreMended) {
  Terminal terminal(200);
  for (int i = 0; i < 12; ++i) {
    PluginResult one = changed(Verdict::kPassed, Comparison::Change::kMended, "crashed");
    one.run.bundle = "/lib/" + std::to_string(i) + ".so";
    terminal.report().ended(one);
  }
  terminal.take();
  terminal.report().ended(ScanEnded());
  EXPECT_EQ(
      terminal.take(),
      "mended: 0.so, 1.so, 2.so, 3.so, 4.so, 5.so, 6.so, 7.so, 8.so, 9.so and 2 more\n0 results, in 0 s\n");
}

TEST(TerminalReport, MarksWhatIsRememberedAndCountsIt) {
  Terminal terminal;
  PluginResult one = result(Verdict::kPassed, "/lib/a.so");
  one.isRemembered = true;
  terminal.report().ended(one);
  EXPECT_EQ(terminal.take(), "passed                 /lib/a.so  (remembered)\n");
  ScanEnded ended;
  ended.counts = {{"passed", 2}};
  terminal.report().ended(ended);
  EXPECT_EQ(terminal.take(), "2 results: 2 passed, in 0 s; 1 remembered\n");
  ended.counts = {{"passed", 1}};
  terminal.report().ended(ended);
  EXPECT_EQ(terminal.take(), "1 result: 1 passed, in 0 s; all remembered\n");
}

// ---- Progress ---------------------------------------------------------------------------------------------

TEST(TerminalReport, ProgressStandsInPlaceAndMakesRoomForALine) {
  Terminal terminal;
  terminal.report().progress(3, 200, 71.5, {"a.so", "shell.so #1 One"});
  EXPECT_EQ(terminal.take(), "\r\x1b[K3/200, 1 min 12 s left  a.so  shell.so #1 One");
  terminal.report().ended(result(Verdict::kPassed, "/a"));
  EXPECT_EQ(terminal.take(), "\r\x1b[Kpassed          1.2 s  /a\n");
  terminal.report().ended(result(Verdict::kPassed, "/b"));
  EXPECT_EQ(terminal.take(), "passed          1.2 s  /b\n");
}

TEST(TerminalReport, ProgressLeavesTheLastColumnFree) {
  Terminal terminal(40);
  terminal.report().progress(1, 9, 0, {std::string(100, 'a')});
  EXPECT_EQ(terminal.take().size(), 39 + std::string("\r\x1b[K").size());
}

TEST(TerminalReport, FollowsTheWidthOfTheWindow) {
  Terminal terminal(80);
  terminal.report().setColumns(30);
  terminal.report().progress(1, 9, 0, {std::string(100, 'a')});
  EXPECT_EQ(terminal.take().size(), 29 + std::string("\r\x1b[K").size());
}

TEST(TerminalReport, ShowsNoControlCodesOfOthers) {
  Terminal terminal;
  PluginResult one = child(1, "\x1b[2J\nname\xFF");
  one.run.bundle = "/lib/\x1b]0;title\x07.so";
  terminal.report().ended(one);
  EXPECT_EQ(terminal.take(), "passed          1.2 s  /lib/?]0;title?.so #1 ?[2J?name\xEF\xBF\xBD\n");
  terminal.report().progress(0, 1, 0, {"\x1b[31m"});
  EXPECT_EQ(terminal.take(), "\r\x1b[K0/1  ?[31m");
}

TEST(Printable, ControlCharactersOfEightBitsAreReplacedAndLettersStay) {
  EXPECT_EQ(printable("a\xC2\x9B"
                      "31m \xC3\xA9\xE2\x82\xAC"),
            "a?31m \xC3\xA9\xE2\x82\xAC");
}

TEST(Printable, CharactersThatReorderOrHideOthersAreShown) {
  EXPECT_EQ(printable("a\u202Eos.b"), "a[U+202E]os.b");
  EXPECT_EQ(printable("\u2066\u200B\uFEFF"), "[U+2066][U+200B][U+FEFF]");
}

TEST(Shortened, KeepsBothEndsAndCountsCharacters) {
  EXPECT_EQ(shortened("abcdefghij", 10), "abcdefghij");
  EXPECT_EQ(shortened("abcdefghijk", 10), "ab...ghijk");
  EXPECT_EQ(shortened("\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9\xC3\xA9", 6),
            "\xC3\xA9...\xC3\xA9\xC3\xA9");
  EXPECT_EQ(shortened("abcdef", 2), "ab");
}

TEST(Shortened, CountsTwoColumnsForWideCharactersAndNoneForMarks) {
  EXPECT_EQ(shortened("音源プラグイン.so", 17), "音源プラグイン.so");
  EXPECT_EQ(shortened("音源プラグイン.so", 16), "音源...グイン.so");
  EXPECT_EQ(shortened("音源プラグイン.so", 3), "音");
  // An accent stays with its letter.
  EXPECT_EQ(shortened("e\u0301e\u0301e\u0301e\u0301e\u0301", 5), "e\u0301e\u0301e\u0301e\u0301e\u0301");
  EXPECT_EQ(shortened("abcdefe\u0301e\u0301e\u0301", 6), "a...e\u0301e\u0301");
}

TEST(Wrapped, BreaksAtBlanksAndLongWordsWhereTheyMust) {
  EXPECT_EQ(wrapped("one two three", 8, 2), "one two\n  three");
  EXPECT_EQ(wrapped("abcdefghijklmnop", 8, 2), "abcdefgh\n  ijklmn\n  op");
  EXPECT_EQ(wrapped("", 8, 2), "");
  EXPECT_EQ(wrapped("音源プラグイン", 7, 1), "音源プ\n ラグイ\n ン");
  EXPECT_EQ(wrapped("音源", 1, 0), "音\n源");
}

TEST(ShellCommand, QuotesWhatAShellWouldTakeApart) {
  EXPECT_EQ(shellCommand({"/bin/worker", "/lib/it's a.so", "", "-7"}),
            "/bin/worker '/lib/it'\\''s a.so' '' -7");
}

TEST(ShellCommand, ShowsTheBytesOfWhatATerminalMustNotGet) {
  EXPECT_EQ(shellCommand({"/lib/it's\x1b[2J\n\\.so", "\u202E", "\xFF", "\xC3\xA9"}),
            "$'/lib/it\\'s\\033[2J\\012\\\\.so' $'\\342\\200\\256' $'\\377' '\xC3\xA9'");
}

}  // namespace
