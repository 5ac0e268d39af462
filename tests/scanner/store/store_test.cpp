// SPDX-License-Identifier: MIT
#include <atomic>
#include <filesystem>
#include <fstream>
#include <thread>

#include <gmock/gmock.h>
#include <sys/stat.h>

#include "scanner/store/database.h"
#include "scanner/store/history.h"
#include "scanner/store/schema.h"
#include "scanner/store/store.h"
#include "tests/shared/temporary_directory.h"

using namespace scanner;
namespace fs = std::filesystem;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::SizeIs;

namespace {

ScanStarted aScan() {
  ScanStarted scan;
  scan.version = "1.2.3";
  scan.time = 1700000000;
  scan.machine = "studio";
  return scan;
}

PluginResult result(const std::string& bundle, Verdict verdict = Verdict::kPassed) {
  PluginResult one;
  one.run.bundle = bundle;
  one.run.target.processor = "x86_64";
  one.judgement.verdict = verdict;
  one.seen = RunSeen{};
  one.seen->startedAt = 1700000001;
  one.seen->wallSeconds = 1.5;
  return one;
}

class StoreTest : public ::testing::Test {
 protected:
  StoreTest() : file(folder.path() / "cache/vsttorture/results.sqlite") {}

  std::unique_ptr<Store> open() {
    return std::make_unique<Store>(file,
                                   [this](const std::string& sentence) { sentences.push_back(sentence); });
  }
  /// A scan that remembers one result of each bundle, and what it had to say.
  std::vector<std::string> scan(const std::vector<std::string>& bundles) {
    sentences.clear();
    const std::unique_ptr<Store> store = open();
    store->beginScan(aScan());
    for (const std::string& bundle : bundles) store->save(result(bundle), {}, {});
    ScanEnded ended;
    ended.time = 1700000100;
    ended.counts = {{"passed", bundles.size()}};
    store->endScan(ended, {{"mended", 1}}, 0);
    return sentences;
  }
  std::size_t resultsOf(const std::string& bundle) { return open()->resultsOf(bundle, "x86_64", {}).size(); }
  void overwrite(std::size_t at, const std::string& bytes) {
    std::fstream stream(file, std::ios::in | std::ios::out | std::ios::binary);
    stream.seekp(static_cast<std::streamoff>(at));
    stream << bytes;
  }
  std::vector<std::string> filesBeside() {
    std::vector<std::string> names;
    for (const auto& entry : fs::directory_iterator(fs::path(file).parent_path()))
      names.push_back(entry.path().filename());
    std::sort(names.begin(), names.end());
    return names;
  }

