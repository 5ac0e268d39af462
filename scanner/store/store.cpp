// SPDX-License-Identifier: MIT
#include "scanner/store/store.h"

#include <cerrno>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <deque>
#include <map>
#include <thread>

#include <fcntl.h>
#include <fmt/format.h>
#include <nlohmann/json.hpp>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "scanner/events/event_json.h"
#include "scanner/store/database.h"
#include "scanner/store/open_database.h"
#include "scanner/store/schema.h"

namespace scanner {
namespace {

using Kind = DatabaseError::Kind;
using Clock = std::chrono::steady_clock;

constexpr int kWaitAtTheBeginningInMilliseconds = 1000;
/// While plug-ins run nothing may take long: their limits of time are watched by the same thread.
constexpr int kWaitMeanwhileInMilliseconds = 100;
constexpr int kWaitAtTheEndInMilliseconds = 3000;
constexpr std::chrono::seconds kPauseAfterALock(1);
constexpr std::size_t kMostBytesWaiting = 16 << 20;

/// How many results of a plug-in are kept, and how many of them with their events.
constexpr int kResultsKept = 100;
constexpr int kEventsKept = 5;

constexpr const char* kResultsOf =
    "SELECT id, device, inode, size, changedAt, worker, options, sandboxWanted, isSandboxed, libraries, "
    "format,"
    " toolVersion, verdict, step, cause, isFlaky, time, wallSeconds, children, event IS NOT NULL FROM results"
    " WHERE bundle = ?1 AND processor = ?2 AND child IS ?3 ORDER BY id DESC LIMIT ?4";
constexpr const char* kEventOf = "SELECT event FROM results WHERE id = ?1 AND event IS NOT NULL";
constexpr const char* kSecondsOf =
    "SELECT wallSeconds FROM results WHERE bundle = ?1 AND processor = ?2 AND child IS NULL ORDER BY id DESC "
    "LIMIT 1";
constexpr const char* kVersionOf = "SELECT says FROM programs WHERE path = ?1 AND identity = ?2";
constexpr const char* kSaveVersion =
    "INSERT OR REPLACE INTO programs (path, identity, says) VALUES (?1, ?2, ?3)";
constexpr const char* kBeginScan = "INSERT INTO scans (time, machine, toolVersion) VALUES (?1, ?2, ?3)";
constexpr const char* kEndScan =
    "UPDATE scans SET endedAt = ?2, status = ?3, isInterrupted = ?4, counts = ?5, changes = ?6, remembered = "
    "?7"
    " WHERE id = ?1";
constexpr const char* kSave =
    "INSERT INTO results (scan, bundle, processor, child, childName, device, inode, size, changedAt, worker, "
    "options,"
    " sandboxWanted, isSandboxed, libraries, format, toolVersion, verdict, step, cause, isFlaky, time, "
    "wallSeconds,"
    " children, event, change) VALUES (?1, ?2, ?3, ?4, ?5, ?6, ?7, ?8, ?9, ?10, ?11, ?12, ?13, ?14, ?15, "
    "?16, ?17, "
    "?18, ?19,"
    " ?20, ?21, ?22, ?23, ?24, ?25)";
constexpr const char* kForgetEvents =
    "UPDATE results SET event = NULL WHERE event IS NOT NULL AND id IN (SELECT id FROM results WHERE bundle "
    "= ?1 AND"
    " processor = ?2 AND child IS ?3 ORDER BY id DESC LIMIT -1 OFFSET ?4)";
constexpr const char* kForgetResults =
    "DELETE FROM results WHERE id IN (SELECT id FROM results WHERE bundle = ?1 AND processor = ?2 AND child "
    "IS ?3"
    " ORDER BY id DESC LIMIT -1 OFFSET ?4)";

std::optional<std::int64_t> wide(const std::optional<std::int32_t>& number) {
  return number ? std::optional<std::int64_t>(*number) : std::nullopt;
}

std::string childrenText(const std::vector<Child>& children) {
  nlohmann::json list = nlohmann::json::array();
  for (const Child& child : children) list.push_back({{"id", child.id}, {"name", child.name}});
  return list.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace);
}

std::optional<std::vector<Child>> childrenOf(const std::string& text) {
  const nlohmann::json list = nlohmann::json::parse(text, nullptr, false);
  if (!list.is_array()) return std::nullopt;
  std::vector<Child> children;
  for (const nlohmann::json& one : list) {
    const bool isChild = one.is_object() && one.contains("id") && one["id"].is_number_integer() &&
                         one["id"] >= INT32_MIN && one["id"] <= INT32_MAX && one.contains("name") &&
                         one["name"].is_string();
    if (!isChild) return std::nullopt;
    children.push_back({one["id"].get<std::int32_t>(), one["name"].get<std::string>()});
  }
  return children;
}

/// The folders that `file` stands in. Empty, or why there are none.
std::string makeFolders(const std::string& file) {
  for (std::size_t slash = file.find('/', 1); slash != std::string::npos; slash = file.find('/', slash + 1)) {
    const std::string folder = file.substr(0, slash);
    if (!isThere(folder, false) && mkdir(folder.c_str(), 0700) != 0 && errno != EEXIST)
      return folder + ": " + std::strerror(errno);
  }
  return {};
}

/// 0 where there is no such file.
ino_t inodeOf(const std::string& file) {
  struct stat status = {};
  return stat(file.c_str(), &status) == 0 ? status.st_ino : 0;
}

/// Held by one scan at a time, on all file systems that have such locks.
class FolderLock {
 public:
  explicit FolderLock(const std::string& folder)
      : descriptor(::open(folder.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC)) {
    while (descriptor >= 0 && flock(descriptor, LOCK_EX) != 0 && errno == EINTR) {
    }
  }
  ~FolderLock() {
    if (descriptor >= 0) close(descriptor);
  }
  FolderLock(const FolderLock&) = delete;
  FolderLock& operator=(const FolderLock&) = delete;

