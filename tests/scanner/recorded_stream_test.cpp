// SPDX-License-Identifier: MIT
#include <algorithm>
#include <stdexcept>

#include <gmock/gmock.h>

#include "scanner/events/event_json.h"
#include "scanner/events/recorded_stream.h"
#include "tests/scanner/report_fixture.h"

using namespace scanner;
using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::SizeIs;

namespace {

/// Reads a text in pieces of this size.
RecordedStream read(const std::string& text, std::size_t pieceSize = 1000) {
  std::size_t at = 0;
  return readStream("file", [&](char* buffer, std::size_t size) {
    const std::size_t count = std::min({pieceSize, size, text.size() - at});
    std::copy_n(text.data() + at, count, buffer);
    at += count;
    return count;
  });
}

const Run kRun = resultOf("/lib/a.so", Verdict::kPassed).run;
const std::string kStarted = eventLine(scanOf("", {}).report.started);
const std::string kResult = eventLine(resultOf("/lib/a.so", Verdict::kPassed));
const std::string kEnded = eventLine(ScanEnded{});

TEST(ReadStream, HowTheBytesArriveMakesNoDifference) {
  const std::string text = kStarted + eventLine(kRun) + "\n  \n" + kResult + kEnded;
  for (const std::size_t size : {1, 7, 100, 100000}) {
    const RecordedStream stream = read(text, size);
    EXPECT_THAT(stream.problems, IsEmpty());
    ASSERT_THAT(stream.scans, SizeIs(1));
    EXPECT_THAT(stream.scans[0].report.results, SizeIs(1));
    EXPECT_THAT(stream.scans[0].underWay, IsEmpty());
    EXPECT_TRUE(stream.scans[0].report.ended);
  }
}

TEST(ReadStream, TheLastLineNeedsNoNewline) {
  const std::string text = kStarted + kEnded;
  EXPECT_TRUE(read(text.substr(0, text.size() - 1)).scans[0].report.ended);
}

TEST(ReadStream, AFileMayHoldSeveralScansAndAnyOfThemMayBeCutOff) {
  const RecordedStream stream = read(kStarted + eventLine(kRun) + kStarted + kResult + kEnded);
  EXPECT_THAT(stream.problems, IsEmpty());
  ASSERT_THAT(stream.scans, SizeIs(2));
  EXPECT_FALSE(stream.scans[0].report.ended);
  EXPECT_THAT(stream.scans[0].underWay, SizeIs(1));
  EXPECT_THAT(stream.scans[1].report.results, SizeIs(1));
}

TEST(ReadStream, LinesThatAreNoEventsAreNamedAndTheOthersAreRead) {
  const RecordedStream stream = read(kStarted + "lunch\n" + kResult + kEnded + kResult);
  EXPECT_THAT(stream.problems,
              ElementsAre("file, line 2: it is no JSON", "file, line 5: no scan is under way there"));
  EXPECT_THAT(stream.scans[0].report.results, SizeIs(1));
}

TEST(ReadStream, OfManyBrokenLinesTheFirstAreNamed) {
  std::string text = kStarted;
  for (int i = 0; i < 1000; ++i) text += "lunch\n";
  const RecordedStream stream = read(text);
  ASSERT_THAT(stream.problems, SizeIs(21));
  EXPECT_EQ(stream.problems[19], "file, line 21: it is no JSON");
  EXPECT_EQ(stream.problems[20], "file: 980 further lines are no events");
}

TEST(ReadStream, ALineWithoutEndIsGivenUp) {
  std::size_t bytes = 0;
  const auto zeros = [&bytes](char* buffer, std::size_t size) {
    std::fill_n(buffer, size, '\0');
    bytes += size;
    return size;
  };
  EXPECT_THROW(readStream("file", zeros), std::runtime_error);
  EXPECT_LT(bytes, 20U << 20);
}

TEST(ReadStream, ADescriptionThatWouldMakeItsLineTooLongIsNotWritten) {
  PluginResult result = resultOf("/lib/a.so", Verdict::kPassed);
  result.description = R"({"name":")" + std::string(17U << 20, 'x') + "\"}";
  const RecordedStream stream = read(kStarted + eventLine(result) + kResult + kEnded, 1U << 16);
  EXPECT_THAT(stream.problems, IsEmpty());
  ASSERT_THAT(stream.scans.at(0).report.results, SizeIs(2));
  EXPECT_FALSE(stream.scans[0].report.results[0].description);
}

}  // namespace
