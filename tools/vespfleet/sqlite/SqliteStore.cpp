#include "SqliteStore.h"

#include <sqlite3.h>

#include <algorithm>
#include <tuple>

#include "SqliteChunks.h"
#include "SqliteStoreParts.h"

namespace vesprun {
namespace {

// A chunk that has as much takes no more.
constexpr std::size_t kChunkSize = 16U * 1024;

// What a load keeps in memory and writes in one transaction.
constexpr std::size_t kBatchBytes = 32U * 1024 * 1024;

std::string_view asText(const LineDigest& digest) {
  return {reinterpret_cast<const char*>(digest.data()), digest.size()};
}

std::int64_t statementTextNumber(const MemberText& text,
                                 const std::function<std::int64_t(const std::string&)>& number) {
  return text ? number(*text) : 0;
}

}  // namespace

struct SqliteStore::Statements {
  explicit Statements(const SqliteConnection& opened) : database(opened) {}

  const SqliteConnection& database;
  SqliteStatement findLine{database,
                           "SELECT number, revision, seconds, nanoseconds, digest FROM line"
                           " WHERE day = ? AND device = ?"};
  SqliteStatement remove{database, "DELETE FROM line WHERE number = ?"};
  SqliteStatement insert{
      database,
      "INSERT INTO line(day, device, revision, seconds, nanoseconds, digest, build, model,"
      " whitelist, shape) VALUES(?, ?, ?, ?, ?, ?, nullif(?, 0), nullif(?, 0), ?, ?)"};
  SqliteStatement lastChunk{database,
                            "SELECT number, last, entries FROM chunk WHERE number >= ? AND"
                            " number < ? ORDER BY number DESC LIMIT 1"};
  SqliteStatement writeChunk{database,
                             "INSERT OR REPLACE INTO chunk(number, last, entries) VALUES(?, ?, ?)"};
};

SqliteStore::SqliteStore(const std::string& path, StoreUse use, std::optional<int> least)
    : _path(path) {
  guarded([&] {
    open(use, least);
    if (use == StoreUse::Ask) {
      _database->execute("BEGIN");  // one state of the store, until it is closed
    } else {
      prepareChanges();
    }
  });
}

SqliteStore::~SqliteStore() = default;

void SqliteStore::prepareChanges() { _statements = std::make_unique<Statements>(*_database); }

std::int64_t SqliteStore::insertedNumber() const {
  return sqlite3_last_insert_rowid(_database->handle());
}

/// A statement that is used often, prepared once.
SqliteStatement& SqliteStore::prepared(const std::string& sql) {
  return _prepared.try_emplace(sql, *_database, sql.c_str()).first->second;
}

/// The number of a text in the tables `device`, `key` and `text`; only keys have a kind.
std::optional<std::int64_t> SqliteStore::findNumber(const char* table, std::string_view text,
                                                    std::optional<KeyKind> kind) {
  const std::string query = std::string("SELECT number FROM ") + table + " WHERE name = ?" +
                            (kind ? " AND kind = ?" : "");
  SqliteStatement& find = prepared(query);
  find.bind(1, text);
  if (kind) {
    find.bind(2, static_cast<std::int64_t>(*kind));
  }
  const auto number = find.step() ? std::optional(find.integer(0)) : std::nullopt;
  find.reset();
  return number;
}

/// The same, where a text that is not there gets a number.
std::int64_t SqliteStore::numberOf(const char* table, std::string_view text,
                                   std::optional<KeyKind> kind) {
  std::string cached = table;
  cached.append(kind == KeyKind::Distribution ? "\1" : "\2").append(text);
  if (const auto known = _numbers.find(cached); known != _numbers.end()) {
    return known->second;
  }
  std::optional<std::int64_t> number = findNumber(table, text, kind);
  if (!number) {
    const std::string query = std::string("INSERT INTO ") + table +
                              (kind ? "(name, kind) VALUES(?, ?)" : "(name) VALUES(?)");
    SqliteStatement& insert = prepared(query);
    insert.bind(1, text);
    if (kind) {
      insert.bind(2, static_cast<std::int64_t>(*kind));
    }
    insert.run();
    number = insertedNumber();
    if (kind && *number > kMaxKeyNumber) {
      throw StoreFailure(_path + ": too many keys");
    }
  }
  return _numbers.emplace(std::move(cached), *number).first->second;
}

/// The number of the key at a place of a line. Mostly the line before has the same one there.
std::int64_t SqliteStore::numberOfKey(std::size_t place, const std::string& key, KeyKind kind) {
  if (place >= _lastKeys.size()) {
    _lastKeys.resize(place + 1);
  }
  LastKey& last = _lastKeys[place];
  if (last.name != key || last.kind != kind) {
    last = {key, kind, numberOf("key", key, kind)};
  }
  return last.number;
}

std::int64_t SqliteStore::shapeOf(std::vector<std::int64_t> keys) {
  std::sort(keys.begin(), keys.end());
  std::string shape;
  std::int64_t last = 0;
  for (const std::int64_t key : keys) {
    appendVarint(shape, static_cast<std::uint64_t>(key - last));
    last = key;
  }
  if (const auto known = _numbers.find(shape = '\3' + shape); known != _numbers.end()) {
    return known->second;
  }
  const std::string_view bytes = std::string_view(shape).substr(1);
  const LineDigest digest = digestOf(bytes);
  SqliteStatement find(*_database, "SELECT number FROM shape WHERE digest = ?");
  find.bind(1, digest);
  std::int64_t number = 0;
  if (find.step()) {
    number = find.integer(0);
  } else {
    SqliteStatement insert(*_database, "INSERT INTO shape(digest, keys) VALUES(?, ?)");
    insert.bind(1, digest).bind(2, asBytes(bytes)).run();
    number = insertedNumber();
  }
  return _numbers.emplace(std::move(shape), number).first->second;
}

void SqliteStore::add(const ExportedLine& line) {
  guarded([&] {
    if (!_inBatch) {
      beginBatch();
    }
    count(place(line));
    _batchSize += line.size;
    if (_batchSize >= kBatchBytes || _pending.size() >= kMaxPending) {
      commitBatch();
    }
  });
}

Outcome SqliteStore::place(const ExportedLine& line) {
  if (line.day < _firstDay ||
      (!_forgotten.empty() && _forgotten.contains(std::string(asText(digestOf(line.device)))))) {
    return Outcome::Refused;
  }
  const std::int64_t device = numberOf("device", line.device);
  SqliteStatement& find = _statements->findLine;
  find.bind(1, line.day).bind(2, device);
  Outcome outcome = Outcome::New;
  std::int64_t earlier = 0;
  if (find.step()) {
    earlier = find.integer(0);
    const auto bytes = find.bytes(4);
    const std::string digest(bytes.begin(), bytes.end());
    const auto rank =
        std::tuple(line.revision, line.created.seconds, std::int64_t{line.created.nanoseconds},
                   std::string(asText(line.digest)));
    const auto rankOfEarlier =
        std::tuple(find.integer(1), find.integer(2), find.integer(3), digest);
    outcome = rank > rankOfEarlier    ? Outcome::Replaced
              : rank == rankOfEarlier ? Outcome::Repeated
                                      : Outcome::Older;
  }
  find.reset();
  if (outcome == Outcome::Repeated || outcome == Outcome::Older) {
    return outcome;
  }
  if (outcome == Outcome::Replaced) {
    _statements->remove.bind(1, earlier).run();
    ++_replaced[line.day];
  }
  std::vector<std::int64_t> keys;
  keys.reserve(line.scalars.size() + line.distributions.size());
  for (const ReportedScalar& scalar : line.scalars) {
    keys.push_back(numberOfKey(keys.size(), scalar.key, KeyKind::Scalar));
  }
  for (const ReportedDistribution& reported : line.distributions) {
    keys.push_back(numberOfKey(keys.size(), reported.key, KeyKind::Distribution));
  }
  const auto text = [this](const std::string& found) { return numberOf("text", found); };
  _statements->insert.bind(1, line.day)
      .bind(2, device)
      .bind(3, line.revision)
      .bind(4, line.created.seconds)
      .bind(5, std::int64_t{line.created.nanoseconds})
      .bind(6, line.digest)
      .bind(7, statementTextNumber(line.build, text))
      .bind(8, statementTextNumber(line.model, text))
      .bind(9, text(line.whitelist))
      .bind(10, shapeOf(keys))
      .run();
  const std::int64_t number = insertedNumber();
  std::string value;
  auto key = keys.begin();
  for (const ReportedScalar& scalar : line.scalars) {
    value.clear();
    appendSigned(value, scalar.value);
    append(line.day, *key++, number, value);
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
        appendVarint(value, static_cast<std::uint64_t>(numberOf("text", label)));
        appendVarint(value, count);
      }
    }
    append(line.day, *key++, number, value);
  }
  return outcome;
}