 private:
  int descriptor;
};

/// A row to write, which outlives the result it was made of.
struct Row {
  std::string bundle;
  std::string processor;
  std::optional<std::int32_t> child;
  std::string childName;
  Circumstances circumstances;
  bool isSandboxed = false;
  std::string verdict;
  std::optional<std::int64_t> step;
  std::string cause;
  bool isFlaky = false;
  double time = 0;
  double wallSeconds = 0;
  std::optional<std::string> children;
  std::string event;
  std::optional<std::string> change;
};

}  // namespace

struct Store::Implementation {
  Implementation(const std::string& file_, std::function<void(const std::string&)> say_)
      : file(file_), say(std::move(say_)) {}

  /// An open database with its statements.
  struct Connection {
    explicit Connection(std::unique_ptr<Database> database_)
        : owner(std::move(database_)), database(*owner) {}

    Statement& prepared(const char* sql) {
      std::unique_ptr<Statement>& statement = statements[sql];
      if (!statement) statement = std::make_unique<Statement>(database, sql);
      statement->reset();
      return *statement;
    }

    std::unique_ptr<Database> owner;
    Database& database;
    std::map<const char*, std::unique_ptr<Statement>> statements;
  };

  void open();
  void connect();
  bool setAside(const std::string& reason);
  void handle(const DatabaseError& error, bool isWriting);
  void giveUpWriting(const std::string& reason);
  void write(const Row& row);
  void writeScan();
  void flush();

  /// Does it with the connection; false where that has failed, and then everything is said that has to be.
  template <class Work>
  bool attempt(bool isWriting, Work work) {
    if (!connection || (isWriting && !canWrite)) return false;
    try {
      work(*connection);
      return true;
    } catch (const DatabaseError& error) {
      handle(error, isWriting);
      return false;
    }
  }

  std::string file;
  std::function<void(const std::string&)> say;
  std::unique_ptr<Connection> connection;
  bool canWrite = false;
  bool wasSetAside = false;
  ino_t inode = 0;  ///< Of the file that is open, or is being opened; 0 for one that was not there.
  std::optional<ScanStarted> scan;
  std::int64_t scanRow = 0;
  std::deque<Row> waiting;  ///< Until another program gives its lock back.
  std::size_t bytesWaiting = 0;
  std::size_t dropped = 0;
  bool hasSaved = false;
  Clock::time_point nextAttempt = {};
};

// ---- Opening ----------------------------------------------------------------------------------------------

void Store::Implementation::open() {
  const std::string problem = makeFolders(file);
  if (!problem.empty()) {
    say("nothing is remembered: " + problem);
    return;
  }
  try {
    connect();
    return;
  } catch (const NotOurDatabase& error) {
    say("nothing is remembered: " + file + " " + error.what());
  } catch (const DatabaseError& error) {
    if (error.kind == Kind::kDamaged) {
      setAside(error.what());
      return;
    }
    say("nothing is remembered: " + file + ": " + reasonInWords(error));
  }
  connection.reset();
}

