#include "platform/host/counters/SqliteConnection.h"

#include <sys/stat.h>
#include <unistd.h>

#include <new>

namespace vesprun {
namespace {

// Our cells are far smaller; a damaged one may claim any size.
constexpr int kMaxCell = 16 * 1024 * 1024;
constexpr int kMaxStatement = 64 * 1024;

// Steps of SQLite's machine. Our longest statements, over all rows, take some tens a row.
constexpr int kStepsCounted = 1000;
constexpr std::int64_t kMaxOpeningWork = 2;  // some hundred tables
constexpr std::int64_t kMinAllowedWork = 200'000;
constexpr std::int64_t kBytesPerWork = 10;

/// SQLite's own file system with one difference: SQLite treats a read that fails with EIO as
/// damage; here it stays a read error. The one to look with also leaves all files alone: SQLite
/// removes and creates files even for connections that read.
class ErrorKeepingFileSystem {
 public:
  /// Registered as long as the program or library is loaded.
  static const char* name(bool looks) {
    static ErrorKeepingFileSystem fileSystem("vesprun", false);
    static ErrorKeepingFileSystem lookingFileSystem("vesprun-looking", true);
    return (looks ? lookingFileSystem : fileSystem)._methods.zName;
  }

  ErrorKeepingFileSystem(const ErrorKeepingFileSystem&) = delete;
  ErrorKeepingFileSystem& operator=(const ErrorKeepingFileSystem&) = delete;

 private:
  /// Behind each open file of the original file system.
  struct Methods {
    sqlite3_io_methods methods;
    const sqlite3_io_methods* original;
  };

  ErrorKeepingFileSystem(const char* name, bool looks) : _methods(*original()) {
    _methods.zName = name;
    _methods.pNext = nullptr;
    _methods.szOsFile += static_cast<int>(sizeof(Methods));
    _methods.xOpen = looks ? openToLook : open;
    if (looks) {
      _methods.xDelete = refuseToDelete;
    }
    sqlite3_vfs_register(&_methods, 0);
  }
  ~ErrorKeepingFileSystem() { sqlite3_vfs_unregister(&_methods); }

  static sqlite3_vfs* original() {
    static sqlite3_vfs* const found = sqlite3_vfs_find(nullptr);
    return found;
  }

  static Methods* methodsOf(sqlite3_file* file) {
    void* behind = reinterpret_cast<std::uint8_t*>(file) + original()->szOsFile;
    return static_cast<Methods*>(behind);
  }

  static int open(sqlite3_vfs* /*self*/, const char* name, sqlite3_file* file, int flags,
                  int* flagsTaken) {
    const int result = original()->xOpen(original(), name, file, flags, flagsTaken);
    if (result == SQLITE_OK) {
      Methods* const methods = new (methodsOf(file)) Methods{*file->pMethods, file->pMethods};
      methods->methods.xRead = read;
      file->pMethods = &methods->methods;
    }
    return result;
  }

  static int openToLook(sqlite3_vfs* self, const char* name, sqlite3_file* file, int flags,
                        int* flagsTaken) {
    constexpr int kWriting = SQLITE_OPEN_READWRITE | SQLITE_OPEN_CREATE | SQLITE_OPEN_DELETEONCLOSE;
    const int result =
        open(self, name, file, (flags & ~kWriting) | SQLITE_OPEN_READONLY, flagsTaken);
    if (result == SQLITE_OK) {
      methodsOf(file)->methods.iVersion = 1;  // without shared memory, whose file would be made
    }
    return result;
  }

  static int refuseToDelete(sqlite3_vfs* /*self*/, const char* /*name*/, int /*syncFolder*/) {
    return SQLITE_READONLY;
  }

  static int read(sqlite3_file* file, void* bytes, int length, sqlite3_int64 offset) {
    const int result = methodsOf(file)->original->xRead(file, bytes, length, offset);
    return result == SQLITE_IOERR_CORRUPTFS ? SQLITE_IOERR_READ : result;
  }

