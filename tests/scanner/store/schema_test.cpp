// SPDX-License-Identifier: MIT
#include <fstream>
#include <iterator>

#include <gmock/gmock.h>

#include "scanner/store/history.h"
#include "scanner/store/schema.h"
#include "scanner/store/store.h"
#include "tests/shared/temporary_directory.h"

using namespace scanner;
using ::testing::ElementsAre;
using ::testing::IsEmpty;

namespace {

/// A database file that is made by SQL.
class DatabaseFile {
 public:
  std::string file() const { return folder.path() / "results.sqlite"; }
  void run(const std::string& sql) { Database(file(), Database::Access::kWrite).run(sql); }
  void readIn(const std::string& path) {
    std::ifstream input(path);
    run({std::istreambuf_iterator<char>(input), {}});
  }
  /// All statements that have made its tables, indices and views, and its version.
  std::vector<std::string> schema() {
    Database database(file(), Database::Access::kRead);
    Statement row(database, "SELECT type || ' ' || name FROM sqlite_master ORDER BY 1");
    std::vector<std::string> all = {std::to_string(database.number("PRAGMA user_version"))};
    while (row.step()) all.push_back(row.text(0));
    Statement column(
        database,
        "SELECT m.name || '.' || i.name FROM sqlite_master m, pragma_table_info(m.name) i ORDER BY 1");
    while (column.step()) all.push_back(column.text(0));
    return all;
  }

 private:
  TemporaryDirectory folder;
};

std::vector<std::string> sentences;
void keep(const std::string& sentence) { sentences.push_back(sentence); }

TEST(BringUpToDate, AnOlderVersionGetsTheTablesOfANewDatabase) {
  DatabaseFile fresh;
  { Store store(fresh.file(), keep); }
  DatabaseFile old;
  old.readIn(VERSION_1);
  ASSERT_EQ(old.schema().front(), "1");
  { Store store(old.file(), keep); }
  EXPECT_EQ(old.schema(), fresh.schema());
  EXPECT_EQ(old.schema().front(), "2");
  EXPECT_THAT(sentences, IsEmpty());
}

TEST(BringUpToDate, WhatAnOlderVersionHasRememberedStays) {
  DatabaseFile old;
  old.readIn(VERSION_1);
  Store store(old.file(), keep);
  const std::vector<Remembered> results = store.resultsOf("/lib/\xFF.so", "x86_64", {});
  ASSERT_EQ(results.size(), 1U);
  EXPECT_EQ(results[0].verdict, Verdict::kCrashed);
  EXPECT_EQ(results[0].step, 5);
  EXPECT_EQ(results[0].circumstances.file.changedAtInNanoseconds, 4);
  EXPECT_EQ(store.eventOf(results[0].id), R"({"event":"plugin_ended"})");
  EXPECT_EQ(store.resultsOf("/lib/shell.so", "x86_64", -7).size(), 1U);
  EXPECT_EQ(store.versionOf("/worker", "1:2:3"), "vsttorture-worker 0.2.0");
}

TEST(BringUpToDate, HistoryShowsScansOfAnOlderVersion) {
  DatabaseFile old;
  old.readIn(VERSION_1);
  const std::vector<EarlierScan> scans = History(old.file()).lastScans(9);
  ASSERT_EQ(scans.size(), 1U);
  EXPECT_EQ(scans[0].machine, "studio");
  EXPECT_FALSE(scans[0].hasEnded);
  EXPECT_THAT(scans[0].counts, ElementsAre(std::pair("crashed", 1), std::pair("passed", 1)));
}

TEST(BringUpToDate, AStepThatFailsLeavesTheOlderVersionAsItWas) {
  DatabaseFile old;
  old.readIn(VERSION_1);
  old.run(
      "CREATE TABLE resultsByScan (x)");  // In the way of the new index, the last thing that the step makes.
  const std::vector<std::string> before = old.schema();
  {
    Database database(old.file(), Database::Access::kWrite);
    EXPECT_THROW(bringUpToDate(database), DatabaseError);
  }
  EXPECT_EQ(old.schema(), before);
}

}  // namespace
