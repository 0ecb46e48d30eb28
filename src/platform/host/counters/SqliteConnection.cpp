#include "platform/host/counters/SqliteConnection.h"

namespace vesprun {
namespace {

// No cell of ours is near this size; a damaged one may claim to be.
constexpr int kLongestCell = 16 * 1024 * 1024;

}  // namespace

bool SqliteFailure::isCorruption() const {
  switch (code & 0xFF) {
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
    case SQLITE_ERROR:  // our statements are sound, so a table or column is missing
    case SQLITE_MISMATCH:
    case SQLITE_TOOBIG:
    case SQLITE_CONSTRAINT:  // rows that contradict the schema
      return true;
    default:
      return false;
  }
}

SqliteConnection::SqliteConnection(const std::string& path, std::chrono::milliseconds longestWait)
    : _path(path) {
  sqlite3* database = nullptr;
  const int result =
      sqlite3_open_v2(path.c_str(), &database,
                      SQLITE_OPEN_READWRITE | SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE, nullptr);
  _database.reset(database);
  if (result != SQLITE_OK) {
    fail(result);
  }
  sqlite3_busy_timeout(database, static_cast<int>(longestWait.count()));
  sqlite3_db_config(database, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
  sqlite3_db_config(database, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
  sqlite3_limit(database, SQLITE_LIMIT_LENGTH, kLongestCell);
  // EXTRA: the end of a transaction is the removal of its journal, which must be durable too.
  execute("PRAGMA cell_size_check = ON; PRAGMA synchronous = EXTRA; PRAGMA mmap_size = 0");
}

void SqliteConnection::execute(const char* sql) {
  const int result = sqlite3_exec(handle(), sql, nullptr, nullptr, nullptr);
  if (result != SQLITE_OK) {
    fail(result);
  }
}

std::int64_t SqliteConnection::queryInteger(const char* sql) {
  SqliteStatement statement(*this, sql);
  return statement.step() ? statement.integer(0) : 0;
}

// Through SQLite's own descriptor: closing another one would drop its locks.
void SqliteConnection::readHeader(std::span<std::uint8_t> header) const {
  sqlite3_file* file = nullptr;
  int result = sqlite3_file_control(handle(), "main", SQLITE_FCNTL_FILE_POINTER, &file);
  if (result == SQLITE_OK) {
    result = file->pMethods->xRead(file, header.data(), static_cast<int>(header.size()), 0);
  }
  if (result == SQLITE_IOERR_SHORT_READ) {
    failAsCorrupt("the file is too short");
  }
  if (result != SQLITE_OK) {
    fail(result);
  }
}

void SqliteConnection::fail(int code) const {
  if ((code & 0xFF) == SQLITE_BUSY) {
    throw SqliteFailure{code, _path + ": another process keeps it locked"};
  }
  const bool ofThisCall = handle() != nullptr && sqlite3_extended_errcode(handle()) == code;
  throw SqliteFailure{
      code, _path + ": " + (ofThisCall ? sqlite3_errmsg(handle()) : sqlite3_errstr(code))};
}

void SqliteConnection::failAsCorrupt(const std::string& what) const {
  throw SqliteFailure{SQLITE_CORRUPT, _path + ": " + what};
}

SqliteStatement::SqliteStatement(const SqliteConnection& connection, const char* sql)
    : _connection(connection) {
  sqlite3_stmt* statement = nullptr;
  check(sqlite3_prepare_v2(connection.handle(), sql, -1, &statement, nullptr));
  _statement.reset(statement);
}

SqliteStatement& SqliteStatement::bind(int parameter, std::int64_t value) {
  check(sqlite3_bind_int64(_statement.get(), parameter, value));
  return *this;
}

SqliteStatement& SqliteStatement::bind(int parameter, std::string_view text) {
  check(sqlite3_bind_text64(_statement.get(), parameter, text.data(), text.size(), SQLITE_STATIC,
                            SQLITE_UTF8));
  return *this;
}

SqliteStatement& SqliteStatement::bind(int parameter, std::span<const std::uint8_t> bytes) {
  check(
      sqlite3_bind_blob64(_statement.get(), parameter, bytes.data(), bytes.size(), SQLITE_STATIC));
  return *this;
}

bool SqliteStatement::step() {
  const int result = sqlite3_step(_statement.get());
  if (result == SQLITE_ROW) {
    return true;
  }
  if (result != SQLITE_DONE) {
    check(result);
  }
  return false;
}

void SqliteStatement::run() {
  step();
  reset();
}

void SqliteStatement::reset() { sqlite3_reset(_statement.get()); }

std::int64_t SqliteStatement::integer(int column) const {
  requireType(column, SQLITE_INTEGER);
  return sqlite3_column_int64(_statement.get(), column);
}

std::string_view SqliteStatement::text(int column) const {
  requireType(column, SQLITE_TEXT);
  const void* text = sqlite3_column_text(_statement.get(), column);
  return {static_cast<const char*>(text),
          static_cast<std::size_t>(sqlite3_column_bytes(_statement.get(), column))};
}

std::span<const std::uint8_t> SqliteStatement::bytes(int column) const {
  requireType(column, SQLITE_BLOB);
  const void* bytes = sqlite3_column_blob(_statement.get(), column);
  const int length = sqlite3_column_bytes(_statement.get(), column);
  if (bytes == nullptr && length != 0) {
    check(SQLITE_NOMEM);
  }
  return {static_cast<const std::uint8_t*>(bytes), static_cast<std::size_t>(length)};
}

bool SqliteStatement::isNull(int column) const {
  return sqlite3_column_type(_statement.get(), column) == SQLITE_NULL;
}

void SqliteStatement::check(int code) const {
  if (code != SQLITE_OK) {
    _connection.fail(code);
  }
}

void SqliteStatement::requireType(int column, int type) const {
  if (sqlite3_column_type(_statement.get(), column) != type) {
    _connection.failAsCorrupt("a cell is not of its column's type");
  }
}

SqliteTransaction::SqliteTransaction(SqliteConnection& connection, Kind kind)
    : _connection(connection) {
  _connection.execute(kind == Kind::Writing ? "BEGIN IMMEDIATE" : "BEGIN");
}

SqliteTransaction::~SqliteTransaction() {
  if (_open) {
    sqlite3_exec(_connection.handle(), "ROLLBACK", nullptr, nullptr, nullptr);
  }
}

void SqliteTransaction::commit() {
  _connection.execute("COMMIT");
  _open = false;
}

}  // namespace vesprun