void SqliteStore::append(std::int32_t day, std::int64_t key, std::int64_t line,
                         std::string_view value) {
  Pending& pending = _pending[chunkNumber(day, key)];
  if (pending.entries.empty()) {
    pending.first = line;
  } else {
    appendVarint(pending.entries, static_cast<std::uint64_t>(line - pending.last));
  }
  pending.entries.append(value);
  pending.last = line;
}

/// Puts the pending entries behind those that their keys have.
void SqliteStore::writePending() {
  std::vector<std::int64_t> numbers;  // in the order of the file
  numbers.reserve(_pending.size());
  for (const auto& [number, pending] : _pending) {
    numbers.push_back(number);
  }
  std::sort(numbers.begin(), numbers.end());
  for (const std::int64_t first : numbers) {
    const Pending& pending = _pending.at(first);
    std::int64_t number = first;
    std::int64_t last = 0;
    std::string entries;
    SqliteStatement& find = _statements->lastChunk;
    find.bind(1, first).bind(2, first + (std::int64_t{1} << kPartBits));
    if (find.step()) {
      number = find.integer(0);
      last = find.integer(1);
      entries = unpacked(find.bytes(2));
      if (entries.size() >= kChunkSize) {
        ++number;
        last = 0;
        entries.clear();
      }
    }
    find.reset();
    appendVarint(entries, static_cast<std::uint64_t>(pending.first - last));
    entries.append(pending.entries);
    const std::string bytes = packed(entries);
    _statements->writeChunk.bind(1, number).bind(2, pending.last).bind(3, asBytes(bytes)).run();
  }
  _pending.clear();
}

