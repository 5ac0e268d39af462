// SPDX-License-Identifier: MIT
#include "scanner/report/html_details.h"

#include <algorithm>
#include <cmath>
#include <csignal>

#include <fmt/format.h>
#include <nlohmann/json.hpp>

#include "scanner/report/html_text.h"
#include "scanner/report/step_bar.h"
#include "scanner/report/terminal.h"
#include "scanner/report/words.h"

namespace scanner {
namespace {

using nlohmann::json;

/// Of a plug-in that is as wanted little is shown of what it printed, so that the page stays small.
constexpr std::size_t kPrintedOfTheGoodInBytes = 1024;
constexpr std::size_t kProgramsNamed = 8;
/// Longer causes are not whole in the row.
constexpr std::size_t kLongestCause = 300;
constexpr double kRoomForText = 9;    ///< Percent of the bar that the text of a step needs at least,
constexpr double kRoomForNumber = 3;  ///< and its number.

std::string plain(const char* text) { return escaped(text); }

std::string code(std::string_view text) { return "<code>" + escaped(text) + "</code>"; }

std::string requestInWords(const RequestSeen& request) {
  if (request.kind == "load") return "the system loads the module";
  if (request.kind == "entry") return "the module's entry point";
  if (request.kind == "getParameter") return fmt::format("getParameter, parameter {}", request.index);
  if (request.kind == "setParameter")
    return fmt::format("setParameter, parameter {} to {}", request.index, request.opt);
  std::string words = fmt::format("{} ({})", request.name, request.opcode);
  if (request.index != 0) words += fmt::format(", index {}", request.index);
  if (request.value != 0) words += fmt::format(", value {}", request.value);
  if (request.opt != 0) words += fmt::format(", opt {}", request.opt);
  return words;
}

std::string hostRequestInWords(const HostRequestSeen& request) {
  std::string words = request.name;
  if (request.index != 0) words += fmt::format(", index {}", request.index);
  if (request.value != 0) words += fmt::format(", value {}", request.value);
  return words + fmt::format("; {} in all", countInWords(request.count, "request"));
}

std::string placeInWords(const Place& place) {
  return place.module.empty() ? fmt::format("0x{:x}, in no module", place.offset)
                              : fmt::format("{}+0x{:x}", place.module, place.offset);
}

std::string stateInWords(char state) {
  switch (state) {
    case 'R':
      return "running";
    case 'S':
      return "sleeping";
    case 'D':
      return "in a wait that cannot be interrupted";
    case 'T':
      return "stopped";
    case 'Z':
      return "ended";
    default:
      return "in an unknown state";
  }
}

std::string activityInWords(const Activity& activity, const std::optional<bool>& isBusy) {
  std::string words = isBusy ? (*isBusy ? "busy: " : "waiting: ") : "";
  words +=
      fmt::format("used the processor for {} of the last {}, {}", durationInWords(activity.processorSeconds),
                  durationInWords(activity.wallSeconds), stateInWords(activity.state));
  if (!activity.systemCall.empty()) words += " in the system call " + activity.systemCall;
  if (activity.sockets > 0) words += ", " + countInWords(activity.sockets, "open socket");
  return words;
}

std::vector<TimedStep> timedSteps(const PluginResult& result) {
  std::vector<TimedStep> steps;
  if (!result.seen) return steps;
  const std::vector<double>& seconds = result.judgement.stepSeconds;
  for (const ProtocolLine& line : result.seen->lines) {
    if (line.kind != ProtocolLine::Kind::kStep) continue;
    const auto number = static_cast<std::size_t>(std::max(line.number, 0));
    const bool isTimed = number >= 1 && number <= seconds.size();
    steps.push_back({line.number, line.text, isTimed ? seconds[number - 1] : std::nan("")});
  }
  return steps;
}

class Details {
 public:
  explicit Details(const PluginResult& result_)
      : result(result_), row(rowOf(result_.judgement.verdict)), hasPassed(row.isGood && result_.isWanted) {}

  std::string html() {
    out = "<div class=\"details\">\n";
    addCause();
    addBar();
    addFacts();
    addCommand("To repeat it", result.command);
    addShrunk();
    addDiagnosis();
    addPrinted();
    addSteps();
    out += "</div>";
    return std::move(out);
  }

