#include "platform/host/counters/CounterStore.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <mutex>
#include <utility>

#include "platform/host/counters/ChunkEnumerator.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/documents/XmlText.h"
#include "vesprun/PropertyValue.h"

namespace vesprun {
namespace {

constexpr std::int64_t kApplicationIdentifier = 0x56455350;  // "VESP"
constexpr std::int64_t kSchemaVersion = 1;
constexpr int kMaxFormatVersion = 2;  // of SQLite's files
constexpr std::size_t kMaxKeySize = 1024 * 1024;

// Pages of 16 KiB: a chunk of samples is read by few calls. Files are compared with this text,
// spaces included.
constexpr const char* kSchema = R"(
  PRAGMA page_size = 16384;
  PRAGMA auto_vacuum = INCREMENTAL;
  CREATE TABLE scalar (
    day INTEGER NOT NULL,
    key TEXT NOT NULL,
    value INTEGER NOT NULL,
    PRIMARY KEY (day, key)
  ) STRICT, WITHOUT ROWID;
  CREATE TABLE distribution (
    id INTEGER PRIMARY KEY,
    day INTEGER NOT NULL,
    key TEXT NOT NULL,
    UNIQUE (day, key)
  ) STRICT;
  CREATE TABLE chunk (
    distribution INTEGER NOT NULL REFERENCES distribution (id),
    sequence INTEGER NOT NULL,
    samples BLOB NOT NULL,
    offsets BLOB NOT NULL,
    PRIMARY KEY (distribution, sequence)
  ) STRICT;
  PRAGMA application_id = 0x56455350;
  PRAGMA user_version = 1;
)";

constexpr const char* kMarkTable =
    "CREATE TABLE IF NOT EXISTS mark (place TEXT PRIMARY KEY, device INTEGER NOT "
    "NULL, value INTEGER NOT NULL, text TEXT NOT NULL) STRICT, WITHOUT ROWID";

bool hasOurTables(const std::string& schema) {
  static const std::string withoutMarks = schemaOf(kSchema);
  static const std::string withMarks = schemaOf(std::string(kSchema) + kMarkTable);
  return schema == withoutMarks || schema == withMarks;
}

/// `wrapping_sum` in statements: one look-up of the row is enough to add to it.
void sumInStatement(sqlite3_context* context, int /*count*/, sqlite3_value** values) {
  if (sqlite3_value_type(values[0]) != SQLITE_INTEGER) {
    sqlite3_result_error_code(context, SQLITE_CORRUPT);
    return;
  }
  sqlite3_result_int64(context,
                       wrappingSum(sqlite3_value_int64(values[0]), sqlite3_value_int64(values[1])));
}

void appendBytes(Bytes& bytes, const void* value, std::size_t size) {
  const std::size_t end = bytes.size();
  bytes.resize(end + size);
  std::memcpy(bytes.data() + end, value, size);
}

}  // namespace

bool isCounterKey(std::string_view key, std::string& error) {
  const std::size_t good = xmlTextLength(key);
  if (good != key.size()) {
    error = "the key " + quotedText(key) + " has, at byte " + std::to_string(good) +
            ", what no ptree document can carry";
    return false;
  }
  if (key.size() > kMaxKeySize) {
    error = "the key " + quotedText(key) + " is longer than 1 MiB";
    return false;
  }
  return true;
}

struct CounterStore::Writer {
  explicit Writer(const SqliteConnection& connection)
      : putScalar(connection,
                  "INSERT INTO scalar (day, key, value) VALUES (?, ?, ?) "
                  "ON CONFLICT DO UPDATE SET value = excluded.value"),
        addScalar(connection,
                  "INSERT INTO scalar (day, key, value) VALUES (?, ?, ?) "
                  "ON CONFLICT DO UPDATE SET value = wrapping_sum(value, excluded.value)"),
        findDistribution(connection, "SELECT id FROM distribution WHERE day = ? AND key = ?"),
        putDistribution(connection, "INSERT INTO distribution (day, key) VALUES (?, ?)"),
        lastChunk(connection,
                  "SELECT sequence, samples, offsets FROM chunk WHERE distribution = ? "
                  "ORDER BY sequence DESC LIMIT 1"),
        putChunk(connection,
                 "INSERT OR REPLACE INTO chunk (distribution, sequence, samples, offsets) "
                 "VALUES (?, ?, ?, ?)") {}

  SqliteStatement putScalar;
  SqliteStatement addScalar;
  SqliteStatement findDistribution;
  SqliteStatement putDistribution;
  SqliteStatement lastChunk;
  SqliteStatement putChunk;
};

CounterStore::CounterStore(std::string path, std::chrono::milliseconds longestWait, Access access)
    : _path(std::move(path)), _longestWait(longestWait), _access(access) {
  readTwice([this] { open(); });
}

