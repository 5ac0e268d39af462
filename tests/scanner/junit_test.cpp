// SPDX-License-Identifier: MIT
#include <cmath>
#include <limits>

#include <gmock/gmock.h>
#include <pugixml.hpp>

#include "scanner/report/junit.h"
#include "tests/scanner/report_fixture.h"

using namespace scanner;
using ::testing::HasSubstr;
using ::testing::MatchesRegex;
using ::testing::Not;

namespace {

/// The report of a scan with these results, read back by a parser.
class Junit {
 public:
  explicit Junit(std::vector<PluginResult> results, int status = 0, bool hasEnded = true) {
    ScanReport report = scanOf("", std::move(results)).report;
    report.started.time = 1795302000.5;
    report.ended->status = status;
    if (!hasEnded) report.ended.reset();
    parse(report);
  }
  explicit Junit(const ScanReport& report) { parse(report); }

  [[nodiscard]] pugi::xml_node suite() const { return document.child("testsuites").child("testsuite"); }
  /// The test case number `index`.
  [[nodiscard]] pugi::xml_node test(int index = 0) const {
    pugi::xml_node one = suite().child("testcase");
    for (; index > 0; --index) one = one.next_sibling("testcase");
    return one;
  }
  [[nodiscard]] std::string counts() const {
    const pugi::xml_node all = suite();
    return std::string(all.attribute("tests").value()) + " tests, " + all.attribute("failures").value() +
           " failures, " + all.attribute("errors").value() + " errors, " + all.attribute("skipped").value() +
           " skipped";
  }

  std::string text;

 private:
  void parse(const ScanReport& report) {
    text = junitReport(report);
    EXPECT_TRUE(document.load_string(text.c_str(), pugi::parse_full)) << text;
  }