 private:
  void addCause() {
    const Judgement& judgement = result.judgement;
    // The row has it already, unless it is too long for that.
    if (judgement.cause.size() > kLongestCause)
      out += "<p class=\"cause\">" + escaped(judgement.cause) + "</p>\n";
    for (const std::string& sentence : judgement.contradictions)
      out += "<p class=\"contradiction\"><b>Contradiction:</b> " + escaped(sentence) + "</p>\n";
    if (row.isGood) return;
    out += fmt::format("<p class=\"advice\"><b>{}:</b> {} <b>What to do:</b> {}</p>\n", plain(row.word),
                       plain(row.meaning), plain(row.advice));
  }

  void addBar() {
    const std::vector<TimedStep> steps = timedSteps(result);
    if (steps.empty() || result.judgement.stepSeconds.empty()) return;
    const int marked = row.isGood ? 0 : result.judgement.step;
    const std::string label =
        fmt::format("Times of {}{}", countInWords(steps.size(), "step"),
                    marked > 0 ? fmt::format("; step {} is the one that did not end well", marked) : "");
    out += fmt::format("<svg class=\"bar\" role=\"img\" aria-label=\"{}\">", escaped(label));
    bool isOdd = false;
    for (const BarPart& part : barParts(steps, marked)) {
      addBarPart(steps, part, isOdd);
      isOdd = !isOdd;
    }
    out += "</svg>\n";
  }

  void addBarPart(const std::vector<TimedStep>& steps, const BarPart& part, bool isOdd) {
    const TimedStep& first = steps[part.first];
    const bool isOne = part.first == part.last;
    const std::string number = isOne ? std::to_string(first.number)
                                     : fmt::format("{}\xE2\x80\x93{}", first.number, steps[part.last].number);
    const std::string duration = durationInWords(part.seconds);
    const std::string tip = isOne ? fmt::format("Step {}, {}: {}{}", first.number, first.text, duration,
                                                part.isMarked ? " (did not end well)" : "")
                                  : fmt::format("Steps {}: {} together", number, duration);
    std::string text;
    if (part.isMarked) {
      text = fmt::format("\xE2\x9C\x95 {}", number);
    } else if (part.width >= kRoomForNumber) {
      text = number;
    }
    if (part.width >= kRoomForText)
      text += isOne ? fmt::format(" {}, {}", first.text, duration) : ", " + duration;
    out +=
        fmt::format("<svg x=\"{:.2f}%\" width=\"{:.2f}%\"{}><title>{}</title><rect/>", part.begin, part.width,
                    part.isMarked ? " class=\"mark\""
                    : isOdd       ? " class=\"odd\""
                                  : "",
                    escaped(tip));
    if (!text.empty()) out += "<text x=\"5\" y=\"17\">" + escaped(text) + "</text>";
    out += "</svg>";
  }

  void fact(const char* name, const std::string& html) {
    if (!html.empty()) out += fmt::format("<dt>{}</dt><dd>{}</dd>\n", name, html);
  }

  void addFacts() {
    out += "<div class=\"facts\">\n";
    addList(&Details::addWhatHappened);
    addList(&Details::addCircumstances);
    out += "</div>\n";
  }

  /// A list of facts, unless there is none.
  void addList(void (Details::*addFactsOfList)()) {
    const std::string before = std::move(out);
    out.clear();
    (this->*addFactsOfList)();
    out = out.empty() ? before : before + "<dl>\n" + out + "</dl>\n";
  }

  void addWhatHappened() {
    const Judgement& judgement = result.judgement;
    if (judgement.request) {
      fact(judgement.verdict == Verdict::kFailed ? "Request that failed" : "Request under way",
           code(requestInWords(*judgement.request)));
    }
    if (judgement.hostRequest)
      fact("Last request to the host", code(hostRequestInWords(*judgement.hostRequest)));
    if (judgement.place) fact("Place", code(placeInWords(*judgement.place)));
    const bool isMemory = judgement.signal == SIGSEGV || judgement.signal == SIGBUS;
    if (judgement.place && isMemory)
      fact("Could not reach", code(fmt::format("0x{:x}", judgement.place->address)));
    if (judgement.signal)
      fact("Signal", escaped(fmt::format("{} ({})", nameOfSignal(*judgement.signal), *judgement.signal)));
    if (judgement.status && !hasPassed) fact("Exit status", std::to_string(*judgement.status));
    if (result.seen && result.seen->activity)
      fact("Activity", escaped(activityInWords(*result.seen->activity, judgement.isBusy)));
    if (result.expected) addExpected(*result.expected);
    if (result.repetitions) addRepetitions(*result.repetitions);
    if (result.comparison) addComparison(*result.comparison);
  }

