#pragma once

#include "SqliteChunks.h"
#include "SqliteStore.h"

namespace vesprun {

// What the sources of `SqliteStore` have in common.

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

/// Walks over the entries of a key on a day.
class SqliteStore::Cursor {
 public:
  Cursor(const SqliteConnection& database, std::int32_t day, std::int64_t key)
      : _chunks(database,
                "SELECT entries FROM chunk WHERE number >= ? AND number < ? ORDER BY number") {
    _chunks.bind(1, chunkNumber(day, key)).bind(2, chunkNumber(day, key + 1));
  }

  /// Goes to the next entry, once the value of the one before was read. False behind the last.
  bool next() {
    while (_entries.atEnd()) {
      if (!_chunks.step()) {
        return false;
      }
      _unpacked = unpacked(_chunks.bytes(0));
      _entries = PackedReader(_unpacked);
      _line = 0;
    }
    _line += static_cast<std::int64_t>(_entries.varint());
    return true;
  }
  std::int64_t line() const { return _line; }  ///< its number
  PackedReader& value() { return _entries; }

 private:
  SqliteStatement _chunks;
  std::string _unpacked;
  PackedReader _entries{{}};
  std::int64_t _line = 0;
};

/// Calls `read` for each entry of a key on a day, to read its value, with its line, or null when
/// that is not among `lines`. Entries and lines ascend by the lines' numbers.
template <typename Read>
void SqliteStore::visitEntries(std::int32_t day, std::int64_t key, const std::vector<Line>& lines,
                               const Read& read) {
  auto line = lines.begin();
  for (Cursor cursor(*_database, day, key); cursor.next();) {
    while (line != lines.end() && line->number < cursor.line()) {
      ++line;
    }
    const bool isCurrent = line != lines.end() && line->number == cursor.line();
    read(cursor.value(), isCurrent ? &*line : nullptr);
  }
}

}  // namespace vesprun
