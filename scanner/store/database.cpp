// SPDX-License-Identifier: MIT
#include "scanner/store/database.h"

#include <cerrno>
#include <cstring>

#include <sqlite3.h>

namespace scanner {
namespace {

DatabaseError::Kind kindOf(int code, int systemError) {
  switch (code & 0xFF) {
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
    case SQLITE_ERROR:  // Our statements are right, so the tables are not.
      return DatabaseError::Kind::kDamaged;
    case SQLITE_BUSY:
    case SQLITE_LOCKED:
    case SQLITE_PROTOCOL:
      return DatabaseError::Kind::kLocked;
    case SQLITE_READONLY:
      return DatabaseError::Kind::kReadOnly;
    case SQLITE_FULL:
      return DatabaseError::Kind::kFull;
    case SQLITE_IOERR:
      if (code == SQLITE_IOERR_SHORT_READ || code == SQLITE_IOERR_CORRUPTFS)
        return DatabaseError::Kind::kDamaged;
      // EFBIG: the limit for the size of files, which is a full disk to whoever runs into it.
      if (systemError == ENOSPC || systemError == EDQUOT || systemError == EFBIG)
        return DatabaseError::Kind::kFull;
      return DatabaseError::Kind::kOther;
    default:
      return DatabaseError::Kind::kOther;
  }
}

[[noreturn]] void fail(sqlite3* handle, int code) {
  const int systemError = handle != nullptr ? sqlite3_system_errno(handle) : 0;
  const int extended = handle != nullptr ? sqlite3_extended_errcode(handle) : code;
  std::string text = handle != nullptr ? sqlite3_errmsg(handle) : sqlite3_errstr(code);
  const bool isOfFiles = (code & 0xFF) == SQLITE_CANTOPEN || (code & 0xFF) == SQLITE_IOERR;
  if (isOfFiles && systemError != 0) text += std::string(" (") + std::strerror(systemError) + ")";
  throw DatabaseError(kindOf(extended, systemError), text);
}

/// The path as SQLite's form of a URI takes it.
std::string uriOf(const std::string& file, const char* parameters) {
  static constexpr const char* kDigits = "0123456789ABCDEF";
  std::string uri = "file:";
  for (const char c : file) {
    if (c == '%' || c == '?' || c == '#') {
      const auto byte = static_cast<unsigned char>(c);
      uri += '%';
      uri += kDigits[byte >> 4U];
      uri += kDigits[byte & 0xFU];
    } else {
      uri += c;
    }
  }
  return uri + parameters;
}

}  // namespace

Database::Database(const std::string& file, Access access) {
  const int flags = access == Access::kWrite       ? SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE
                    : access == Access::kImmutable ? SQLITE_OPEN_READONLY | SQLITE_OPEN_URI
                                                   : SQLITE_OPEN_READONLY;
  const std::string name = access == Access::kImmutable ? uriOf(file, "?immutable=1") : file;
  const int code = sqlite3_open_v2(name.c_str(), &handle, flags | SQLITE_OPEN_NOMUTEX, nullptr);
  if (code == SQLITE_OK) {
    sqlite3_extended_result_codes(handle, 1);
    return;
  }
  sqlite3* failed = handle;
  try {
    fail(failed, code);
  } catch (...) {
    sqlite3_close(failed);
    throw;
  }
}

Database::~Database() { sqlite3_close(handle); }

void Database::waitForLocks(int milliseconds) { sqlite3_busy_timeout(handle, milliseconds); }

void Database::run(const std::string& sql) {
  const int code = sqlite3_exec(handle, sql.c_str(), nullptr, nullptr, nullptr);
  if (code != SQLITE_OK) fail(handle, code);
}

std::int64_t Database::number(const std::string& sql) {
  Statement statement(*this, sql);
  return statement.step() ? statement.number(0) : 0;
}

std::int64_t Database::lastRow() const { return sqlite3_last_insert_rowid(handle); }

bool Database::isReadOnly() const { return sqlite3_db_readonly(handle, "main") == 1; }

Statement::Statement(Database& database_, const std::string& sql) : database(database_) {
  const int code =
      sqlite3_prepare_v2(database.handle, sql.c_str(), static_cast<int>(sql.size()), &handle, nullptr);
  if (code != SQLITE_OK) fail(database.handle, code);
}

Statement::~Statement() { sqlite3_finalize(handle); }

Statement& Statement::bind(int at, std::int64_t value) {
  sqlite3_bind_int64(handle, at, value);
  return *this;
}

Statement& Statement::bind(int at, double value) {
  sqlite3_bind_double(handle, at, value);
  return *this;
}

Statement& Statement::bind(int at, const std::string& text) {
  sqlite3_bind_text64(handle, at, text.data(), text.size(), SQLITE_TRANSIENT, SQLITE_UTF8);
  return *this;
}

Statement& Statement::bindBytes(int at, const std::string& bytes) {
  sqlite3_bind_blob64(handle, at, bytes.data(), bytes.size(), SQLITE_TRANSIENT);
  return *this;
}

Statement& Statement::bindNull(int at) {
  sqlite3_bind_null(handle, at);
  return *this;
}

bool Statement::step() {
  const int code = sqlite3_step(handle);
  if (code == SQLITE_ROW) return true;
  if (code == SQLITE_DONE) return false;
  fail(database.handle, code);
}

void Statement::reset() { sqlite3_reset(handle); }

void Statement::finish() {
  try {
    while (step()) {
    }
  } catch (...) {
    reset();
    throw;
  }
  reset();
}

bool Statement::isNull(int column) const { return sqlite3_column_type(handle, column) == SQLITE_NULL; }

std::int64_t Statement::number(int column) const { return sqlite3_column_int64(handle, column); }

double Statement::real(int column) const { return sqlite3_column_double(handle, column); }

std::string Statement::text(int column) const {
  const void* bytes = sqlite3_column_blob(handle, column);
  const int size = sqlite3_column_bytes(handle, column);
  return bytes == nullptr ? std::string()
                          : std::string(static_cast<const char*>(bytes), static_cast<std::size_t>(size));
}

Transaction::Transaction(Database& database_) : database(database_) { database.run("BEGIN IMMEDIATE"); }

Transaction::~Transaction() {
  if (isOver) return;
  try {
    database.run("ROLLBACK");
  } catch (const DatabaseError&) {
    // SQLite has rolled it back by itself.
  }
}

void Transaction::commit() {
  database.run("COMMIT");
  isOver = true;
}

}  // namespace scanner
