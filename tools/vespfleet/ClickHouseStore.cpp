#include "ClickHouseStore.h"

#include <md5.h>

#include <cstring>

#include "Varint.h"
#include "common/HexText.h"

namespace vesprun {
namespace {

constexpr std::size_t kBatchSize = 32U * 1024 * 1024;
constexpr std::int32_t kDaysOfPartition = 100;
constexpr std::size_t kPartitionsOfInsert = 90;  // servers refuse more than 100

struct Table {
  const char* name;
  const char* columns;  ///< as a server lists them
  const char* order;
};

// `line` is a digest of the line's text: what was sent twice, or left over from an insert that was
// cut, has the same.
constexpr Table kTables[] = {
    {"vespfleet_line",
     "day Int32, device String, revision Int64, seconds Int64, nanoseconds UInt32, line UInt64, "
     "text String",
     "(day, device, revision, seconds, nanoseconds, line)"},
    {"vespfleet_scalar", "key String, day Int32, device String, line UInt64, value Int64",
     "(key, day, device, line)"},
    {"vespfleet_distribution",
     "key String, day Int32, device String, line UInt64, minimum Float64, maximum Float64, "
     "mean Float64, deviations Float64, count Int64, hasHistogram UInt8, labels Array(String), "
     "counts Array(UInt64)",
     "(key, day, device, line)"},
};

std::uint64_t digest(std::string_view text) {
  MD5_CTX context;
  MD5Init(&context);
  MD5Update(&context, reinterpret_cast<const std::uint8_t*>(text.data()), text.size());
  std::uint8_t bytes[MD5_DIGEST_LENGTH];
  MD5Final(bytes, &context);
  std::uint64_t value = 0;
  std::memcpy(&value, bytes, sizeof value);
  return value;
}

/// A text literal of any bytes.
std::string literal(std::string_view text) {
  std::string sql = "unhex('";
  for (const char byte : text) {
    appendHex(sql, static_cast<std::uint8_t>(byte), kUpperHexDigits);
  }
  return sql + "')";
}

std::string within(const DayRange& days) {
  return "day BETWEEN " + std::to_string(days.from) + " AND " + std::to_string(days.to);
}

/// The lines that hold, as (day, device, line). The texts, large and seldom needed, are read only
/// of lines that nothing else tells apart.
std::string linesThatHold(const DayRange& days) {
  const std::string same =
      "SELECT day, device, revision, seconds, nanoseconds FROM vespfleet_line WHERE " +
      within(days) +
      " GROUP BY day, device, revision, seconds, nanoseconds HAVING uniqExact(line) > 1";
  const std::string greatest =
      "SELECT day, device, argMax(line, text) FROM vespfleet_line"
      " PREWHERE (day, device, revision, seconds, nanoseconds) IN (" +
      same + ") GROUP BY day, device, revision, seconds, nanoseconds";
  return "SELECT day, device, argMax(line, (revision, seconds, nanoseconds, greatest)) FROM "
         "(SELECT day, device, revision, seconds, nanoseconds, line, (day, device, line) IN (" +
         greatest + ") AS greatest FROM vespfleet_line WHERE " + within(days) +
         ") GROUP BY day, device";
}

/// Rows of `columns`, one for each device and day, of a table under a key.
std::string rowsOf(const char* table, const char* columns, std::string_view key,
                   const DayRange& days) {
  return std::string("SELECT day, ") + columns + " FROM " + table +
         " PREWHERE key = " + literal(key) + " AND " + within(days) +
         " WHERE (day, device, line) IN (" + linesThatHold(days) +
         ") LIMIT 1 BY day, device FORMAT RowBinary";
}

/// Reads all rows of an answer in RowBinary by `row`.
template <typename Row>
void readRows(const std::string& address, const std::string& answer, const Row& row) {
  try {
    for (PackedReader rows(answer); !rows.atEnd();) {
      row(rows);
    }
  } catch (const std::out_of_range&) {
    throw StoreFailure(address + ": the server's answer is cut");
  }
}

}  // namespace

ClickHouseStore::ClickHouseStore(const std::string& address, bool toBeLoaded)
    : _address(address), _server(address) {
  for (const Table& table : kTables) {
    const std::string found = _server.post(
        std::string("SELECT arrayStringConcat(groupArray(concat(name, ' ', type)), ', ') FROM "
                    "(SELECT name, type FROM system.columns WHERE database = currentDatabase() AND "
                    "table = '") +
        table.name + "') FORMAT TabSeparatedRaw");
    const std::string columns = found.substr(0, found.find('\n'));
    if (columns.empty() && toBeLoaded) {
      _server.post(std::string("CREATE TABLE IF NOT EXISTS ") + table.name + "(" + table.columns +
                   ") ENGINE = ReplacingMergeTree PARTITION BY intDiv(day, " +
                   std::to_string(kDaysOfPartition) + ") ORDER BY " + table.order);
    } else if (columns != table.columns) {
      throw StoreFailure(address + ": " +
                         (columns.empty() ? "no fleet store"
                                          : std::string("no fleet store: the table ") + table.name +
                                                " has other columns"));
    }
  }
}

void ClickHouseStore::add(const ExportedLine& line) {
  const std::int32_t partition = line.day / kDaysOfPartition;
  if (_partitions.size() >= kPartitionsOfInsert && !_partitions.contains(partition)) {
    finish();
  }
  _partitions.insert(partition);
  const std::uint64_t number = digest(line.text);
  const auto begin = [&](std::string& row, const std::string& key) {
    appendText(row, key);
    appendRaw(row, line.day);
    appendText(row, line.device);
    appendRaw(row, number);
  };
  for (const ReportedScalar& scalar : line.scalars) {
    begin(_scalars, scalar.key);
    appendRaw(_scalars, scalar.value);
  }
  for (const ReportedDistribution& reported : line.distributions) {
    const auto& [statistics, histogram] = reported.values;
    begin(_distributions, reported.key);
    for (const double real :
         {statistics.minimum, statistics.maximum, statistics.mean, statistics.deviations}) {
      appendRaw(_distributions, real);
    }
    appendRaw(_distributions, statistics.count);
    appendRaw(_distributions, static_cast<std::uint8_t>(histogram.has_value()));
    const Histogram counts = histogram.value_or(Histogram{});
    appendVarint(_distributions, counts.size());
    for (const auto& [label, count] : counts) {
      appendText(_distributions, label);
    }
    appendVarint(_distributions, counts.size());
    for (const auto& [label, count] : counts) {
      appendRaw(_distributions, count);
    }
  }
  appendRaw(_lines, line.day);
  appendText(_lines, line.device);
  appendRaw(_lines, line.revision);
  appendRaw(_lines, line.created.seconds);
  appendRaw(_lines, line.created.nanoseconds);
  appendRaw(_lines, number);
  appendText(_lines, line.text);
  if (_lines.size() + _scalars.size() + _distributions.size() >= kBatchSize) {
    finish();
  }
}

void ClickHouseStore::finish() {
  const auto send = [this](const Table& table, std::string& rows) {
    if (!rows.empty()) {
      _server.post(std::string("INSERT INTO ") + table.name + " FORMAT RowBinary", rows);
      rows.clear();
    }
  };
  send(kTables[1], _scalars);
  send(kTables[2], _distributions);
  send(kTables[0], _lines);
  _partitions.clear();
}

void ClickHouseStore::visitKeys(const VisitKey& visit) {
  const auto keysOf = [](const Table& table, KeyKind kind) {
    return "SELECT key, toUInt8(" + std::to_string(static_cast<int>(kind)) +
           ") AS kind, uniqExact(device) AS devices, uniqExact(day) AS days FROM " + table.name +
           " WHERE (day, device, line) IN (" + linesThatHold({}) + ") GROUP BY key";
  };
  const std::string answer =
      _server.post("SELECT key, kind, devices, days FROM (" + keysOf(kTables[1], KeyKind::Scalar) +
                   " UNION ALL " + keysOf(kTables[2], KeyKind::Distribution) +
                   ") ORDER BY key, kind FORMAT RowBinary");
  readRows(_address, answer, [&](PackedReader& rows) {
    ReportedKey key;
    key.key = rows.text();
    key.kind = static_cast<KeyKind>(rows.raw<std::uint8_t>());
    key.devices = rows.raw<std::uint64_t>();
    key.days = rows.raw<std::uint64_t>();
    visit(key);
  });
}

void ClickHouseStore::visitScalars(std::string_view key, const DayRange& days,
                                   const VisitScalar& visit) {
  readRows(_address, _server.post(rowsOf("vespfleet_scalar", "value", key, days)),
           [&](PackedReader& rows) {
             const auto day = rows.raw<std::int32_t>();
             visit(day, rows.raw<std::int64_t>());
           });
}

void ClickHouseStore::visitDistributions(std::string_view key, const DayRange& days,
                                         const VisitDistribution& visit) {
  const char* const columns =
      "minimum, maximum, mean, deviations, count, hasHistogram, labels, counts";
  readRows(_address, _server.post(rowsOf("vespfleet_distribution", columns, key, days)),
           [&](PackedReader& rows) {
             const auto day = rows.raw<std::int32_t>();
             Distribution distribution;
             distribution.statistics.minimum = rows.raw<double>();
             distribution.statistics.maximum = rows.raw<double>();
             distribution.statistics.mean = rows.raw<double>();
             distribution.statistics.deviations = rows.raw<double>();
             distribution.statistics.count = rows.raw<std::int64_t>();
             const bool hasHistogram = rows.raw<std::uint8_t>() != 0;
             std::vector<std::string> labels;
             for (std::uint64_t left = rows.varint(); left > 0; --left) {
               labels.push_back(rows.text());
             }
             Histogram histogram;
             const std::uint64_t counts = rows.varint();
             for (std::uint64_t i = 0; i < counts; ++i) {
               const auto count = rows.raw<std::uint64_t>();
               if (i < labels.size()) {
                 histogram[labels[i]] = count;
               }
             }
             if (hasHistogram) {
               distribution.histogram = std::move(histogram);
             }
             visit(day, distribution);
           });
}

}  // namespace vesprun
