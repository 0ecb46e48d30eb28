#include <algorithm>
#include <cstdio>

#include "ClickHouseSql.h"
#include "ClickHouseStore.h"
#include "platform/host/documents/NumberText.h"

namespace vesprun {
namespace {

struct Table {
  const char* name;
  std::string columns;  ///< as a server lists them
  const char* engine;
};

std::string lineColumns() {
  std::string columns =
      "day Int32, device String, rank UInt64, revision Int64, seconds Int64, nanoseconds UInt32, "
      "digest FixedString(32), build Array(String), model Array(String), whitelist Array(String)";
  visitShared([&](const std::string& name, const char* type) {
    columns += ", " + name + " Array(" + type + ")";
  });
  return columns;
}

// A rule is the least number of devices, the first day that is taken, or a forgotten device. What
// is unique is a week up to that block, as long as it has so many rows.
const Table kTables[] = {
    {kRuleTable, "name String, value String", "ReplacingMergeTree ORDER BY (name, value)"},
    {kUniqueTable, "week Int32, block UInt64, lines UInt64",
     "ReplacingMergeTree(block) ORDER BY week"},
    {kLineTable, lineColumns(),
     "ReplacingMergeTree(rank) PARTITION BY intDiv(day, 7) ORDER BY (day, device)"}};

// What version 0.9 made; only the lines' texts are taken from it.
const Table kEarlierTables[] = {
    {"vespfleet_scalar", "key String, day Int32, device String, line UInt64, value Int64", ""},
    {"vespfleet_distribution",
     "key String, day Int32, device String, line UInt64, minimum Float64, maximum Float64, "
     "mean Float64, deviations Float64, count Int64, hasHistogram UInt8, labels Array(String), "
     "counts Array(UInt64)",
     ""},
    {"vespfleet_line",
     "day Int32, device String, revision Int64, seconds Int64, nanoseconds UInt32, line UInt64, "
     "text String",
     ""}};

}  // namespace

ClickHouseStore::ClickHouseStore(const std::string& address, StoreUse use, std::optional<int> least)
    : _address(address), _server(address) {
  open(use, least);
}

void ClickHouseStore::open(StoreUse use, std::optional<int> least) {
  std::map<std::string, std::string> found;
  bool mergesApart = false;
  // A server refuses settings that it does not know.
  readRows(_server,
           "SELECT table, name, type FROM system.columns WHERE database = currentDatabase() AND "
           "table LIKE 'vespfleet_%' UNION ALL SELECT '', name, '' FROM system.settings WHERE name "
           "= 'do_not_merge_across_partitions_select_final'",
           [&](PackedReader& row) {
             const std::string table = row.text();
             const std::string name = row.text();
             const std::string type = row.text();
             mergesApart = mergesApart || table.empty();
             found[table] += (found[table].empty() ? "" : ", ") + name + ' ' + type;
           });
  // What does not fit into memory goes through files.
  _server.set("max_bytes_before_external_group_by=2000000000");
  _server.set("max_bytes_before_external_sort=2000000000");
  if (mergesApart) {
    _server.set("do_not_merge_across_partitions_select_final=1");
  }
  const auto isThere = [&](const Table& table) {
    const auto columns = found.find(table.name);
    if (columns != found.end() && columns->second != table.columns) {
      throw StoreFailure(_address + ": no fleet store: the table " + table.name +
                         " has other columns");
    }
    return columns != found.end();
  };
  bool isEarlier = false;
  for (const Table& table : kEarlierTables) {
    isEarlier = isThere(table) || isEarlier;
  }
  std::vector<const Table*> missing;
  for (const Table& table : kTables) {
    if (!isThere(table)) {
      missing.push_back(&table);
    }
  }
  if ((isEarlier || !missing.empty()) && use != StoreUse::Load) {
    const bool isNone = !isEarlier && missing.size() == std::size(kTables);
    throw StoreFailure(_address + (isNone ? ": no fleet store"
                                          : ": a store of an earlier version; \"vespfleet load\" "
                                            "brings it up to date"));
  }
  for (const Table* table : missing) {
    _server.post(std::string("CREATE TABLE IF NOT EXISTS ") + table->name + "(" + table->columns +
                 ") ENGINE = " + table->engine);
  }
  const bool isNew = !missing.empty() && missing.front()->name == kRuleTable;
  if (isNew) {
    std::string row;
    appendText(row, "least");
    appendText(row, std::to_string(isEarlier ? kUsualLeast : least.value_or(kUsualLeast)));
    _server.post(std::string("INSERT INTO ") + kRuleTable + " FORMAT RowBinary", row);
  }
  readRules();
  if (isEarlier) {
    bringUpToDate();
  }
  if (least && static_cast<std::uint64_t>(*least) != _least) {
    throw StoreFailure(_address + ": the least number of devices of this store is " +
                       std::to_string(_least));
  }
}

/// Takes the lines of an earlier version, whose tables go when all are stored.
void ClickHouseStore::bringUpToDate() {
  const std::string table = kEarlierTables[std::size(kEarlierTables) - 1].name;
  ClickHouseServer reader(_address);
  if (_server.post("EXISTS TABLE " + table).starts_with('1')) {
    readRows(
        reader, "SELECT text FROM " + table,
        [&](PackedReader& row) {
          const std::string text = row.text();
          std::string why;
          if (const auto line = parseExportedLine(text, why, 1)) {
            add(*line);
          } else {
            std::fprintf(stderr,
                         "vespfleet load: %s: a line of the earlier version is dropped: %s\n",
                         _address.c_str(), why.c_str());
          }
        },
        nullptr, UINT64_MAX);
  }
  finish();
  clearOutcomes();
  for (const Table& earlier : kEarlierTables) {
    _server.post(std::string("DROP TABLE IF EXISTS ") + earlier.name);
  }
}

void ClickHouseStore::readRules() {
  readRows(_server, std::string("SELECT name, value FROM ") + kRuleTable,
           [this](PackedReader& row) {
             const std::string name = row.text();
             const std::string value = row.text();
             if (name == "forgotten") {
               _forgotten.insert(value);
             } else if (std::int32_t number = 0; parseWholeText(value, number)) {
               if (name == "least") {
                 _least = static_cast<std::uint64_t>(std::max(number, kMinLeast));
               } else if (name == "first day") {
                 _firstDay = std::max(_firstDay, number);
               }
             }
           });
}

/// The weeks that have lines of those days.
std::vector<ClickHouseStore::WeekState> ClickHouseStore::weeks(const DayRange& days) {
  std::vector<WeekState> found;
  readRows(_server,
           "SELECT number, block, lines, size, most, isMerged OR (number, block, lines) IN (SELECT "
           "week, block, lines FROM " +
               std::string(kUniqueTable) +
               ") FROM (SELECT toInt32(partition) AS number, toUInt64(max(max_block_number)) AS "
               "block, toUInt64(sum(rows)) AS lines, toUInt64(sum(bytes_on_disk)) AS size, "
               "toUInt64(max(rows)) AS most, count() = 1 AND max(level) > 0 AS isMerged FROM "
               "system.parts WHERE active AND database = currentDatabase() AND table = '" +
               kLineTable + "' GROUP BY partition) ORDER BY number",
           [&](PackedReader& row) {
             WeekState state;
             state.week.number = row.raw<std::int32_t>();
             state.week.lastBlock = row.raw<std::uint64_t>();
             state.week.rows = row.raw<std::uint64_t>();
             state.bytes = row.raw<std::uint64_t>();
             state.mostOfPart = row.raw<std::uint64_t>();
             state.isUnique = row.raw<std::uint8_t>() != 0;
             if (state.week.number >= days.from / kDaysOfPartition &&
                 state.week.number <= days.to / kDaysOfPartition) {
               found.push_back(state);
             }
           });
  return found;
}

/// Asks about the lines of those days, as they lie where no week has a line twice. When lines come
/// or go meanwhile, `ask` is called again: its queries are to see the same lines. It is not called
/// without end, so under a constant stream of lines they may see those of several moments.
void ClickHouseStore::whileUnchanged(const DayRange& days, const std::function<void()>& ask) {
  constexpr int kTries = 5;
  for (int left = kTries; left > 0; --left) {
    const std::vector<WeekState> before = weeks(days);
    const bool areUnique =
        std::all_of(before.begin(), before.end(), [](const auto& state) { return state.isUnique; });
    _source = std::string(kLineTable) + (areUnique && left > 1 ? "" : " FINAL");
    ask();
    const std::vector<WeekState> after = weeks(days);
    if (std::equal(before.begin(), before.end(), after.begin(), after.end(),
                   [](const auto& one, const auto& other) { return one.week == other.week; })) {
      return;
    }
  }
}

std::uint64_t ClickHouseStore::countRows(const std::string& query) {
  std::uint64_t number = 0;
  readRows(_server, "SELECT toUInt64(count()) FROM (" + query + ")",
           [&](PackedReader& row) { number = row.raw<std::uint64_t>(); });
  return number;
}

}  // namespace vesprun