  void addExpected(const Expectation& expected) {
    std::string html = escaped(endInWords(expected.verdict, expected.step, " at step ")) +
                       (expected.isMet ? ", and so it ended" : ", <strong>but it ended otherwise</strong>");
    if (!expected.reason.empty()) html += "; reason in the list: " + escaped(expected.reason);
    fact("Expected", html);
  }

  void addRepetitions(const Repetitions& repetitions) {
    std::string ends = endsInWords(repetitions);
    if (repetitions.isFlaky())
      ends += fmt::format("; {:.0f} % of the runs failed", 100 * repetitions.flakeRate());
    fact("Repetitions", escaped(ends));
  }

  void addComparison(const Comparison& comparison) {
    std::string words = changeSentence(comparison.change);
    if (comparison.earlier) {
      const Comparison::Earlier& earlier = *comparison.earlier;
      words += fmt::format("; earlier: {}", endInWords(earlier.verdict, earlier.step, " at step "));
      const std::string time = timeInWords(earlier.time);
      if (!time.empty()) words += ", " + time;
    } else if (comparison.change == Comparison::Change::kNone) {
      words = "seen for the first time";
    } else {
      words += "; seen for the first time";
    }
    fact("Compared", escaped(words));
  }

  [[nodiscard]] std::string changeSentence(Comparison::Change change) const {
    switch (change) {
      case Comparison::Change::kNone:
        return "nothing has changed";
      case Comparison::Change::kNew:
        return "new: it did not fail in this way before";
      case Comparison::Change::kMended:
        return "mended: it did not end as it should before";
      case Comparison::Change::kStillFailing:
        return row.isGood ? "still failing, with no more findings than before"
                          : "still failing, with the verdict that it had before";
      case Comparison::Change::kFlaky:
        return "flaky: it does not always end the same way";
    }
    return {};
  }

  void addCircumstances() {
    fact("File", code(result.run.bundle));
    if (result.run.child) fact("Child", code(fmt::format("{} {}", *result.run.child, result.run.childName)));
    std::string others;
    for (const std::string& name : result.otherNames) others += (others.empty() ? "" : "<br>") + code(name);
    fact("Also found as", others);
    const Target& target = result.run.target;
    if (!target.processor.empty()) fact("Built for", escaped(systemInWords(target) + target.processor));
    if (result.seen) addRun(*result.seen);
    addDescription();
  }

  void addRun(const RunSeen& seen) {
    fact("Run", escaped(fmt::format(
                    "{}, {} of processor time, {} of memory, sandbox: {}{}",
                    durationInWords(seen.wallSeconds), durationInWords(seen.userSeconds + seen.systemSeconds),
                    sizeInWords(seen.peakMemoryInBytes), seen.wasSandboxed ? "bubblewrap" : "none",
                    result.isRemembered ? "; remembered from an earlier scan" : "")));
    fact("Begun", escaped(timeInWords(seen.startedAt)));
    addLeftBehind(seen.leftBehind);
  }

  static std::string systemInWords(const Target& target) {
    switch (target.system) {
      case Target::System::kLinux:
        return "Linux, ";
      case Target::System::kMacOs:
        return "macOS, ";
      case Target::System::kWindows:
        return "Windows, ";
    }
    return "";
  }

