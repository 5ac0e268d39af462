// SPDX-License-Identifier: MIT
#include <cmath>
#include <fstream>
#include <iterator>
#include <limits>
#include <map>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "scanner/events/event_json.h"
#include "scanner/events/event_members.h"
#include "scanner/events/event_reader.h"
#include "tests/shared/program_run.h"

using namespace scanner;
using ::testing::MatchesRegex;

namespace {

constexpr const char* kPlugin = R"({"bundle":"/a.so","child":null,"childName":null,"target":null})";

/// A plugin_ended with the least that it must have; `members` come first, so that they stand for those below.
std::string resultLine(const std::string& members = "") {
  std::string line = R"({"event":"plugin_ended","plugin":)" + std::string(kPlugin);
  const auto add = [&](const std::string& name, const std::string& value) {
    if (members.find("\"" + name + "\":") == std::string::npos) line += ",\"" + name + "\":" + value;
  };
  if (!members.empty()) line += "," + members;
  add("otherNames", "[]");
  add("verdict", "\"passed\"");
  add("isWanted", "true");
  add("cause", "\"\"");
  for (const char* name : {"step", "request", "hostRequest", "status", "signal", "place", "activity", "hangs",
                           "expected", "repetitions", "comparison", "diagnosis", "shrunk"})
    add(name, "null");
  add("contradictions", "[]");
  add("command", "[]");
  add("isRemembered", "false");
  return line + "}\n";
}

std::string seenMembers(const std::string& steps = "[]", const std::string& printed = "[]") {
  return R"("time":1.5,"wallSeconds":0.25,"userSeconds":0.0,"systemSeconds":0.0,"peakMemoryInBytes":1,)"
         R"("sandbox":"none","steps":)" +
         steps + R"(,"tests":null,"printed":)" + printed +
         R"(,"outputBytes":0,"leftBehind":{"processes":0,"sharedMemory":0,"files":[],"fileCount":0,"fileBytes":0})";
}

std::string startedLine(const std::string& format = "1",
                        const std::string& shard = R"({"part":1,"parts":1})") {
  return R"({"event":"scan_started","format":)" + format +
         R"(,"version":"0.2.0","time":1.0,"machine":"m","places":[],"shard":)" + shard +
         R"(,"jobs":1,"limits":{"stepInSeconds":1.0,"runInSeconds":1.0,"memoryInBytes":0,"outputInBytes":0,)"
         R"("filesInBytes":0},"sandbox":"none","plugins":0,"notes":[]})";
}

std::string problemOf(const std::string& line) {
  std::string problem;
  EXPECT_FALSE(readEvent(line, &problem)) << line.substr(0, 300);
  return problem;
}

PluginResult readResult(const std::string& line) {
  std::string problem;
  const std::optional<Event> event = readEvent(line, &problem);
  EXPECT_TRUE(event && std::holds_alternative<PluginResult>(*event)) << problem;
  return event ? std::get<PluginResult>(*event) : PluginResult{};
}

/// Something in every member, with values at the edges of their ranges.
PluginResult fullResult() {
  PluginResult result;
  result.run.bundle = "/lib/\xFF caf\xC3\xA9\n\x01\x7F.so";
  result.run.child = std::numeric_limits<std::int32_t>::min();
  result.run.childName = "</script>\xED\xA0\x80";
  result.run.target = {Target::System::kWindows, "machine 40000"};
  result.otherNames = {"/b.so", ""};
  Judgement& judgement = result.judgement;
  judgement.verdict = Verdict::kHung;
  judgement.cause = "step 65, \"testing\": busy";
  judgement.step = 65;
  judgement.stepText = "testing setting states";
  judgement.request = RequestSeen{"dispatcher",
                                  -1,
                                  "opcode -1",
                                  std::numeric_limits<std::int32_t>::max(),
                                  std::numeric_limits<std::int64_t>::min(),
                                  std::numeric_limits<float>::denorm_min()};
  judgement.hostRequest =
      HostRequestSeen{7, "audioMasterGetTime", -1, std::numeric_limits<std::int64_t>::max(),
                      std::numeric_limits<std::uint64_t>::max()};
  judgement.status = -3;
  judgement.signal = 63;
  judgement.place = Place{"", std::numeric_limits<std::uint64_t>::max(), 0};
  judgement.isBusy = true;
  judgement.contradictions = {"It was forged."};
  judgement.testsRun = "0,3,3,1";
  judgement.stepSeconds = {0.0, std::nan(""), 1e-9};
  RunSeen& seen = result.seen.emplace();
  seen.startedAt = 1795302000.123456;
  seen.wallSeconds = 0.1;
  seen.userSeconds = 1e300;
  seen.systemSeconds = 5e-324;
  seen.peakMemoryInBytes = std::numeric_limits<std::uint64_t>::max();
  seen.wasSandboxed = true;
  for (int number = 1; number <= 4; ++number)
    seen.lines.push_back({ProtocolLine::Kind::kStep, number, "step"});
  seen.texts = {{0, false, std::string("\0\r\n", 3)}, {4, true, "\xE2\x80\xA8 \xF0\x9F\x8E\xB5"}};
  seen.outputBytes = 7;
  seen.leftBehind.processes = 2;
  seen.leftBehind.sharedMemory = 1;
  seen.leftBehind.files = {"home/.x"};
  seen.leftBehind.fileCount = 101;
  seen.leftBehind.fileBytes = std::numeric_limits<std::uint64_t>::max();
  seen.activity = Activity{19.5, 20, 'R', "", 3};
  result.expected = Expectation{"crashed", 5, "known\tissue", false};
  result.repetitions = Repetitions{3, {{"passed", 2}, {"hung at 65", 1}}};
  result.isWanted = false;
  result.description = R"({"z":1,"a":{"nested":[1.5,null,true,-0.0,1e22]},"text":"\u0001"})";
  result.command = {"/usr/lib/vsttorture-worker", "it's"};
  result.isRemembered = true;
  result.comparison = Comparison{Comparison::Change::kStillFailing, Comparison::Earlier{"crashed", 5, 1.25}};
  result.diagnosis = Diagnosis{
      "memcheck", {"valgrind"}, {{"InvalidRead", "of size 4", {"f (a.c:1)", "b.so+0x1"}, false}}, "", "r"};
  result.shrunk = Shrunk{"0,3,3,1", "3", 7, true, {"worker", "--tests", "3"}, "why"};
  return result;
}

void expectReadBack(const std::string& line) {
  std::string problem;
  const std::optional<Event> event = readEvent(line, &problem);
  ASSERT_TRUE(event) << problem << "\n" << line;
  EXPECT_EQ(eventLine(*event), line);
}

TEST(ReadEvent, AResultWithEverythingIsWrittenAgainToTheByte) {
  const PluginResult full = fullResult();
  expectReadBack(eventLine(full));
  const PluginResult read = readResult(eventLine(full));
  EXPECT_EQ(read.judgement.request->value, std::numeric_limits<std::int64_t>::min());
  EXPECT_EQ(read.judgement.place->offset, std::numeric_limits<std::uint64_t>::max());
  EXPECT_EQ(read.seen->activity->state, 'R');
  EXPECT_EQ(read.run.target, full.run.target);
}

TEST(ReadEvent, EveryVerdictChangeRequestAndEmptyMemberIsWrittenAgainToTheByte) {
  for (const VerdictRow& row : verdictTable()) {
    PluginResult result;
    result.run.bundle = "/a.so";
    result.judgement.verdict = row.verdict;
    expectReadBack(eventLine(result));
    result.seen = RunSeen{};
    result.run.child = 0;
    expectReadBack(eventLine(result));
    PluginResult full = fullResult();
    full.judgement.isBusy = false;
    full.judgement.step = 0;
    full.diagnosis->problem = "valgrind is not installed";
    full.comparison->earlier->step.reset();
    expectReadBack(eventLine(full));
  }
  using Change = Comparison::Change;
  for (const Change change :
       {Change::kNone, Change::kNew, Change::kMended, Change::kStillFailing, Change::kFlaky}) {
    PluginResult result;
    result.comparison = Comparison{change, {}};
    expectReadBack(eventLine(result));
  }
  for (const char* kind : {"load", "entry", "dispatcher", "getParameter", "setParameter"}) {
    for (const float opt : {0.0f, -0.0f, 0.1f, 3.4028235e38f, std::nanf(""), INFINITY}) {
      PluginResult result;
      result.judgement.request = RequestSeen{kind, 44, "effSetBypass", 1, -1, opt};
      expectReadBack(eventLine(result));
    }
  }
}

TEST(ReadEvent, TheOtherEventsAreWrittenAgainToTheByte) {
  ScanStarted started;
  started.version = "0.2.0";
  started.time = 1795302000.5;
  started.machine = "a\nb";
  started.places = {"/usr/lib/vst"};
  started.shard = {2, 3};
  started.limits.memoryInBytes = 0;
  started.sandbox = "none (bubblewrap is not installed)";
  started.plugins = 200;
  started.notes = {"not searched: \xFF"};
  expectReadBack(eventLine(started));
  expectReadBack(eventLine(fullResult().run));
  ScanEnded ended;
  ended.counts = {{"crashed", 1}, {"passed", 2}};
  ended.isInterrupted = true;
  ended.status = 130;
  expectReadBack(eventLine(ended));
}

TEST(ReadEvent, EveryLineOfRealScansIsWrittenAgainToTheByte) {
  const std::string plugins = samplePlugin("shell").substr(0, samplePlugin("shell").rfind('/'));
  const std::map<std::string, std::string> hang = {{"FAULT_KIND", "hang"}, {"FAULT_PLACE", "dispatch:10"}};
  const std::vector<ProgramCall> calls = {
      {{plugins}},
      {{"--describe", "--repeat", "2", plugins}},
      {{"--expect", "/dev/null", "--step-limit", "0.5", samplePlugin("faulty")}, hang},
  };
  for (ProgramCall call : calls) {
    call.arguments.insert(call.arguments.begin(), {"--json", "-", "--sandbox", "off", "--cache", "off"});
    const std::vector<std::string> all = lines(runProgram(SCAN, call).standardOutput);
    EXPECT_GE(all.size(), 4U);
    for (const std::string& line : all) expectReadBack(line + "\n");
  }
}

TEST(ReadEvent, TheSeedsOfItsFuzzTargetAreEvents) {
  for (const char* name :
       {"everything", "not_run", "parameter", "run_started", "scan_ended", "scan_started"}) {
    std::ifstream file(std::string(SEEDS) + "/" + name);
    const std::string line((std::istreambuf_iterator<char>(file)), std::istreambuf_iterator<char>());
    std::string problem;
    EXPECT_TRUE(readEvent(line, &problem)) << name << ": " << problem;
  }
}

TEST(ReadEvent, StepsWithoutATimeStayWithoutOne) {
  const PluginResult result = readResult(resultLine(
      seenMembers(R"([{"number":1,"text":"a","seconds":null},{"number":2,"text":"b","seconds":0.5},)"
                  R"({"number":3,"text":"c","seconds":null}])")));
  ASSERT_EQ(result.judgement.stepSeconds.size(), 2U);
  EXPECT_TRUE(std::isnan(result.judgement.stepSeconds[0]));
  EXPECT_EQ(result.judgement.stepSeconds[1], 0.5);
}

TEST(ReadEvent, WhatALaterVersionAddsIsIgnored) {
  EXPECT_EQ(readResult(resultLine(R"("added":{"x":[1]})")).run.bundle, "/a.so");
}

TEST(ReadEvent, ANewlineIsNotNeeded) {
  std::string line = resultLine();
  line.pop_back();
  EXPECT_TRUE(readEvent(line));
}

struct BadLine {
  const char* name;
  std::string line;
  std::string problem;  ///< A regular expression.
};

class ReadEventBadLines : public ::testing::TestWithParam<BadLine> {};

TEST_P(ReadEventBadLines, GiveTheirProblem) {
  EXPECT_THAT(problemOf(GetParam().line), MatchesRegex(GetParam().problem));
}

INSTANTIATE_TEST_SUITE_P(
    , ReadEventBadLines,
    ::testing::Values(
        BadLine{"Empty", "", "it is no JSON"}, BadLine{"Text", "passed  /a.so", "it is no JSON"},
        BadLine{"CutOff", resultLine().substr(0, 100), "it is no JSON"},
        BadLine{"TwoInOneLine", resultLine() + resultLine(), "it is no JSON"},
        BadLine{"NulByte", std::string("\0{}", 3), "it is no JSON"},
        BadLine{"NotUtf8", "{\"event\":\"\xFF\"}", "it is no JSON"},
        BadLine{"Number", "7", "the line is no object"}, BadLine{"List", "[]", "the line is no object"},
        BadLine{"Null", "null", "the line is no object"}, BadLine{"NoEvent", "{}", "\"event\" is no text"},
        BadLine{"UnknownEvent", R"({"event":"lunch\n"})", "its event is \"lunch.\", which is unknown"},
        BadLine{"LongUnknownEvent", "{\"event\":\"" + std::string(1000, 'x') + "\"}",
                "its event is \"x{40}\\.\\.\\.\", which is unknown"},
        BadLine{"OtherFormat", startedLine("2"), "its format is 2, not 1"},
        BadLine{"NoFormat", startedLine("null"), "\"format\" is no whole number"},
        BadLine{"FractionalFormat", startedLine("1.0"), "\"format\" is no whole number"},
        BadLine{"PartZero", startedLine("1", R"({"part":0,"parts":1})"),
                "\"part\" is 0, which is out of range"},
        BadLine{"PartTooHigh", startedLine("1", R"({"part":3,"parts":2})"),
                "\"shard\" has a part that it does not have"},
        BadLine{"NegativeCount", startedLine("1", R"({"part":-1,"parts":1})"), "\"part\" is -1, which.*"},
        BadLine{"UnknownVerdict", resultLine(R"("verdict":"pased")"),
                "\"verdict\" is \"pased\", which is no verdict"},
        BadLine{"VerdictOfAnotherType", resultLine(R"("verdict":["passed"])"), "\"verdict\" is no text"},
        BadLine{"WantedAsText", resultLine(R"("isWanted":"true")"), "\"isWanted\" is neither true nor false"},
        BadLine{"ListAsText", resultLine(R"("command":"worker")"), "\"command\" is no list"},
        BadLine{"NumberInAListOfTexts", resultLine(R"("command":[1])"), "an item of \"command\" is no text"},
        BadLine{"StatusAboveAnInt", resultLine(R"("status":2147483648)"),
                "\"status\" is 2147483648, which.*"},
        BadLine{"StatusBelowAnInt", resultLine(R"("status":-2147483649)"),
                "\"status\" is -2147483649, which.*"},
        BadLine{"StatusAboveAllNumbers", resultLine(R"("status":99999999999999999999999)"),
                "\"status\" is no whole number"},
        BadLine{"NumberAboveAllNumbers", resultLine(R"("status":1e999)"), "it is no JSON"},
        BadLine{"SignalZero", resultLine(R"("signal":{"number":0,"name":"x"})"), "\"number\" is 0, which.*"},
        BadLine{"StepAsNumber", resultLine(R"("step":5)"), "\"step\" is no object"},
        BadLine{"AddressTooLong",
                resultLine(R"("place":{"module":null,"offset":"0x10000000000000000","address":"0x0"})"),
                "\"offset\" is .*, which is no address"},
        BadLine{"AddressWithoutPrefix",
                resultLine(R"("place":{"module":null,"offset":"12","address":"0x0"})"),
                "\"offset\" is \"12\", which is no address"},
        BadLine{"OptAboveAFloat", resultLine(R"("request":{"kind":"setParameter","index":0,"opt":1e300})"),
                "\"opt\" is out of range"},
        BadLine{"ValueAboveInt64",
                resultLine(R"("request":{"kind":"dispatcher","opcode":0,"name":"","index":0,)"
                           R"("value":9223372036854775808,"opt":0.0})"),
                "\"value\" is 9223372036854775808, which is out of range"},
        BadLine{"UnknownRequest", resultLine(R"("request":{"kind":"x"})"), "\"kind\" is \"x\", which.*"},
        BadLine{"UnknownChange", resultLine(R"("comparison":{"change":"x","earlier":null})"),
                "\"change\" is \"x\", which is no change"},
        BadLine{"UnknownHang", resultLine(R"("hangs":"x")"), "\"hangs\" is \"x\", neither busy nor waiting"},
        BadLine{"DescriptionAsText", resultLine(R"("description":"x")"), "\"description\" is no object"},
        BadLine{"StepsNotInOrder",
                resultLine(seenMembers(R"([{"number":2000000000,"text":"","seconds":1}])")),
                "an item of \"steps\" is number 2000000000 and should be 1"},
        BadLine{"NegativeSeconds", resultLine(seenMembers(R"([{"number":1,"text":"","seconds":-1}])")),
                "\"seconds\" is out of range"},
        BadLine{"UnknownStream", resultLine(seenMembers("[]", R"([{"step":0,"stream":"x","text":""}])")),
                "\"stream\" is \"x\", which is no stream"},
        BadLine{"ActivityOfTwoLetters",
                resultLine(R"("activity":{"processorSeconds":0,"wallSeconds":0,"state":"RS",)"
                           R"("systemCall":null,"sockets":0},)" +
                           seenMembers()),
                "\"state\" is \"RS\", which is no state of a thread"},
        BadLine{"RunWithoutItsMembers", resultLine(R"("time":1.0)"), "\"wallSeconds\" is no number"},
        BadLine{"CountOfNoVerdict",
                R"({"event":"scan_ended","time":1,"wallSeconds":1,"counts":{"lunch":1},"unwanted":0,)"
                R"("isInterrupted":false,"status":0})",
                "\"counts\" counts \"lunch\", which is no verdict"},
        BadLine{"CountOfZero",
                R"({"event":"scan_ended","time":1,"wallSeconds":1,"counts":{"passed":0},"unwanted":0,)"
                R"("isInterrupted":false,"status":0})",
                "\"passed\" is 0, which is out of range"},
        BadLine{"NestedWithoutEnd", std::string(1000000, '['), "it is nested too deeply"},
        BadLine{
            "NestedDescription",
            resultLine(R"("description":{"a":)" + std::string(100000, '[') + std::string(100000, ']') + "}"),
            "it is nested too deeply"}),
    [](const auto& line) { return std::string(line.param.name); });

TEST(ReadEvent, AnObjectOfAMillionMembersIsRefusedSoon) {
  std::string line = "{\"event\":\"run_started\"";
  for (int i = 0; i < 1000000; ++i) line += ",\"" + std::to_string(i) + "\":0";
  EXPECT_EQ(problemOf(line + "}"), "an object in it has too many members");
}

TEST(ReadEvent, NoPieceOfALineIsAnEvent) {
  std::string line = eventLine(fullResult());
  line.pop_back();
  for (std::size_t size = 0; size < line.size(); ++size)
    EXPECT_FALSE(readEvent(line.substr(0, size))) << size;
}

// ---- Events that are written again, unread ----------------------------------------------------------------

TEST(EventMembers, TakesALineApartAndKeepsItsTexts) {
  EXPECT_THAT(eventMembers(R"({"a":1,"b":{"c":[1,{"d":"}"}],"e":","},"f":"\\\",\"g\":","h":null})"),
              ::testing::Optional(::testing::ElementsAre(
                  ::testing::Pair("a", "1"), ::testing::Pair("b", R"({"c":[1,{"d":"}"}],"e":","})"),
                  ::testing::Pair("f", R"("\\\",\"g\":")"), ::testing::Pair("h", "null"))));
}

TEST(EventMembers, TakesNothingThatNoScanHasWritten) {
  for (const char* line :
       {"", "{", "[]", "7", "{}x", R"({"a":})", R"({"a":1,})", R"({ "a":1})", R"({"a" :1})",
        R"({"a":1, "b":2})", "{\"a\":1}\n", R"({"a":"})", "{\"a\":\"\xFF\"}"})
    EXPECT_FALSE(eventMembers(line) && !eventMembers(line)->empty()) << line;
}

TEST(EventLine, OfARecordedResultHasWhatIsOfThisScanAndElseWhatItHad) {
  std::string line = resultLine(seenMembers(R"([{"number":1,"text":"one","seconds":0.5}])"));
  line.pop_back();
  PluginResult result;
  result.judgement.verdict = Verdict::kPassed;
  result.isRemembered = true;
  result.command = {"worker", "/a.so"};
  result.recorded = eventMembers(line);
  ASSERT_TRUE(result.recorded);
  PluginResult expected = readResult(line);
  expected.isRemembered = true;
  expected.command = result.command;
  EXPECT_EQ(readResult(eventLine(result)).seen->lines.size(), 1U);
  EXPECT_EQ(eventLine(readResult(eventLine(result))), eventLine(expected));
}

}  // namespace
