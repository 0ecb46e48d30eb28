#include "ClickHouseStore.h"

#include <algorithm>
#include <chrono>
#include <thread>

#include "Statistics.h"
#include "Varint.h"
#include "common/HexText.h"
#include "platform/host/documents/NumberText.h"

namespace vesprun {
namespace {

constexpr std::size_t kBatchSize = 32U * 1024 * 1024;
constexpr std::int32_t kDaysOfPartition = 32;
constexpr std::size_t kPartitionsOfInsert = 90;  // servers refuse more than 100

constexpr const char* kLineTable = "vespfleet_line";
constexpr const char* kRuleTable = "vespfleet_rule";

struct Table {
  const char* name;
  const char* columns;  ///< as a server lists them
  const char* engine;
};

// A rule is the least number of devices, the first day that is taken, or a forgotten device.
constexpr Table kTables[] = {
    {kRuleTable, "name String, value String", "ReplacingMergeTree ORDER BY (name, value)"},
    {kLineTable,
     "day Int32, device String, revision Int64, seconds Int64, nanoseconds UInt32, "
     "digest FixedString(32), build Array(String), model Array(String), whitelist Array(String), "
     "scalars Array(String), integers Array(Int64), distributions Array(String), "
     "minima Array(Float64), maxima Array(Float64), means Array(Float64), "
     "deviations Array(Float64), counts Array(Int64), histograms Array(UInt8), "
     "labels Array(Array(String)), buckets Array(Array(UInt64))",
     "ReplacingMergeTree PARTITION BY intDiv(day, 32) ORDER BY (day, device, revision, seconds, "
     "nanoseconds, digest)"},
};

std::string hexOf(std::string_view bytes) {
  std::string text;
  for (const char byte : bytes) {
    appendHex(text, static_cast<std::uint8_t>(byte), kUpperHexDigits);
  }
  return text;
}

/// A text literal of any bytes.
std::string literal(std::string_view text) { return "unhex('" + hexOf(text) + "')"; }

/// All that is kept of the name of a forgotten device.
std::string nameDigest(std::string_view device) {
  const LineDigest digest = digestOf(device);
  return hexOf({reinterpret_cast<const char*>(digest.data()), digest.size()});
}

std::string within(const DayRange& days) {
  return "day BETWEEN " + std::to_string(days.from) + " AND " + std::to_string(days.to);
}

/// The column of a member: an array of one text, or of none.
const char* columnOf(Member by) {
  return by == Member::Build       ? "build"
         : by == Member::Model     ? "model"
         : by == Member::Whitelist ? "whitelist"
                                   : "emptyArrayString() AS member";
}

/// Columns of the current lines of those days, one row for each device and day.
std::string currentLines(const std::string& columns, const DayRange& days,
                         const std::string& condition = "1") {
  return "SELECT day, device, " + columns + " FROM " + kLineTable + " PREWHERE " + within(days) +
         " AND (day, device, digest) IN (SELECT day, device, argMax(digest, (revision, seconds, "
         "nanoseconds, digest)) FROM " +
         kLineTable + " WHERE " + within(days) + " GROUP BY day, device) WHERE " + condition +
         " LIMIT 1 BY day, device";
}

const char* keysOf(KeyKind kind) { return kind == KeyKind::Scalar ? "scalars" : "distributions"; }

void appendTexts(std::string& row, const MemberText& text) {
  appendVarint(row, text ? 1 : 0);
  if (text) {
    appendText(row, *text);
  }
}

MemberText readText(PackedReader& row) {
  MemberText text;
  for (std::uint64_t left = row.varint(); left > 0; --left) {
    text = row.text();
  }
  return text;
}

template <typename T>
std::vector<T> readArray(PackedReader& row) {
  std::vector<T> values;
  for (std::uint64_t left = row.varint(); left > 0; --left) {
    if constexpr (std::is_same_v<T, std::string>) {
      values.push_back(row.text());
    } else {
      values.push_back(row.raw<T>());
    }
  }
  return values;
}

Histogram histogramOf(const std::vector<std::string>& labels,
                      const std::vector<std::uint64_t>& buckets) {
  Histogram histogram;
  for (std::size_t i = 0; i < labels.size() && i < buckets.size(); ++i) {
    histogram[labels[i]] = buckets[i];
  }
  return histogram;
}

Distribution readValues(PackedReader& row) {
  Distribution values;
  values.statistics.minimum = row.raw<double>();
  values.statistics.maximum = row.raw<double>();
  values.statistics.mean = row.raw<double>();
  values.statistics.deviations = row.raw<double>();
  values.statistics.count = row.raw<std::int64_t>();
  const bool hasHistogram = row.raw<std::uint8_t>() != 0;
  const auto labels = readArray<std::string>(row);
  const auto buckets = readArray<std::uint64_t>(row);
  if (hasHistogram) {
    values.histogram = histogramOf(labels, buckets);
  }
  return values;
}

}  // namespace

/// Reads all rows of an answer in RowBinary by `row`, as they come.
template <typename Row>
void ClickHouseStore::readRows(const std::string& query, const Row& row) {
  std::string rest;
  _server.post(query + " FORMAT RowBinary", {}, [&](std::string_view piece) {
    rest.append(piece);
    std::size_t taken = 0;
    try {
      while (taken < rest.size()) {
        PackedReader reader(std::string_view(rest).substr(taken));
        row(reader);
        taken = static_cast<std::size_t>(reader.position() - rest.data());
      }
    } catch (const std::out_of_range&) {
      // The rest of the row is still to come.
    }
    rest.erase(0, taken);
  });
  if (!rest.empty()) {
    throw StoreFailure(_address + ": the server's answer is cut");
  }
}

ClickHouseStore::ClickHouseStore(const std::string& address, StoreUse use, std::optional<int> least)
    : _address(address), _server(address) {
  bool isNew = false;
  for (const Table& table : kTables) {
    const std::string found = _server.post(
        std::string("SELECT arrayStringConcat(groupArray(concat(name, ' ', type)), ', ') FROM "
                    "(SELECT name, type FROM system.columns WHERE database = currentDatabase() AND "
                    "table = '") +
        table.name + "') FORMAT TabSeparatedRaw");
    const std::string columns = found.substr(0, found.find('\n'));
    if (columns.empty() && use == StoreUse::Load) {
      isNew = isNew || table.name == kRuleTable;
      _server.post(std::string("CREATE TABLE IF NOT EXISTS ") + table.name + "(" + table.columns +
                   ") ENGINE = " + table.engine);
    } else if (columns != table.columns) {
      throw StoreFailure(address + ": " +
                         (columns.empty() ? "no fleet store"
                                          : std::string("no fleet store: the table ") + table.name +
                                                " has other columns"));
    }
  }
  if (isNew) {
    std::string row;
    appendText(row, "least");
    appendText(row, std::to_string(least.value_or(kUsualLeast)));
    _server.post(std::string("INSERT INTO ") + kRuleTable + " FORMAT RowBinary", row);
  }
  readRules();
  if (!isNew && least && static_cast<std::uint64_t>(*least) != _least) {
    throw StoreFailure(address + ": the least number of devices of this store is " +
                       std::to_string(_least));
  }
}

void ClickHouseStore::readRules() {
  readRows(std::string("SELECT name, value FROM ") + kRuleTable, [this](PackedReader& row) {
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

Outcome ClickHouseStore::add(const ExportedLine& line) {
  if (_rows.empty()) {
    readRules();
  }
  if (line.day < _firstDay ||
      (!_forgotten.empty() && _forgotten.contains(nameDigest(line.device)))) {
    return Outcome::Refused;
  }
  const std::int32_t partition = line.day / kDaysOfPartition;
  if (_partitions.size() >= kPartitionsOfInsert && !_partitions.contains(partition)) {
    finish();
  }
  _partitions.insert(partition);
  appendRaw(_rows, line.day);
  appendText(_rows, line.device);
  appendRaw(_rows, line.revision);
  appendRaw(_rows, line.created.seconds);
  appendRaw(_rows, static_cast<std::uint32_t>(line.created.nanoseconds));
  _rows.append(line.digest.begin(), line.digest.end());
  appendTexts(_rows, line.build);
  appendTexts(_rows, line.model);
  appendTexts(_rows, line.whitelist);
  appendVarint(_rows, line.scalars.size());
  for (const ReportedScalar& scalar : line.scalars) {
    appendText(_rows, scalar.key);
  }
  appendVarint(_rows, line.scalars.size());
  for (const ReportedScalar& scalar : line.scalars) {
    appendRaw(_rows, scalar.value);
  }
  const auto each = [&](const auto& append) {
    appendVarint(_rows, line.distributions.size());
    for (const ReportedDistribution& distribution : line.distributions) {
      append(distribution);
    }
  };
  each([&](const ReportedDistribution& one) { appendText(_rows, one.key); });
  for (const auto member :
       {&Statistics::minimum, &Statistics::maximum, &Statistics::mean, &Statistics::deviations}) {
    each([&](const ReportedDistribution& one) { appendRaw(_rows, one.values.statistics.*member); });
  }
  each([&](const ReportedDistribution& one) { appendRaw(_rows, one.values.statistics.count); });
  each([&](const ReportedDistribution& one) {
    appendRaw(_rows, static_cast<std::uint8_t>(one.values.histogram.has_value()));
  });
  each([&](const ReportedDistribution& one) {
    const Histogram counts = one.values.histogram.value_or(Histogram{});
    appendVarint(_rows, counts.size());
    for (const auto& [label, count] : counts) {
      appendText(_rows, label);
    }
  });
  each([&](const ReportedDistribution& one) {
    const Histogram counts = one.values.histogram.value_or(Histogram{});
    appendVarint(_rows, counts.size());
    for (const auto& [label, count] : counts) {
      appendRaw(_rows, count);
    }
  });
  if (_rows.size() >= kBatchSize) {
    finish();
  }
  return Outcome::New;
}

void ClickHouseStore::finish() {
  if (!_rows.empty()) {
    _server.post(std::string("INSERT INTO ") + kLineTable + " FORMAT RowBinary", _rows);
    _rows.clear();
  }
  _partitions.clear();
}

std::int64_t ClickHouseStore::numberOf(MemberText text) {
  if (!text) {
    return 0;
  }
  const auto [found, isNew] = _numbers.try_emplace(*text, static_cast<std::int64_t>(_texts.size()));
  if (isNew) {
    _texts.push_back(std::move(text));
  }
  return found->second;
}

std::int64_t ClickHouseStore::numberOfDevice(const std::string& device) {
  return _devices.try_emplace(device, static_cast<std::int64_t>(_devices.size())).first->second;
}

void ClickHouseStore::visitKeys(const VisitKey& visit) {
  const auto ofKind = [](KeyKind kind) {
    return "SELECT key, toUInt8(" + std::to_string(static_cast<int>(kind)) +
           ") AS kind, uniqExact(device) AS devices, uniqExact(day) AS days FROM (" +
           currentLines(keysOf(kind), {}) + ") ARRAY JOIN " + keysOf(kind) + " AS key GROUP BY key";
  };
  readRows("SELECT key, kind, devices, days FROM (" + ofKind(KeyKind::Scalar) + " UNION ALL " +
               ofKind(KeyKind::Distribution) + ") ORDER BY key, kind",
           [&](PackedReader& row) {
             ReportedKey key;
             key.key = row.text();
             key.kind = static_cast<KeyKind>(row.raw<std::uint8_t>());
             key.devices = row.raw<std::uint64_t>();
             key.days = row.raw<std::uint64_t>();
             visit(key);
           });
}

std::uint64_t ClickHouseStore::count(const std::string& query) {
  std::uint64_t number = 0;
  readRows("SELECT toUInt64(count()) FROM (" + query + ")",
           [&](PackedReader& row) { number = row.raw<std::uint64_t>(); });
  return number;
}

bool ClickHouseStore::hasKey(std::string_view key, KeyKind kind) {
  return count(currentLines("1 AS one", {},
                            std::string("has(") + keysOf(kind) + ", " + literal(key) + ")")) != 0;
}

bool ClickHouseStore::hasMember(Member by, const std::string& value) {
  return count(currentLines("1 AS one", {},
                            std::string("has(") + columnOf(by) + ", " + literal(value) + ")")) != 0;
}

void ClickHouseStore::visitLastDays(Member by, const VisitDevices& visit) {
  std::map<std::pair<std::int32_t, MemberText>, std::uint64_t> counts;
  readRows(
      "SELECT last, text, toUInt64(count()) FROM (SELECT max(day) AS last, argMax(member, day)"
      " AS text FROM (" +
          currentLines(std::string(columnOf(by)) + (by == Member::None ? "" : " AS member"), {}) +
          ") GROUP BY device) GROUP BY last, text",
      [&](PackedReader& row) {
        const auto day = row.raw<std::int32_t>();
        MemberText text = readText(row);
        counts[{day, std::move(text)}] = row.raw<std::uint64_t>();
      });
  for (const auto& [place, devices] : counts) {
    visit(place.first, place.second, devices);
  }
}

void ClickHouseStore::visitScalars(std::string_view key, const DayRange& days, Member by,
                                   const VisitScalar& visit) {
  const std::string place = "indexOf(scalars, " + literal(key) + ")";
  readRows("SELECT day, device, member, value FROM (" +
               currentLines(std::string(columnOf(by)) + (by == Member::None ? "" : " AS member") +
                                ", integers[" + place + "] AS value",
                            days, place + " != 0") +
               ") ORDER BY day",
           [&](PackedReader& row) {
             Origin origin;
             origin.day = row.raw<std::int32_t>();
             const std::string device = row.text();
             MemberText text = readText(row);
             const auto value = row.raw<std::int64_t>();
             origin.device = numberOfDevice(device);
             origin.member = numberOf(std::move(text));
             visit(origin, value);
           });
}

void ClickHouseStore::visitDistributions(std::string_view key, const DayRange& days, Member by,
                                         const VisitDistribution& visit) {
  const std::string place = "indexOf(distributions, " + literal(key) + ")";
  std::string columns = std::string(columnOf(by)) + (by == Member::None ? "" : " AS member") +
                        ", " + place + " AS at";
  std::string wanted = "SELECT day, device, member";
  for (const char* const column :
       {"minima", "maxima", "means", "deviations", "counts", "histograms", "labels", "buckets"}) {
    columns.append(", ").append(column).append("[at] AS one_").append(column);
    wanted.append(", one_").append(column);
  }
  readRows(wanted + " FROM (" + currentLines(columns, days, "at != 0") + ") ORDER BY day",
           [&](PackedReader& row) {
             Origin origin;
             origin.day = row.raw<std::int32_t>();
             const std::string device = row.text();
             MemberText text = readText(row);
             Distribution values = readValues(row);
             origin.device = numberOfDevice(device);
             origin.member = numberOf(std::move(text));
             visit(origin, std::move(values));
           });
}

void ClickHouseStore::visitMeans(const ComparedGroups& groups, const VisitMeans& visit) {
  const std::string member = columnOf(groups.by);
  const std::string side = "has(" + member + ", " + literal(groups.values[1]) + ")";
  const std::string isWanted = "has(" + member + ", " + literal(groups.values[0]) + ") OR " + side;
  const std::string prefix = groups.prefix.empty()
                                 ? "1"
                                 : "substring(key, 1, " + std::to_string(groups.prefix.size()) +
                                       ") = " + literal(groups.prefix);
  for (const KeyKind kind : {KeyKind::Scalar, KeyKind::Distribution}) {
    const bool isScalar = kind == KeyKind::Scalar;
    // The sum of integers in two halves of 32 bits, which cannot overflow.
    const std::string sums =
        isScalar ? "toInt64(sum(bitShiftRight(value, 32))), "
                   "toInt64(sum(toInt64(bitAnd(value, 4294967295)))), toInt64(count())"
                 : "sum(value * number), toFloat64(0), toInt64(sum(number))";
    const std::string unfolded = isScalar ? "value" : "value, number";
    const std::string columns = isScalar ? "scalars, integers" : "distributions, means, counts";
    const std::string joined = isScalar ? "scalars AS key, integers AS value"
                                        : "distributions AS key, means AS value, counts AS number";
    KeyMeans means;
    means.kind = kind;
    readRows("SELECT key, side, device, " + sums + " FROM (SELECT key, side, device, " + unfolded +
                 " FROM (" +
                 currentLines(side + " AS side, " + columns, groups.days, "(" + isWanted + ")") +
                 ") ARRAY JOIN " + joined + ") WHERE " + prefix +
                 " GROUP BY key, side, device ORDER BY key, side, device",
             [&](PackedReader& row) {
               std::string key = row.text();
               const std::size_t of = row.raw<std::uint8_t>() != 0 ? 1 : 0;
               row.text();
               double mean = 0;
               if (isScalar) {
                 const auto high = row.raw<std::int64_t>();
                 const auto low = row.raw<std::int64_t>();
                 constexpr Int128 kHalf = Int128{1} << 32;
                 mean = meanOf(high * kHalf + low, row.raw<std::int64_t>());
               } else {
                 const auto sum = row.raw<double>();
                 row.raw<double>();
                 mean = sum / static_cast<double>(row.raw<std::int64_t>());
               }
               if (key != means.key) {
                 if (!means.key.empty()) {
                   visit(std::move(means));
                 }
                 means = {std::move(key), kind, {}};
               }
               means.means[of].push_back(mean);
             });
    if (!means.key.empty()) {
      visit(std::move(means));
    }
  }
}

void ClickHouseStore::visitLines(const DayRange& days, const std::string& prefix,
                                 const VisitLine& visit) {
  readRows(
      "SELECT day, device, revision, build, model, scalars, integers, distributions, minima,"
      " maxima, means, deviations, counts, histograms, labels, buckets FROM (" +
          currentLines("revision, build, model, scalars, integers, distributions, minima,"
                       " maxima, means, deviations, counts, histograms, labels, buckets",
                       days) +
          ") ORDER BY day, device",
      [&](PackedReader& row) {
        ExportedLine line;
        line.day = row.raw<std::int32_t>();
        line.device = row.text();
        line.revision = row.raw<std::int64_t>();
        line.build = readText(row);
        line.model = readText(row);
        const auto scalars = readArray<std::string>(row);
        const auto integers = readArray<std::int64_t>(row);
        const auto distributions = readArray<std::string>(row);
        const auto minima = readArray<double>(row);
        const auto maxima = readArray<double>(row);
        const auto means = readArray<double>(row);
        const auto deviations = readArray<double>(row);
        const auto counts = readArray<std::int64_t>(row);
        const auto histograms = readArray<std::uint8_t>(row);
        std::vector<std::vector<std::string>> labels(row.varint());
        for (auto& of : labels) {
          of = readArray<std::string>(row);
        }
        std::vector<std::vector<std::uint64_t>> buckets(row.varint());
        for (auto& of : buckets) {
          of = readArray<std::uint64_t>(row);
        }
        for (std::size_t i = 0; i < scalars.size(); ++i) {
          if (scalars[i].starts_with(prefix)) {
            line.scalars.push_back({scalars[i], integers.at(i)});
          }
        }
        for (std::size_t i = 0; i < distributions.size(); ++i) {
          if (distributions[i].starts_with(prefix)) {
            ReportedDistribution one{
                distributions[i],
                {{minima.at(i), maxima.at(i), means.at(i), deviations.at(i), counts.at(i)},
                 std::nullopt}};
            if (histograms.at(i) != 0) {
              one.values.histogram = histogramOf(labels.at(i), buckets.at(i));
            }
            line.distributions.push_back(std::move(one));
          }
        }
        visit(line);
      });
}

void ClickHouseStore::removeWhere(const std::string& condition) {
  _server.post(std::string("ALTER TABLE ") + kLineTable + " DELETE WHERE " + condition);
  constexpr auto kPause = std::chrono::milliseconds(100);
  while (count("SELECT 1 FROM system.mutations WHERE database = currentDatabase() AND table = '" +
               std::string(kLineTable) + "' AND is_done = 0") != 0) {
    std::this_thread::sleep_for(kPause);
  }
}

Removal ClickHouseStore::forget(std::span<const std::string> devices) {
  std::string rules;
  std::string condition = "device IN (";
  for (const std::string& device : devices) {
    appendText(rules, "forgotten");
    appendText(rules, nameDigest(device));
    condition.append(&device == devices.data() ? "" : ", ").append(literal(device));
  }
  condition += ")";
  _server.post(std::string("INSERT INTO ") + kRuleTable + " FORMAT RowBinary", rules);
  const Removal removal{count(std::string("SELECT 1 FROM ") + kLineTable + " WHERE " + condition),
                        std::nullopt};
  if (removal.lines != 0) {
    removeWhere(condition);
  }
  return removal;
}

Removal ClickHouseStore::prune(std::int32_t days, std::int32_t latest) {
  std::int32_t first = _firstDay;
  readRows(std::string("SELECT day FROM ") + kLineTable +
               " WHERE day <= " + std::to_string(latest) +
               " GROUP BY day HAVING uniqExact(device) >= " + std::to_string(_least) +
               " ORDER BY day DESC LIMIT 1",
           [&](PackedReader& row) { first = std::max(first, row.raw<std::int32_t>() - days); });
  std::string rule;
  appendText(rule, "first day");
  appendText(rule, std::to_string(first));
  _server.post(std::string("INSERT INTO ") + kRuleTable + " FORMAT RowBinary", rule);
  const std::string condition = "day < " + std::to_string(first);
  const Removal removal{count(std::string("SELECT 1 FROM ") + kLineTable + " WHERE " + condition),
                        first};
  if (removal.lines != 0) {
    removeWhere(condition);
  }
  return removal;
}

}  // namespace vesprun
