#pragma once

#include <sqlite3.h>

#include <chrono>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <string_view>

namespace vesprun {

/// Our own failure code: the file is sound, but this program must not write to it.
inline constexpr int kWrittenByNewerProgram = SQLITE_SCHEMA;

/// A failure of the database. Thrown and caught within this folder.
struct SqliteFailure {
  int code;          ///< SQLite's extended result code
  std::string text;  ///< names the file and the cause

  /// True for a damaged file or one of another shape; false for locks, permissions and full disks.
  bool isCorruption() const;

  /// True after waiting in vain for another process's lock.
  bool isBusy() const { return (code & 0xFF) == SQLITE_BUSY; }
};

/// An open SQLite database that distrusts its content. System errors never count as damage; a
/// statement that takes more steps than the file's size explains does, such as one on a view
/// without end, or one in a file whose pages lead in circles.
class SqliteConnection {
 public:
  SqliteConnection() = default;
  /// Opens an existing file, for reading only if it cannot be written, or ":memory:". Waits
  /// `longestWait` at most for a lock. Throws `SqliteFailure`.
  ///
  /// Opened with `looks`, it never writes, creates or removes a file, not even beside the database.
  /// What would need that fails: rolling back a commit that was cut off, reading a write-ahead log.
  SqliteConnection(const std::string& path, std::chrono::milliseconds longestWait,
                   bool looks = false);

  /// Runs statements without rows. Throws `SqliteFailure`.
  void execute(const char* sql);

  /// The result of a one-row query.
  std::int64_t queryInteger(const char* sql);

  /// The tables, indexes, views and triggers, as text that is equal for equal ones. Nothing in the
  /// file is run for it. To be compared within the transaction that relies on it, and before any
  /// other statement names a table.
  std::string schema() const;

  /// Without a commit the transaction ends with the connection.
  void commit();

  /// The version that a program must know to write to the file, as its header says.
  int formatVersion() const;

  sqlite3* handle() const { return _database.get(); }

  /// Call when a statement begins: it may do as much work again.
  void allowWork() const;

  [[noreturn]] void fail(int code) const;
  [[noreturn]] void failAsCorrupt(const std::string& what) const;

 private:
  struct Close {
    void operator()(sqlite3* database) const { sqlite3_close_v2(database); }
  };

  static int countWork(void* left);

  std::string _path;
  bool _looks = false;
  std::int64_t _allowedWork = 0;
  std::unique_ptr<std::int64_t> _workLeft;  ///< of the statement, in calls of `countWork`
  std::unique_ptr<sqlite3, Close> _database;
};

/// The bytes of a new database file that the statements create. Throws `SqliteFailure`.
std::string newSqliteFile(const std::string& statements);

/// What `SqliteConnection::schema` gives for such a file. Throws `SqliteFailure`.
std::string schemaOf(const std::string& statements);

/// A prepared statement. Every operation throws `SqliteFailure`. A column of another type than the
/// schema's counts as corruption.
class SqliteStatement {
 public:
  SqliteStatement(const SqliteConnection& connection, const char* sql);

  SqliteStatement& bind(int parameter, std::int64_t value);
  /// Text and bytes must stay until the reset.
  SqliteStatement& bind(int parameter, std::string_view text);
  SqliteStatement& bind(int parameter, std::span<const std::uint8_t> bytes);

  /// True for a row, valid until the next step.
  bool step();
  /// Runs a statement without rows, and resets it.
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