  pugi::xml_document document;
};

PluginResult crashed() {
  PluginResult result = resultOf("/usr/lib/vst/osc.so", Verdict::kCrashed, 5);
  Judgement& judgement = result.judgement;
  judgement.cause = "step 5, testing setting states: SIGSEGV in effSetBypass (44) value 1";
  judgement.stepText = "testing setting states";
  judgement.request = RequestSeen{"dispatcher", 44, "effSetBypass", 0, 1, 0};
  judgement.signal = 11;
  judgement.place = Place{"osc.so", 0x43480c, 0};
  judgement.stepSeconds = {0.25, std::nan("")};
  RunSeen& seen = result.seen.emplace();
  seen.wallSeconds = 1.5;
  seen.lines = {{ProtocolLine::Kind::kTotal, 65},
                {ProtocolLine::Kind::kStep, 1, "test gathering info"},
                {ProtocolLine::Kind::kStep, 2, "inspect class info"}};
  seen.texts = {{0, false, "loading\n"}, {1, true, "one\rtwo\x1b[31m"}};
  result.command = {"/usr/lib/vsttorture-worker", "/usr/lib/vst/osc.so"};
  return result;
}

TEST(JunitReport, AFailureHasItsCauseAndTheCommandThatRepeatsIt) {
  const Junit junit({crashed()}, 1);
  EXPECT_EQ(junit.counts(), "1 tests, 1 failures, 0 errors, 0 skipped");
  EXPECT_STREQ(junit.test().attribute("classname").value(), "/usr/lib/vst");
  EXPECT_STREQ(junit.test().attribute("name").value(), "osc.so");
  EXPECT_STREQ(junit.test().attribute("time").value(), "1.500");
  const pugi::xml_node failure = junit.test().child("failure");
  EXPECT_STREQ(failure.attribute("type").value(), "crashed");
  EXPECT_STREQ(failure.attribute("message").value(),
               "step 5, testing setting states: SIGSEGV in effSetBypass (44) value 1");
  EXPECT_STREQ(failure.text().get(),
               R"(crashed: step 5, testing setting states: SIGSEGV in effSetBypass (44) value 1
step: 5, testing setting states
request: effSetBypass (44), index 0, value 1, opt 0
signal: SIGSEGV
place: osc.so+0x43480c, address 0x0
again: /usr/lib/vsttorture-worker /usr/lib/vst/osc.so
)");
}

TEST(JunitReport, TheStepsHaveTheirTimesAndWhatThePluginPrintedIsMarked) {
  EXPECT_STREQ(Junit({crashed()}, 1).test().child("system-out").text().get(),
               R"(1.500 s, 0.000 s of processor time, 0.0 MiB of memory, sandbox: none
  stdout| loading
 0.250000 s   1, test gathering info
  stderr| one
  stderr| two\x1b[31m
              2, inspect class info
)");
}

TEST(JunitReport, TheSuiteNamesTheMachineTheTimeAndTheNotes) {
  ScanReport report = scanOf("", {}).report;
  report.started.time = 1795302000.5;
  report.started.notes = {"not searched: /lib/\x07"};
  const Junit junit(report);
  EXPECT_STREQ(junit.suite().attribute("name").value(), "vsttorture-scan on box");
  EXPECT_STREQ(junit.suite().attribute("hostname").value(), "box");
  EXPECT_STREQ(junit.suite().attribute("timestamp").value(), "2026-11-21T23:00:00");
  EXPECT_STREQ(junit.suite().child("system-out").text().get(), "not searched: /lib/?\n");
}

TEST(JunitReport, ATimeThatNoClockShowsIsLeftOut) {
  for (const double time : {1e300, std::nan(""), -1.0}) {
    ScanReport report = scanOf("", {}).report;
    report.started.time = time;
    EXPECT_FALSE(Junit(report).suite().attribute("timestamp")) << time;
  }
}

TEST(JunitReport, WhatWasSkippedHasItsReasonAndWhatWasNotRunIsAnError) {
  PluginResult skipped = resultOf("/lib/a.so", Verdict::kSkipped);
  skipped.judgement.cause = "slow";
  PluginResult notRun = resultOf("/lib/b.so", Verdict::kNotRun);
  notRun.judgement.cause = "no memory";
  const Junit junit({skipped, notRun}, 1);
  EXPECT_EQ(junit.counts(), "2 tests, 0 failures, 1 errors, 1 skipped");
  EXPECT_STREQ(junit.test(0).child("skipped").attribute("message").value(), "slow");
  EXPECT_STREQ(junit.test(1).child("error").attribute("type").value(), "not_run");
  EXPECT_STREQ(junit.test(1).child("error").attribute("message").value(), "no memory");
}

TEST(JunitReport, APassThatIsNotWhatWasExpectedFails) {
  PluginResult result = resultOf("/lib/a.so", Verdict::kPassed, 65);
  result.expected = Expectation{"crashed", 5, "known", false};
  result.isWanted = false;
  const Junit junit({result}, 1);
  const pugi::xml_node failure = junit.test().child("failure");
  EXPECT_STREQ(failure.attribute("type").value(), "unexpected");
  EXPECT_STREQ(failure.attribute("message").value(), "expected: crashed at 5 (known), but passed");
}

TEST(JunitReport, AFailureThatIsExpectedPassesAndSaysSo) {
  PluginResult result = crashed();
  result.expected = Expectation{"crashed", 5, "known", true};
  result.isWanted = true;
  const Junit junit({result});
  EXPECT_EQ(junit.counts(), "1 tests, 0 failures, 0 errors, 0 skipped");
  EXPECT_THAT(
      junit.test().child("system-out").text().get(),
      HasSubstr("as expected: crashed: step 5, testing setting states: SIGSEGV in effSetBypass (44) value "
                "1\nreason: known\n"));
}

TEST(JunitReport, AFailureOfTheBaselinePassesAndSaysSoAndANewOneSaysWhatItWas) {
  PluginResult known = crashed();
  known.comparison = Comparison{Comparison::Change::kStillFailing, Comparison::Earlier{"crashed", 5, 1}};
  known.isWanted = true;
  PluginResult fresh = crashed();
  fresh.comparison = Comparison{Comparison::Change::kNew, Comparison::Earlier{"hung", {}, 1}};
  const Junit junit({known, fresh}, 1);
  EXPECT_EQ(junit.counts(), "2 tests, 1 failures, 0 errors, 0 skipped");
  EXPECT_THAT(
      junit.test(0).child("system-out").text().get(),
      HasSubstr("not new: crashed: step 5, testing setting states: SIGSEGV in effSetBypass (44) value 1\n"
                "still failing\n"));
  EXPECT_THAT(junit.test(1).child("failure").text().get(),
              HasSubstr("compared: new: it was \"hung\" before\n"));
}

TEST(JunitReport, AFlakyPluginSaysSo) {
  PluginResult result = crashed();
  result.repetitions = Repetitions{3, {{"passed", 2}, {"crashed at 5", 1}}};
  EXPECT_THAT(Junit({result}, 1).test().child("failure").attribute("message").value(),
              HasSubstr("flaky: 1 of 3 crashed at 5, 2 of 3 passed; step 5, "));
}

TEST(JunitReport, WhatAToolFoundAndTheShortestListAreInTheFailure) {
  PluginResult result = crashed();
  result.diagnosis = Diagnosis{
      "gdb", {"gdb", "--args"}, {{"SIGSEGV", "in bypass()", {"bypass (osc.cpp:7)", "osc.so+0x1"}}}, "", ""};
  result.shrunk = Shrunk{"0,3,3", "3", 4, true, {"worker", "--tests", "3"}};
  EXPECT_THAT(Junit({result}, 1).test().child("failure").text().get(),
              HasSubstr("gdb: SIGSEGV: in bypass()\n    bypass (osc.cpp:7)\n    osc.so+0x1\n"
                        "shortest list of tests: 3 (of 0,3,3)\n"
                        "again: /usr/lib/vsttorture-worker /usr/lib/vst/osc.so\n"
                        "shorter: worker --tests 3\nwith gdb: gdb --args\n"));
}

TEST(JunitReport, APassInWhichAToolFoundSomethingFailsWithWhatItFound) {
  PluginResult result = resultOf("/lib/a.so", Verdict::kPassed);
  result.isWanted = false;
  result.diagnosis.emplace();
  result.diagnosis->tool = "memcheck";
  result.diagnosis->findings = {{"UninitValue", "Use", {}, false},
                                {"InvalidRead", "Invalid read of size 4", {}}};
  const Junit junit({result}, 1);
  EXPECT_STREQ(junit.test().child("failure").attribute("type").value(), "findings");
  EXPECT_STREQ(junit.test().child("failure").attribute("message").value(),
               "1 finding of memcheck: Invalid read of size 4");
  EXPECT_THAT(
      junit.test().child("failure").text().get(),
      HasSubstr("memcheck: UninitValue: Use (not of the plug-in)\nmemcheck: InvalidRead: Invalid read"));
}

TEST(JunitReport, AScanThatIsNotWholeHasATestThatIsAnError) {
  const auto lastTest = [](const Junit& junit) {
    EXPECT_EQ(junit.counts(), "2 tests, 0 failures, 1 errors, 0 skipped");
    EXPECT_STREQ(junit.test(1).attribute("name").value(), "the scan is whole");
    return std::string(junit.test(1).child("error").attribute("message").value());
  };
  const std::vector<PluginResult> results = {resultOf("/lib/a.so", Verdict::kPassed)};
  EXPECT_THAT(lastTest(Junit(results, 0, false)), HasSubstr("killed"));
  EXPECT_THAT(lastTest(Junit(results, 1)), HasSubstr("is missing"));
  ScanReport interrupted = scanOf("", results).report;
  interrupted.ended->isInterrupted = true;
  EXPECT_THAT(lastTest(Junit(interrupted)), HasSubstr("interrupted"));
}

TEST(JunitReport, PluginsOfTwoProcessorsUnderOnePathAreToldApart) {
  PluginResult first = resultOf("/lib/a.so", Verdict::kPassed);
  first.run.target.processor = "i386";
  PluginResult second = first;
  second.run.target.processor = "x86_64";
  const Junit junit({first, second});
  EXPECT_STREQ(junit.test(0).attribute("name").value(), "a.so (i386)");
  EXPECT_STREQ(junit.test(1).attribute("name").value(), "a.so (x86_64)");
}

TEST(JunitReport, NoTextOfAPluginLeavesItsPlace) {
  const std::string hostile = "]]></system-out><testcase name=\"x\"/>&lt;\" onload='\n</testsuites>\x01\xFF";
  PluginResult result = crashed();
  result.run.bundle = "/lib/" + hostile + "/" + hostile + ".so";
  result.run.child = 1;
  result.run.childName = hostile;
  result.judgement.cause = result.judgement.stepText = result.judgement.request->name = hostile;
  result.judgement.contradictions = result.command = {hostile};
  result.seen->texts = {{1, false, hostile}};
  result.diagnosis = Diagnosis{hostile, {}, {{hostile, hostile, {hostile}}}, hostile, hostile};
  const Junit junit({result, crashed()}, 1);
  EXPECT_EQ(junit.counts(), "2 tests, 2 failures, 0 errors, 0 skipped");
  EXPECT_STREQ(junit.test(1).attribute("name").value(), "osc.so");
  EXPECT_FALSE(junit.test(2));
  EXPECT_THAT(junit.test().child("system-out").text().get(), HasSubstr("stdout| ]]></system-out><testcase"));
  EXPECT_THAT(junit.text, Not(HasSubstr("\x01")));
}

struct XmlCase {
  const char* name;
  std::string text;
  std::string expected;
};

class XmlText : public ::testing::TestWithParam<XmlCase> {};

TEST_P(XmlText, HoldsNothingThatXmlForbids) { EXPECT_EQ(xmlText(GetParam().text), GetParam().expected); }

INSTANTIATE_TEST_SUITE_P(
    , XmlText,
    ::testing::Values(XmlCase{"Letters", "caf\xC3\xA9 \xF0\x9F\x8E\xB5", "caf\xC3\xA9 \xF0\x9F\x8E\xB5"},
                      XmlCase{"TabsAndNewlines", "a\tb\nc", "a\tb\nc"},
                      XmlCase{"CarriageReturns", "a\r\nb\rc\r", "a\nb\nc\n"},
                      XmlCase{"Nul", std::string("a\0b", 3), "a\\x00b"},
                      XmlCase{"Escape", "\x1b[0m", "\\x1b[0m"}, XmlCase{"Delete", "\x7F", "\\x7f"},
                      XmlCase{"ControlsOfEightBits", "\xC2\x85", "\\x85"},
                      XmlCase{"RightToLeftOverride", "a\xE2\x80\xAE", "a[U+202E]"},
                      XmlCase{"NotUtf8", "\xFF", "\xEF\xBF\xBD"},
                      XmlCase{"Noncharacters", "\xEF\xBF\xBE\xEF\xBF\xBF", "\xEF\xBF\xBD\xEF\xBF\xBD"}),
    [](const auto& one) { return std::string(one.param.name); });

}  // namespace
