// SPDX-License-Identifier: MIT
#include <chrono>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "scanner/engine/output_parser.h"
#include "tests/shared/step_texts.h"

namespace scanner {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;
using ::testing::StartsWith;

/// What a parser has made of an output: lines as "kind number text", texts as "step: bytes".
struct Parsed {
  std::vector<std::string> lines;
  std::vector<std::string> texts;
  int step = 0;

  bool operator==(const Parsed& other) const {
    return lines == other.lines && texts == other.texts && step == other.step;
  }
};

std::string described(const ProtocolLine& line) {
  switch (line.kind) {
    case ProtocolLine::Kind::kTotal:
      return "total " + std::to_string(line.number);
    case ProtocolLine::Kind::kStep:
      return "step " + std::to_string(line.number) + " " + line.text;
    case ProtocolLine::Kind::kFailure:
      return "failure " + line.text;
    case ProtocolLine::Kind::kLastWords:
      return "last words";
    case ProtocolLine::Kind::kOutOfTurn:
      return "out of turn " + line.text;
  }
  return "";
}

Parsed parse(const std::string& output, std::size_t pieceSize = std::string::npos) {
  OutputParser parser;
  for (std::size_t begin = 0; begin < output.size(); begin += std::min(pieceSize, output.size())) {
    parser.feed(std::string_view(output).substr(begin, pieceSize));
  }
  parser.finish();
  Parsed parsed;
  for (const ProtocolLine& line : parser.lines()) parsed.lines.push_back(described(line));
  for (const PluginText& text : parser.texts().pieces()) {
    parsed.texts.push_back(std::to_string(text.step) + ": " + text.bytes);
  }
  parsed.step = parser.step();
  return parsed;
}

/// The first `steps` lines of a run, in the order of the fixed ones.
std::string runOf(int steps) {
  std::string lines = "total, 64\n";
  for (std::size_t index = 0; index < static_cast<std::size_t>(steps); ++index) {
    const char* const text = index < kOrderedTexts.size() ? kOrderedTexts[index] : "inspect latency";
    lines += std::to_string(index + 1) + ", " + text + "\n";
  }
  return lines;
}

TEST(OutputParser, AWholeRunHasItsTotalAndAllItsStepsAndNoText) {
  const Parsed parsed = parse(runOf(65));

  ASSERT_EQ(parsed.lines.size(), 66u);
  EXPECT_EQ(parsed.lines[0], "total 64");
  EXPECT_EQ(parsed.lines[14], "step 14 initialize");
  EXPECT_EQ(parsed.lines[65], "step 65 inspect latency");
  EXPECT_EQ(parsed.step, 65);
  EXPECT_THAT(parsed.texts, IsEmpty());
}

TEST(OutputParser, HowTheOutputIsCutMakesNoDifference) {
  const std::string output = std::string("hello\0there\n\xff\xfe", 14) + runOf(3) +
                             "said in step 3\nno newline4, inspect parameter info\n" + std::string(700, 'x') +
                             "unexpected exit" + std::string(600, 'y') + "5, testing setting states\n" +
                             std::string(3000, '7') + ", inspect latency\n!test setting state failed -12\n" +
                             runOf(2) + "\n\nend";
  const Parsed whole = parse(output);
  ASSERT_THAT(whole.lines,
              ElementsAre("total 64", "step 1 test gathering info", "step 2 inspect class info",
                          "step 3 inspect preset info", "step 4 inspect parameter info", "last words",
                          "step 5 testing setting states", "failure !test setting state failed -12",
                          "out of turn total, 64", "out of turn 1, test gathering info",
                          "out of turn 2, inspect class info"));

  for (std::size_t size = 1; size <= output.size(); size += size < 600 ? 1 : 97) {
    ASSERT_TRUE(parse(output, size) == whole) << "in pieces of " << size << " bytes";
  }
}

TEST(OutputParser, TextBelongsToTheStepInWhichItCame) {
  const Parsed parsed = parse("loading\ntotal, 64\ncreated\n1, test gathering info\none\nstill 1, " +
                              std::string("without a newline 2, inspect class info\ntwo"));

  EXPECT_THAT(parsed.texts,
              ElementsAre("0: loading\ncreated\n", "1: one\nstill 1, without a newline ", "2: two"));
}

struct LineCase {
  const char* name;
  std::string output;
  std::vector<std::string> lines;
  std::vector<std::string> texts;
};

void PrintTo(const LineCase& one, std::ostream* stream) { *stream << one.name; }

class OutputParserLine : public testing::TestWithParam<LineCase> {};

TEST_P(OutputParserLine, IsReadAs) {
  const Parsed parsed = parse(GetParam().output);

  EXPECT_EQ(parsed.lines, GetParam().lines);
  EXPECT_EQ(parsed.texts, GetParam().texts);
}

const std::string kFirst = "total, 64\n1, test gathering info\n";
const std::vector<std::string> kFirstLines = {"total 64", "step 1 test gathering info"};

std::vector<std::string> firstLinesAnd(const std::string& line) {
  return {kFirstLines[0], kFirstLines[1], line};
}

const LineCase kLineCases[] = {
    {"ATextOfAStepThatIsMissing", kFirst + "2, inspect nothing\n", kFirstLines, {"1: 2, inspect nothing\n"}},
    {"ALineWithoutANewlineIsNoLine",
     kFirst + "2, inspect class info",
     kFirstLines,
     {"1: 2, inspect class info"}},
    {"AStepThatIsNotDue",
     kFirst + "3, inspect preset info\n",
     firstLinesAnd("out of turn 3, inspect preset info"),
     {"1: 3, inspect preset info\n"}},
    {"AStepThatWasThere",
     kFirst + "1, test gathering info\n",
     firstLinesAnd("out of turn 1, test gathering info"),
     {"1: 1, test gathering info\n"}},
    {"TheDueNumberAtTheEndOfAnother",
     kFirst + "12, inspect class info\n",
     firstLinesAnd("out of turn 12, inspect class info"),
     {"1: 12, inspect class info\n"}},
    {"TheDueNumberBehindAZero",
     kFirst + "02, inspect class info\n",
     firstLinesAnd("out of turn 02, inspect class info"),
     {"1: 02, inspect class info\n"}},
    {"ANumberAboveAnInt",
     kFirst + "4294967298, inspect class info\n",
     kFirstLines,
     {"1: 4294967298, inspect class info\n"}},
    {"TheDueStepBehindAnotherText",
     kFirst + "step 1, then 2, inspect class info\n",
     firstLinesAnd("step 2 inspect class info"),
     {"1: step 1, then "}},
    {"AStepBeforeTheTotal",
     "1, test gathering info\n",
     {"out of turn 1, test gathering info"},
     {"0: 1, test gathering info\n"}},
    {"TheLastTotalBeforeTheFirstStepCounts",
     "voices in total, 8\ntotal, 64\n1, test gathering info\n",
     kFirstLines,
     {"0: voices in total, 8\n"}},
    {"ASecondTotalOfARunIsOutOfTurn",
     "total, 51\ntotal, 64\n1, test gathering info\n",
     {"out of turn total, 51", "total 64", "step 1 test gathering info"},
     {"0: total, 51\n"}},
    {"ATotalOfARunBehindASteps",
     kFirst + "total, 51\n",
     firstLinesAnd("out of turn total, 51"),
     {"1: total, 51\n"}},
    {"AnotherTotalBehindAStepIsText", kFirst + "total, 8\n", kFirstLines, {"1: total, 8\n"}},
    {"ATotalThatIsNotANumber", "total, 6x\ntotal, -1\ntotal,\n", {}, {"0: total, 6x\ntotal, -1\ntotal,\n"}},
    {"AFailureWithANumber",
     kFirst + "!gather info failed 5\n",
     firstLinesAnd("failure !gather info failed 5"),
     {}},
    {"AFailureWithANegativeNumber",
     "!create and initialize failed -1\n",
     {"failure !create and initialize failed -1"},
     {}},
    {"AFailureOfTheLongerPhase",
     kFirst + "!delete, create and initialize failed, unknown error\n",
     firstLinesAnd("failure !delete, create and initialize failed, unknown error"),
     {}},
    {"AFailureBehindAText",
     kFirst + "text!gather info failed 5\n",
     firstLinesAnd("failure !gather info failed 5"),
     {"1: text"}},
    {"AFailureOfAPlugInsOwnIsText",
     kFirst + "!preset load failed 3\n",
     kFirstLines,
     {"1: !preset load failed 3\n"}},
    {"ASecondFailure",
     "!gather info failed 5\n!gather info failed 6\n",
     {"failure !gather info failed 5", "out of turn !gather info failed 6"},
     {"0: !gather info failed 6\n"}},
    {"LastWords", kFirst + "unexpected exit", firstLinesAnd("last words"), {}},
    {"LastWordsBetweenTexts",
     kFirst + "before unexpected exit behind\nand on",
     firstLinesAnd("last words"),
     {"1: before  behind\nand on"}},
    {"LastWordsTwice",
     kFirst + "unexpected exit unexpected exit",
     firstLinesAnd("last words"),
     {"1:  unexpected exit"}},
    {"LastWordsInFrontOfAStep",
     kFirst + "unexpected exit2, inspect class info\n",
     {"total 64", "step 1 test gathering info", "last words", "step 2 inspect class info"},
     {}},
    {"NothingAtAll", "", {}, {}},
};

INSTANTIATE_TEST_SUITE_P(Output, OutputParserLine, testing::ValuesIn(kLineCases),
                         [](const auto& one) { return one.param.name; });

TEST(OutputParser, ALineOfAMegabyteEndsInTheStepThatIsDue) {
  const Parsed parsed =
      parse(kFirst + std::string(1 << 20, '!') + "2, inspect class info\n3, inspect preset info\n");

  EXPECT_EQ(parsed.step, 3);
  ASSERT_EQ(parsed.texts.size(), 1u);
  EXPECT_EQ(parsed.texts[0], "1: " + std::string(65536, '!'));
}

TEST(OutputParser, KeepsTheLast64KiBOfTheTextAndItsSteps) {
  const Parsed parsed =
      parse(kFirst + std::string(60000, 'a') + "\n2, inspect class info\n" + std::string(30000, 'b') +
            "\n3, inspect preset info\n" + std::string(40000, 'c'));

  ASSERT_EQ(parsed.texts.size(), 2u);
  EXPECT_EQ(parsed.texts[0], "2: " + std::string(25535, 'b') + "\n");
  EXPECT_EQ(parsed.texts[1], "3: " + std::string(40000, 'c'));
}

TEST(OutputParser, ReadsNoMoreThan1000Steps) {
  const Parsed parsed = parse(runOf(1100));

  EXPECT_EQ(parsed.step, 1000);
  EXPECT_EQ(parsed.lines.size(), 1u + 1000u + 20u);
  EXPECT_EQ(parsed.lines[1001], "out of turn 1001, inspect latency");
}

TEST(OutputParser, KeepsTheFirst20LinesThatWereNotDue) {
  std::string output = kFirst;
  for (int i = 0; i < 100; ++i) output += "9, inspect latency\n";

  EXPECT_EQ(parse(output).lines.size(), 2u + 20u);
}

/// Each of them moves the text that is kept by a byte.
TEST(OutputParser, Reads8MiBOfEmptyLinesInAFewSeconds) {
  const std::string block(65536, '\n');
  OutputParser parser;
  const auto begin = std::chrono::steady_clock::now();
  for (int i = 0; i < 128; ++i) parser.feed(block);
  parser.finish();

  EXPECT_LT(std::chrono::steady_clock::now() - begin, std::chrono::seconds(20));
  ASSERT_EQ(parser.texts().pieces().size(), 1u);
  EXPECT_EQ(parser.texts().pieces()[0].bytes.size(), 65536u);
}

}  // namespace
}  // namespace scanner
