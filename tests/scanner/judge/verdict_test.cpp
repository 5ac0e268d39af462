// SPDX-License-Identifier: MIT
#include <fstream>
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "scanner/judge/verdict.h"

namespace scanner {
namespace {

using ::testing::ElementsAreArray;

TEST(VerdictTable, IsTheTableOfItsPage) {
  std::vector<std::string> rows;
  for (const VerdictRow& row : verdictTable()) {
    rows.push_back(std::string("| `") + row.word + "` | " + row.meaning + " | " + row.advice + " |");
  }

  std::vector<std::string> shown;
  std::ifstream page(VERDICTS_PAGE);
  bool isInTable = false;
  for (std::string line; std::getline(page, line);) {
    if (line == "| word | meaning | what to do |") {
      isInTable = std::getline(page, line) && line == "|---|---|---|";
    } else if (isInTable && line.empty()) {
      break;
    } else if (isInTable) {
      shown.push_back(line);
    }
  }

  EXPECT_THAT(shown, ElementsAreArray(rows));
}

TEST(VerdictTable, HasEachVerdictOnceUnderAWordOfItsOwn) {
  std::set<Verdict> verdicts;
  std::set<std::string> words;
  for (const VerdictRow& row : verdictTable()) {
    EXPECT_TRUE(verdicts.insert(row.verdict).second) << row.word;
    EXPECT_TRUE(words.insert(row.word).second) << row.word;
    EXPECT_EQ(rowOf(row.verdict).word, std::string(row.word));
  }

  EXPECT_EQ(verdicts.size(), 13u);
}

TEST(VerdictTable, OnlyAPassAShellAndASkippedPlugInAreGood) {
  std::vector<std::string> good;
  for (const VerdictRow& row : verdictTable()) {
    if (row.isGood) good.emplace_back(row.word);
  }

  EXPECT_THAT(good, ::testing::ElementsAre("passed", "shell", "skipped"));
}

}  // namespace
}  // namespace scanner
