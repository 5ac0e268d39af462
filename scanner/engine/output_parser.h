// SPDX-License-Identifier: MIT
// Tells the lines of a run's protocol from what the plug-in prints between them, while they come in.
#pragma once

#include <cstddef>
#include <deque>
#include <string>
#include <string_view>
#include <vector>

#include "scanner/engine/run_seen.h"

namespace scanner {

/// The last bytes of what a plug-in prints, by step.
class TextTail {
 public:
  static constexpr std::size_t kMostBytes = 64 * 1024;

  explicit TextTail(bool isStandardError_) : isStandardError(isStandardError_) {}

  void add(int step, std::string_view bytes);
  /// The last kMostBytes at most, in order; one piece for each step.
  [[nodiscard]] std::vector<PluginText> pieces() const;

 private:
  void dropFront(std::size_t bytes);

  bool isStandardError;
  std::deque<PluginText> texts;
  std::size_t size = 0;  ///< Up to twice kMostBytes, so that a small piece rarely moves all that is kept.
};

/// Standard output of a worker, in pieces of any size: how it is cut makes no difference.
///
/// A line counts as one of the protocol's when it ends in what is due at that point: the total, then the
/// steps in order, a failure line, the words of an unexpected exit. A line of the protocol that is not due is
/// noted as ProtocolLine::Kind::kOutOfTurn: the worker prints none, so either it or the line that came in its
/// place is the plug-in's. Whatever else is printed, also in front of a line, is the plug-in's.
///
/// Steps beyond the thousandth are out of turn, too: no run has so many.
///
/// Of several totals before the first step the last one counts, since a plug-in may print such a text while
/// it is created.
class OutputParser {
 public:
  void feed(std::string_view bytes);
  /// The output has ended: what came without a newline is looked at now.
  void finish();

  [[nodiscard]] int step() const { return lastStep; }
  [[nodiscard]] const std::vector<ProtocolLine>& lines() const { return protocol; }
  [[nodiscard]] const TextTail& texts() const { return plugin; }

 private:
  void takeLine(std::string_view line);
  void takeTotal(std::string_view line, int number, std::string_view front);
  void takeStep(std::string_view line, int number, std::string_view text, std::string_view front);
  void takeFailure(std::string_view line, std::string_view front);
  void takeOutOfTurn(std::string_view line, std::string_view front);
  void takeTextLine(std::string_view line);
  void takeText(std::string_view bytes);

  std::string pending;  ///< The beginning of a line.
  std::vector<ProtocolLine> protocol;
  int lastStep = 0;
  std::size_t outOfTurn = 0;  ///< How many lines were.
  bool hasTotal = false;
  bool hasFailure = false;
  bool hasLastWords = false;
  TextTail plugin{false};
};

}  // namespace scanner
