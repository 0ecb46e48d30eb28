#include <sqlite3.h>
#include <sys/stat.h>

#include <chrono>
#include <cstdio>
#include <filesystem>

#include "SqliteStoreParts.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

// A line's number is never reused, or stale entries of chunks would become valid again. The index
// has all that questions need of a line.
constexpr const char* kSchema = R"(
  PRAGMA application_id = 0x76666C74;
  PRAGMA user_version = 2;
  CREATE TABLE rule(least INTEGER NOT NULL, first_day INTEGER NOT NULL) STRICT;
  CREATE TABLE forgotten(device BLOB PRIMARY KEY) STRICT, WITHOUT ROWID;
  CREATE TABLE device(number INTEGER PRIMARY KEY, name TEXT NOT NULL UNIQUE) STRICT;
  CREATE TABLE key(number INTEGER PRIMARY KEY, kind INTEGER NOT NULL, name TEXT NOT NULL,
                   UNIQUE(name, kind)) STRICT;
  CREATE TABLE text(number INTEGER PRIMARY KEY, name TEXT NOT NULL UNIQUE) STRICT;
  CREATE TABLE shape(number INTEGER PRIMARY KEY, digest BLOB NOT NULL UNIQUE,
                     keys BLOB NOT NULL) STRICT;
  CREATE TABLE line(number INTEGER PRIMARY KEY AUTOINCREMENT, day INTEGER NOT NULL,
                    device INTEGER NOT NULL, revision INTEGER NOT NULL, seconds INTEGER NOT NULL,
                    nanoseconds INTEGER NOT NULL, digest BLOB NOT NULL, build INTEGER,
                    model INTEGER, whitelist INTEGER NOT NULL, shape INTEGER NOT NULL) STRICT;
  CREATE INDEX line_of_day ON line(day, device, shape, build, model, whitelist);
  CREATE TABLE chunk(number INTEGER PRIMARY KEY, last INTEGER NOT NULL, entries BLOB NOT NULL)
    STRICT;
  CREATE TABLE replaced(day INTEGER PRIMARY KEY, lines INTEGER NOT NULL) STRICT;)";

// What version 0.9 made; only the lines' texts are taken from it.
constexpr const char* kEarlierSchema = R"(
  CREATE TABLE device(number INTEGER PRIMARY KEY, name TEXT NOT NULL UNIQUE) STRICT;
  CREATE TABLE key(number INTEGER PRIMARY KEY, kind INTEGER NOT NULL, name TEXT NOT NULL,
                   UNIQUE(name, kind)) STRICT;
  CREATE TABLE label(number INTEGER PRIMARY KEY, name TEXT NOT NULL UNIQUE) STRICT;
  CREATE TABLE line(number INTEGER PRIMARY KEY AUTOINCREMENT, day INTEGER NOT NULL,
                    device INTEGER NOT NULL, revision INTEGER NOT NULL, seconds INTEGER NOT NULL,
                    nanoseconds INTEGER NOT NULL, size INTEGER NOT NULL, text BLOB NOT NULL,
                    UNIQUE(day, device)) STRICT;
  CREATE TABLE chunk(number INTEGER PRIMARY KEY, last INTEGER NOT NULL, entries BLOB NOT NULL)
    STRICT;
  CREATE TABLE replaced(lines INTEGER NOT NULL) STRICT;)";
constexpr std::int64_t kApplication = 0x76666C74;
constexpr std::int64_t kPageSize = 4096;

// One load waits for another, which commits batch by batch.
constexpr std::chrono::minutes kMaxWait{5};

constexpr int kMaxCell = 256 * 1024 * 1024;  // a chunk of lines that are as long as they may be

/// Makes the file unless it is there, complete or not at all. False when it was there.
bool makeStore(const std::string& path, int least) {
  std::error_code ignored;
  if (std::filesystem::exists(std::filesystem::symlink_status(path, ignored))) {
    return false;
  }
  const std::filesystem::path file(path);
  const std::string folder = file.has_parent_path() ? file.parent_path().string() : ".";
  std::string error;
  auto added = AtomicFile::Added::Failed;
  if (auto document = AtomicFile::create(folder, error)) {
    document->append(newSqliteFile("PRAGMA page_size = " + std::to_string(kPageSize) +
                                   "; PRAGMA auto_vacuum = INCREMENTAL;" + kSchema +
                                   "INSERT INTO rule VALUES(" + std::to_string(least) + ", 0)"));
    added = document->addNew(file.filename().string(), error);
  }
  if (added == AtomicFile::Added::Failed) {
    throw StoreFailure(error);
  }
  return added == AtomicFile::Added::Done;
}

}  // namespace

