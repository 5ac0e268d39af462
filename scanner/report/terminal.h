// SPDX-License-Identifier: MIT
// The report for people: a line for each plug-in as it ends, progress in place, and at the end everything
// that is not as it should be, with the cause in words and the command that repeats it.
//
// Control codes are used on a terminal only, colours only there and without NO_COLOR. Texts of plug-ins and
// names of files are shown without control characters, and without those that would reorder or hide others.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "scanner/events/result.h"

namespace scanner {

struct TerminalOptions {
  bool isTerminal = false;
  bool hasColours = false;
  bool showsProgress = false;  ///< In place; on a terminal only.
  bool isQuiet = false;        ///< No line for a plug-in that is as wanted.
  unsigned columns = 80;
};

class TerminalReport {
 public:
  /// `write` gets finished pieces of text; false from it means that nobody reads any more.
  TerminalReport(const TerminalOptions& options, std::function<bool(const std::string&)> write);

  /// When the terminal's window has another width.
  void setColumns(unsigned columns);

  void started(const ScanStarted& scan);
  void ended(const PluginResult& result);
  void ended(const ScanEnded& scan);

  /// Shows how far the scan is, in place of what it showed before, with the names of what runs. `secondsLeft`
  /// is 0 where nobody knows.
  void progress(std::size_t done, std::size_t total, double secondsLeft,
                const std::vector<std::string>& running);
  /// Takes the progress line away, so that another text can be printed.
  void clearProgress();

 private:
  void print(const std::string& text);
  [[nodiscard]] std::string coloured(const std::string& text, Verdict verdict, bool isWanted) const;
  [[nodiscard]] std::string indented(const std::string& text, std::size_t depth) const;
  [[nodiscard]] static std::string commandLine(const std::string& what,
                                               const std::vector<std::string>& command);
  /// The line of a plug-in, and what the table at the end has of it.
  [[nodiscard]] std::string lineOf(const PluginResult& result) const;
  [[nodiscard]] std::string blockOf(const PluginResult& result) const;
  [[nodiscard]] std::string diagnosisText(const Diagnosis& diagnosis) const;
  [[nodiscard]] std::string shrunkText(const Shrunk& shrunk) const;
  [[nodiscard]] std::string mendedText() const;
  [[nodiscard]] std::string summaryOf(const ScanEnded& scan) const;

  TerminalOptions options;
  std::function<bool(const std::string&)> write;
  bool hasProgressLine = false;
  std::vector<PluginResult> remarkable;  ///< For the table at the end.
  std::vector<std::string> mended;       ///< Names of plug-ins that fail no longer; the first few.
  std::size_t mendedInAll = 0;
  std::size_t remembered = 0;
};

/// What people call a plug-in: the file's name, with its folder where that is wanted, and the child. Not yet
/// printable().
std::string nameOf(const Run& run, bool withFolder);

/// `text` on one line: control characters become "?", invisible ones "[U+202E]" and the like, and bytes that
/// are no UTF-8 U+FFFD.
std::string printable(const std::string& text);

/// `text`, which is printable(), with at most `columns` columns: its middle becomes "...". Ideographs and the
/// like take two columns.
std::string shortened(const std::string& text, std::size_t columns);

/// `text` in lines of at most `columns` columns, broken at blanks where possible; each line but the first
/// begins with `indent` blanks.
std::string wrapped(const std::string& text, std::size_t columns, std::size_t indent);

/// The command as a shell takes it, each argument quoted where that is needed: one that printable() would
/// change by the numbers of its bytes ($'\033'), so that the command can be shown and still names the same
/// file.
std::string shellCommand(const std::vector<std::string>& command);

}  // namespace scanner
