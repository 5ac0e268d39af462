// SPDX-License-Identifier: MIT
#include "scanner/report/junit.h"

#include <algorithm>
#include <cmath>
#include <ctime>
#include <map>
#include <set>
#include <tuple>

#include <fmt/format.h>
#include <pugixml.hpp>

#include "scanner/events/baseline.h"
#include "scanner/events/event_json.h"
#include "scanner/report/characters.h"
#include "scanner/report/terminal.h"
#include "scanner/report/words.h"

namespace scanner {
namespace {

/// How one test case ended.
enum class Outcome { kPassed, kFailed, kError, kSkipped };

Outcome outcomeOf(const PluginResult& result) {
  if (result.isWanted)
    return result.judgement.verdict == Verdict::kSkipped ? Outcome::kSkipped : Outcome::kPassed;
  return result.judgement.verdict == Verdict::kNotRun ? Outcome::kError : Outcome::kFailed;
}

struct Counts {
  std::size_t tests = 0;
  std::size_t failures = 0;
  std::size_t errors = 0;
  std::size_t skipped = 0;
  double seconds = 0;

  void count(Outcome outcome) {
    ++tests;
    if (outcome == Outcome::kFailed) ++failures;
    if (outcome == Outcome::kError) ++errors;
    if (outcome == Outcome::kSkipped) ++skipped;
  }
};

std::string decimal(double seconds) { return fmt::format("{:.3f}", std::isfinite(seconds) ? seconds : 0.0); }

void setAttribute(pugi::xml_node node, const char* name, const std::string& value) {
  node.append_attribute(name) = xmlText(value).c_str();
}

void addText(pugi::xml_node node, const char* name, const std::string& text) {
  node.append_child(name).text() = xmlText(text).c_str();
}

void setCounts(pugi::xml_node node, const Counts& counts) {
  setAttribute(node, "tests", std::to_string(counts.tests));
  setAttribute(node, "failures", std::to_string(counts.failures));
  setAttribute(node, "errors", std::to_string(counts.errors));
  setAttribute(node, "skipped", std::to_string(counts.skipped));
  setAttribute(node, "time", decimal(counts.seconds));
}

/// "2026-11-21T23:05:00", in UTC; empty for a time that no clock shows.
std::string timestamp(double secondsSince1970) {
  constexpr double kYear10000 = 253402300800.0;
  if (!(secondsSince1970 >= 0 && secondsSince1970 < kYear10000)) return "";
  const auto time = static_cast<std::time_t>(secondsSince1970);
  std::tm date = {};
  if (gmtime_r(&time, &date) == nullptr) return "";
  char text[32];
  return std::strftime(text, sizeof text, "%Y-%m-%dT%H:%M:%S", &date) > 0 ? text : "";
}

std::string folderOf(const std::string& bundle) {
  const std::size_t end = bundle.find_last_not_of('/');
  const std::size_t slash = end == std::string::npos ? end : bundle.rfind('/', end);
  if (slash == std::string::npos) return ".";
  return slash == 0 ? "/" : bundle.substr(0, slash);
}

std::string requestInWords(const RequestSeen& request) {
  if (request.kind == "load") return "loading the module";
  if (request.kind == "entry") return "the entry point";
  if (request.kind == "getParameter") return fmt::format("getParameter {}", request.index);
  if (request.kind == "setParameter") return fmt::format("setParameter {} to {}", request.index, request.opt);
  return fmt::format("{} ({}), index {}, value {}, opt {}", request.name, request.opcode, request.index,
                     request.value, request.opt);
}

/// One line: why it failed.
std::string messageOf(const PluginResult& result) {
  const std::string reason = whyNotWanted(result);
  return printable(reason.empty() ? rowOf(result.judgement.verdict).meaning : reason);
}

/// The type of a failure: the verdict's word, or, of a good verdict, why it is a failure all the same.
const char* typeOf(const PluginResult& result) {
  const VerdictRow& row = rowOf(result.judgement.verdict);
  if (!row.isGood) return row.word;
  if (result.isFlaky()) return "flaky";
  return result.isUnexpected() ? "unexpected" : "findings";
}

/// Everything that is known of the failure, a line each.
std::string detailsOf(const PluginResult& result) {
  const Judgement& judgement = result.judgement;
  std::string text;
  const auto add = [&text](const std::string& name, const std::string& value) {
    if (!value.empty()) text += name + ": " + printable(value) + "\n";
  };
  add(rowOf(judgement.verdict).word,
      judgement.cause.empty() ? rowOf(judgement.verdict).meaning : judgement.cause);
  if (judgement.step > 0) add("step", fmt::format("{}, {}", judgement.step, judgement.stepText));
  if (judgement.request) add("request", requestInWords(*judgement.request));
  if (judgement.hostRequest)
    add("last request to the host",
        fmt::format("{} ({})", judgement.hostRequest->name, judgement.hostRequest->opcode));
  if (judgement.signal) add("signal", nameOfSignal(*judgement.signal));
  if (judgement.status) add("status", std::to_string(*judgement.status));
  if (judgement.place)
    add("place", fmt::format("{}{:#x}, address {:#x}",
                             judgement.place->module.empty() ? "" : judgement.place->module + "+",
                             judgement.place->offset, judgement.place->address));
  if (result.isUnexpected()) add("expected", endInWords(result.expected->verdict, result.expected->step));
  if (result.isFlaky()) add("flaky", endsInWords(*result.repetitions));
  add("compared", changeInWords(result));
  for (const std::string& one : judgement.contradictions) add("note", one);
  if (result.diagnosis) {
    add(result.diagnosis->tool, result.diagnosis->problem);
    for (const Diagnosis::Finding& finding : result.diagnosis->findings) {
      add(result.diagnosis->tool,
          finding.kind + ": " + finding.text + (finding.isInPlugin ? "" : " (not of the plug-in)"));
      for (const std::string& frame : finding.frames) text += "    " + printable(frame) + "\n";
    }
  }
  if (result.shrunk) {
    if (result.shrunk->isReproduced)
      add("shortest list of tests", fmt::format("{} (of {})", result.shrunk->tests, result.shrunk->from));
    add("shortest list of tests", result.shrunk->problem);
  }
  if (!result.command.empty()) add("again", shellCommand(result.command));
  if (result.shrunk && !result.shrunk->command.empty()) add("shorter", shellCommand(result.shrunk->command));
  if (result.diagnosis && !result.diagnosis->command.empty())
    add("with " + result.diagnosis->tool, shellCommand(result.diagnosis->command));
  return text;
}

/// What the plug-in printed during a step, each line marked.
void addPrinted(std::string& text, const RunSeen& seen, int step) {
  for (const PluginText& one : seen.texts) {
    if (one.step != step) continue;
    const char* mark = one.isStandardError ? "  stderr| " : "  stdout| ";
    const std::string printed = xmlText(one.bytes);  // Now, since a carriage return makes a line as well.
    std::size_t at = 0;
    while (at < printed.size()) {
      const std::size_t end = std::min(printed.find('\n', at), printed.size());
      text += mark + printed.substr(at, end - at) + "\n";
      at = end + 1;
    }
  }
}

std::string systemOut(const PluginResult& result) {
  std::string text;
  if (result.isWanted && !rowOf(result.judgement.verdict).isGood) {
    const bool isExpected = result.expected && result.expected->isMet;
    text += printable(fmt::format("{}: {}{}", isExpected ? "as expected" : "not new",
                                  rowOf(result.judgement.verdict).word,
                                  result.judgement.cause.empty() ? "" : ": " + result.judgement.cause)) +
            "\n";
    if (isExpected && !result.expected->reason.empty())
      text += "reason: " + printable(result.expected->reason) + "\n";
  } else if (result.isWanted && (result.isUnexpected() || result.isFlaky())) {
    text += printable("not new: " + messageOf(result)) + "\n";
  }
  if (const std::string change = changeInWords(result); result.isWanted && !change.empty())
    text += printable(change) + "\n";
  if (result.isRemembered) text += "remembered from an earlier scan\n";
  if (!result.seen) return text;

  const RunSeen& seen = *result.seen;
  text += fmt::format("{} s, {} s of processor time, {:.1f} MiB of memory, sandbox: {}\n",
                      decimal(seen.wallSeconds), decimal(seen.userSeconds + seen.systemSeconds),
                      static_cast<double>(seen.peakMemoryInBytes) / (1 << 20),
                      seen.wasSandboxed ? "bubblewrap" : "none");
  addPrinted(text, seen, 0);
  for (const ProtocolLine& line : seen.lines) {
    if (line.kind != ProtocolLine::Kind::kStep) continue;
    const auto index = static_cast<std::size_t>(line.number - 1);
    const std::vector<double>& all = result.judgement.stepSeconds;
    const bool isTimed = index < all.size() && std::isfinite(all[index]);
    text += fmt::format("{:>11}  {:>2}, {}\n", isTimed ? fmt::format("{:.6f} s", all[index]) : "",
                        line.number, printable(line.text));
    addPrinted(text, seen, line.number);
  }
  return text;
}

void addResult(pugi::xml_node suite, const PluginResult& result, bool namesProcessor) {
  pugi::xml_node test = suite.append_child("testcase");
  setAttribute(test, "classname", folderOf(result.run.bundle));
  setAttribute(test, "name",
               nameOf(result.run, false) + (namesProcessor ? " (" + result.run.target.processor + ")" : ""));
  setAttribute(test, "time", decimal(result.seen ? result.seen->wallSeconds : 0));
  const Outcome outcome = outcomeOf(result);
  if (outcome == Outcome::kSkipped) {
    setAttribute(test.append_child("skipped"), "message", printable(result.judgement.cause));
  } else if (outcome != Outcome::kPassed) {
    pugi::xml_node trouble = test.append_child(outcome == Outcome::kError ? "error" : "failure");
    setAttribute(trouble, "type", typeOf(result));
    setAttribute(trouble, "message", messageOf(result));
    trouble.text() = xmlText(detailsOf(result)).c_str();
  }
  if (const std::string text = systemOut(result); !text.empty()) addText(test, "system-out", text);
}

void addProperties(pugi::xml_node suite, const ScanStarted& started) {
  pugi::xml_node properties = suite.append_child("properties");
  const auto add = [&properties](const char* name, const std::string& value) {
    pugi::xml_node property = properties.append_child("property");
    setAttribute(property, "name", name);
    setAttribute(property, "value", printable(value));
  };
  add("version", started.version);
  add("sandbox", started.sandbox);
  add("part", fmt::format("{} of {}", started.shard.part, started.shard.parts));
  for (const std::string& place : started.places) add("place", place);
}

class StringWriter : public pugi::xml_writer {
 public:
  void write(const void* data, std::size_t size) override {
    text.append(static_cast<const char*>(data), size);
  }
  std::string text;
};

}  // namespace

std::string xmlText(std::string_view text) {
  const std::string valid = validUtf8(text);
  std::string out;
  out.reserve(valid.size());
  for (std::size_t at = 0; at < valid.size();) {
    const std::size_t begin = at;
    const char32_t character = nextCharacter(valid, at);
    if (character == '\r') {
      if (at == valid.size() || valid[at] != '\n') out += '\n';
    } else if (isControl(character) && character != '\n' && character != '\t') {
      out += fmt::format("\\x{:02x}", static_cast<unsigned>(character));
    } else if (character == 0xFFFE || character == 0xFFFF) {
      out += "\xEF\xBF\xBD";
    } else if (isInvisible(character)) {
      out += codeOf(character);
    } else {
      out.append(valid, begin, at - begin);
    }
  }
  return out;
}

std::string junitReport(const ScanReport& report) {
  std::map<std::pair<std::string, std::optional<std::int32_t>>, unsigned> timesNamed;
  Counts counts;
  for (const PluginResult& result : report.results) {
    ++timesNamed[{result.run.bundle, result.run.child}];
    counts.count(outcomeOf(result));
    if (result.seen && std::isfinite(result.seen->wallSeconds)) counts.seconds += result.seen->wallSeconds;
  }
  const std::string missing = incompleteness(report);
  if (!missing.empty()) counts.count(Outcome::kError);

  pugi::xml_document document;
  pugi::xml_node declaration = document.append_child(pugi::node_declaration);
  declaration.append_attribute("version") = "1.0";
  declaration.append_attribute("encoding") = "UTF-8";
  pugi::xml_node suites = document.append_child("testsuites");
  setAttribute(suites, "name", "vsttorture-scan");
  setCounts(suites, counts);
  pugi::xml_node suite = suites.append_child("testsuite");
  setAttribute(suite, "name", printable("vsttorture-scan on " + report.started.machine));
  setCounts(suite, counts);
  setAttribute(suite, "hostname", printable(report.started.machine));
  if (const std::string time = timestamp(report.started.time); !time.empty())
    setAttribute(suite, "timestamp", time);
  addProperties(suite, report.started);
  for (const PluginResult& result : report.results)
    addResult(suite, result, timesNamed[{result.run.bundle, result.run.child}] > 1);
  if (!missing.empty()) {
    pugi::xml_node test = suite.append_child("testcase");
    setAttribute(test, "classname", "vsttorture-scan");
    setAttribute(test, "name", "the scan is whole");
    setAttribute(test, "time", decimal(0));
    pugi::xml_node error = test.append_child("error");
    setAttribute(error, "type", "incomplete");
    setAttribute(error, "message", missing);
  }
  std::string notes;
  for (const std::string& note : report.started.notes) notes += printable(note) + "\n";
  if (!notes.empty()) addText(suite, "system-out", notes);

  StringWriter writer;
  document.save(writer, "  ", pugi::format_indent, pugi::encoding_utf8);
  return std::move(writer.text);
}

}  // namespace scanner