void SqliteStore::open(StoreUse use, std::optional<int> least) {
  const bool isNew = use == StoreUse::Load && makeStore(_path, least.value_or(kUsualLeast));
  struct stat status {};
  if (stat(_path.c_str(), &status) == 0 && !S_ISREG(status.st_mode)) {
    throw StoreFailure(_path + ": no fleet store");
  }
  if (use != StoreUse::Ask) {
    _turn.open(_path);
  }
  bool isEarlier = false;
  try {
    _database = std::make_unique<SqliteConnection>(_path, kMaxWait);
    sqlite3_limit(_database->handle(), SQLITE_LIMIT_LENGTH, kMaxCell);
    const std::string schema = _database->schema();
    const std::int64_t version = _database->queryInteger("PRAGMA user_version");
    isEarlier = version == 1 && schema == schemaOf(kEarlierSchema);
    if (_database->queryInteger("PRAGMA application_id") != kApplication ||
        !(isEarlier || (version == 2 && schema == schemaOf(kSchema)))) {
      throw StoreFailure(_path + ": no fleet store");
    }
  } catch (const SqliteFailure& failure) {
    if (failure.isCorruption()) {
      throw StoreFailure(_path + ": no fleet store");
    }
    throw;
  }
  _database->execute("PRAGMA cache_size = -65536");
  if (isEarlier && use != StoreUse::Load) {
    throw StoreFailure(_path +
                       ": a store of an earlier version; \"vespfleet load\" brings it up to date");
  }
  if (isEarlier) {
    bringUpToDate();
  }
  if (use == StoreUse::Load && _database->queryInteger("PRAGMA page_size") != kPageSize) {
    _turn.take();
    _database->execute("PRAGMA page_size = 4096; PRAGMA auto_vacuum = INCREMENTAL; VACUUM");
    _turn.giveUp();
  }
  _least = static_cast<std::uint64_t>(_database->queryInteger("SELECT least FROM rule"));
  if (!isNew && least && static_cast<std::uint64_t>(*least) != _least) {
    throw StoreFailure(_path + ": the least number of devices of this store is " +
                       std::to_string(_least));
  }
}

/// Takes what an earlier version stored, in one transaction: its lines' texts.
void SqliteStore::bringUpToDate() {
  _turn.take();
  _database->execute("BEGIN EXCLUSIVE");
  if (_database->queryInteger("PRAGMA user_version") != 1) {  // another load did it meanwhile
    _database->execute("ROLLBACK");
    _turn.giveUp();
    return;
  }
  _database->execute(
      "ALTER TABLE line RENAME TO earlier_line; DROP TABLE device; DROP TABLE key;"
      "DROP TABLE label; DROP TABLE chunk; DROP TABLE replaced");
  _database->execute(kSchema);
  SqliteStatement rule(*_database, "INSERT INTO rule VALUES(?, 0)");
  rule.bind(1, kUsualLeast).run();
  prepareChanges();
  {
    SqliteStatement lines(*_database, "SELECT size, text FROM earlier_line ORDER BY number");
    while (lines.step()) {
      const std::string text =
          unpacked(lines.bytes(1), static_cast<std::uint64_t>(lines.integer(0)));
      std::string why;
      if (const auto line = parseExportedLine(text, why, 1)) {
        place(*line);
        if (_pending.size() >= kMaxPending) {
          writePending();
        }
      } else {
        std::fprintf(stderr, "vespfleet load: %s: a line of the earlier version is dropped: %s\n",
                     _path.c_str(), why.c_str());
      }
    }
  }
  writePending();
  _database->execute("DROP TABLE earlier_line");
  _database->commit();
  _turn.giveUp();
  _numbers.clear();
  _lastKeys.clear();
}

}  // namespace vesprun