void Store::Implementation::connect() {
  canWrite = false;
  inode = inodeOf(file);  // Before anything is read: another scan may put a new database in its place.
  try {
    connection = std::make_unique<Connection>(std::make_unique<Database>(file, Database::Access::kWrite));
    Database& database = connection->database;
    database.waitForLocks(kWaitAtTheBeginningInMilliseconds);
    if (database.isReadOnly()) throw DatabaseError(Kind::kReadOnly, "");
    const auto deadline = Clock::now() + std::chrono::milliseconds(kWaitAtTheBeginningInMilliseconds);
    for (;;) {
      try {
        hasCurrentSchema(database);  // Nothing of a file that is not ours is changed.
        database.run(
            "PRAGMA journal_mode = WAL; PRAGMA synchronous = NORMAL; PRAGMA wal_autocheckpoint = 4000");
        bringUpToDate(database);
        break;
      } catch (const DatabaseError& error) {
        // Two scans that begin at the same time on a new file: SQLite does not wait for this lock by itself.
        if (error.kind != Kind::kLocked || Clock::now() > deadline) throw;
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
      }
    }
    database.waitForLocks(kWaitMeanwhileInMilliseconds);
    canWrite = true;
  } catch (const DatabaseError& error) {
    const bool isMaybeReadOnly = error.kind == Kind::kReadOnly || error.kind == Kind::kOther;
    if (!isMaybeReadOnly || !isThere(file, true)) throw;
    connection.reset();
    connection = std::make_unique<Connection>(openForReading(file));
    connection->database.waitForLocks(kWaitMeanwhileInMilliseconds);
    say("the results of this scan are not remembered: " + file + " cannot be written to");
  }
  if (inode == 0) inode = inodeOf(file);
}

/// Renames the database, with the files that belong to it, and opens a new one. Once a scan: something that
/// damages each new one is not ours to fight with.
bool Store::Implementation::setAside(const std::string& reason) {
  connection.reset();
  if (wasSetAside) {
    say("nothing more is remembered: " + file + " is damaged again (" + reason + ")");
    return false;
  }
  wasSetAside = true;
  const FolderLock lock(file.substr(0, file.rfind('/') + 1));
  if (inode == 0 || inodeOf(file) == inode) {  // Else another scan was faster.
    std::string aside;
    for (int number = 1; aside.empty() || isThere(aside, false); ++number)
      aside = file + ".damaged-" + std::to_string(number);
    if (std::rename(file.c_str(), aside.c_str()) != 0) {
      say(fmt::format("nothing is remembered: {} is damaged ({}) and cannot be renamed: {}", file, reason,
                      std::strerror(errno)));
      return false;
    }
    for (const char* end : {"-wal", "-shm"}) std::rename((file + end).c_str(), (aside + end).c_str());
    say(fmt::format("{} is damaged ({}); it is now called {}, and a new one was begun", file, reason, aside));
  }
  try {
    connect();
    return true;
  } catch (const std::exception& error) {
    connection.reset();
    say("nothing is remembered: " + file + ": " + error.what());
    return false;
  }
}

// ---- Trouble ----------------------------------------------------------------------------------------------

void Store::Implementation::handle(const DatabaseError& error, bool isWriting) {
  if (error.kind == Kind::kDamaged) {
    scanRow = 0;
    setAside(error.what());
  } else if (error.kind == Kind::kLocked) {
    nextAttempt = Clock::now() + kPauseAfterALock;
  } else if (isWriting) {
    giveUpWriting(reasonInWords(error));
  } else {
    connection.reset();
    canWrite = false;
    say("nothing is remembered: " + file + ": " + reasonInWords(error));
  }
}

void Store::Implementation::giveUpWriting(const std::string& reason) {
  canWrite = false;
  waiting.clear();
  bytesWaiting = 0;
  say("results are no longer remembered: " + file + ": " + reason);
}

// ---- Writing ----------------------------------------------------------------------------------------------

void Store::Implementation::writeScan() {
  connection->prepared(kBeginScan)
      .bind(1, scan->time)
      .bind(2, validUtf8(scan->machine))
      .bind(3, scan->version)
      .finish();
  scanRow = connection->database.lastRow();
}