  sqlite3_vfs _methods;
};

/// SQLite would wait at a pipe for ever, and take whatever lies beside a file for its journal.
void requireOwnCompanions(const std::string& path) {
  struct stat database {};
  for (const char* const end : {"-journal", "-wal", "-shm"}) {
    const std::string name = path + end;
    struct stat beside {};
    if (lstat(name.c_str(), &beside) != 0 || stat(path.c_str(), &database) != 0) {
      continue;
    }
    const bool isOwn = beside.st_uid == database.st_uid || beside.st_uid == geteuid();
    if (!S_ISREG(beside.st_mode) || !isOwn) {
      throw SqliteFailure{SQLITE_CANTOPEN,
                          name + (isOwn ? ": not a regular file" : ": belongs to another user")};
    }
  }
}

}  // namespace

bool SqliteFailure::isCorruption() const {
  switch (code & 0xFF) {
    case SQLITE_CORRUPT:
    case SQLITE_NOTADB:
    case SQLITE_ERROR:  // our statements are sound, so a table or column is missing
    case SQLITE_MISMATCH:
    case SQLITE_TOOBIG:
    case SQLITE_CONSTRAINT:  // rows that contradict the schema
    case SQLITE_INTERRUPT:   // too much work
      return true;
    default:
      return false;
  }
}

SqliteConnection::SqliteConnection(const std::string& path, std::chrono::milliseconds longestWait,
                                   bool looks)
    : _path(path) {
  requireOwnCompanions(path);
  sqlite3* database = nullptr;
  const int result = sqlite3_open_v2(path.c_str(), &database,
                                     (looks ? SQLITE_OPEN_READONLY : SQLITE_OPEN_READWRITE) |
                                         SQLITE_OPEN_NOMUTEX | SQLITE_OPEN_EXRESCODE,
                                     ErrorKeepingFileSystem::name(looks));
  _database.reset(database);
  if (result != SQLITE_OK) {
    fail(result);
  }
  _looks = looks;
  sqlite3_busy_timeout(database, static_cast<int>(longestWait.count()));
  sqlite3_db_config(database, SQLITE_DBCONFIG_DEFENSIVE, 1, nullptr);
  sqlite3_db_config(database, SQLITE_DBCONFIG_TRUSTED_SCHEMA, 0, nullptr);
  sqlite3_limit(database, SQLITE_LIMIT_LENGTH, kMaxCell);
  sqlite3_limit(database, SQLITE_LIMIT_SQL_LENGTH, kMaxStatement);
  _workLeft = std::make_unique<std::int64_t>(kMaxOpeningWork);
  sqlite3_progress_handler(database, kStepsCounted, countWork, _workLeft.get());
  // EXTRA: the end of a transaction is the removal of its journal, which must be durable too.
  execute("PRAGMA cell_size_check = ON; PRAGMA synchronous = EXTRA");
  sqlite3_file* file = nullptr;
  sqlite3_int64 size = 0;
  if (sqlite3_file_control(database, "main", SQLITE_FCNTL_FILE_POINTER, &file) == SQLITE_OK &&
      file->pMethods != nullptr && file->pMethods->xFileSize(file, &size) != SQLITE_OK) {
    size = 0;
  }
  _allowedWork = kMinAllowedWork + size / kBytesPerWork;
}

void SqliteConnection::allowWork() const {
  if (_allowedWork != 0) {
    *_workLeft = _allowedWork;
  }
}

int SqliteConnection::countWork(void* left) { return --*static_cast<std::int64_t*>(left) < 0; }

void SqliteConnection::execute(const char* sql) {
  allowWork();
  const int result = sqlite3_exec(handle(), sql, nullptr, nullptr, nullptr);
  if (result != SQLITE_OK) {
    fail(result);
  }
}

std::int64_t SqliteConnection::queryInteger(const char* sql) {
  SqliteStatement statement(*this, sql);
  return statement.step() ? statement.integer(0) : 0;
}

std::string SqliteConnection::schema() const {
  SqliteStatement rows(*this,
                       "SELECT quote(type), quote(name), quote(tbl_name), quote(sql) "
                       "FROM sqlite_schema ORDER BY name");
  std::string text;
  while (rows.step()) {
    for (int column = 0; column < 4; ++column) {
      text.append(rows.text(column)).append(column < 3 ? " " : "\n");
    }
  }
  return text;
}

void SqliteConnection::commit() {
  const int result = sqlite3_exec(handle(), "COMMIT", nullptr, nullptr, nullptr);
  // After these failures the journal is gone: no way back.
  if (result != SQLITE_OK && result != SQLITE_IOERR_DIR_FSYNC && result != SQLITE_IOERR_UNLOCK &&
      result != SQLITE_IOERR_RDLOCK) {
    fail(result);
  }
}

int SqliteConnection::formatVersion() const {
  constexpr sqlite3_int64 kOffset = 18;
  sqlite3_file* file = nullptr;
  std::uint8_t version = 0;
  int result = sqlite3_file_control(handle(), "main", SQLITE_FCNTL_FILE_POINTER, &file);
  if (result == SQLITE_OK) {
    result = file->pMethods->xRead(file, &version, sizeof version, kOffset);
  }
  if (result != SQLITE_OK && result != SQLITE_IOERR_SHORT_READ) {
    fail(result);
  }
  return version;
}

void SqliteConnection::fail(int code) const {
  if (_looks && (code == SQLITE_READONLY_ROLLBACK || code == SQLITE_CANTOPEN)) {
    throw SqliteFailure{code, _path +
                                  (code == SQLITE_CANTOPEN ? ": has a write-ahead log"
                                                           : ": the last commit was cut off") +
                                  ", which only a command that may write can take in"};
  }
  if ((code & 0xFF) == SQLITE_BUSY) {
    throw SqliteFailure{code, _path + ": another process keeps it locked"};
  }
  if ((code & 0xFF) == SQLITE_INTERRUPT) {
    throw SqliteFailure{code, _path + ": takes more work than its size explains"};
  }
  const bool ofThisCall = handle() != nullptr && sqlite3_extended_errcode(handle()) == code;
  throw SqliteFailure{
      code, _path + ": " + (ofThisCall ? sqlite3_errmsg(handle()) : sqlite3_errstr(code))};
}

void SqliteConnection::failAsCorrupt(const std::string& what) const {
  throw SqliteFailure{SQLITE_CORRUPT, _path + ": " + what};
}

std::string newSqliteFile(const std::string& statements) {
  SqliteConnection database(":memory:", std::chrono::milliseconds::zero());
  database.execute(statements.c_str());
  sqlite3_int64 size = 0;
  const std::unique_ptr<unsigned char, decltype(&sqlite3_free)> bytes(
      sqlite3_serialize(database.handle(), "main", &size, 0), sqlite3_free);
  if (!bytes) {
    database.fail(SQLITE_NOMEM);
  }
  return {reinterpret_cast<const char*>(bytes.get()), static_cast<std::size_t>(size)};
}

std::string schemaOf(const std::string& statements) {
  SqliteConnection database(":memory:", std::chrono::milliseconds::zero());
  database.execute(statements.c_str());
  return database.schema();
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
  if (sqlite3_stmt_busy(_statement.get()) == 0) {
    _connection.allowWork();
  }
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

}  // namespace vesprun
