// SPDX-License-Identifier: MIT
#include "scanner/events/event_reader.h"

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <limits>
#include <stdexcept>
#include <type_traits>
#include <utility>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "scanner/events/bounded_json.h"
#include "scanner/events/event_json.h"

namespace scanner {
namespace {

using Json = nlohmann::ordered_json;

constexpr std::size_t kMostQuoted = 40;  ///< Bytes of a text that a problem repeats.

/// What is wrong with a line. Never leaves this file.
struct NoEvent : std::runtime_error {
  using std::runtime_error::runtime_error;
};

/// A text out of the line, for a sentence: short and without control characters.
std::string asText(const std::string& text) {
  std::string shown = validUtf8(text.substr(0, kMostQuoted));
  for (char& c : shown) {
    const auto byte = static_cast<unsigned char>(c);
    if (byte < 0x20 || byte == 0x7F) c = '?';
  }
  return '"' + shown + (text.size() > kMostQuoted ? "...\"" : "\"");
}

/// One value of the line, with the name under which a problem mentions it.
class Value {
 public:
  Value(const Json& json_, std::string name_) : json(&json_), name(std::move(name_)) {}

  [[nodiscard]] bool isNull() const { return json->is_null(); }
  [[nodiscard]] const Json& raw() const { return *json; }

  [[noreturn]] void fail(const std::string& what) const { throw NoEvent(name + " " + what); }

  /// The member of an object; null where it has none of that name.
  [[nodiscard]] Value operator[](const char* member) const {
    static const Json none;
    if (!json->is_object()) fail("is no object");
    const auto found = json->find(member);
    return Value(found == json->end() ? none : *found, '"' + std::string(member) + '"');
  }

  [[nodiscard]] bool boolean() const {
    if (!json->is_boolean()) fail("is neither true nor false");
    return json->get<bool>();
  }

  [[nodiscard]] const std::string& text() const {
    if (!json->is_string()) fail("is no text");
    return json->get_ref<const std::string&>();
  }

  [[nodiscard]] std::string textOrNull() const { return isNull() ? std::string() : text(); }

  /// A whole number that the type can hold, at least `least`.
  template <class Number>
  [[nodiscard]] Number whole(Number least = std::numeric_limits<Number>::min()) const {
    if (!json->is_number_integer()) fail("is no whole number");
    bool fits = false;
    Number number = 0;
    if (json->is_number_unsigned()) {
      const auto value = json->get<std::uint64_t>();
      fits = value <= static_cast<std::uint64_t>(std::numeric_limits<Number>::max());
      number = fits ? static_cast<Number>(value) : Number{0};
    } else {
      const auto value = json->get<std::int64_t>();
      fits =
          std::is_signed_v<Number> && value >= static_cast<std::int64_t>(std::numeric_limits<Number>::min());
      number = fits ? static_cast<Number>(value) : Number{0};
    }
    if (!fits || number < least) fail(fmt::format("is {}, which is out of range", json->dump()));
    return number;
  }

  /// A number that is not below 0.
  [[nodiscard]] double measure() const {
    if (!json->is_number()) fail("is no number");
    const auto number = json->get<double>();
    if (!std::isfinite(number) || number < 0) fail("is out of range");
    return number;
  }

  /// Null is what became of a value that was not finite.
  [[nodiscard]] float singleOrNull() const {
    if (isNull()) return std::numeric_limits<float>::quiet_NaN();
    if (!json->is_number()) fail("is no number");
    const auto number = json->get<double>();
    if (!(std::fabs(number) <= static_cast<double>(std::numeric_limits<float>::max())))
      fail("is out of range");
    return static_cast<float>(number);
  }

  /// "0x1f"
  [[nodiscard]] std::uint64_t hexadecimal() const {
    const std::string& digits = text();
    const bool isOne = digits.size() > 2 && digits.size() <= 18 && digits.compare(0, 2, "0x") == 0 &&
                       digits.find_first_not_of("0123456789abcdef", 2) == std::string::npos;
    if (!isOne) fail("is " + asText(digits) + ", which is no address");
    return std::strtoull(digits.c_str() + 2, nullptr, 16);
  }

  [[nodiscard]] Verdict verdict() const {
    if (const std::optional<Verdict> verdict = verdictOf(text())) return *verdict;
    fail("is " + asText(text()) + ", which is no verdict");
  }

  /// Calls `take` with each item of an array.
  template <class Take>
  void forEach(Take take) const {
    if (!json->is_array()) fail("is no list");
    for (const Json& item : *json) take(Value(item, "an item of " + name));
  }

  [[nodiscard]] std::vector<std::string> texts() const {
    std::vector<std::string> all;
    forEach([&all](const Value& item) { all.push_back(item.text()); });
    return all;
  }