void CounterStore::open() {
  // One thread at a time: SQLite takes a thread that is about to take a cut-off commit back for a
  // writer at work, and reads the file as that commit left it.
  static std::mutex opening;
  const std::scoped_lock guard(opening);
  ++_opening;
  _connection = SqliteConnection(_path, _longestWait, _access == Access::Looking);
  const std::int64_t version = _connection.queryInteger("PRAGMA user_version");
  const bool isOurs = _connection.queryInteger("PRAGMA application_id") == kApplicationIdentifier;
  if (isOurs && version > kSchemaVersion) {
    throw SqliteFailure{kWrittenByNewerProgram, _path + ": written by a newer version of vesprun"};
  }
  if (!isOurs || version != kSchemaVersion) {
    _connection.failAsCorrupt("not a counter database of this version");
  }
  // SQLite takes an unknown format version for a database of the future and never writes to it.
  if (_connection.formatVersion() > kMaxFormatVersion) {
    _connection.failAsCorrupt("the header is damaged");
  }
  _connection.execute(_access == Access::Writing ? "BEGIN IMMEDIATE" : "BEGIN");
  // A view or trigger in place of our tables could do anything, or never end.
  if (!hasOurTables(_connection.schema())) {
    _connection.failAsCorrupt("its tables are not those of a counter database");
  }
}

std::string CounterStore::emptyDatabase() { return newSqliteFile(kSchema); }

void CounterStore::makeMarkTable() { _connection.execute(kMarkTable); }

CounterStore::Writer& CounterStore::writer() {
  if (!_writer) {
    const int result = sqlite3_create_function_v2(_connection.handle(), "wrapping_sum", 2,
                                                  SQLITE_UTF8 | SQLITE_DETERMINISTIC, nullptr,
                                                  sumInStatement, nullptr, nullptr, nullptr);
    if (result != SQLITE_OK) {
      _connection.fail(result);
    }
    _writer = std::make_shared<Writer>(_connection);
  }
  return *_writer;
}

void CounterStore::setScalar(std::int32_t day, std::string_view key, std::int64_t value) {
  writer().putScalar.bind(1, day).bind(2, key).bind(3, value).run();
}

void CounterStore::addToScalar(std::int32_t day, std::string_view key, std::int64_t value) {
  writer().addScalar.bind(1, day).bind(2, key).bind(3, value).run();
}

std::int64_t CounterStore::distributionForWriting(std::int32_t day, std::string_view key) {
  SqliteStatement& find = writer().findDistribution.bind(1, day).bind(2, key);
  const bool found = find.step();
  const std::int64_t id = found ? find.integer(0) : 0;
  find.reset();
  if (found) {
    return id;
  }
  writer().putDistribution.bind(1, day).bind(2, key).run();
  return sqlite3_last_insert_rowid(_connection.handle());
}

void CounterStore::appendSamples(std::int32_t day, std::string_view key,
                                 std::span<const Sample> samples) {
  const std::int64_t distribution = distributionForWriting(day, key);
  Bytes values;
  Bytes offsets;
  std::int64_t sequence = 0;
  SqliteStatement& last = writer().lastChunk.bind(1, distribution);
  if (last.step()) {
    sequence = last.integer(0);
    const auto lastValues = last.bytes(1);
    const auto lastOffsets = last.bytes(2);
    if (lastValues.size() % sizeof(double) != 0 ||
        lastOffsets.size() / sizeof(std::int32_t) != lastValues.size() / sizeof(double)) {
      _connection.failAsCorrupt("a chunk of samples has a wrong length");
    }
    if (lastValues.size() / sizeof(double) < kSamplesPerChunk) {
      values.assign(lastValues.begin(), lastValues.end());
      offsets.assign(lastOffsets.begin(), lastOffsets.end());
    } else {
      ++sequence;
    }
  }
  last.reset();
  while (!samples.empty()) {
    const std::size_t taken =
        std::min(samples.size(), kSamplesPerChunk - values.size() / sizeof(double));
    for (const Sample& sample : samples.first(taken)) {
      appendBytes(values, &sample.value, sizeof sample.value);
      appendBytes(offsets, &sample.secondsInDay, sizeof sample.secondsInDay);
    }
    writer()
        .putChunk.bind(1, distribution)
        .bind(2, sequence)
        .bind(3, values)
        .bind(4, offsets)
        .run();
    samples = samples.subspan(taken);
    ++sequence;
    values.clear();
    offsets.clear();
  }
}

