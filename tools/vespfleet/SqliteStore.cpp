#include "SqliteStore.h"

#include <sqlite3.h>
#include <sys/stat.h>
#include <zlib.h>

#include <algorithm>
#include <chrono>
#include <filesystem>
#include <map>
#include <span>
#include <tuple>

#include "Varint.h"
#include "platform/host/files/AtomicFile.h"

namespace vesprun {
namespace {

// `line` numbers are never used again: what chunks have of a replaced line must not come back.
constexpr const char* kSchema = R"(
  PRAGMA page_size = 16384;
  PRAGMA application_id = 0x76666C74;
  PRAGMA user_version = 1;
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
  CREATE TABLE replaced(lines INTEGER NOT NULL) STRICT;
  INSERT INTO replaced VALUES(0);)";
constexpr std::int64_t kApplication = 0x76666C74;

// One chunk is one page of the file.
constexpr std::size_t kChunkSize = 12U * 1024;
constexpr std::int64_t kChunksOfKey = std::int64_t{1} << 32;

// What a load keeps in memory and writes in one transaction.
constexpr std::size_t kBatchBytes = 32U * 1024 * 1024;
constexpr std::size_t kBatchTails = 20000;

// One load waits for another, which commits batch by batch.
constexpr std::chrono::minutes kLongestWait{5};

constexpr int kLongestCell = 1024 * 1024 * 1024;

std::string compressed(std::string_view text) {
  std::string bytes(compressBound(text.size()), '\0');
  uLongf size = bytes.size();
  if (compress2(reinterpret_cast<Bytef*>(bytes.data()), &size,
                reinterpret_cast<const Bytef*>(text.data()), text.size(), Z_BEST_SPEED) != Z_OK) {
    throw std::bad_alloc();
  }
  bytes.resize(size);
  return bytes;
}

std::string uncompressed(std::span<const std::uint8_t> bytes, std::int64_t size) {
  std::string text(static_cast<std::size_t>(size), '\0');
  uLongf length = text.size();
  if (uncompress(reinterpret_cast<Bytef*>(text.data()), &length, bytes.data(), bytes.size()) !=
          Z_OK ||
      length != text.size()) {
    throw std::out_of_range("a line that does not unpack");
  }
  return text;
}

std::span<const std::uint8_t> asBytes(std::string_view text) {
  return {reinterpret_cast<const std::uint8_t*>(text.data()), text.size()};
}

std::string_view asText(std::span<const std::uint8_t> bytes) {
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

/// Makes the file unless it is there, complete or not at all.
void makeStore(const std::string& path) {
  std::error_code ignored;
  if (std::filesystem::exists(std::filesystem::symlink_status(path, ignored))) {
    return;
  }
  const std::filesystem::path file(path);
  const std::string folder = file.has_parent_path() ? file.parent_path().string() : ".";
  std::string error;
  auto added = AtomicFile::Added::Failed;
  if (auto document = AtomicFile::create(folder, error)) {
    document->append(newSqliteFile(kSchema));
    added = document->addNew(file.filename().string(), error);
  }
  if (added == AtomicFile::Added::Failed) {
    throw StoreFailure(error);
  }
}

/// Labels by their numbers in `label`.
struct PackedDistribution {
  Statistics statistics;
  bool hasHistogram = false;
  std::vector<std::pair<std::int64_t, std::uint64_t>> counts;
};

PackedDistribution readDistribution(PackedReader& entries) {
  PackedDistribution value;
  value.statistics.minimum = entries.raw<double>();
  value.statistics.maximum = entries.raw<double>();
  value.statistics.mean = entries.raw<double>();
  value.statistics.deviations = entries.raw<double>();
  value.statistics.count = static_cast<std::int64_t>(entries.varint());
  std::uint64_t labels = entries.varint();
  value.hasHistogram = labels != 0;
  for (; labels > 1; --labels) {
    const auto label = static_cast<std::int64_t>(entries.varint());
    value.counts.emplace_back(label, entries.varint());
  }
  return value;
}

/// Reads a value of which only the line matters.
void passOver(KeyKind kind, PackedReader& entries) {
  if (kind == KeyKind::Scalar) {
    entries.varint();
    return;
  }
  for (int number = 0; number < 4; ++number) {
    entries.raw<double>();
  }
  entries.varint();
  for (std::uint64_t labels = entries.varint(); labels > 1; --labels) {
    entries.varint();
    entries.varint();
  }
}

}  // namespace

struct SqliteStore::Statements {
  explicit Statements(const SqliteConnection& opened) : database(opened) {}

