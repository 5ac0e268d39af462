// SPDX-License-Identifier: MIT
#include "scanner/engine/output_parser.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <optional>

namespace scanner {
namespace {

/// No line of the protocol is longer; the beginning of a longer line is the plug-in's.
constexpr std::size_t kLongestProtocolLine = 256;

constexpr std::size_t kShortestProtocolLine = 8;  ///< "total, 0"

/// More of them tell nothing new.
constexpr std::size_t kMostOutOfTurn = 20;

/// Far more than a run has. A plug-in that prints lines of steps without end fills no memory.
constexpr int kMostSteps = 1000;

constexpr int kTotalOfAPlugin = 64;
constexpr int kTotalOfAShell = 51;

constexpr std::array<std::string_view, 8> kStepTexts = {
    "test gathering info",    "inspect class info", "inspect preset info",   "inspect parameter info",
    "testing setting states", "inspect latency",    "inspect stream format", "initialize",
};
constexpr std::array<std::string_view, 9> kPhases = {
    "delete, create and initialize",
    "create and initialize",
    "gather info",
    "inspect class info test",
    "inspect preset info test",
    "inspect parameter info test",
    "test setting state",
    "inspect latency test",
    "inspect io config",
};
constexpr std::string_view kLastWords = "unexpected exit";

/// Takes `end` off the end of the text; false where it does not end so.
bool takeEnd(std::string_view& text, std::string_view end) {
  if (text.size() < end.size() || text.substr(text.size() - end.size()) != end) return false;
  text.remove_suffix(end.size());
  return true;
}

/// Takes decimal digits off the end of the text. Nothing where there are none, or too many for an int.
std::optional<int> takeNumber(std::string_view& text) {
  const std::size_t before = text.find_last_not_of("0123456789");
  const std::size_t begin = before == std::string_view::npos ? 0 : before + 1;
  int number = 0;
  const auto [end, error] = std::from_chars(text.data() + begin, text.data() + text.size(), number);
  if (begin == text.size() || error != std::errc() || end != text.data() + text.size()) return std::nullopt;
  text.remove_suffix(text.size() - begin);
  return number;
}

/// Takes a failure line off the end of the text.
bool takeFailureLine(std::string_view& text) {
  std::string_view rest = text;
  if (!takeEnd(rest, " failed, unknown error")) {
    if (!takeNumber(rest)) return false;
    takeEnd(rest, "-");
    if (!takeEnd(rest, " failed ")) return false;
  }
  for (const std::string_view phase : kPhases) {
    std::string_view front = rest;
    if (!takeEnd(front, phase) || !takeEnd(front, "!")) continue;
    text = front;
    return true;
  }
  return false;
}

}  // namespace

void TextTail::add(int step, std::string_view bytes) {
  if (bytes.empty()) return;
  if (bytes.size() > kMostBytes) bytes.remove_prefix(bytes.size() - kMostBytes);
  if (texts.empty() || texts.back().step != step) texts.push_back({step, isStandardError, {}});
  texts.back().bytes += bytes;
  size += bytes.size();
  if (size > 2 * kMostBytes) dropFront(size - kMostBytes);
}

void TextTail::dropFront(std::size_t bytes) {
  size -= bytes;
  while (bytes > 0) {
    std::string& first = texts.front().bytes;
    const std::size_t cut = std::min(bytes, first.size());
    first.erase(0, cut);
    bytes -= cut;
    if (first.empty()) texts.pop_front();
  }
}

std::vector<PluginText> TextTail::pieces() const {
  TextTail last = *this;
  if (last.size > kMostBytes) last.dropFront(last.size - kMostBytes);
  return {last.texts.begin(), last.texts.end()};
}

void OutputParser::feed(std::string_view bytes) {
  while (!bytes.empty()) {
    const std::size_t newline = bytes.find('\n');
    pending += bytes.substr(0, newline);
    if (newline == std::string_view::npos) break;
    takeLine(pending);
    pending.clear();
    bytes.remove_prefix(newline + 1);
  }
  // The last words have no newline. They are looked for here, too, since they may stand where this cuts.
  if (pending.size() > 2 * kLongestProtocolLine) {
    std::size_t cut = pending.size() - kLongestProtocolLine;
    const std::size_t words = hasLastWords ? std::string::npos : pending.find(kLastWords);
    if (words < cut) cut = std::max(cut, words + kLastWords.size());
    takeText(std::string_view(pending).substr(0, cut));
    pending.erase(0, cut);
  }
}

void OutputParser::finish() {
  takeText(pending);
  pending.clear();
}

void OutputParser::takeLine(std::string_view line) {
  std::string_view front = line;
  if (line.size() < kShortestProtocolLine) {
    takeTextLine(line);
    return;
  }
  for (const std::string_view text : kStepTexts) {
    front = line;
    if (!takeEnd(front, text) || !takeEnd(front, ", ")) continue;
    const std::size_t size = front.size();
    if (const std::optional<int> number = takeNumber(front)) {
      const bool hasLeadingZeros = size - front.size() != std::to_string(*number).size();
      takeStep(line, hasLeadingZeros ? 0 : *number, text, front);
      return;
    }
  }
  front = line;
  if (const std::optional<int> number = takeNumber(front); number && takeEnd(front, "total, ")) {
    takeTotal(line, *number, front);
    return;
  }
  front = line;
  if (takeFailureLine(front)) {
    takeFailure(line, front);
    return;
  }
  takeTextLine(line);
}

void OutputParser::takeTotal(std::string_view line, int number, std::string_view front) {
  const auto isOfARun = [](int total) { return total == kTotalOfAPlugin || total == kTotalOfAShell; };
  if (lastStep > 0) {
    if (isOfARun(number)) {
      takeOutOfTurn(line, front);
    } else {
      takeTextLine(line);
    }
    return;
  }
  takeText(front);
  if (hasTotal) {
    const auto isTotal = [](const ProtocolLine& one) { return one.kind == ProtocolLine::Kind::kTotal; };
    const auto former = std::find_if(protocol.begin(), protocol.end(), isTotal);
    const int formerNumber = former->number;
    const std::string formerLine = "total, " + std::to_string(formerNumber);
    protocol.erase(former);
    if (isOfARun(formerNumber)) {
      takeOutOfTurn(formerLine, "");
    } else {
      takeTextLine(formerLine);
    }
  }
  hasTotal = true;
  protocol.push_back({ProtocolLine::Kind::kTotal, number});
}

void OutputParser::takeStep(std::string_view line, int number, std::string_view text,
                            std::string_view front) {
  if (!hasTotal || number != lastStep + 1 || number > kMostSteps) {
    takeOutOfTurn(line, front);
    return;
  }
  takeText(front);  // Came before this step.
  lastStep = number;
  protocol.push_back({ProtocolLine::Kind::kStep, number, std::string(text)});
}

void OutputParser::takeFailure(std::string_view line, std::string_view front) {
  if (hasFailure) {
    takeOutOfTurn(line, front);
    return;
  }
  hasFailure = true;
  takeText(front);
  protocol.push_back({ProtocolLine::Kind::kFailure, 0, std::string(line.substr(front.size()))});
}

void OutputParser::takeOutOfTurn(std::string_view line, std::string_view front) {
  if (++outOfTurn <= kMostOutOfTurn) {
    protocol.push_back({ProtocolLine::Kind::kOutOfTurn, 0, std::string(line.substr(front.size()))});
  }
  takeTextLine(line);
}

void OutputParser::takeTextLine(std::string_view line) {
  takeText(line);
  takeText("\n");
}

void OutputParser::takeText(std::string_view bytes) {
  const std::size_t words = hasLastWords ? std::string_view::npos : bytes.find(kLastWords);
  if (words != std::string_view::npos) {
    hasLastWords = true;
    takeText(bytes.substr(0, words));
    protocol.push_back({ProtocolLine::Kind::kLastWords});
    takeText(bytes.substr(words + kLastWords.size()));
    return;
  }
  plugin.add(lastStep, bytes);
}

}  // namespace scanner