  /// An object of numbers above 0, by name.
  template <class Number>
  [[nodiscard]] std::map<std::string, Number> counts() const {
    if (!json->is_object()) fail("is no object");
    std::map<std::string, Number> all;
    for (const auto& [key, item] : json->items())
      all[key] = Value(item, asText(key)).template whole<Number>(1);
    return all;
  }

 private:
  const Json* json;
  std::string name;
};

/// What `read` makes of the value; nothing for null.
template <class Read>
auto unlessNull(const Value& value, Read read) -> std::optional<decltype(read(value))> {
  if (value.isNull()) return std::nullopt;
  return read(value);
}

int wholeNumber(const Value& value) { return value.whole<int>(); }

Target readTarget(const Value& value) {
  if (value.isNull()) return {};
  Target target;
  const Value system = value["system"];
  if (system.text() == "linux") {
    target.system = Target::System::kLinux;
  } else if (system.text() == "macos") {
    target.system = Target::System::kMacOs;
  } else if (system.text() == "windows") {
    target.system = Target::System::kWindows;
  } else {
    system.fail("is " + asText(system.text()) + ", which is unknown");
  }
  target.processor = value["processor"].text();
  return target;
}

Run readRun(const Value& value) {
  Run run;
  run.bundle = value["bundle"].text();
  run.child = unlessNull(value["child"], [](const Value& child) { return child.whole<std::int32_t>(); });
  run.childName = value["childName"].textOrNull();
  run.target = readTarget(value["target"]);
  return run;
}

Limits readLimits(const Value& value) {
  Limits limits;
  limits.stepInSeconds = value["stepInSeconds"].measure();
  limits.runInSeconds = value["runInSeconds"].measure();
  limits.memoryInBytes = value["memoryInBytes"].whole<std::uint64_t>();
  limits.outputInBytes = value["outputInBytes"].whole<std::uint64_t>();
  limits.filesInBytes = value["filesInBytes"].whole<std::uint64_t>();
  return limits;
}

RequestSeen readRequest(const Value& value) {
  RequestSeen request;
  request.kind = value["kind"].text();
  if (request.kind == "load" || request.kind == "entry") return request;
  if (request.kind != "dispatcher" && request.kind != "getParameter" && request.kind != "setParameter")
    value["kind"].fail("is " + asText(request.kind) + ", which is no kind of request");
  request.index = value["index"].whole<std::int32_t>();
  if (request.kind != "getParameter") request.opt = value["opt"].singleOrNull();
  if (request.kind == "dispatcher") {
    request.opcode = value["opcode"].whole<std::int32_t>();
    request.name = value["name"].text();
    request.value = value["value"].whole<std::int64_t>();
  }
  return request;
}

HostRequestSeen readHostRequest(const Value& value) {
  HostRequestSeen request;
  request.opcode = value["opcode"].whole<std::int32_t>();
  request.name = value["name"].text();
  request.index = value["index"].whole<std::int32_t>();
  request.value = value["value"].whole<std::int64_t>();
  request.count = value["count"].whole<std::uint64_t>();
  return request;
}

Place readPlace(const Value& value) {
  return {value["module"].textOrNull(), value["offset"].hexadecimal(), value["address"].hexadecimal()};
}

Activity readActivity(const Value& value) {
  Activity activity;
  activity.processorSeconds = value["processorSeconds"].measure();
  activity.wallSeconds = value["wallSeconds"].measure();
  const std::string& state = value["state"].text();
  if (state.size() != 1) value["state"].fail("is " + asText(state) + ", which is no state of a thread");
  activity.state = state[0];
  activity.systemCall = value["systemCall"].textOrNull();
  activity.sockets = value["sockets"].whole<unsigned>();
  return activity;
}

std::optional<bool> readIsBusy(const Value& value) {
  if (value.isNull()) return std::nullopt;
  if (value.text() == "busy") return true;
  if (value.text() == "waiting") return false;
  value.fail("is " + asText(value.text()) + ", neither busy nor waiting");
}

void readSteps(const Value& value, PluginResult& result) {
  std::vector<double>& seconds = result.judgement.stepSeconds;
  std::size_t timed = 0;
  value.forEach([&](const Value& step) {
    std::vector<ProtocolLine>& lines = result.seen->lines;
    const int number = step["number"].whole<int>(1);
    if (static_cast<std::size_t>(number) != lines.size() + 1)
      step.fail(fmt::format("is number {} and should be {}", number, lines.size() + 1));
    lines.push_back({ProtocolLine::Kind::kStep, number, step["text"].text()});
    const bool isTimed = !step["seconds"].isNull();
    seconds.push_back(isTimed ? step["seconds"].measure() : std::numeric_limits<double>::quiet_NaN());
    if (isTimed) timed = seconds.size();
  });
  seconds.resize(timed);
}

void readPrinted(const Value& value, RunSeen& seen) {
  value.forEach([&seen](const Value& piece) {
    const std::string& stream = piece["stream"].text();
    if (stream != "stdout" && stream != "stderr")
      piece["stream"].fail("is " + asText(stream) + ", which is no stream");
    seen.texts.push_back({piece["step"].whole<int>(0), stream == "stderr", piece["text"].text()});
  });
}

LeftBehind readLeftBehind(const Value& value) {
  LeftBehind left;
  left.processes = value["processes"].whole<unsigned>();
  left.sharedMemory = value["sharedMemory"].whole<unsigned>();
  left.files = value["files"].texts();
  left.fileCount = value["fileCount"].whole<std::uint64_t>();
  left.fileBytes = value["fileBytes"].whole<std::uint64_t>();
  return left;
}

void readSeen(const Value& event, PluginResult& result) {
  RunSeen& seen = result.seen.emplace();
  seen.startedAt = event["time"].measure();
  seen.wallSeconds = event["wallSeconds"].measure();
  seen.userSeconds = event["userSeconds"].measure();
  seen.systemSeconds = event["systemSeconds"].measure();
  seen.peakMemoryInBytes = event["peakMemoryInBytes"].whole<std::uint64_t>();
  const Value sandbox = event["sandbox"];
  if (sandbox.text() != "bubblewrap" && sandbox.text() != "none")
    sandbox.fail("is " + asText(sandbox.text()) + ", which is unknown");
  seen.wasSandboxed = sandbox.text() == "bubblewrap";
  readSteps(event["steps"], result);
  result.judgement.testsRun = unlessNull(event["tests"], [](const Value& tests) { return tests.text(); });
  readPrinted(event["printed"], seen);
  seen.outputBytes = event["outputBytes"].whole<std::uint64_t>();
  seen.leftBehind = readLeftBehind(event["leftBehind"]);
  seen.activity = unlessNull(event["activity"], readActivity);
}

Expectation readExpectation(const Value& value) {
  Expectation expected;
  expected.verdict = rowOf(value["verdict"].verdict()).word;
  expected.step = unlessNull(value["step"], wholeNumber);
  expected.reason = value["reason"].text();
  expected.isMet = value["isMet"].boolean();
  return expected;
}

Repetitions readRepetitions(const Value& value) {
  return {value["runs"].whole<unsigned>(1), value["verdicts"].counts<unsigned>()};
}

Comparison readComparison(const Value& value) {
  using Change = Comparison::Change;
  Comparison comparison;
  const Value word = value["change"];
  bool isKnown = false;
  for (const Change change :
       {Change::kNone, Change::kNew, Change::kMended, Change::kStillFailing, Change::kFlaky}) {
    if (word.text() != nameOfChange(change)) continue;
    comparison.change = change;
    isKnown = true;
  }
  if (!isKnown) word.fail("is " + asText(word.text()) + ", which is no change");
  comparison.earlier = unlessNull(value["earlier"], [](const Value& earlier) {
    return Comparison::Earlier{rowOf(earlier["verdict"].verdict()).word,
                               unlessNull(earlier["step"], wholeNumber), earlier["time"].measure()};
  });
  return comparison;
}

Diagnosis readDiagnosis(const Value& value) {
  Diagnosis diagnosis;
  diagnosis.tool = value["tool"].text();
  diagnosis.command = value["command"].texts();
  value["findings"].forEach([&diagnosis](const Value& finding) {
    diagnosis.findings.push_back({finding["kind"].text(), finding["text"].text(), finding["frames"].texts(),
                                  finding["isInPlugin"].boolean()});
  });
  diagnosis.problem = value["problem"].textOrNull();
  diagnosis.report = value["report"].text();
  return diagnosis;
}

Shrunk readShrunk(const Value& value) {
  Shrunk shrunk;
  shrunk.from = value["from"].text();
  shrunk.tests = value["tests"].text();
  shrunk.runs = value["runs"].whole<unsigned>();
  shrunk.isReproduced = value["isReproduced"].boolean();
  shrunk.command = value["command"].texts();
  shrunk.problem = value["problem"].textOrNull();
  return shrunk;
}

Judgement readJudgement(const Value& event) {
  Judgement judgement;
  judgement.verdict = event["verdict"].verdict();
  judgement.cause = event["cause"].text();
  if (const Value step = event["step"]; !step.isNull()) {
    judgement.step = step["number"].whole<int>(1);
    judgement.stepText = step["text"].text();
  }
  judgement.request = unlessNull(event["request"], readRequest);
  judgement.hostRequest = unlessNull(event["hostRequest"], readHostRequest);
  judgement.status = unlessNull(event["status"], wholeNumber);
  // Its name follows from the number.
  judgement.signal =
      unlessNull(event["signal"], [](const Value& signal) { return signal["number"].whole<int>(1); });
  judgement.place = unlessNull(event["place"], readPlace);
  judgement.isBusy = readIsBusy(event["hangs"]);
  judgement.contradictions = event["contradictions"].texts();
  return judgement;
}

PluginResult readResult(const Value& event) {
  PluginResult result;
  result.run = readRun(event["plugin"]);
  result.otherNames = event["otherNames"].texts();
  result.judgement = readJudgement(event);
  result.isWanted = event["isWanted"].boolean();
  result.expected = unlessNull(event["expected"], readExpectation);
  result.repetitions = unlessNull(event["repetitions"], readRepetitions);
  result.command = event["command"].texts();
  result.isRemembered = event["isRemembered"].boolean();
  result.comparison = unlessNull(event["comparison"], readComparison);
  result.diagnosis = unlessNull(event["diagnosis"], readDiagnosis);
  result.shrunk = unlessNull(event["shrunk"], readShrunk);
  if (!event["time"].isNull()) readSeen(event, result);
  if (const Value description = event["description"]; !description.isNull()) {
    if (!description.raw().is_object()) description.fail("is no object");
    result.description = description.raw().dump();
  }
  return result;
}

ScanStarted readScanStarted(const Value& event) {
  const auto format = event["format"].whole<int>();
  if (format != kEventFormat) throw NoEvent(fmt::format("its format is {}, not {}", format, kEventFormat));
  ScanStarted started;
  started.version = event["version"].text();
  started.time = event["time"].measure();
  started.machine = event["machine"].text();
  started.places = event["places"].texts();
  started.shard.parts = event["shard"]["parts"].whole<unsigned>(1);
  started.shard.part = event["shard"]["part"].whole<unsigned>(1);
  if (started.shard.part > started.shard.parts) event["shard"].fail("has a part that it does not have");
  started.jobs = event["jobs"].whole<unsigned>(1);
  started.limits = readLimits(event["limits"]);
  started.sandbox = event["sandbox"].text();
  started.plugins = event["plugins"].whole<std::size_t>();
  started.notes = event["notes"].texts();
  return started;
}

ScanEnded readScanEnded(const Value& event) {
  ScanEnded ended;
  ended.time = event["time"].measure();
  ended.wallSeconds = event["wallSeconds"].measure();
  ended.counts = event["counts"].counts<std::size_t>();
  for (const auto& [word, count] : ended.counts) {
    if (!verdictOf(word)) event["counts"].fail("counts " + asText(word) + ", which is no verdict");
  }
  ended.unwanted = event["unwanted"].whole<std::size_t>();
  ended.isInterrupted = event["isInterrupted"].boolean();
  ended.status = event["status"].whole<int>(0);
  if (ended.status > 255) event["status"].fail("is out of range");
  return ended;
}

Event eventOf(std::string_view line) {
  const char* problem = nullptr;
  const std::optional<Json> json = parseBounded(line, kDeepestEvent, &problem);
  if (!json) throw NoEvent(problem);
  const Value event(*json, "the line");
  const std::string& kind = event["event"].text();
  if (kind == "scan_started") return readScanStarted(event);
  if (kind == "run_started") return RunStarted{readRun(event["plugin"])};
  if (kind == "plugin_ended") return readResult(event);
  if (kind == "scan_ended") return readScanEnded(event);
  throw NoEvent("its event is " + asText(kind) + ", which is unknown");
}

}  // namespace

std::optional<Event> readEvent(std::string_view line, std::string* problem) {
  try {
    return eventOf(line);
  } catch (const NoEvent& error) {
    if (problem != nullptr) *problem = error.what();
  } catch (const std::exception& error) {
    // Not enough memory for a very long line.
    if (problem != nullptr) *problem = std::string("it cannot be read: ") + error.what();
  }
  return std::nullopt;
}

std::string eventLine(const Event& event) {
  struct Writer {
    std::string operator()(const ScanStarted& started) const { return eventLine(started); }
    std::string operator()(const RunStarted& started) const { return eventLine(started.run); }
    std::string operator()(const PluginResult& result) const { return eventLine(result); }
    std::string operator()(const ScanEnded& ended) const { return eventLine(ended); }
  };
  return std::visit(Writer{}, event);
}

}  // namespace scanner