  void addLeftBehind(const LeftBehind& left) {
    std::string html;
    const auto add = [&html](const std::string& more) { html += (html.empty() ? "" : ", ") + more; };
    const auto processes = [](std::size_t count) {
      return fmt::format("{} {}", count, count == 1 ? "process" : "processes");
    };
    if (left.processes > 0) add(processes(left.processes));
    if (!left.unkillable.empty()) add(processes(left.unkillable.size()) + " that SIGKILL did not end");
    if (!left.folder.empty()) add("the folder " + code(left.folder));
    if (left.sharedMemory > 0) add(countInWords(left.sharedMemory, "segment") + " of shared memory");
    if (left.fileCount > 0 || !left.files.empty()) {
      add(fmt::format("{} of {}", countInWords(left.fileCount, "file"), sizeInWords(left.fileBytes)));
      std::string names;
      for (const std::string& name : left.files) names += (names.empty() ? ": " : ", ") + code(name);
      html += names;
      if (left.fileCount > left.files.size()) html += " and others";
    }
    fact("Left behind", html);
  }

  void addCommand(const char* title, const std::vector<std::string>& command) {
    if (command.empty()) return;
    out += fmt::format("<h3>{}</h3>\n<pre class=\"command\">{}</pre>\n", title,
                       escaped(shellCommand(command), LineBreaks::kKept));
  }

  void addShrunk() {
    if (!result.shrunk) return;
    const Shrunk& shrunk = *result.shrunk;
    out += "<h3>Shortest list of tests that fails</h3>\n";
    if (shrunk.isReproduced) {
      out += fmt::format("<p>{} of {}, found in {}</p>\n", code(shrunk.tests), code(shrunk.from),
                         countInWords(shrunk.runs, "run"));
    } else {
      out += fmt::format("<p>None was found in {}</p>\n", countInWords(shrunk.runs, "run"));
    }
    if (!shrunk.problem.empty()) out += "<p>" + escaped(shrunk.problem) + "</p>\n";
    addCommand("To repeat it with this list", shrunk.command);
  }

  void addDiagnosis() {
    if (!result.diagnosis) return;
    const Diagnosis& diagnosis = *result.diagnosis;
    out += "<h3>Under " + escaped(diagnosis.tool) + "</h3>\n";
    if (!diagnosis.problem.empty()) out += "<p>" + escaped(diagnosis.problem) + "</p>\n";
    if (diagnosis.problem.empty() && diagnosis.findings.empty()) out += "<p>It found nothing.</p>\n";
    std::size_t others = 0;
    for (const Diagnosis::Finding& finding : diagnosis.findings) {
      if (finding.isInPlugin) addFinding(finding);
      if (!finding.isInPlugin) ++others;
    }
    if (others > 0) {
      out += fmt::format("<details><summary>{} in which the plug-in has no part</summary>\n",
                         countInWords(others, "finding"));
      for (const Diagnosis::Finding& finding : diagnosis.findings) {
        if (!finding.isInPlugin) addFinding(finding);
      }
      out += "</details>\n";
    }
    if (!diagnosis.report.empty()) {
      out += fmt::format("<details><summary>What {} said, {}</summary><pre>{}</pre></details>\n",
                         escaped(diagnosis.tool), sizeInWords(diagnosis.report.size()),
                         escaped(diagnosis.report, LineBreaks::kKept));
    }
    addCommand("To repeat this", diagnosis.command);
  }

  void addFinding(const Diagnosis::Finding& finding) {
    out +=
        "<div class=\"finding\"><p><b>" + escaped(finding.kind) + "</b> " + escaped(finding.text) + "</p>\n";
    if (!finding.frames.empty()) {
      out += "<ol>";
      for (const std::string& frame : finding.frames) out += "<li>" + code(frame) + "</li>";
      out += "</ol>";
    }
    out += "</div>\n";
  }

  void addPrinted() {
    if (!result.seen || result.seen->texts.empty()) return;
    std::size_t room = hasPassed ? kPrintedOfTheGoodInBytes : std::string::npos;
    std::size_t leftOut = 0;
    std::string texts;
    for (const PluginText& text : result.seen->texts) {
      const std::string_view bytes = std::string_view(text.bytes).substr(0, room);
      leftOut += text.bytes.size() - bytes.size();
      if (room != std::string::npos) room -= bytes.size();
      if (bytes.empty()) continue;
      texts += fmt::format("<h4>{}, standard {}</h4><pre>{}</pre>\n",
                           text.step == 0 ? "Before the first step" : fmt::format("Step {}", text.step),
                           text.isStandardError ? "error" : "output", escaped(bytes, LineBreaks::kKept));
    }
    out += fmt::format("<details><summary>What it printed, {} with the lines of the run</summary>\n{}",
                       sizeInWords(result.seen->outputBytes), texts);
    if (leftOut > 0)
      out += "<p>The next " + sizeInWords(leftOut) + " are in the events of the scan (--json).</p>\n";
    out += "</details>\n";
  }

