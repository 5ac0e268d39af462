// SPDX-License-Identifier: MIT
#include "scanner/report/terminal.h"

#include <algorithm>

#include <fmt/format.h>

#include "scanner/events/event_json.h"
#include "scanner/report/characters.h"
#include "scanner/report/words.h"

namespace scanner {
namespace {

constexpr std::size_t kWordColumns = 12;
constexpr std::size_t kTimeColumns = 9;
constexpr std::size_t kIndent = 2;
constexpr unsigned kFewestColumns = 20;
/// Below so many columns a line has neither time nor folder.
constexpr unsigned kNarrow = 60;
constexpr std::size_t kMostMendedNamed = 10;
/// Of a tool's findings, and of the frames of each.
constexpr std::size_t kMostFindings = 3;
constexpr std::size_t kMostFrames = 5;

constexpr const char* kGreen = "\x1b[32m";
constexpr const char* kRed = "\x1b[31m";
constexpr const char* kYellow = "\x1b[33m";
constexpr const char* kPlain = "\x1b[0m";
constexpr const char* kClearLine = "\r\x1b[K";

std::size_t columnsOf(const std::string& text) {
  std::size_t columns = 0;
  for (std::size_t at = 0; at < text.size();) columns += widthOf(nextCharacter(text, at));
  return columns;
}

/// The byte behind the characters that fit into so many columns, with the marks that are put on the last of
/// them.
std::size_t byteOf(const std::string& text, std::size_t columns) {
  std::size_t used = 0;
  for (std::size_t at = 0; at < text.size();) {
    const std::size_t begin = at;
    used += widthOf(nextCharacter(text, at));
    if (used > columns) return begin;
  }
  return text.size();
}

/// The last characters of the text that fit into so many columns.
std::string endOf(const std::string& text, std::size_t columns) {
  std::size_t left = columnsOf(text);
  std::size_t at = 0;
  while (at < text.size()) {
    std::size_t next = at;
    const std::size_t own = widthOf(nextCharacter(text, next));
    if (left <= columns && own > 0) break;
    left -= own;
    at = next;
  }
  return text.substr(at);
}

/// "$'a\\033b'", which shells take for the bytes themselves.
std::string quotedByNumbers(const std::string& argument) {
  std::string quoted = "$'";
  for (const char c : argument) {
    if (c == '\'' || c == '\\') {
      quoted += {'\\', c};
    } else if (c >= 0x20 && c < 0x7F) {
      quoted += c;
    } else {
      quoted += fmt::format("\\{:03o}", static_cast<unsigned char>(c));
    }
  }
  return quoted + '\'';
}

/// Whether it has a place in the table at the end.
bool isRemarkable(const PluginResult& result) {
  const bool changesByItself = result.comparison && result.comparison->change == Comparison::Change::kFlaky;
  const bool isExplained =
      result.diagnosis && (!result.diagnosis->findings.empty() || !result.diagnosis->problem.empty());
  // What was expected needs no second look.
  if (result.expected && result.expected->isMet && !result.isFlaky()) return false;
  return !rowOf(result.judgement.verdict).isGood || result.isFlaky() || changesByItself || isExplained ||
         !result.isWanted;
}

}  // namespace

TerminalReport::TerminalReport(const TerminalOptions& options_,
                               std::function<bool(const std::string&)> write_)
    : options(options_), write(std::move(write_)) {
  setColumns(options.columns);
}

void TerminalReport::setColumns(unsigned columns) { options.columns = std::max(columns, kFewestColumns); }

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
  print(wrapped(fmt::format("{}{}, {} at a time, sandbox: {}", countInWords(scan.plugins, "plug-in"), part,
                            scan.jobs, scan.sandbox),
                options.columns, kIndent) +
        "\n");
}

