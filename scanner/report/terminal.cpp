// SPDX-License-Identifier: MIT
#include "scanner/report/terminal.h"

#include <algorithm>
#include <cmath>

#include <fmt/format.h>

#include "scanner/events/event_json.h"

namespace scanner {
namespace {

constexpr std::size_t kWordColumns = 12;
constexpr std::size_t kTimeColumns = 8;
constexpr std::size_t kIndent = 2;
constexpr std::size_t kFewestColumns = 20;
constexpr std::size_t kMostMendedNamed = 10;
/// Of a tool's findings, and of the frames of each.
constexpr std::size_t kMostFindings = 3;
constexpr std::size_t kMostFrames = 5;

constexpr const char* kGreen = "\x1b[32m";
constexpr const char* kRed = "\x1b[31m";
constexpr const char* kYellow = "\x1b[33m";
constexpr const char* kPlain = "\x1b[0m";
constexpr const char* kClearLine = "\r\x1b[K";

bool isContinuation(char c) { return (static_cast<unsigned char>(c) & 0xC0U) == 0x80U; }

/// One column for each character: near enough for names and paths.
std::size_t columnsOf(const std::string& text) {
  return static_cast<std::size_t>(
      std::count_if(text.begin(), text.end(), [](char c) { return !isContinuation(c); }));
}

/// The byte where character number `n` begins.
std::size_t byteOf(const std::string& text, std::size_t n) {
  std::size_t at = 0;
  while (at < text.size() && n > 0) {
    ++at;
    while (at < text.size() && isContinuation(text[at])) ++at;
    --n;
  }
  return at;
}

std::string fileName(const std::string& path) {
  const std::size_t end = path.find_last_not_of('/');
  const std::string plain = end == std::string::npos ? path : path.substr(0, end + 1);
  const std::size_t slash = plain.rfind('/');
  return slash == std::string::npos ? plain : plain.substr(slash + 1);
}

std::string secondsInWords(double seconds) {
  if (seconds < 10) return fmt::format("{:.1f} s", seconds);
  if (seconds < 100) return fmt::format("{:.0f} s", seconds);
  if (seconds < 3600) return fmt::format("{:.0f} min", seconds / 60);
  return fmt::format("{:.1f} h", seconds / 3600);
}

bool isGoodWord(const std::string& word) {
  const std::vector<VerdictRow>& rows = verdictTable();
  return std::any_of(rows.begin(), rows.end(),
                     [&](const VerdictRow& row) { return row.isGood && word == row.word; });
}

/// What has changed since the last scan, in a sentence; empty for nothing.
std::string changeInWords(const PluginResult& result) {
  if (!result.comparison || result.judgement.verdict == Verdict::kNotRun) return {};
  const std::optional<Comparison::Earlier>& earlier = result.comparison->earlier;
  const std::string before = !earlier ? std::string()
                             : earlier->step && !isGoodWord(earlier->verdict)
                                 ? fmt::format("{} at {}", earlier->verdict, *earlier->step)
                                 : earlier->verdict;
  switch (result.comparison->change) {
    case Comparison::Change::kNew:
      return earlier ? "new: it was \"" + before + "\" before" : "new: it was not there before";
    case Comparison::Change::kStillFailing:
      return "still failing";
    case Comparison::Change::kFlaky:
      return earlier && earlier->verdict != rowOf(result.judgement.verdict).word
                 ? "flaky: it was \"" + before + "\" before, and nothing has changed since"
                 : "";
    case Comparison::Change::kMended:
    case Comparison::Change::kNone:
      break;
  }
  return {};
}

}  // namespace

TerminalReport::TerminalReport(const TerminalOptions& options_,
                               std::function<bool(const std::string&)> write_)
    : options(options_), write(std::move(write_)) {
  options.columns = std::max(options.columns, static_cast<unsigned>(kFewestColumns));
}

void TerminalReport::print(const std::string& text) {
  clearProgress();
  write(text);
}

void TerminalReport::clearProgress() {
  if (!hasProgressLine) return;
  hasProgressLine = false;
  write(kClearLine);
}

std::string TerminalReport::coloured(const std::string& text, Verdict verdict, bool isWanted) const {
  if (!options.hasColours) return text;
  const char* colour = !isWanted ? kRed : rowOf(verdict).isGood ? kGreen : kYellow;
  return colour + text + kPlain;
}

void TerminalReport::started(const ScanStarted& scan) {
  for (const std::string& note : scan.notes) print(wrapped(printable(note), options.columns, kIndent) + "\n");
  if (options.isQuiet) return;
  const std::string part =
      scan.shard.parts > 1 ? fmt::format(", part {} of {}", scan.shard.part, scan.shard.parts) : "";
  print(wrapped(fmt::format("{} {}{}, {} at a time, sandbox: {}", scan.plugins,
                            scan.plugins == 1 ? "plug-in" : "plug-ins", part, scan.jobs, scan.sandbox),
                options.columns, kIndent) +
        "\n");
}

void TerminalReport::ended(const PluginResult& result) {
  const bool isGood = rowOf(result.judgement.verdict).isGood;
  const bool isFlaky = result.repetitions && result.repetitions->isFlaky();
  const bool isExpected = result.expected && result.expected->isMet;
  const bool changesByItself = result.comparison && result.comparison->change == Comparison::Change::kFlaky;
  if (result.isRemembered) ++remembered;
  if (result.comparison && result.comparison->change == Comparison::Change::kMended &&
      ++mendedInAll <= kMostMendedNamed)
    mended.push_back(nameOf(result.run, false));
  const bool isExplained =
      result.diagnosis && (!result.diagnosis->findings.empty() || !result.diagnosis->problem.empty());
  if (!isGood || isFlaky || changesByItself || isExplained || !result.isWanted) {
    remarkable.push_back(result);
    // What it printed and the like is not shown, and would be kept for each of many.
    remarkable.back().seen.reset();
    remarkable.back().description.reset();
    if (result.diagnosis) remarkable.back().diagnosis->report.clear();
  }
  if (options.isQuiet && result.isWanted) return;

  std::string word = rowOf(result.judgement.verdict).word;
  if (isFlaky) word = "flaky";
  std::string line = fmt::format("{:<{}}", word, kWordColumns);
  if (columnsOf(line) > kWordColumns) line += ' ';
  std::string time(kTimeColumns + 2, ' ');
  if (result.seen && !result.isRemembered)
    time = fmt::format("{:>{}}  ", secondsInWords(result.seen->wallSeconds), kTimeColumns);
  const bool isNarrow = options.columns < 60;
  if (isNarrow) time.clear();
  const std::string name = printable(nameOf(result.run, !isNarrow));
  const std::size_t used = columnsOf(line) + columnsOf(time);
  const std::size_t room = options.columns > used ? options.columns - used : 1;
  std::string remark = isExpected && !isGood ? "  as expected" : "";
  if (isGood && result.diagnosis && result.diagnosis->hasFindings())
    remark = "  with findings of " + printable(result.diagnosis->tool);
  if (result.isRemembered) remark += "  (remembered)";
  if (options.isTerminal && columnsOf(name) + remark.size() > room) remark.clear();
  print(coloured(line, result.judgement.verdict, result.isWanted && !isFlaky) + time +
        shortened(name, options.isTerminal ? room : name.size()) + remark + "\n");
}

std::string TerminalReport::indented(const std::string& text, std::size_t depth) const {
  const std::size_t columns = options.columns > depth ? options.columns - depth : 1;
  return std::string(depth, ' ') + wrapped(printable(text), columns, depth) + "\n";
}

std::string TerminalReport::diagnosisText(const Diagnosis& diagnosis) const {
  std::string text;
  std::size_t shown = 0;
  for (const Diagnosis::Finding& finding : diagnosis.findings) {
    if (shown++ == kMostFindings) break;
    const char* place = finding.isInPlugin ? "" : ", not in the plug-in";
    text += indented(fmt::format("{}{}: {}", diagnosis.tool, place, finding.text), kIndent);
    for (std::size_t i = 0; i < std::min(finding.frames.size(), kMostFrames); ++i) {
      const std::size_t depth = 2 * kIndent;
      const std::size_t room = options.columns > depth ? options.columns - depth : 1;
      text += std::string(depth, ' ') + shortened(printable(finding.frames[i]), room) + "\n";
    }
  }
  const std::size_t more = diagnosis.findings.size() - std::min(diagnosis.findings.size(), kMostFindings);
  if (more > 0) text += indented(fmt::format("{}: {} more of them", diagnosis.tool, more), kIndent);
  if (!diagnosis.problem.empty()) text += indented(diagnosis.tool + ": " + diagnosis.problem, kIndent);
  if (!diagnosis.command.empty())
    text += "  " + printable("under " + diagnosis.tool + ": " + shellCommand(diagnosis.command)) + "\n";
  return text;
}

std::string TerminalReport::shrunkText(const Shrunk& shrunk) const {
  if (!shrunk.isReproduced) return indented("shortest list of tests: " + shrunk.problem, kIndent);
  const auto count = [](const std::string& tests) {
    return std::count(tests.begin(), tests.end(), ',') + (tests.empty() ? 0 : 1);
  };
  std::string text = fmt::format("shortest list of tests: {} of {}, found in {} {}", count(shrunk.tests),
                                 count(shrunk.from), shrunk.runs, shrunk.runs == 1 ? "run" : "runs");
  if (!shrunk.problem.empty()) text += "; " + shrunk.problem;
  return indented(text, kIndent) + "  " + printable("shortest: " + shellCommand(shrunk.command)) + "\n";
}

void TerminalReport::ended(const ScanEnded& scan) {
  clearProgress();
  bool isFirst = true;
  for (const PluginResult& result : remarkable) {
    // What was expected needs no second look.
    const bool isFlaky = result.repetitions && result.repetitions->isFlaky();
    if (result.expected && result.expected->isMet && !isFlaky) continue;
    if (isFirst) print("\n");
    isFirst = false;
    const std::string word = rowOf(result.judgement.verdict).word;
    const std::size_t columns = options.columns;
    const std::string indent(kIndent, ' ');
    std::string block =
        coloured(word, result.judgement.verdict, result.isWanted) + "  " +
        wrapped(printable(nameOf(result.run, true)), columns > 14 ? columns - 14 : 1, kIndent) + "\n";
    const auto add = [&](const std::string& text) {
      block += indent + wrapped(printable(text), columns - kIndent, kIndent) + "\n";
    };
    if (!result.judgement.cause.empty()) add(result.judgement.cause);
    if (result.expected && !result.expected->isMet) {
      add(fmt::format("expected: {}{}", result.expected->verdict,
                      result.expected->step ? fmt::format(" at {}", *result.expected->step) : ""));
    }
    if (isFlaky) {
      std::string ends;
      for (const auto& [end, count] : result.repetitions->verdicts) {
        ends += fmt::format("{}{} of {} {}", ends.empty() ? "" : ", ", count, result.repetitions->runs, end);
      }
      add(fmt::format("flaky: {:.0f} % of the runs failed: {}", result.repetitions->flakeRate() * 100, ends));
    }
    if (const std::string change = changeInWords(result); !change.empty()) add(change);
    for (const std::string& contradiction : result.judgement.contradictions) add("note: " + contradiction);
    if (result.diagnosis) block += diagnosisText(*result.diagnosis);
    if (result.shrunk) block += shrunkText(*result.shrunk);
    if (!result.command.empty()) block += indent + printable("again: " + shellCommand(result.command)) + "\n";
    print(block);
  }

  std::size_t total = 0;
  std::string counts;
  for (const VerdictRow& row : verdictTable()) {
    const auto found = scan.counts.find(row.word);
    if (found == scan.counts.end() || found->second == 0) continue;
    total += found->second;
    counts += fmt::format("{}{} {}", counts.empty() ? "" : ", ", found->second, row.word);
  }
  std::string summary = fmt::format("{} {}{}{}, in {}", total, total == 1 ? "result" : "results",
                                    counts.empty() ? "" : ": ", counts, secondsInWords(scan.wallSeconds));
  if (remembered > 0)
    summary += remembered == total ? "; all remembered" : fmt::format("; {} remembered", remembered);
  if (scan.isInterrupted) summary += "; interrupted";
  if (!isFirst) print("\n");
  if (mendedInAll > 0) {
    std::string names;
    for (const std::string& name : mended) names += (names.empty() ? "" : ", ") + printable(name);
    if (mendedInAll > mended.size()) names += fmt::format(" and {} more", mendedInAll - mended.size());
    print(wrapped("mended: " + names, options.columns, kIndent) + "\n");
  }
  print(wrapped(summary, options.columns, kIndent) + "\n");
}

void TerminalReport::progress(std::size_t done, std::size_t total, double secondsLeft,
                              const std::vector<std::string>& running) {
  if (!options.isTerminal || !options.showsProgress) return;
  std::string line = fmt::format("{}/{}", done, total);
  if (secondsLeft > 0) line += ", " + secondsInWords(secondsLeft) + " left";
  for (const std::string& name : running) line += "  " + printable(name);
  // The last column stays free: some terminals begin a new line there.
  write(kClearLine + shortened(line, options.columns - 1));
  hasProgressLine = true;
}

std::string nameOf(const Run& run, bool withFolder) {
  std::string name = withFolder ? run.bundle : fileName(run.bundle);
  if (run.child) {
    name += fmt::format(" #{}", *run.child);
    if (!run.childName.empty()) name += " " + run.childName;
  }
  return name;
}

std::string printable(const std::string& text) {
  std::string line;
  for (const char c : validUtf8(text)) {
    const auto byte = static_cast<unsigned char>(c);
    line += byte < 0x20 || byte == 0x7F ? '?' : c;
  }
  // The C1 control characters, U+0080 to U+009F, are control codes to some terminals.
  for (std::size_t at = line.find('\xC2'); at != std::string::npos; at = line.find('\xC2', at + 1)) {
    if (at + 1 < line.size() && static_cast<unsigned char>(line[at + 1]) < 0xA0) line.replace(at, 2, "?");
  }
  return line;
}

std::string shortened(const std::string& text, std::size_t columns) {
  constexpr const char* kGap = "...";
  const std::size_t length = columnsOf(text);
  if (length <= columns) return text;
  if (columns <= 3) return text.substr(0, byteOf(text, columns));
  // More of the end: that is where a path has its name.
  const std::size_t head = (columns - 3) / 3;
  const std::size_t tail = columns - 3 - head;
  return text.substr(0, byteOf(text, head)) + kGap + text.substr(byteOf(text, length - tail));
}

std::string wrapped(const std::string& text, std::size_t columns, std::size_t indent) {
  std::string out;
  std::string rest = text;
  std::size_t room = std::max<std::size_t>(columns, 1);
  while (columnsOf(rest) > room) {
    const std::size_t limit = byteOf(rest, room);
    std::size_t at = rest.rfind(' ', limit);
    const bool isAtBlank = at != std::string::npos && at > 0;
    if (!isAtBlank) at = limit;
    out += rest.substr(0, at) + "\n" + std::string(indent, ' ');
    rest = rest.substr(isAtBlank ? at + 1 : at);
    room = columns > indent ? columns - indent : 1;
  }
  return out + rest;
}

std::string shellCommand(const std::vector<std::string>& command) {
  static const std::string harmless =
      "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789_-+=./,:@%";
  std::string line;
  for (const std::string& argument : command) {
    if (!line.empty()) line += ' ';
    if (!argument.empty() && argument.find_first_not_of(harmless) == std::string::npos) {
      line += argument;
      continue;
    }
    line += '\'';
    for (const char c : argument) line += c == '\'' ? std::string("'\\''") : std::string(1, c);
    line += '\'';
  }
  return line;
}

}  // namespace scanner
