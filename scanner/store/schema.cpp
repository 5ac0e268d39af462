// SPDX-License-Identifier: MIT
#include "scanner/store/schema.h"

#include <array>
#include <string>

namespace scanner {
namespace {

/// "vstt", by which a database is known as ours ("PRAGMA application_id").
constexpr std::int64_t kApplication = 0x76737474;

/// Step n leads from version n to version n + 1.
constexpr std::array kSteps = {
    R"(
CREATE TABLE scans (
  id INTEGER PRIMARY KEY,
  time REAL NOT NULL,
  machine TEXT NOT NULL,
  toolVersion TEXT NOT NULL
);
CREATE TABLE results (
  id INTEGER PRIMARY KEY,
  scan INTEGER NOT NULL REFERENCES scans (id),
  bundle BLOB NOT NULL,
  processor TEXT NOT NULL,
  child INTEGER,
  childName TEXT,
  device INTEGER NOT NULL,
  inode INTEGER NOT NULL,
  size INTEGER NOT NULL,
  changedAt INTEGER NOT NULL,
  worker TEXT NOT NULL,
  options TEXT NOT NULL,
  sandboxWanted TEXT NOT NULL,
  isSandboxed INTEGER NOT NULL,
  libraries TEXT NOT NULL,
  format INTEGER NOT NULL,
  toolVersion TEXT NOT NULL,
  verdict TEXT NOT NULL,
  step INTEGER,
  cause TEXT NOT NULL,
  isFlaky INTEGER NOT NULL,
  time REAL NOT NULL,
  wallSeconds REAL NOT NULL,
  children TEXT,
  event TEXT
);
CREATE INDEX resultsByPlugin ON results (bundle, processor, child, id);
CREATE TABLE programs (
  path BLOB PRIMARY KEY,
  identity TEXT NOT NULL,
  says TEXT NOT NULL
);
CREATE VIEW latest AS
  SELECT CAST(bundle AS TEXT) AS path, processor, child, childName, verdict, step, cause, isFlaky, time,
         wallSeconds, toolVersion, event
  FROM results WHERE id IN (SELECT max(id) FROM results GROUP BY bundle, processor, child);
)",
    // How a scan ended, and what was new in it.
    R"(
ALTER TABLE scans ADD COLUMN endedAt REAL;
ALTER TABLE scans ADD COLUMN status INTEGER;
ALTER TABLE scans ADD COLUMN isInterrupted INTEGER;
ALTER TABLE scans ADD COLUMN counts TEXT;
ALTER TABLE scans ADD COLUMN changes TEXT;
ALTER TABLE scans ADD COLUMN remembered INTEGER;
ALTER TABLE results ADD COLUMN change TEXT;
CREATE INDEX resultsByScan ON results (scan);
)",
};

std::int64_t versionOf(Database& database) { return database.number("PRAGMA user_version"); }

bool isEmpty(Database& database) { return database.number("SELECT count(*) FROM sqlite_master") == 0; }

}  // namespace

std::int64_t schemaVersion() { return static_cast<std::int64_t>(kSteps.size()); }

bool hasCurrentSchema(Database& database) {
  // In this order, since another scan may make the tables meanwhile: who sees them also sees whose they are.
  const bool wasEmpty = isEmpty(database);
  const std::int64_t version = versionOf(database);
  const bool isOurs = database.number("PRAGMA application_id") == kApplication;
  if (!isOurs && (version != 0 || !wasEmpty)) throw NotOurDatabase("is a database of another program");
  if (version > schemaVersion()) {
    throw NotOurDatabase("was made by a newer vsttorture-scan: its tables have version " +
                         std::to_string(version) + ", and this one knows " + std::to_string(schemaVersion()));
  }
  return isOurs && version == schemaVersion();
}

void bringUpToDate(Database& database) {
  if (hasCurrentSchema(database)) return;
  Transaction transaction(database);
  if (hasCurrentSchema(database)) return;  // Another scan was faster.
  for (auto version = versionOf(database); version < schemaVersion(); ++version)
    database.run(kSteps.at(static_cast<std::size_t>(version)));
  database.run("PRAGMA application_id = " + std::to_string(kApplication));
  database.run("PRAGMA user_version = " + std::to_string(schemaVersion()));
  transaction.commit();
}

}  // namespace scanner