void SqliteStore::beginBatch() {
  _turn.take();
  _database->execute("BEGIN IMMEDIATE");
  _inBatch = true;
  _firstDay = static_cast<std::int32_t>(_database->queryInteger("SELECT first_day FROM rule"));
  _forgotten.clear();
  SqliteStatement forgotten(*_database, "SELECT device FROM forgotten");
  while (forgotten.step()) {
    const auto digest = forgotten.bytes(0);
    _forgotten.emplace(digest.begin(), digest.end());
  }
}

void SqliteStore::commitBatch() {
  writePending();
  SqliteStatement count(*_database,
                        "INSERT INTO replaced(day, lines) VALUES(?1, ?2)"
                        " ON CONFLICT(day) DO UPDATE SET lines = lines + ?2");
  SqliteStatement most(*_database,
                       "SELECT lines > (SELECT count(*) FROM line WHERE day = ?1)"
                       " FROM replaced WHERE day = ?1");
  for (const auto& [day, lines] : _replaced) {
    count.bind(1, day).bind(2, lines).run();
    most.bind(1, day);
    const bool rewrites = most.step() && most.integer(0) != 0;
    most.reset();
    if (rewrites) {
      rewriteDay(day);
    }
  }
  _replaced.clear();
  _database->commit();
  _turn.giveUp();
  _inBatch = false;
  _numbers.clear();  // another load may go on from here
  _lastKeys.clear();
  _batchSize = 0;
}

void SqliteStore::finish() {
  guarded([&] {
    if (_inBatch) {
      commitBatch();
      giveBackRoom();
    }
  });
}

void SqliteStore::giveBackRoom() {
  if (_database->queryInteger("PRAGMA freelist_count") != 0) {
    _database->execute("PRAGMA incremental_vacuum");
  }
}

/// Removes the values of lines that are not current any more from a day's chunks. Labels of the
/// others are added to `labels`.
void SqliteStore::rewriteDay(std::int32_t day, std::set<std::int64_t>* labels) {
  const std::vector<Line> lines = linesOf(day, Member::None);
  std::set<std::int64_t> keys;
  SqliteStatement numbers(*_database, "SELECT number FROM chunk WHERE number >= ? AND number < ?");
  numbers.bind(1, chunkNumber(day)).bind(2, chunkNumber(day + 1));
  while (numbers.step()) {
    keys.insert(keyOfChunk(numbers.integer(0)));
  }
  numbers.reset();
  SqliteStatement kinds(*_database, "SELECT kind FROM key WHERE number = ?");
  SqliteStatement remove(*_database, "DELETE FROM chunk WHERE number >= ? AND number < ?");
  for (const std::int64_t key : keys) {
    kinds.bind(1, key);
    const bool isScalar = kinds.step() && kinds.integer(0) == 0;
    kinds.reset();
    visitEntries(day, key, lines, [&](PackedReader& entries, const Line* line) {
      const char* const begin = entries.position();
      if (isScalar) {
        entries.varint();
      } else {
        const PackedDistribution value = readDistribution(entries);
        for (const auto& [label, count] : value.counts) {
          if (labels != nullptr && line != nullptr) {
            labels->insert(label);
          }
        }
      }
      if (line != nullptr) {
        append(day, key, line->number, {begin, entries.position()});
      }
    });
    remove.bind(1, chunkNumber(day, key)).bind(2, chunkNumber(day, key + 1)).run();
    writePending();
  }
  SqliteStatement none(*_database, "DELETE FROM replaced WHERE day = ?");
  none.bind(1, day).run();
}

