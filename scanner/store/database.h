// SPDX-License-Identifier: MIT
// SQLite with owners and exceptions.
#pragma once

#include <cstdint>
#include <optional>
#include <stdexcept>
#include <string>

struct sqlite3;
struct sqlite3_stmt;

namespace scanner {

/// What SQLite could not do. what() is its text.
class DatabaseError : public std::runtime_error {
 public:
  enum class Kind {
    kDamaged,   ///< No database, or one with contradictions in it.
    kLocked,    ///< Another program holds it, longer than we wait.
    kReadOnly,  ///< The file, its folder or its file system.
    kFull,      ///< The disk.
    kOther,
  };
  DatabaseError(Kind kind_, const std::string& text) : std::runtime_error(text), kind(kind_) {}

  Kind kind;
};

/// One open database file. All functions throw DatabaseError.
class Database {
 public:
  enum class Access {
    kWrite,      ///< Made where it is not there.
    kRead,       ///< Must exist; files beside it (-wal, -shm) may be made.
    kImmutable,  ///< Must exist, and nobody changes it meanwhile; no file is made.
  };
  Database(const std::string& file, Access access);
  ~Database();
  Database(const Database&) = delete;
  Database& operator=(const Database&) = delete;

  /// How long to wait for another program's lock before that is an error.
  void waitForLocks(int milliseconds);

  /// Runs SQL without values, one statement or several.
  void run(const std::string& sql);
  /// The first value of the first row; 0 without a row.
  std::int64_t number(const std::string& sql);

  [[nodiscard]] std::int64_t lastRow() const;
  [[nodiscard]] bool isReadOnly() const;

 private:
  friend class Statement;
  sqlite3* handle = nullptr;
};

/// A prepared statement. Values are numbered from 1, columns from 0.
class Statement {
 public:
  Statement(Database& database, const std::string& sql);
  ~Statement();
  Statement(const Statement&) = delete;
  Statement& operator=(const Statement&) = delete;

  Statement& bind(int at, std::int64_t value);
  Statement& bind(int at, double value);
  Statement& bind(int at, const std::string& text);
  Statement& bindBytes(int at, const std::string& bytes);
  Statement& bindNull(int at);
  template <class Value>
  Statement& bind(int at, const std::optional<Value>& value) {
    return value ? bind(at, *value) : bindNull(at);
  }

  /// The next row; false after the last. Values stay bound.
  bool step();
  /// Ready to be run again.
  void reset();
  /// Runs to the end and resets.
  void finish();

  [[nodiscard]] bool isNull(int column) const;
  [[nodiscard]] std::int64_t number(int column) const;
  [[nodiscard]] double real(int column) const;
  [[nodiscard]] std::string text(int column) const;  ///< Of a blob its bytes.

 private:
  Database& database;
  sqlite3_stmt* handle = nullptr;
};

/// Everything until commit() or none of it.
class Transaction {
 public:
  explicit Transaction(Database& database);
  ~Transaction();
  Transaction(const Transaction&) = delete;
  Transaction& operator=(const Transaction&) = delete;
  void commit();

 private:
  Database& database;
  bool isOver = false;
};

}  // namespace scanner
