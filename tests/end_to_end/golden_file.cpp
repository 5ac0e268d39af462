// SPDX-License-Identifier: MIT
// Golden files: the exact lines that a run is expected to print.
#include "tests/end_to_end/golden_file.h"

#include <algorithm>
#include <cstdlib>
#include <fstream>
#include <iterator>

#include "tests/shared/protocol.h"

namespace {

constexpr int kFirstDrawn = 16;
constexpr int kLastDrawn = 65;

std::string pathOf(const std::string& name) { return std::string(GOLDEN_FILES) + '/' + name + ".txt"; }

std::string lineAt(const std::vector<std::string>& all, std::size_t i) {
  return i < all.size() ? '"' + all[i] + '"' : "the end";
}

}  // namespace

std::vector<std::string> linesAndEnd(const ProgramRun& run) {
  std::vector<std::string> all = lines(run.standardOutput);
  all.push_back(run.end);
  return all;
}

std::vector<std::string> foldRandomPass(std::vector<std::string> actual) {
  const auto first = std::find_if(actual.begin(), actual.end(),
                                  [](const std::string& line) { return isDrawnStep(line, kFirstDrawn); });
  auto next = first;
  int number = kFirstDrawn;
  while (number <= kLastDrawn && next != actual.end() && isDrawnStep(*next, number)) {
    ++next;
    ++number;
  }
  if (number <= kLastDrawn) return actual;
  *first = kRandomPass;
  actual.erase(first + 1, next);
  return actual;
}

std::string firstDifference(const std::vector<std::string>& expected,
                            const std::vector<std::string>& actual) {
  for (std::size_t i = 0; i < std::max(expected.size(), actual.size()); ++i) {
    if (lineAt(expected, i) != lineAt(actual, i)) {
      return "line " + std::to_string(i + 1) + " is " + lineAt(actual, i) + ", expected " +
             lineAt(expected, i);
    }
  }
  return "";
}

testing::AssertionResult matchesGolden(const std::string& name, const std::vector<std::string>& actual) {
  const std::vector<std::string> folded = foldRandomPass(actual);
  if (goldenIsToBeUpdated()) writeGolden(name, folded);
  const std::string difference = firstDifference(goldenLines(name), folded);
  if (difference.empty()) return testing::AssertionSuccess();
  return testing::AssertionFailure() << name << ": " << difference;
}

std::vector<std::string> goldenLines(const std::string& name) {
  std::ifstream file(pathOf(name));
  return lines({std::istreambuf_iterator<char>(file), {}});
}

void writeGolden(const std::string& name, const std::vector<std::string>& golden) {
  std::ofstream file(pathOf(name));
  for (const std::string& line : golden) file << line << '\n';
}

bool goldenIsToBeUpdated() {
  const char* value = std::getenv("UPDATE_GOLDEN");
  return value != nullptr && std::string(value) == "1";
}