  TemporaryDirectory folder;
  std::string file;
  std::vector<std::string> sentences;
};

// ---- What is kept -----------------------------------------------------------------------------------------

TEST_F(StoreTest, TheFoldersAreMadeForTheUserAlone) {
  EXPECT_THAT(scan({"/a.so"}), IsEmpty());
  for (const char* name : {"cache", "cache/vsttorture"}) {
    struct stat status = {};
    ASSERT_EQ(stat((folder.path() / name).c_str(), &status), 0);
    EXPECT_EQ(status.st_mode & 0777U, 0700U) << name;
  }
  EXPECT_THAT(filesBeside(), ElementsAre("results.sqlite"));
}

TEST_F(StoreTest, AResultComesBackAsItWas) {
  PluginResult one = result("/\xFF\n.so", Verdict::kCrashed);
  one.run.child = -7;
  one.run.childName = "Third";
  one.judgement.step = 5;
  one.judgement.cause = "SIGSEGV";
  one.seen->wasSandboxed = true;
  const Circumstances circumstances = {
      {1, UINT64_MAX, 3, -4}, "worker", "options", "auto", "libraries", 7, "1.2.3"};
  {
    const std::unique_ptr<Store> store = open();
    EXPECT_FALSE(store->hasResults());
    store->beginScan(aScan());
    store->save(one, circumstances, std::vector<Child>{{1, "One"}, {-2, ""}});
  }
  const std::unique_ptr<Store> store = open();
  EXPECT_TRUE(store->hasResults());
  EXPECT_THAT(store->resultsOf("/\xFF\n.so", "x86_64", {}), IsEmpty());
  EXPECT_THAT(store->resultsOf("/\xFF\n.so", "i386", -7), IsEmpty());
  const std::vector<Remembered> results = store->resultsOf("/\xFF\n.so", "x86_64", -7);
  ASSERT_THAT(results, SizeIs(1));
  const Remembered& back = results[0];
  EXPECT_EQ(back.verdict, Verdict::kCrashed);
  EXPECT_EQ(back.step, 5);
  EXPECT_EQ(back.cause, "SIGSEGV");
  EXPECT_TRUE(back.wasSandboxed);
  EXPECT_EQ(back.time, 1700000001);
  EXPECT_EQ(back.wallSeconds, 1.5);
  EXPECT_EQ(whyVoid(back, circumstances), Void::kNot);
}

TEST_F(StoreTest, TheLatestResultsComeFirstAndOldOnesLoseTheirEvents) {
  for (int i = 0; i < 7; ++i) scan({"/a.so"});
  const std::unique_ptr<Store> store = open();
  const std::vector<Remembered> results = store->resultsOf("/a.so", "x86_64", {});
  ASSERT_THAT(results, SizeIs(5));
  for (std::size_t i = 1; i < results.size(); ++i) EXPECT_GT(results[i - 1].id, results[i].id);
  EXPECT_TRUE(store->eventOf(results[4].id));
  EXPECT_FALSE(store->eventOf(1));
  EXPECT_THAT(History(file).resultsOf("/a.so"), SizeIs(7));
}

TEST_F(StoreTest, AHundredResultsOfAPluginAreKept) {
  const std::unique_ptr<Store> store = open();
  store->beginScan(aScan());
  for (int i = 0; i < 105; ++i) store->save(result("/a.so"), {}, {});
  store->save(result("/b.so"), {}, {});
  EXPECT_THAT(History(file).resultsOf("/a.so"), SizeIs(100));
  EXPECT_THAT(History(file).resultsOf("/b.so"), SizeIs(1));
}

TEST_F(StoreTest, DurationsAreThoseOfTheLastRunOfTheBundleItself) {
  const std::unique_ptr<Store> store = open();
  store->beginScan(aScan());
  PluginResult one = result("/a.so");
  for (const double seconds : {9.0, 2.0}) {
    one.seen->wallSeconds = seconds;
    store->save(one, {}, {});
  }
  one.run.child = 1;
  one.seen->wallSeconds = 50;
  store->save(one, {}, {});
  EXPECT_EQ(store->secondsOf("/a.so", "x86_64"), 2);
  EXPECT_EQ(store->secondsOf("/a.so", "i386"), 0);
}

TEST_F(StoreTest, AVersionIsKnownForTheSameFileOnly) {
  open()->saveVersion("/worker", "1:2", "worker 1");
  open()->saveVersion("/worker", "1:3", "worker 2");
  EXPECT_EQ(open()->versionOf("/worker", "1:3"), "worker 2");
  EXPECT_EQ(open()->versionOf("/worker", "1:2"), std::nullopt);
}

TEST_F(StoreTest, TwoStoresWriteToOneDatabase) {
  const std::unique_ptr<Store> a = open();
  const std::unique_ptr<Store> b = open();
  a->beginScan(aScan());
  b->beginScan(aScan());
  for (int i = 0; i < 20; ++i) {
    a->save(result("/a" + std::to_string(i)), {}, {});
    b->save(result("/b" + std::to_string(i)), {}, {});
  }
  EXPECT_THAT(History(file).resultsOf("/"), SizeIs(40));
  EXPECT_THAT(History(file).lastScans(9), SizeIs(2));
  EXPECT_THAT(sentences, IsEmpty());
}

TEST_F(StoreTest, HistoryTellsScansThatEndedFromThoseThatDidNot) {
  scan({"/a.so", "/b.so"});
  const std::unique_ptr<Store> store = open();
  store->beginScan(aScan());
  store->save(result("/a.so", Verdict::kHung), {}, {});
  const std::vector<EarlierScan> scans = History(file).lastScans(9);
  ASSERT_THAT(scans, SizeIs(2));
  EXPECT_FALSE(scans[0].hasEnded);
  EXPECT_THAT(scans[0].counts, ElementsAre(std::pair("hung", 1)));
  EXPECT_TRUE(scans[1].hasEnded);
  EXPECT_EQ(scans[1].time, 1700000000);
  EXPECT_EQ(scans[1].machine, "studio");
  EXPECT_EQ(scans[1].toolVersion, "1.2.3");
  EXPECT_THAT(scans[1].counts, ElementsAre(std::pair("passed", 2)));
  EXPECT_THAT(scans[1].changes, ElementsAre(std::pair("mended", 1)));
}

TEST_F(StoreTest, HistoryTakesAPathBeforeAPartOfOne) {
  scan({"/lib/a.so", "/lib/a.so.old", "/lib/\xFF.so"});
  EXPECT_THAT(History(file).resultsOf("/lib/a.so"), SizeIs(1));
  EXPECT_THAT(History(file).resultsOf("a.so"), SizeIs(2));
  EXPECT_THAT(History(file).resultsOf("\xFF"), SizeIs(1));
  EXPECT_THAT(History(file).resultsOf("A.SO"), IsEmpty());
}

// ---- Databases that cannot be used ------------------------------------------------------------------------

TEST_F(StoreTest, WhatIsNoDatabaseIsRenamedAndANewOneBegun) {
  fs::create_directories(fs::path(file).parent_path());
  std::ofstream(file) << std::string(5000, 'x');
  const std::vector<std::string> said = scan({"/a.so"});
  ASSERT_THAT(said, SizeIs(1));
  EXPECT_EQ(said[0], file + " is damaged (file is not a database); it is now called " + file +
                         ".damaged-1, and a new one was begun");
  EXPECT_THAT(scan({"/b.so"}), IsEmpty());
  EXPECT_EQ(resultsOf("/a.so"), 1U);
  std::ofstream(file) << std::string(5000, 'y');
  EXPECT_THAT(scan({"/a.so"}).at(0), HasSubstr("results.sqlite.damaged-2"));
  EXPECT_THAT(filesBeside(),
              ElementsAre("results.sqlite", "results.sqlite.damaged-1", "results.sqlite.damaged-2"));
}

TEST_F(StoreTest, TwoScansThatFindTheSameDamageRenameItOnceAndShareTheNewOne) {
  for (int round = 0; round < 10; ++round) {
    fs::remove_all(fs::path(file).parent_path());
    fs::create_directories(fs::path(file).parent_path());
    std::ofstream(file) << std::string(5000, 'x');
    std::atomic<int> arriving = 2;
    const auto scanOf = [&](const std::string& bundle) {
      --arriving;
      while (arriving > 0) std::this_thread::yield();
      Store store(file, [](const std::string&) {});
      store.beginScan(aScan());
      store.save(result(bundle), {}, {});
      store.endScan({}, {}, 0);
    };
    std::thread other(scanOf, "/a.so");
    scanOf("/b.so");
    other.join();
    ASSERT_FALSE(fs::exists(file + ".damaged-2")) << round;
    ASSERT_THAT(History(file).resultsOf("/"), SizeIs(2)) << round;
  }
}

TEST_F(StoreTest, ATruncatedDatabaseIsRenamed) {
  std::vector<std::string> many;
  for (int i = 0; i < 50; ++i) many.push_back("/a" + std::to_string(i));
  scan(many);
  fs::resize_file(file, 6000);
  const std::vector<std::string> said = scan({"/a0"});
  ASSERT_THAT(said, SizeIs(1));
  EXPECT_THAT(said[0], HasSubstr("damaged-1, and a new one was begun"));
  EXPECT_EQ(resultsOf("/a0"), 1U);
}

TEST_F(StoreTest, AnEmptyFileIsANewDatabase) {
  fs::create_directories(fs::path(file).parent_path());
  std::ofstream(file) << "";
  EXPECT_THAT(scan({"/a.so"}), IsEmpty());
  EXPECT_EQ(resultsOf("/a.so"), 1U);
}

/// A page that nobody reads may be damaged unnoticed; once it is read, the database is renamed.
TEST_F(StoreTest, RubbishInAnyPageNeverStopsAScanAndTheNextOneRemembers) {
  std::vector<std::string> many;
  for (int i = 0; i < 30; ++i) many.push_back("/a" + std::to_string(i));
  scan(many);
  const std::string whole = folder.path() / "whole";
  fs::copy_file(file, whole);
  constexpr std::size_t kPageSize = 4096;
  const std::size_t pages = fs::file_size(file) / kPageSize;
  ASSERT_GE(pages, 8U);
  const std::vector<std::string> some = {"/a7", "/new"};
  std::size_t renamed = 0;
  for (std::size_t page = 0; page < pages; ++page) {
    fs::copy_file(whole, file, fs::copy_options::overwrite_existing);
    overwrite(page * kPageSize, std::string(kPageSize, '\xA5'));
    scan(some);
    for (const std::string& bundle : some) resultsOf(bundle);
    renamed += fs::exists(file + ".damaged-" + std::to_string(renamed + 1)) ? 1 : 0;
    EXPECT_THAT(scan(some), IsEmpty()) << page;
    for (const std::string& bundle : some) EXPECT_GE(resultsOf(bundle), 1U) << page << bundle;
  }
  EXPECT_GE(renamed, 3U);
}

TEST_F(StoreTest, ADatabaseWithoutItsTablesIsRenamed) {
  scan({"/a.so"});
  Database(file, Database::Access::kWrite).run("DROP TABLE results");
  EXPECT_THAT(scan({"/a.so"}).at(0), HasSubstr("damaged-1"));
  EXPECT_EQ(resultsOf("/a.so"), 1U);
}

TEST_F(StoreTest, ANewerVersionIsLeftAlone) {
  scan({"/a.so"});
  Database(file, Database::Access::kWrite).run("PRAGMA user_version = 99");
  EXPECT_THAT(
      scan({"/b.so"}),
      ElementsAre("nothing is remembered: " + file +
                  " was made by a newer vsttorture-scan: its tables have version 99, and this one knows 2"));
  EXPECT_EQ(Database(file, Database::Access::kRead).number("SELECT count(*) FROM results"), 1);
  EXPECT_THROW(History{file}, NotOurDatabase);
}

TEST_F(StoreTest, ADatabaseOfAnotherProgramIsLeftAlone) {
  fs::create_directories(fs::path(file).parent_path());
  Database(file, Database::Access::kWrite).run("CREATE TABLE songs (name TEXT); PRAGMA user_version = 1");
  EXPECT_THAT(scan({"/b.so"}),
              ElementsAre("nothing is remembered: " + file + " is a database of another program"));
  EXPECT_EQ(Database(file, Database::Access::kRead).number("SELECT count(*) FROM sqlite_master"), 1);
}

TEST_F(StoreTest, AFolderInPlaceOfTheFileSaysSo) {
  fs::create_directories(file);
  EXPECT_THAT(scan({"/b.so"}).at(0), HasSubstr("nothing is remembered: " + file + ": "));
}

TEST_F(StoreTest, AFolderThatCannotBeMadeSaysSo) {
  file = "/proc/nowhere/vsttorture/results.sqlite";
  EXPECT_THAT(scan({"/b.so"}),
              ElementsAre("nothing is remembered: /proc/nowhere: No such file or directory"));
}

TEST_F(StoreTest, ALockFromTheBeginningCostsASecondAndSaysSo) {
  scan({"/a.so"});
  Database other(file, Database::Access::kWrite);
  other.run("PRAGMA locking_mode = EXCLUSIVE; BEGIN EXCLUSIVE; UPDATE scans SET machine = 'x'");
  EXPECT_THAT(scan({"/b.so"}),
              ElementsAre("nothing is remembered: " + file + ": another program has locked it"));
}

TEST_F(StoreTest, WhatCannotBeWrittenDuringALockIsWrittenAfterIt) {
  scan({"/a.so"});
  sentences.clear();
  const std::unique_ptr<Store> store = open();
  store->beginScan(aScan());
  {
    Database other(file, Database::Access::kWrite);
    other.run("BEGIN IMMEDIATE");
    for (const char* bundle : {"/b.so", "/c.so"}) store->save(result(bundle), {}, {});
    EXPECT_THAT(store->resultsOf("/a.so", "x86_64", {}), SizeIs(1));
    other.run("COMMIT");
  }
  store->endScan({}, {}, 0);
  EXPECT_THAT(sentences, IsEmpty());
  EXPECT_EQ(resultsOf("/b.so"), 1U);
  EXPECT_EQ(resultsOf("/c.so"), 1U);
}

TEST_F(StoreTest, ALockThatNeverEndsSaysHowManyResultsItCost) {
  scan({"/a.so"});
  sentences.clear();
  const std::unique_ptr<Store> store = open();
  store->beginScan(aScan());
  Database other(file, Database::Access::kWrite);
  other.run("BEGIN IMMEDIATE");
  for (const char* bundle : {"/b.so", "/c.so"}) store->save(result(bundle), {}, {});
  store->endScan({}, {}, 0);
  EXPECT_THAT(sentences,
              ElementsAre("2 results are not remembered: " + file + ": another program has locked it"));
}

// ---- The default place ------------------------------------------------------------------------------------

TEST(DefaultDatabase, IsInTheUsersCacheFolder) {
  EXPECT_EQ(defaultDatabase("/cache", "/home/a"), "/cache/vsttorture/results.sqlite");
  EXPECT_EQ(defaultDatabase("relative", "/home/a"), "/home/a/.cache/vsttorture/results.sqlite");
  EXPECT_EQ(defaultDatabase("", "/home/a"), "/home/a/.cache/vsttorture/results.sqlite");
  EXPECT_EQ(defaultDatabase(nullptr, "/home/a"), "/home/a/.cache/vsttorture/results.sqlite");
  EXPECT_EQ(defaultDatabase(nullptr, nullptr), "");
}

}  // namespace