void TerminalReport::ended(const PluginResult& result) {
  if (result.isRemembered) ++remembered;
  if (result.comparison && result.comparison->change == Comparison::Change::kMended &&
      ++mendedInAll <= kMostMendedNamed)
    mended.push_back(nameOf(result.run, false));
  if (isRemarkable(result)) {
    remarkable.push_back(result);
    // What it printed and the like is not shown, and would be kept for each of many.
    remarkable.back().seen.reset();
    remarkable.back().description.reset();
    if (result.diagnosis) remarkable.back().diagnosis->report.clear();
  }
  if (!options.isQuiet || !result.isWanted) print(lineOf(result));
}

std::string TerminalReport::lineOf(const PluginResult& result) const {
  const VerdictRow& row = rowOf(result.judgement.verdict);
  std::string word = fmt::format("{:<{}}", result.isFlaky() ? "flaky" : row.word, kWordColumns);
  if (columnsOf(word) > kWordColumns) word += ' ';
  const bool isNarrow = options.columns < kNarrow;
  std::string time(isNarrow ? 0 : kTimeColumns + 2, ' ');
  if (result.seen && !result.isRemembered && !isNarrow)
    time = fmt::format("{:>{}}  ", durationInWords(result.seen->wallSeconds), kTimeColumns);
  std::string remark;
  if (!row.isGood && result.expected && result.expected->isMet) remark += "  as expected";
  if (row.isGood && result.hasFindings()) remark += "  with findings of " + printable(result.diagnosis->tool);
  if (result.isRemembered) remark += "  (remembered)";

  std::string name = printable(nameOf(result.run, !isNarrow));
  if (options.isTerminal) {
    const std::size_t used = columnsOf(word) + columnsOf(time);
    const std::size_t room = options.columns > used ? options.columns - used : 1;
    if (columnsOf(name) + columnsOf(remark) > room) remark.clear();
    name = shortened(name, room);
  }
  return coloured(word, result.judgement.verdict, result.isWanted && !result.isFlaky()) + time + name +
         remark + "\n";
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
  if (!diagnosis.command.empty()) text += commandLine("under " + diagnosis.tool, diagnosis.command);
  return text;
}

std::string TerminalReport::shrunkText(const Shrunk& shrunk) const {
  if (!shrunk.isReproduced) return indented("shortest list of tests: " + shrunk.problem, kIndent);
  const auto count = [](const std::string& tests) {
    return std::count(tests.begin(), tests.end(), ',') + (tests.empty() ? 0 : 1);
  };
  std::string text = fmt::format("shortest list of tests: {} of {}, found in {}", count(shrunk.tests),
                                 count(shrunk.from), countInWords(shrunk.runs, "run"));
  if (!shrunk.problem.empty()) text += "; " + shrunk.problem;
  return indented(text, kIndent) + commandLine("shortest", shrunk.command);
}

std::string TerminalReport::blockOf(const PluginResult& result) const {
  const std::string word = rowOf(result.judgement.verdict).word;
  const std::string heading =
      wrapped(word + "  " + printable(nameOf(result.run, true)), options.columns, kIndent) + "\n";
  std::string block = coloured(word, result.judgement.verdict, result.isWanted) + heading.substr(word.size());
  const auto add = [&](const std::string& text) {
    if (!text.empty()) block += indented(text, kIndent);
  };
  add(result.judgement.cause);
  if (result.isUnexpected()) add("expected: " + endInWords(result.expected->verdict, result.expected->step));
  if (result.isFlaky()) {
    add(fmt::format("flaky: {:.0f} % of the runs failed: {}", result.repetitions->flakeRate() * 100,
                    endsInWords(*result.repetitions)));
  } else {
    add(changeInWords(result));
  }
  for (const std::string& contradiction : result.judgement.contradictions) add("note: " + contradiction);
  if (result.diagnosis) block += diagnosisText(*result.diagnosis);
  if (result.shrunk) block += shrunkText(*result.shrunk);
  if (!result.command.empty()) block += commandLine("again", result.command);
  return block;
}

std::string TerminalReport::commandLine(const std::string& what, const std::vector<std::string>& command) {
  return std::string(kIndent, ' ') + printable(what + ": " + shellCommand(command)) + "\n";
}