  const SqliteConnection& database;
  SqliteStatement findLine{database,
                           "SELECT number, revision, seconds, nanoseconds, size, text FROM line"
                           " WHERE day = ? AND device = ?"};
  SqliteStatement remove{database, "DELETE FROM line WHERE number = ?"};
  SqliteStatement insert{database,
                         "INSERT INTO line(day, device, revision, seconds, nanoseconds, size, text)"
                         " VALUES(?, ?, ?, ?, ?, ?, ?)"};
  SqliteStatement lastChunk{database,
                            "SELECT number, last, entries FROM chunk WHERE number >= ? AND"
                            " number < ? ORDER BY number DESC LIMIT 1"};
  SqliteStatement writeChunk{database,
                             "INSERT OR REPLACE INTO chunk(number, last, entries) VALUES(?, ?, ?)"};
  SqliteStatement countReplaced{database, "UPDATE replaced SET lines = lines + 1"};
};

/// Turns what goes wrong in the file into one line.
template <typename Task>
auto SqliteStore::guarded(const Task& task) {
  try {
    return task();
  } catch (const SqliteFailure& failure) {
    throw StoreFailure(failure.text);
  } catch (const std::out_of_range& damage) {
    throw StoreFailure(_path + ": the store is damaged: " + damage.what());
  }
}

SqliteStore::SqliteStore(const std::string& path, bool toBeLoaded) : _path(path) {
  guarded([&] {
    if (toBeLoaded) {
      makeStore(path);
    }
    struct stat status {};
    if (stat(path.c_str(), &status) == 0 && !S_ISREG(status.st_mode)) {
      throw StoreFailure(path + ": no fleet store");
    }
    try {
      _database = std::make_unique<SqliteConnection>(path, kLongestWait);
      sqlite3_limit(_database->handle(), SQLITE_LIMIT_LENGTH, kLongestCell);
      if (_database->queryInteger("PRAGMA application_id") != kApplication ||
          _database->queryInteger("PRAGMA user_version") != 1) {
        throw StoreFailure(path + ": no fleet store");
      }
    } catch (const SqliteFailure& failure) {
      if (failure.isCorruption()) {
        throw StoreFailure(path + ": no fleet store");
      }
      throw;
    }
    _database->execute("PRAGMA cache_size = -65536");
    if (toBeLoaded) {
      _statements = std::make_unique<Statements>(*_database);
    }
  });
}

SqliteStore::~SqliteStore() = default;

/// The number of a text in the tables `device`, `key` and `label`; only keys have a kind.
std::optional<std::int64_t> SqliteStore::findNumber(const std::string& table, KeyKind kind,
                                                    std::string_view text) {
  const bool isKey = table == "key";
  const std::string query =
      "SELECT number FROM " + table + " WHERE name = ?" + (isKey ? " AND kind = ?" : "");
  SqliteStatement find(*_database, query.c_str());
  find.bind(1, text);
  if (isKey) {
    find.bind(2, static_cast<std::int64_t>(kind));
  }
  return find.step() ? std::optional(find.integer(0)) : std::nullopt;
}

/// The same, where a text that is not there gets a number.
std::int64_t SqliteStore::numberOf(const std::string& table, KeyKind kind, std::string_view text) {
  std::string cached = table;
  cached.append(kind == KeyKind::Scalar ? "\1" : "\2").append(text);
  if (const auto known = _numbers.find(cached); known != _numbers.end()) {
    return known->second;
  }
  std::optional<std::int64_t> number = findNumber(table, kind, text);
  if (!number) {
    const bool isKey = table == "key";
    const std::string query =
        "INSERT INTO " + table + (isKey ? "(name, kind) VALUES(?, ?)" : "(name) VALUES(?)");
    SqliteStatement insert(*_database, query.c_str());
    insert.bind(1, text);
    if (isKey) {
      insert.bind(2, static_cast<std::int64_t>(kind));
    }
    insert.run();
    number = sqlite3_last_insert_rowid(_database->handle());
  }
  return _numbers.emplace(std::move(cached), *number).first->second;
}

/// Removes the line of the same device and day. False when it stays, as it ranks above `line`.
bool SqliteStore::replacesEarlier(const ExportedLine& line, std::int64_t device) {
  SqliteStatement& find = _statements->findLine;
  find.bind(1, line.day).bind(2, device);
  bool replaces = true;
  std::optional<std::int64_t> earlier;
  if (find.step()) {
    earlier = find.integer(0);
    const auto rank =
        std::tuple(line.revision, line.created.seconds, std::int64_t{line.created.nanoseconds});
    const auto rankOfEarlier = std::tuple(find.integer(1), find.integer(2), find.integer(3));
    replaces = rank == rankOfEarlier ? line.text > uncompressed(find.bytes(5), find.integer(4))
                                     : rank > rankOfEarlier;
  }
  find.reset();
  if (replaces && earlier) {
    _statements->remove.bind(1, *earlier).run();
    _statements->countReplaced.run();
  }
  return replaces;
}

void SqliteStore::add(const ExportedLine& line) {
  guarded([&] {
    if (!_inBatch) {
      beginBatch();
    }
    const std::int64_t device = numberOf("device", KeyKind::Scalar, line.device);
    if (replacesEarlier(line, device)) {
      const std::string text = compressed(line.text);
      _statements->insert.bind(1, line.day)
          .bind(2, device)
          .bind(3, line.revision)
          .bind(4, line.created.seconds)
          .bind(5, std::int64_t{line.created.nanoseconds})
          .bind(6, static_cast<std::int64_t>(line.text.size()))
          .bind(7, asBytes(text))
          .run();
      const std::int64_t number = sqlite3_last_insert_rowid(_database->handle());
      std::string value;
      for (const ReportedScalar& scalar : line.scalars) {
        value.clear();
        appendSigned(value, scalar.value);
        append(numberOf("key", KeyKind::Scalar, scalar.key), number, value);
      }
      for (const ReportedDistribution& reported : line.distributions) {
        const auto& [statistics, histogram] = reported.values;
        value.clear();
        for (const double real :
             {statistics.minimum, statistics.maximum, statistics.mean, statistics.deviations}) {
          appendRaw(value, real);
        }
        appendVarint(value, static_cast<std::uint64_t>(statistics.count));
        appendVarint(value, histogram ? histogram->size() + 1 : 0);
        if (histogram) {
          for (const auto& [label, count] : *histogram) {
            appendVarint(value,
                         static_cast<std::uint64_t>(numberOf("label", KeyKind::Scalar, label)));
            appendVarint(value, count);
          }
        }
        append(numberOf("key", KeyKind::Distribution, reported.key), number, value);
      }
    }
    _batchSize += line.text.size();
    if (_batchSize >= kBatchBytes || _tails.size() >= kBatchTails) {
      commitBatch();
    }
  });
}

SqliteStore::Tail& SqliteStore::tailOf(std::int64_t key) {
  const auto [found, isNew] = _tails.try_emplace(key);
  Tail& tail = found->second;
  if (isNew) {
    SqliteStatement& last = _statements->lastChunk;
    last.bind(1, key * kChunksOfKey).bind(2, (key + 1) * kChunksOfKey);
    if (last.step()) {
      tail = {last.integer(0), last.integer(1), std::string(asText(last.bytes(2)))};
    } else {
      tail.chunk = key * kChunksOfKey;
    }
    last.reset();
  }
  return tail;
}

void SqliteStore::append(std::int64_t key, std::int64_t line, std::string_view value) {
  Tail& tail = tailOf(key);
  if (tail.entries.size() >= kChunkSize) {
    write(tail);
    tail = {tail.chunk + 1, 0, {}};
  }
  appendVarint(tail.entries, static_cast<std::uint64_t>(line - tail.last));
  tail.entries.append(value);
  tail.last = line;
}

void SqliteStore::write(Tail& tail) {
  _statements->writeChunk.bind(1, tail.chunk)
      .bind(2, tail.last)
      .bind(3, asBytes(tail.entries))
      .run();
}

void SqliteStore::beginBatch() {
  _database->execute("BEGIN IMMEDIATE");
  _inBatch = true;
}

void SqliteStore::commitBatch() {
  // In the order of the file.
  std::vector<std::int64_t> keys;
  keys.reserve(_tails.size());
  for (const auto& [key, tail] : _tails) {
    keys.push_back(key);
  }
  std::sort(keys.begin(), keys.end());
  for (const std::int64_t key : keys) {
    write(_tails.at(key));
  }
  _database->commit();
  _inBatch = false;
  _tails.clear();
  _numbers.clear();  // another load may go on from here
  _batchSize = 0;
}

void SqliteStore::finish() {
  guarded([&] {
    if (_inBatch) {
      commitBatch();
    }
    if (_database->queryInteger("SELECT lines > (SELECT count(*) FROM line) FROM replaced") != 0) {
      writeAnew();
    }
  });
}

/// Leaves out of the chunks what replaced lines said.
void SqliteStore::writeAnew() {
  beginBatch();
  const std::vector<Line> lines = linesThatHold({});
  SqliteStatement remove(*_database, "DELETE FROM chunk WHERE number >= ? AND number < ?");
  SqliteStatement keys(*_database, "SELECT number, kind FROM key");
  while (keys.step()) {
    const std::int64_t key = keys.integer(0);
    std::vector<std::pair<std::int64_t, std::string>> kept;
    const auto kind = static_cast<KeyKind>(keys.integer(1));
    visitEntries(key, lines, [&](PackedReader& entries, const Line* line) {
      const char* const begin = entries.position();
      passOver(kind, entries);
      if (line != nullptr) {
        kept.emplace_back(line->number, std::string(begin, entries.position()));
      }
    });
    remove.bind(1, key * kChunksOfKey).bind(2, (key + 1) * kChunksOfKey).run();
    for (const auto& [line, packed] : kept) {
      append(key, line, packed);
    }
    if (const auto tail = _tails.find(key); tail != _tails.end()) {
      write(tail->second);
      _tails.erase(tail);
    }
  }
  _database->execute("UPDATE replaced SET lines = 0");
  commitBatch();
}

std::vector<SqliteStore::Line> SqliteStore::linesThatHold(const DayRange& days) {
  SqliteStatement select(*_database,
                         "SELECT number, day, device FROM line WHERE day BETWEEN ? AND ?");
  select.bind(1, days.from).bind(2, days.to);
  std::vector<Line> lines;
  while (select.step()) {
    lines.push_back(
        {select.integer(0), static_cast<std::int32_t>(select.integer(1)), select.integer(2)});
  }
  std::sort(lines.begin(), lines.end(),
            [](const Line& left, const Line& right) { return left.number < right.number; });
  return lines;
}

/// Calls `read` for each entry of a key, to read its value, with its line, or null when that does
/// not hold. Entries and lines ascend by the lines' numbers.
template <typename Read>
void SqliteStore::visitEntries(std::int64_t key, const std::vector<Line>& lines, const Read& read) {
  SqliteStatement chunks(*_database,
                         "SELECT entries FROM chunk WHERE number >= ? AND number < ?"
                         " ORDER BY number");
  chunks.bind(1, key * kChunksOfKey).bind(2, (key + 1) * kChunksOfKey);
  auto line = lines.begin();
  while (chunks.step()) {
    PackedReader entries(asText(chunks.bytes(0)));
    std::int64_t number = 0;
    while (!entries.atEnd()) {
      number += static_cast<std::int64_t>(entries.varint());
      while (line != lines.end() && line->number < number) {
        ++line;
      }
      read(entries, line != lines.end() && line->number == number ? &*line : nullptr);
    }
  }
}

void SqliteStore::visitKeys(const VisitKey& visit) {
  guarded([&] {
    _database->execute("BEGIN");  // one state of the store, until it is closed
    std::vector<Line> lines = linesThatHold({});
    std::map<std::int32_t, std::int32_t> places;  // of days
    std::int64_t devices = 0;
    for (Line& line : lines) {
      line.day = places.try_emplace(line.day, places.size()).first->second;
      devices = std::max(devices, line.device);
    }

    SqliteStatement keys(*_database, "SELECT number, name, kind FROM key ORDER BY name, kind");
    // The number of the last key that was met on a device, on a day.
    std::vector<std::int64_t> keyOfDevice(static_cast<std::size_t>(devices) + 1, -1);
    std::vector<std::int64_t> keyOfDay(places.size(), -1);
    while (keys.step()) {
      const std::int64_t key = keys.integer(0);
      ReportedKey reported{std::string(keys.text(1)), static_cast<KeyKind>(keys.integer(2)), 0, 0};
      visitEntries(key, lines, [&](PackedReader& entries, const Line* line) {
        passOver(reported.kind, entries);
        if (line != nullptr) {
          std::int64_t& onDay = keyOfDay[static_cast<std::size_t>(line->day)];
          std::int64_t& onDevice = keyOfDevice[static_cast<std::size_t>(line->device)];
          reported.days += onDay != key ? 1 : 0;
          reported.devices += onDevice != key ? 1 : 0;
          onDay = onDevice = key;
        }
      });
      if (reported.devices > 0) {
        visit(reported);
      }
    }
  });
}

void SqliteStore::visitScalars(std::string_view key, const DayRange& days,
                               const VisitScalar& visit) {
  guarded([&] {
    _database->execute("BEGIN");  // one state of the store, until it is closed
    if (const auto number = findNumber("key", KeyKind::Scalar, key)) {
      visitEntries(*number, linesThatHold(days), [&](PackedReader& entries, const Line* line) {
        const std::int64_t value = entries.signedInteger();
        if (line != nullptr) {
          visit(line->day, value);
        }
      });
    }
  });
}

void SqliteStore::visitDistributions(std::string_view key, const DayRange& days,
                                     const VisitDistribution& visit) {
  guarded([&] {
    _database->execute("BEGIN");  // one state of the store, until it is closed
    const auto number = findNumber("key", KeyKind::Distribution, key);
    if (!number) {
      return;
    }
    std::unordered_map<std::int64_t, std::string> labels;
    SqliteStatement label(*_database, "SELECT name FROM label WHERE number = ?");
    visitEntries(*number, linesThatHold(days), [&](PackedReader& entries, const Line* line) {
      const PackedDistribution packed = readDistribution(entries);
      if (line == nullptr) {
        return;
      }
      Distribution distribution{packed.statistics, std::nullopt};
      if (packed.hasHistogram) {
        distribution.histogram.emplace();
      }
      for (const auto& [numberOfLabel, count] : packed.counts) {
        const auto [name, isNew] = labels.try_emplace(numberOfLabel);
        if (isNew) {
          label.bind(1, numberOfLabel);
          if (!label.step()) {
            throw std::out_of_range("a label that is not there");
          }
          name->second = label.text(0);
          label.reset();
        }
        (*distribution.histogram)[name->second] = count;
      }
      visit(line->day, distribution);
    });
  });
}

}  // namespace vesprun