/// Removes the devices, shapes and keys that no line names any more.
void SqliteStore::removeUnused() {
  _database->execute(
      "DELETE FROM device WHERE number NOT IN (SELECT device FROM line);"
      "DELETE FROM shape WHERE number NOT IN (SELECT shape FROM line)");
  const std::set<std::int64_t> used = keysInUse();
  std::vector<std::int64_t> unused;
  SqliteStatement keys(*_database, "SELECT number FROM key");
  while (keys.step()) {
    if (!used.contains(keys.integer(0))) {
      unused.push_back(keys.integer(0));
    }
  }
  SqliteStatement remove(*_database, "DELETE FROM key WHERE number = ?");
  for (const std::int64_t key : unused) {
    remove.bind(1, key).run();
  }
}

Removal SqliteStore::forget(std::span<const std::string> devices) {
  return guarded([&] {
    _database->execute("PRAGMA secure_delete = ON");
    beginBatch();
    Removal removal;
    SqliteStatement refuse(*_database, "INSERT OR IGNORE INTO forgotten(device) VALUES(?)");
    SqliteStatement remove(*_database, "DELETE FROM line WHERE device = ?");
    for (const std::string& device : devices) {
      const LineDigest digest = digestOf(device);
      refuse.bind(1, digest).run();
      if (const auto number = findNumber("device", device)) {
        remove.bind(1, *number).run();
        removal.lines += static_cast<std::uint64_t>(sqlite3_changes64(_database->handle()));
        SqliteStatement forgotten(*_database, "DELETE FROM device WHERE number = ?");
        forgotten.bind(1, *number).run();
      }
    }
    // All days: a label, a key or a build that only the device had goes with it.
    std::set<std::int64_t> texts;
    std::vector<std::int32_t> days;
    SqliteStatement all(*_database, "SELECT DISTINCT number >> 46 FROM chunk");
    while (all.step()) {
      days.push_back(static_cast<std::int32_t>(all.integer(0)));
    }
    all.reset();
    for (const std::int32_t day : days) {
      rewriteDay(day, &texts);
    }
    SqliteStatement named(*_database,
                          "SELECT build FROM line WHERE build IS NOT NULL UNION SELECT model FROM"
                          " line WHERE model IS NOT NULL UNION SELECT whitelist FROM line");
    while (named.step()) {
      texts.insert(named.integer(0));
    }
    std::vector<std::int64_t> unused;
    SqliteStatement known(*_database, "SELECT number FROM text");
    while (known.step()) {
      if (!texts.contains(known.integer(0))) {
        unused.push_back(known.integer(0));
      }
    }
    SqliteStatement removeText(*_database, "DELETE FROM text WHERE number = ?");
    for (const std::int64_t text : unused) {
      removeText.bind(1, text).run();
    }
    removeUnused();
    commitBatch();
    giveBackRoom();
    return removal;
  });
}

Removal SqliteStore::prune(std::int32_t days, std::int32_t latest) {
  return guarded([&] {
    _database->execute("PRAGMA secure_delete = ON");
    beginBatch();
    Removal removal;
    SqliteStatement newest(*_database,
                           "SELECT day FROM line WHERE day <= ? GROUP BY day"
                           " HAVING count(*) >= ? ORDER BY day DESC LIMIT 1");
    newest.bind(1, latest).bind(2, static_cast<std::int64_t>(_least));
    if (newest.step()) {
      _firstDay = std::max(_firstDay, static_cast<std::int32_t>(newest.integer(0)) - days);
    }
    newest.reset();
    SqliteStatement keep(*_database, "UPDATE rule SET first_day = ?");
    keep.bind(1, _firstDay).run();
    SqliteStatement remove(*_database, "DELETE FROM line WHERE day < ?");
    remove.bind(1, _firstDay).run();
    removal.lines = static_cast<std::uint64_t>(sqlite3_changes64(_database->handle()));
    removal.firstDay = _firstDay;
    if (removal.lines != 0) {
      SqliteStatement chunks(*_database, "DELETE FROM chunk WHERE number < ?");
      chunks.bind(1, chunkNumber(_firstDay)).run();
      SqliteStatement replaced(*_database, "DELETE FROM replaced WHERE day < ?");
      replaced.bind(1, _firstDay).run();
      removeUnused();
    }
    commitBatch();
    giveBackRoom();
    return removal;
  });
}

}  // namespace vesprun
