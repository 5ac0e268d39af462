// SPDX-License-Identifier: MIT
// The tables of the results' database, and the way up from each older version of them.
//
// docs/RESULTS_DATABASE.md describes the tables for those who read them. A change is a further step at the end
// of the table; a step that was released is never changed.
#pragma once

#include <cstdint>
#include <stdexcept>

#include "scanner/store/database.h"

namespace scanner {

/// The version that this program reads and writes ("PRAGMA user_version"): the number of steps.
std::int64_t schemaVersion();

/// A database that is not ours to write to. what() says why, to go behind "FILE ".
class NotOurDatabase : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Whether the database has the version of this program; false for a new file and for an older version. Throws
/// NotOurDatabase for a newer one, and for a database of another program.
bool hasCurrentSchema(Database& database);

/// Takes a new file, or a database of any older version, up to schemaVersion(), all of it or nothing. Throws as
/// hasCurrentSchema() does.
void bringUpToDate(Database& database);

}  // namespace scanner