std::string TerminalReport::mendedText() const {
  if (mended.empty()) return {};
  std::string names;
  for (const std::string& name : mended) names += (names.empty() ? "" : ", ") + printable(name);
  if (mendedInAll > mended.size()) names += fmt::format(" and {} more", mendedInAll - mended.size());
  return wrapped("mended: " + names, options.columns, kIndent) + "\n";
}

std::string TerminalReport::summaryOf(const ScanEnded& scan) const {
  std::size_t total = 0;
  std::string counts;
  for (const VerdictRow& row : verdictTable()) {
    const auto found = scan.counts.find(row.word);
    if (found == scan.counts.end() || found->second == 0) continue;
    total += found->second;
    counts += fmt::format("{}{} {}", counts.empty() ? "" : ", ", found->second, row.word);
  }
  std::string summary = fmt::format("{}{}{}, in {}", countInWords(total, "result"),
                                    counts.empty() ? "" : ": ", counts, durationInWords(scan.wallSeconds));
  if (remembered > 0)
    summary += remembered == total ? "; all remembered" : fmt::format("; {} remembered", remembered);
  if (scan.isInterrupted) summary += "; interrupted";
  return wrapped(summary, options.columns, kIndent) + "\n";
}

void TerminalReport::ended(const ScanEnded& scan) {
  clearProgress();
  if (!remarkable.empty()) print("\n");
  for (const PluginResult& result : remarkable) print(blockOf(result));
  if (!remarkable.empty()) print("\n");
  if (const std::string text = mendedText(); !text.empty()) print(text);
  print(summaryOf(scan));
}

void TerminalReport::progress(std::size_t done, std::size_t total, double secondsLeft,
                              const std::vector<std::string>& running) {
  if (!options.isTerminal || !options.showsProgress) return;
  std::string line = fmt::format("{}/{}", done, total);
  if (secondsLeft > 0) line += ", " + durationInWords(secondsLeft) + " left";
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
  const bool isPlain = std::all_of(text.begin(), text.end(), [](char c) { return c >= 0x20 && c < 0x7F; });
  if (isPlain) return text;
  const std::string valid = validUtf8(text);
  std::string line;
  for (std::size_t at = 0; at < valid.size();) {
    const std::size_t begin = at;
    const char32_t character = nextCharacter(valid, at);
    if (isControl(character)) {
      line += '?';
    } else if (isInvisible(character)) {
      line += codeOf(character);
    } else {
      line.append(valid, begin, at - begin);
    }
  }
  return line;
}

std::string shortened(const std::string& text, std::size_t columns) {
  constexpr const char* kGap = "...";
  if (columnsOf(text) <= columns) return text;
  if (columns <= 3) return text.substr(0, byteOf(text, columns));
  // More of the end: that is where a path has its name.
  const std::size_t head = (columns - 3) / 3;
  const std::size_t tail = columns - 3 - head;
  return text.substr(0, byteOf(text, head)) + kGap + endOf(text, tail);
}

std::string wrapped(const std::string& text, std::size_t columns, std::size_t indent) {
  std::string out;
  std::string rest = text;
  std::size_t room = std::max<std::size_t>(columns, 1);
  while (columnsOf(rest) > room) {
    std::size_t limit = byteOf(rest, room);
    if (limit == 0) nextCharacter(rest, limit);  // Wider than the line.
    if (limit == rest.size()) break;
    std::size_t at = rest.rfind(' ', limit);
    const bool isAtBlank = at != std::string::npos && at > 0;
    if (!isAtBlank) at = limit;
    const std::string line = rest.substr(0, at);
    out += line.substr(0, line.find_last_not_of(' ') + 1) + "\n" + std::string(indent, ' ');
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
    } else if (printable(argument) != argument) {
      line += quotedByNumbers(argument);
    } else {
      line += '\'';
      for (const char c : argument) line += c == '\'' ? std::string("'\\''") : std::string(1, c);
      line += '\'';
    }
  }
  return line;
}

}  // namespace scanner
