// SPDX-License-Identifier: MIT
// Reads what a run printed to standard output.
#include "tests/shared/protocol.h"

#include <algorithm>
#include <array>

#include "tests/shared/program_run.h"
#include "tests/shared/step_texts.h"

namespace {

using Kind = ProtocolLine::Kind;

constexpr std::array<const char*, 5> kDrawnTexts = {"inspect class info", "inspect preset info",
                                                    "inspect parameter info", "testing setting states",
                                                    "inspect latency"};

bool isNumber(const std::string& text) {
  return !text.empty() && text.size() < 10 && text.find_first_not_of("0123456789") == std::string::npos;
}

}  // namespace

ProtocolLine readLine(const std::string& line) {
  if (line == "unexpected exit") return {Kind::kUnexpectedExit, 0, "", line};
  if (!line.empty() && line.front() == '!') return {Kind::kFailure, 0, line.substr(1), line};
  const std::size_t comma = line.find(", ");
  if (comma == std::string::npos) return {Kind::kOther, 0, "", line};
  const std::string before = line.substr(0, comma);
  const std::string after = line.substr(comma + 2);
  if (before == "total" && isNumber(after)) return {Kind::kTotal, std::stoi(after), "", line};
  if (isNumber(before)) return {Kind::kStep, std::stoi(before), after, line};
  return {Kind::kOther, 0, "", line};
}

std::vector<Section> sections(const std::string& output) {
  std::vector<Section> all(1);
  for (const std::string& line : lines(output)) {
    const ProtocolLine read = readLine(line);
    if (read.kind == Kind::kOther) {
      all.back().pluginLines.push_back(line);
    } else {
      all.push_back({read, {}});
    }
  }
  return all;
}

std::string beginningOfRun(std::size_t steps) {
  std::string text = "total, 64\n";
  for (std::size_t i = 0; i < steps; ++i) {
    text += std::to_string(i + 1) + ", " + kOrderedTexts.at(i) + '\n';
  }
  return text;
}

bool isDrawnStep(const std::string& line, int number) {
  return std::any_of(kDrawnTexts.begin(), kDrawnTexts.end(),
                     [&](const char* text) { return line == std::to_string(number) + ", " + text; });
}