  void addSteps() {
    const std::vector<TimedStep> steps = timedSteps(result);
    if (steps.empty()) return;
    out += "<details><summary>" + countInWords(steps.size(), "step") +
           " with times</summary><pre class=\"steps\">";
    if (hasPassed) {
      for (const BarPart& part : barParts(steps, 0))
        addStepLine(steps[part.first], steps[part.last], part.seconds);
    } else {
      for (const TimedStep& step : steps) addStepLine(step, step, step.seconds);
    }
    out += "</pre>";
    if (result.judgement.testsRun && !hasPassed)
      out += "<p>The random tests, as --tests takes them: " + code(*result.judgement.testsRun) + "</p>";
    out += "</details>\n";
  }

  /// One step, or several in a row that were short.
  void addStepLine(const TimedStep& first, const TimedStep& last, double seconds) {
    const bool isOne = first.number == last.number;
    const std::string duration = seconds >= 0 ? escaped(durationInWords(seconds)) : "not known";
    const std::string line = isOne ? fmt::format("{:>2} {}\t{}", first.number, escaped(first.text), duration)
                                   : fmt::format("{:>2} to {}\t{}", first.number, last.number, duration);
    out += !row.isGood && isOne && first.number == result.judgement.step ? "<mark>" + line + "</mark>\n"
                                                                         : line + "\n";
  }

  /// The describer ran the plug-in's code, so its object may hold anything.
  void addDescription() {
    if (!result.description) return;
    const json object = json::parse(*result.description, nullptr, false);
    if (!object.is_object()) return;
    const auto text = [](const json& holder, const char* name) {
      const auto member = holder.find(name);
      return member != holder.end() && member->is_string() ? member->get<std::string>() : std::string();
    };
    const auto inner = [&object](const char* name) {
      const auto member = object.find(name);
      return member != object.end() && member->is_object() ? *member : json::object();
    };
    const auto count = [&object](const char* name) {
      const auto member = object.find(name);
      return member != object.end() && member->is_array() ? member->size() : 0;
    };
    std::string who = text(object, "name");
    if (const std::string maker = text(object, "maker"); !maker.empty())
      who += (who.empty() ? "by " : ", by ") + maker;
    fact("Name", who.empty() ? "" : isolated(clipped(who, 400)));
    std::string kind = text(inner("category"), "name");
    if (const std::string identifier = text(inner("uniqueId"), "text"); !identifier.empty())
      kind += (kind.empty() ? "" : ", ") + std::string("identifier ") + identifier;
    fact("Category", escaped(clipped(kind, 400)));
    fact("Has",
         fmt::format("{}, {}, {}, {}", countInWords(count("inputs"), "input"),
                     countInWords(count("outputs"), "output"), countInWords(count("parameters"), "parameter"),
                     countInWords(count("programs"), "program")));
    if (count("programs") > 1) addPrograms(object.at("programs"));
  }

  void addPrograms(const json& programs) {
    std::string html;
    std::size_t named = 0;
    for (const json& program : programs) {
      if (named == kProgramsNamed) break;
      if (!program.is_string()) continue;  // Null where the plug-in does not tell.
      const auto name = program.get<std::string>();
      html += (html.empty() ? "" : ", ") + escaped(clipped(name, 80));
      ++named;
    }
    if (named > 0 && programs.size() > named) html += fmt::format(" and {} more", programs.size() - named);
    fact("Programs", html);
  }

  const PluginResult& result;
  const VerdictRow& row;
  const bool hasPassed;
  std::string out;
};

}  // namespace

std::string htmlDetails(const PluginResult& result) { return Details(result).html(); }

bool endsDifferently(const PluginResult& result) {
  return result.isFlaky() || (result.comparison && result.comparison->change == Comparison::Change::kFlaky);
}

}  // namespace scanner