void Store::Implementation::write(const Row& row) {
  if (scanRow == 0) writeScan();
  Transaction transaction(connection->database);
  const Circumstances& of = row.circumstances;
  connection->prepared(kSave)
      .bind(1, scanRow)
      .bindBytes(2, row.bundle)
      .bind(3, row.processor)
      .bind(4, wide(row.child))
      .bind(5, row.child ? std::optional<std::string>(row.childName) : std::nullopt)
      .bind(6, static_cast<std::int64_t>(of.file.device))
      .bind(7, static_cast<std::int64_t>(of.file.inode))
      .bind(8, static_cast<std::int64_t>(of.file.sizeInBytes))
      .bind(9, of.file.changedAtInNanoseconds)
      .bind(10, of.worker)
      .bind(11, of.options)
      .bind(12, of.sandboxWanted)
      .bind(13, std::int64_t{row.isSandboxed})
      .bind(14, of.libraries)
      .bind(15, std::int64_t{of.format})
      .bind(16, of.toolVersion)
      .bind(17, row.verdict)
      .bind(18, row.step)
      .bind(19, row.cause)
      .bind(20, std::int64_t{row.isFlaky})
      .bind(21, row.time)
      .bind(22, row.wallSeconds)
      .bind(23, row.children)
      .bind(24, row.event)
      .bind(25, row.change)
      .finish();
  const auto forget = [&](const char* sql, std::int64_t kept) {
    connection->prepared(sql)
        .bindBytes(1, row.bundle)
        .bind(2, row.processor)
        .bind(3, wide(row.child))
        .bind(4, kept)
        .finish();
  };
  forget(kForgetEvents, kEventsKept);
  forget(kForgetResults, kResultsKept);
  transaction.commit();
}

/// Writes what waits, the oldest first, up to the first that cannot be written.
void Store::Implementation::flush() {
  while (!waiting.empty() && canWrite && connection) {
    const bool wasSetAsideBefore = wasSetAside;
    if (!attempt(true, [this](Connection&) { write(waiting.front()); })) {
      if (wasSetAside && !wasSetAsideBefore) continue;  // Into the new one.
      return;
    }
    hasSaved = true;
    bytesWaiting -= waiting.front().event.size();
    waiting.pop_front();
  }
}

// ---- The interface ----------------------------------------------------------------------------------------

std::string defaultDatabase(const char* xdgCacheHome, const char* home) {
  constexpr const char* kName = "/vsttorture/results.sqlite";
  if (xdgCacheHome != nullptr && *xdgCacheHome == '/') return std::string(xdgCacheHome) + kName;
  if (home != nullptr && *home != '\0') return std::string(home) + "/.cache" + kName;
  return {};
}

PluginResult resultInShort(const Remembered& remembered) {
  PluginResult result;
  result.judgement.verdict = remembered.verdict;
  result.judgement.step = remembered.step;
  result.judgement.cause = remembered.cause;
  result.seen = RunSeen{};
  result.seen->startedAt = remembered.time;
  result.seen->wallSeconds = remembered.wallSeconds;
  result.seen->wasSandboxed = remembered.wasSandboxed;
  return result;
}

Store::Store(const std::string& file, std::function<void(const std::string&)> say)
    : implementation(std::make_unique<Implementation>(file, std::move(say))) {
  implementation->open();
}

Store::~Store() = default;

bool Store::canRead() const { return implementation->connection != nullptr; }

bool Store::hasResults() {
  bool hasAny = false;
  implementation->attempt(false, [&](auto& connection) {
    hasAny = connection.database.number("SELECT EXISTS (SELECT 1 FROM results)") != 0;
  });
  return hasAny;
}

std::vector<Remembered> Store::resultsOf(const std::string& bundle, const std::string& processor,
                                         const std::optional<std::int32_t>& child) {
  std::vector<Remembered> results;
  const bool isRead = implementation->attempt(false, [&](auto& connection) {
    Statement& row = connection.prepared(kResultsOf);
    row.bindBytes(1, bundle).bind(2, processor).bind(3, wide(child)).bind(4, std::int64_t{kEventsKept});
    while (row.step()) {
      const std::optional<Verdict> verdict = verdictOf(row.text(12));
      if (!verdict) continue;  // Of another version.
      Remembered& one = results.emplace_back();
      one.id = row.number(0);
      one.circumstances = {
          {static_cast<std::uint64_t>(row.number(1)), static_cast<std::uint64_t>(row.number(2)),
           static_cast<std::uint64_t>(row.number(3)), row.number(4)},
          row.text(5),
          row.text(6),
          row.text(7),
          row.text(9),
          static_cast<int>(row.number(10)),
          row.text(11)};
      one.wasSandboxed = row.number(8) != 0;
      one.verdict = *verdict;
      one.step = static_cast<int>(row.number(13));
      one.cause = row.text(14);
      one.isFlaky = row.number(15) != 0;
      one.time = row.real(16);
      one.wallSeconds = row.real(17);
      if (!row.isNull(18)) one.children = childrenOf(row.text(18));
      one.hasEvent = row.number(19) != 0;
    }
    row.reset();
  });
  // The numbers of those that were read before it broke mean nothing in the database that is open now.
  if (!isRead) results.clear();
  return results;
}

