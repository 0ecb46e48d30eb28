#pragma once

#include <sqlite3.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>

namespace vesprun {

/// Why the database could not do what it was asked. Thrown within the counter database's own files
/// and caught before it leaves them.
struct SqliteFailure {
  int code;          ///< SQLite's extended result code
  std::string text;  ///< names the file and the cause

  /// True when the file is not, or no longer, a sound database of the expected shape; false for
  /// trouble around it: locks, permissions, a full disk.
  bool isCorruption() const;

  /// True when another process kept the file locked for as long as the connection waits.
  bool isBusy() const { return (code & 0xFF) == SQLITE_BUSY; }
};

/// An open SQLite database file, set up to distrust what it finds in it. An error of the system is
/// never taken for damage of the file.
class SqliteConnection {
 public:
  SqliteConnection() = default;
  /// Opens an existing file, for reading only when it cannot be written, or a database in memory
  /// (":memory:"). What another process has locked is waited for, `longestWait` at most. Throws
  /// `SqliteFailure`.
  ///
  /// One that `looks` neither writes nor makes nor removes a file, also not one beside the
  /// database. What would need that fails: to take back a commit that was cut off, to read a
  /// write-ahead log.
  SqliteConnection(const std::string& path, std::chrono::milliseconds longestWait,
                   bool looks = false);

  /// Runs statements that give no rows. Throws `SqliteFailure`.
  void execute(const char* sql);

  /// The integer that a one-row query gives.
  std::int64_t queryInteger(const char* sql);

  /// Commits the transaction that `BEGIN` began. One that is not committed ends with the
  /// connection.
  void commit();

  /// The version that a program must know to write to the file, as its header says.
  int formatVersion() const;

  sqlite3* handle() const { return _database.get(); }

  [[noreturn]] void fail(int code) const;
  [[noreturn]] void failAsCorrupt(const std::string& what) const;

 private:
  struct Close {
    void operator()(sqlite3* database) const { sqlite3_close_v2(database); }
  };

  std::string _path;
  bool _looks = false;
  std::unique_ptr<sqlite3, Close> _database;
};

/// A prepared statement. Every operation throws `SqliteFailure`. Columns are read only as the type
/// that the schema gives them; another type counts as corruption.
class SqliteStatement {
 public:
  SqliteStatement(const SqliteConnection& connection, const char* sql);

  SqliteStatement& bind(int parameter, std::int64_t value);
  /// The text or bytes must stay until the statement is reset.
  SqliteStatement& bind(int parameter, std::string_view text);
  SqliteStatement& bind(int parameter, std::span<const std::uint8_t> bytes);

  /// True when there is a row, which is valid until the next step.
  bool step();
  /// Steps to the end of a statement that gives no rows, and resets it.
  void run();
  void reset();

  std::int64_t integer(int column) const;
  std::string_view text(int column) const;
  std::span<const std::uint8_t> bytes(int column) const;
  bool isNull(int column) const;

 private:
  struct Finalize {
    void operator()(sqlite3_stmt* statement) const { sqlite3_finalize(statement); }
  };

  void check(int code) const;
  void requireType(int column, int type) const;

  const SqliteConnection& _connection;
  std::unique_ptr<sqlite3_stmt, Finalize> _statement;
};

}  // namespace vesprun
