// SPDX-License-Identifier: MIT
// The parts of the HTML report that are functions of their own, and what a browser does not see. How the page
// looks and works is tested in one, by html_page_test.py.
#include <cmath>

#include <gmock/gmock.h>

#include "scanner/report/html.h"
#include "scanner/report/html_text.h"
#include "scanner/report/step_bar.h"
#include "scanner/report/words.h"

using namespace scanner;
using ::testing::HasSubstr;
using ::testing::Not;

namespace {

struct TextCase {
  const char* name;
  std::string bytes;
  std::string html;
};

class Escaped : public ::testing::TestWithParam<TextCase> {};

TEST_P(Escaped, IsAsciiWithoutMarkup) { EXPECT_EQ(escaped(GetParam().bytes), GetParam().html); }

INSTANTIATE_TEST_SUITE_P(
    Texts, Escaped,
    ::testing::Values(
        TextCase{"Plain", "amsynth 1.13", "amsynth 1.13"}, TextCase{"Empty", "", ""},
        TextCase{"Markup", "<b class=\"x\">&'</b>", "&lt;b class=&quot;x&quot;&gt;&amp;&#39;&lt;/b&gt;"},
        TextCase{"Zero", std::string("a\0b", 3), "a&#x2400;b"},
        TextCase{"Escape", "\x1b[31m", "&#x241b;[31m"}, TextCase{"NewLine", "a\nb", "a&#x240a;b"},
        TextCase{"Delete", "a\x7f", "a&#x2421;"}, TextCase{"C1", "a\xc2\x9b", "a[U+009B]"},
        TextCase{"RightToLeftOverride", "\xe2\x80\xae", "[U+202E]"},
        TextCase{"ZeroWidthSpace", "\xe2\x80\x8b", "[U+200B]"},
        TextCase{"Tag", "\xf3\xa0\x81\x81", "[U+E0041]"}, TextCase{"TwoBytes", "\xc3\xa4", "&#xe4;"},
        TextCase{"ThreeBytes", "\xe4\xb8\xad", "&#x4e2d;"},
        TextCase{"FourBytes", "\xf0\x9f\x8e\xb9", "&#x1f3b9;"}, TextCase{"LoneByte", "a\xff", "a&#xfffd;"},
        TextCase{"CutOff", "a\xe4\xb8", "a&#xfffd;"},
        TextCase{"Surrogate", "\xed\xa0\x80<", "&#xfffd;&#xfffd;&#xfffd;&lt;"}),
    [](const auto& one) { return one.param.name; });

TEST(Escaped, KeepsLinesAndTabsWhereTheElementDoes) {
  EXPECT_EQ(escaped("a\n\tb\r<", LineBreaks::kKept), "a\n\tb&#x240d;&lt;");
}

TEST(Isolated, PutsAnElementAroundTextsThatMayRunTheOtherWay) {
  EXPECT_EQ(isolated("a <b>"), "a &lt;b&gt;");
  EXPECT_EQ(isolated("\xd7\x90"), "<bdi>&#x5d0;</bdi>");
}

TEST(Clipped, CountsCharactersAndNotBytes) {
  EXPECT_EQ(clipped("\xc3\xa4\xc3\xb6\xc3\xbc", 3), "\xc3\xa4\xc3\xb6\xc3\xbc");
  EXPECT_EQ(clipped("\xc3\xa4\xc3\xb6\xc3\xbc", 2), "\xc3\xa4\xc3\xb6\xe2\x80\xa6");
  EXPECT_EQ(clipped("ab\xe4", 3), "ab\xe4");
}

struct NumberCase {
  double value;
  const char* words;
};

class DurationInWords : public ::testing::TestWithParam<NumberCase> {};

TEST_P(DurationInWords, HasTwoOrThreeDigitsAndAUnit) {
  EXPECT_EQ(durationInWords(GetParam().value), GetParam().words);
}

INSTANTIATE_TEST_SUITE_P(Durations, DurationInWords,
                         ::testing::Values(NumberCase{0, "0 s"}, NumberCase{-1, "0 s"},
                                           NumberCase{std::nan(""), "0 s"}, NumberCase{8.9e-7, "890 ns"},
                                           NumberCase{6.4e-5, "64 \xc2\xb5s"}, NumberCase{6.03e-4, "0.6 ms"},
                                           NumberCase{0.0023, "2.3 ms"}, NumberCase{0.0377, "38 ms"},
                                           NumberCase{0.9996, "1.0 s"}, NumberCase{1.25, "1.2 s"},
                                           NumberCase{20, "20 s"}, NumberCase{59.7, "1 min 0 s"},
                                           NumberCase{125, "2 min 5 s"}, NumberCase{3599.6, "1 h 0 min"},
                                           NumberCase{7500, "2 h 5 min"}, NumberCase{1e300, "1e+300 s"}));

class SizeInWords : public ::testing::TestWithParam<NumberCase> {};

TEST_P(SizeInWords, HasAboutThreeDigitsAndAUnit) {
  EXPECT_EQ(sizeInWords(static_cast<std::uint64_t>(GetParam().value)), GetParam().words);
}

INSTANTIATE_TEST_SUITE_P(Sizes, SizeInWords,
                         ::testing::Values(NumberCase{0, "0 bytes"}, NumberCase{1, "1 byte"},
                                           NumberCase{1023, "1023 bytes"}, NumberCase{1024, "1 KiB"},
                                           NumberCase{1536, "1.5 KiB"}, NumberCase{15978496, "15.2 MiB"},
                                           NumberCase{1048575, "1.0 MiB"}, NumberCase{4294967296, "4 GiB"},
                                           NumberCase{18446744073709549568.0, "16.0 EiB"}));

TEST(TimeInWords, IsOfTheCalendarOrEmpty) {
  EXPECT_EQ(timeInWords(1795302622.9), "2026-11-21 23:10:22 UTC");
  EXPECT_EQ(timeForMachines(1795302622.9), "2026-11-21T23:10:22Z");
  for (const double time : {-1.0, 1e18, std::nan("")}) EXPECT_EQ(timeInWords(time), "");
}

std::vector<TimedStep> stepsOf(const std::vector<double>& seconds) {
  std::vector<TimedStep> steps;
  for (const double one : seconds) steps.push_back({static_cast<int>(steps.size()) + 1, "step", one});
  return steps;
}

/// "first-last" of each part, counted from 0.
std::vector<std::string> spans(const std::vector<BarPart>& parts) {
  std::vector<std::string> all;
  for (const BarPart& part : parts)
    all.push_back(std::to_string(part.first) + "-" + std::to_string(part.last));
  return all;
}

TEST(BarParts, ShortStepsInARowShareAPart) {
  const auto parts = barParts(stepsOf({0.01, 0.01, 0.6, 0.01, 0.01, 0.36}), 0);
  EXPECT_THAT(spans(parts), ::testing::ElementsAre("0-1", "2-2", "3-4", "5-5"));
  EXPECT_NEAR(parts[0].seconds, 0.02, 1e-9);
  EXPECT_NEAR(parts[1].width, 60, 1e-6);
}

TEST(BarParts, TheMarkedStepIsAloneAndWideEnoughToBeSeen) {
  const auto parts = barParts(stepsOf({0.01, 1e-6, 0.01, 5}), 2);
  ASSERT_THAT(spans(parts), ::testing::ElementsAre("0-0", "1-1", "2-2", "3-3"));
  EXPECT_TRUE(parts[1].isMarked);
  EXPECT_GT(parts[1].width, 3);
}

TEST(BarParts, PartsFollowEachOtherAndFillTheBar) {
  for (const auto& seconds : std::vector<std::vector<double>>{
           {1}, {0, 0, 0}, {std::nan(""), 1, std::nan("")}, {-1, 2}, std::vector<double>(65, 0.001)}) {
    double end = 0;
    for (const BarPart& part : barParts(stepsOf(seconds), 1)) {
      EXPECT_NEAR(part.begin, end, 1e-6);
      EXPECT_GT(part.width, 0);
      end = part.begin + part.width;
    }
    EXPECT_NEAR(end, 100, 1e-6);
  }
  EXPECT_TRUE(barParts({}, 0).empty());
}

PluginResult passed(const std::string& bundle) {
  PluginResult result;
  result.run.bundle = bundle;
  result.judgement.verdict = Verdict::kPassed;
  return result;
}

TEST(HtmlReport, AScanThatWasKilledOrInterruptedSaysSo) {
  ScanReport report;
  report.started.plugins = 3;
  report.results = {passed("/lib/a.so")};
  EXPECT_THAT(htmlReport(report),
              HasSubstr("The scan did not come to its end: it was to try 3 plug-ins, and there "
                        "are results of 1."));
  report.ended = ScanEnded{};
  report.ended->isInterrupted = true;
  EXPECT_THAT(htmlReport(report),
              HasSubstr("The scan was interrupted: it was to try 3 plug-ins, and there are results of 1."));
  report.ended->isInterrupted = false;
  EXPECT_THAT(htmlReport(report), Not(HasSubstr("class=\"warnings\"")));
}

struct HeadingCase {
  const char* name;
  unsigned wanted;
  unsigned unwanted;
  const char* heading;
};

class HtmlReportHeading : public ::testing::TestWithParam<HeadingCase> {};

TEST_P(HtmlReportHeading, SaysHowManyDidNotEndAsTheyShould) {
  ScanReport report;
  report.ended = ScanEnded{};
  for (unsigned i = 0; i < GetParam().wanted + GetParam().unwanted; ++i) {
    report.results.push_back(passed("/lib/" + std::to_string(i) + ".so"));
    report.results.back().isWanted = i < GetParam().wanted;
  }
  EXPECT_THAT(htmlReport(report), HasSubstr("<h1>" + std::string(GetParam().heading) + "</h1>"));
}

INSTANTIATE_TEST_SUITE_P(
    Counts, HtmlReportHeading,
    ::testing::Values(HeadingCase{"None", 0, 0, "No plug-in was tried"},
                      HeadingCase{"OneGood", 1, 0, "The plug-in ended as it should"},
                      HeadingCase{"AllGood", 2, 0, "All 2 plug-ins ended as they should"},
                      HeadingCase{"OneBad", 0, 1, "The plug-in did not end as it should"},
                      HeadingCase{"SomeBad", 2, 1, "1 of 3 plug-ins did not end as it should"}),
    [](const auto& one) { return one.param.name; });

TEST(HtmlReport, AScanThatLacksAPluginSaysSoAndNotThatAllIsWell) {
  ScanReport report;
  report.results = {passed("/lib/a.so"), passed("/lib/b.so")};
  report.ended = ScanEnded{};
  report.ended->status = 1;
  const std::string html = htmlReport(report);
  EXPECT_THAT(html, HasSubstr("<h1>The 2 plug-ins ended as they should</h1>"));
  EXPECT_THAT(
      html,
      HasSubstr("the scan is not whole: a plug-in that was expected, or a part of the scan, is missing"));
}

/// The describer ran the plug-in's code, so that its object may hold anything.
TEST(HtmlReport, ADescriptionOfTheWrongFormDoesNoHarm) {
  for (const char* description : {"", "[]", "7",
                                  "{\"name\":7,\"maker\":[],\"category\":\"x\",\"uniqueId\":null,\"inputs\":{"
                                  "},\"programs\":[1,{},null]}",
                                  "{\"programs\":7}", "{\"category\":{\"name\":{}}}"}) {
    ScanReport report;
    report.results = {passed("/lib/a.so")};
    report.results[0].description = description;
    EXPECT_THAT(htmlReport(report), HasSubstr("/lib/a.so")) << description;
  }
}

TEST(HtmlReport, APassThatIsAFailureHasItsReasonInTheRowAndNoStepBefore) {
  ScanReport report;
  report.results = {passed("/lib/a.so")};
  PluginResult& result = report.results[0];
  result.isWanted = false;
  result.diagnosis.emplace();
  result.diagnosis->tool = "memcheck";
  result.diagnosis->findings = {{"InvalidRead", "Invalid read of size 4", {}}};
  result.comparison = Comparison{Comparison::Change::kNew, Comparison::Earlier{"passed", 65, 1795302622}};
  const std::string html = htmlReport(report);
  EXPECT_THAT(html, HasSubstr("<td role=\"cell\">1 finding of memcheck: Invalid read of size 4</td>"));
  EXPECT_THAT(html, HasSubstr("new: it did not fail in this way before; earlier: passed, 2026-11-21"));
}

TEST(HtmlReport, OfAPassItShowsTheBeginningOfWhatWasPrinted) {
  ScanReport report;
  report.results = {passed("/lib/a.so")};
  report.results[0].seen = RunSeen{};
  report.results[0].seen->texts = {{1, true, std::string(1000, 'a')}, {2, true, std::string(1000, 'b')}};
  EXPECT_THAT(htmlReport(report), HasSubstr("<pre>" + std::string(24, 'b') + "</pre>"));
  EXPECT_THAT(htmlReport(report), HasSubstr("The next 976 bytes are in the events of the scan"));
  report.results[0].isWanted = false;
  EXPECT_THAT(htmlReport(report), HasSubstr("<pre>" + std::string(1000, 'b') + "</pre>"));
}

}  // namespace