std::optional<std::string> Store::eventOf(std::int64_t id) {
  std::optional<std::string> event;
  implementation->attempt(false, [&](auto& connection) {
    Statement& row = connection.prepared(kEventOf);
    if (row.bind(1, id).step()) event = row.text(0);
    row.reset();
  });
  return event;
}

double Store::secondsOf(const std::string& bundle, const std::string& processor) {
  double seconds = 0;
  implementation->attempt(false, [&](auto& connection) {
    Statement& row = connection.prepared(kSecondsOf);
    if (row.bindBytes(1, bundle).bind(2, processor).step()) seconds = row.real(0);
    row.reset();
  });
  return seconds;
}

std::optional<std::string> Store::versionOf(const std::string& path, const std::string& identity) {
  std::optional<std::string> version;
  implementation->attempt(false, [&](auto& connection) {
    Statement& row = connection.prepared(kVersionOf);
    if (row.bindBytes(1, path).bind(2, identity).step()) version = row.text(0);
    row.reset();
  });
  return version;
}

void Store::saveVersion(const std::string& path, const std::string& identity, const std::string& version) {
  implementation->attempt(true, [&](auto& connection) {
    connection.prepared(kSaveVersion)
        .bindBytes(1, path)
        .bind(2, identity)
        .bind(3, validUtf8(version))
        .finish();
  });
}

void Store::beginScan(const ScanStarted& scan) {
  implementation->scan = scan;
  implementation->attempt(true, [this](auto&) { implementation->writeScan(); });
}

void Store::save(const PluginResult& result, const Circumstances& circumstances,
                 const std::optional<std::vector<Child>>& children) {
  Implementation& self = *implementation;
  if (!self.connection || !self.canWrite || !self.scan) return;
  Row row;
  row.bundle = result.run.bundle;
  row.processor = result.run.target.processor;
  row.child = result.run.child;
  row.childName = validUtf8(result.run.childName);
  row.circumstances = circumstances;
  row.isSandboxed = result.seen && result.seen->wasSandboxed;
  row.verdict = rowOf(result.judgement.verdict).word;
  if (result.judgement.step > 0) row.step = result.judgement.step;
  row.cause = validUtf8(result.judgement.cause);
  row.isFlaky = result.repetitions && result.repetitions->isFlaky();
  row.time = result.seen ? result.seen->startedAt : 0;
  row.wallSeconds = result.seen ? result.seen->wallSeconds : 0;
  if (children) row.children = childrenText(*children);
  if (result.comparison) row.change = nameOfChange(result.comparison->change);
  row.event = eventLine(result);
  row.event.pop_back();  // The newline.
  if (self.bytesWaiting + row.event.size() > kMostBytesWaiting) {
    ++self.dropped;
    return;
  }
  self.bytesWaiting += row.event.size();
  self.waiting.push_back(std::move(row));
  if (Clock::now() >= self.nextAttempt) self.flush();
}

void Store::endScan(const ScanEnded& scan, const std::map<std::string, std::size_t>& changes,
                    std::size_t remembered) {
  Implementation& self = *implementation;
  if (!self.connection || !self.canWrite) return;
  self.attempt(true, [](auto& connection) { connection.database.waitForLocks(kWaitAtTheEndInMilliseconds); });
  self.flush();
  self.attempt(true, [&](auto& connection) {
    if (self.scanRow == 0) self.writeScan();
    connection.prepared(kEndScan)
        .bind(1, self.scanRow)
        .bind(2, scan.time)
        .bind(3, std::int64_t{scan.status})
        .bind(4, std::int64_t{scan.isInterrupted})
        .bind(5, nlohmann::json(scan.counts).dump())
        .bind(6, nlohmann::json(changes).dump())
        .bind(7, static_cast<std::int64_t>(remembered))
        .finish();
  });
  // Closing writes to the database file and waits for the disk, which takes longer than a scan of plug-ins that are
  // all remembered. Of such a scan there is nothing to lose but its own row.
  if (!self.hasSaved)
    self.attempt(true, [](auto& connection) { connection.database.run("PRAGMA synchronous = OFF"); });
  const std::size_t lost = self.dropped + self.waiting.size();
  if (self.canWrite && lost > 0) {
    self.say(fmt::format("{} {} not remembered: {}: another program has locked it", lost,
                         lost == 1 ? "result is" : "results are", self.file));
  }
}

}  // namespace scanner