/// Delivers the rows of `select` (day, key and a third column, between two days, from a day and key
/// on) whose key begins with `keyPrefix`, until the handler stops. Checks that rows come in order
/// and with valid keys.
template <typename Deliver>
void CounterStore::forEachRow(const char* what, const char* select, std::string_view keyPrefix,
                              std::int32_t minDay, std::int32_t maxDay, const Deliver& deliver) {
  std::optional<SqliteStatement> rows;
  int opening = 0;
  std::uint64_t count = 0;
  std::int64_t lastDay = minDay;
  std::string lastKey;
  std::int64_t third = 0;
  const auto next = [&] {
    const bool begins = opening != _opening;  // where it broke off: the last row may come again
    if (begins) {
      rows.emplace(_connection, select);
      rows->bind(1, lastDay).bind(2, std::string_view(lastKey)).bind(3, maxDay);
      opening = _opening;
    }
    bool found = rows->step();
    if (begins && count != 0 && found && rows->integer(0) == lastDay && rows->text(1) == lastKey) {
      found = rows->step();
    }
    if (!found) {
      return false;
    }
    const std::int64_t day = rows->integer(0);
    const std::string_view key = rows->text(1);
    if (!isXmlText(key)) {
      _connection.failAsCorrupt("a key is no text");
    }
    if (day < lastDay || (day == lastDay && (count == 0 ? key < lastKey : key <= lastKey))) {
      _connection.failAsCorrupt("rows are out of order");
    }
    third = rows->integer(2);
    lastDay = day;
    lastKey = key;
    ++count;
    return true;
  };
  bool stop = false;
  bool isDelivering = false;
  try {
    while (!stop && readTwice(next)) {
      isDelivering = true;
      if (std::string_view(lastKey).starts_with(keyPrefix)) {
        deliver(lastKey, static_cast<std::int32_t>(lastDay), third, stop);
      }
      isDelivering = false;
    }
  } catch (const SqliteFailure& failure) {
    std::string text = failure.text + (isDelivering ? " " : ", after ");
    text += std::to_string(count) + ' ' + what;
    if (count != 0) {
      text += " up to " + quotedText(lastKey) + " of day " + std::to_string(lastDay);
    }
    throw SqliteFailure{failure.code, std::move(text)};
  }
}

void CounterStore::readScalars(std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
                               const TBHistory::ScalarRowHandler& handler) {
  forEachRow("scalars",
             "SELECT day, key, value FROM scalar WHERE (day, key) >= (?, ?) AND day <= ? "
             "ORDER BY day, key",
             keyPrefix, minDay, maxDay, handler);
}

void CounterStore::readDistributions(std::string_view keyPrefix, std::int32_t minDay,
                                     std::int32_t maxDay,
                                     const TBHistory::DistributionRowHandler& handler) {
  ChunkEnumerator values(*this);
  forEachRow("distributions",
             "SELECT day, key, id FROM distribution WHERE (day, key) >= (?, ?) AND day <= ? "
             "ORDER BY day, key",
             keyPrefix, minDay, maxDay,
             [&](std::string_view key, std::int32_t day, std::int64_t id, bool& stop) {
               values.start(id);
               handler(key, day, values, stop);
               values.rethrowFailure();
             });
}

CounterStore::Rows CounterStore::rowsBefore(std::int64_t day) {
  Rows rows;
  SqliteStatement days(_connection,
                       "SELECT day FROM scalar WHERE day < ?1 UNION "
                       "SELECT day FROM distribution WHERE day < ?1 ORDER BY day");
  for (days.bind(1, day); days.step();) {
    rows.days.push_back(static_cast<std::int32_t>(days.integer(0)));
  }
  const auto count = [&](const char* sql) {
    SqliteStatement counting(_connection, sql);
    return counting.bind(1, day).step() ? counting.integer(0) : 0;
  };
  rows.distributions = count("SELECT count(*) FROM distribution WHERE day < ?");
  rows.scalars = count("SELECT count(*) FROM scalar WHERE day < ?");
  return rows;
}

void CounterStore::removeDay(std::int32_t day) {
  for (const char* const sql :
       {"DELETE FROM chunk WHERE distribution IN (SELECT id FROM distribution WHERE day = ?)",
        "DELETE FROM distribution WHERE day = ?", "DELETE FROM scalar WHERE day = ?"}) {
    SqliteStatement(_connection, sql).bind(1, day).run();
  }
}

void CounterStore::returnFreeSpace() {
  constexpr std::int64_t kIncremental = 2;
  if (_connection.queryInteger("PRAGMA auto_vacuum") == kIncremental) {
    _connection.execute("PRAGMA incremental_vacuum");
  } else if (_connection.queryInteger("PRAGMA freelist_count") != 0) {
    _writer.reset();
    _connection.commit();
    _connection.execute("PRAGMA auto_vacuum = INCREMENTAL; VACUUM; BEGIN IMMEDIATE");
  }
}

std::optional<std::int32_t> CounterStore::nextDay(std::int64_t day) {
  return readTwice([&]() -> std::optional<std::int32_t> {
    SqliteStatement next(_connection,
                         "SELECT min(day) FROM (SELECT min(day) AS day FROM scalar WHERE day > ?1 "
                         "UNION ALL SELECT min(day) FROM distribution WHERE day > ?1)");
    next.bind(1, day);
    if (!next.step() || next.isNull(0)) {
      return std::nullopt;
    }
    const std::int64_t found = next.integer(0);
    if (found <= day || found > std::numeric_limits<std::int32_t>::max()) {
      _connection.failAsCorrupt("a day is out of range");
    }
    return static_cast<std::int32_t>(found);
  });
}

}  // namespace vesprun
