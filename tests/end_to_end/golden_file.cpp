// SPDX-License-Identifier: MIT
// Golden files: the exact lines that a run is expected to give.
#include "tests/end_to_end/golden_file.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <fstream>
#include <iterator>

#include "tests/shared/program_run.h"

namespace {

constexpr int kFirstDrawn = 16;
constexpr int kLastDrawn = 65;
constexpr std::size_t kDrawnSteps = 50;

constexpr std::array<const char*, 5> kDrawnTexts = {
    "inspect class info",     "inspect preset info", "inspect parameter info",
    "testing setting states", "inspect latency",
};

std::string pathOf(const std::string& name) { return std::string(GOLDEN_FILES) + '/' + name + ".txt"; }

std::string lineAt(const std::vector<std::string>& all, std::size_t i) {
  return i < all.size() ? '"' + all[i] + '"' : "the end";
}

}  // namespace

bool isDrawnStep(const std::string& line, int number) {
  return std::any_of(kDrawnTexts.begin(), kDrawnTexts.end(),
                     [&](const char* text) { return line == std::to_string(number) + ", " + text; });
}

std::vector<std::string> foldRandomPass(const std::vector<std::string>& actual) {
  std::vector<std::string> folded = actual;
  for (std::size_t i = 0; i + kDrawnSteps <= actual.size(); ++i) {
    int number = kFirstDrawn;
    while (number <= kLastDrawn &&
           isDrawnStep(actual[i + static_cast<std::size_t>(number - kFirstDrawn)], number)) {
      ++number;
    }
    if (number <= kLastDrawn) continue;
    const auto first = folded.begin() + static_cast<std::ptrdiff_t>(i);
    *first = kRandomPass;
    folded.erase(first + 1, first + kDrawnSteps);
    break;
  }
  return folded;
}

std::string firstDifference(const std::vector<std::string>& golden, const std::vector<std::string>& actual) {
  const auto tell = [&](const std::string& expected, std::size_t i) {
    return "line " + std::to_string(i + 1) + " is " + lineAt(actual, i) + ", expected " + expected;
  };
  std::size_t i = 0;
  for (const std::string& expected : golden) {
    if (expected == kRandomPass) {
      for (int number = kFirstDrawn; number <= kLastDrawn; ++number, ++i) {
        if (i >= actual.size() || !isDrawnStep(actual[i], number)) {
          return tell("drawn test " + std::to_string(number), i);
        }
      }
    } else {
      if (i >= actual.size() || actual[i] != expected) return tell('"' + expected + '"', i);
      ++i;
    }
  }
  return i < actual.size() ? tell("the end", i) : "";
}

testing::AssertionResult matchesGolden(const std::string& name, const std::vector<std::string>& actual) {
  if (goldenIsToBeUpdated()) writeGolden(name, foldRandomPass(actual));
  const std::string difference = firstDifference(goldenLines(name), actual);
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
