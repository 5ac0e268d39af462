// SPDX-License-Identifier: MIT
#include "scanner/store/open_database.h"

#include <sys/stat.h>

#include "scanner/store/schema.h"

namespace scanner {
namespace {

constexpr int kWaitInMilliseconds = 1000;

}  // namespace

std::unique_ptr<Database> openForReading(const std::string& file) {
  // SQLite's usual way of reading needs files beside the database, which it cannot make where nothing can be
  // written. Without an unfinished one there, the database itself is all that there is to read.
  const bool isAlone = !isThere(file + "-wal", true);
  std::unique_ptr<Database> opened;
  try {
    opened = std::make_unique<Database>(file, Database::Access::kRead);
    opened->waitForLocks(kWaitInMilliseconds);
    if (hasCurrentSchema(*opened)) return opened;
  } catch (const DatabaseError& error) {
    const bool isOfAccess =
        error.kind == DatabaseError::Kind::kReadOnly || error.kind == DatabaseError::Kind::kOther;
    if (!isAlone || !isOfAccess) throw;
    opened = std::make_unique<Database>(file, Database::Access::kImmutable);
    if (hasCurrentSchema(*opened)) return opened;
  }
  throw DatabaseError(DatabaseError::Kind::kReadOnly, "its tables have an older form");
}

std::unique_ptr<Database> openUpToDate(const std::string& file) {
  try {
    auto opened = std::make_unique<Database>(file, Database::Access::kWrite);
    opened->waitForLocks(kWaitInMilliseconds);
    if (!opened->isReadOnly()) {
      bringUpToDate(*opened);
      return opened;
    }
  } catch (const DatabaseError& error) {
    if (error.kind == DatabaseError::Kind::kDamaged) throw;
  }
  return openForReading(file);
}

bool isThere(const std::string& path, bool mustHoldBytes) {
  struct stat status = {};
  return stat(path.c_str(), &status) == 0 && (!mustHoldBytes || status.st_size > 0);
}

std::string reasonInWords(const DatabaseError& error) {
  switch (error.kind) {
    case DatabaseError::Kind::kLocked:
      return "another program has locked it";
    case DatabaseError::Kind::kReadOnly:
      return "it cannot be written to";
    case DatabaseError::Kind::kFull:
      return "the disk is full";
    case DatabaseError::Kind::kDamaged:
      return std::string("it is damaged (") + error.what() + ")";
    case DatabaseError::Kind::kOther:
      break;
  }
  return error.what();
}

}  // namespace scanner
