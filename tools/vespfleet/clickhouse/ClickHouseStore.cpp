#include "ClickHouseStore.h"

#include <algorithm>
#include <chrono>
#include <thread>

#include "ClickHouseSql.h"

namespace vesprun {
namespace {

constexpr std::size_t kBatchSize = 32U * 1024 * 1024;
constexpr std::size_t kPartitionsOfInsert = 90;  // servers refuse more than 100

void appendTexts(std::string& row, const MemberText& text) {
  appendVarint(row, text ? 1 : 0);
  if (text) {
    appendText(row, *text);
  }
}

/// Revision and time in one integer: what the engine goes by.
std::uint64_t engineRank(const ExportedLine& line) {
  const auto seconds = static_cast<std::uint64_t>(
      std::clamp(line.created.seconds, std::int64_t{0}, std::int64_t{UINT32_MAX}));
  return static_cast<std::uint64_t>(line.revision) << 32 | seconds;
}

/// A row of the table of lines.
std::string rowOf(const ExportedLine& line) {
  std::string row;
  appendRaw(row, line.day);
  appendText(row, line.device);
  appendRaw(row, engineRank(line));
  appendRaw(row, line.revision);
  appendRaw(row, line.created.seconds);
  appendRaw(row, static_cast<std::uint32_t>(line.created.nanoseconds));
  row.append(line.digest.begin(), line.digest.end());
  appendTexts(row, line.build);
  appendTexts(row, line.model);
  appendTexts(row, line.whitelist);
  std::array<std::vector<const ReportedScalar*>, kShares> scalars;
  for (const ReportedScalar& scalar : line.scalars) {
    scalars[static_cast<std::size_t>(shareOf(scalar.key))].push_back(&scalar);
  }
  std::array<std::vector<const ReportedDistribution*>, kShares> distributions;
  for (const ReportedDistribution& distribution : line.distributions) {
    distributions[static_cast<std::size_t>(shareOf(distribution.key))].push_back(&distribution);
  }
  const auto each = [&row](const auto& entries, std::size_t figures, const auto& append) {
    appendVarint(row, entries.size() * figures);
    for (const auto* entry : entries) {
      append(*entry);
    }
  };
  const Histogram none;
  const auto eachLabel = [&](const ReportedDistribution& one, const auto& append) {
    const Histogram& counts = one.values.histogram ? *one.values.histogram : none;
    appendVarint(row, counts.size());
    for (const auto& [label, count] : counts) {
      append(label, count);
    }
  };
  for (std::size_t share = 0; share < kShares; ++share) {
    each(scalars[share], 1, [&](const ReportedScalar& one) { appendText(row, one.key); });
    each(scalars[share], 1, [&](const ReportedScalar& one) { appendRaw(row, one.value); });
    const auto& of = distributions[share];
    each(of, 1, [&](const ReportedDistribution& one) { appendText(row, one.key); });
    each(of, 4, [&](const ReportedDistribution& one) {
      const Statistics& values = one.values.statistics;
      for (const double figure : {values.minimum, values.maximum, values.mean, values.deviations}) {
        appendRaw(row, figure);
      }
    });
    each(of, 1,
         [&](const ReportedDistribution& one) { appendRaw(row, one.values.statistics.count); });
    each(of, 1, [&](const ReportedDistribution& one) {
      appendRaw(row, static_cast<std::uint8_t>(one.values.histogram.has_value()));
    });
    each(of, 1, [&](const ReportedDistribution& one) {
      eachLabel(one, [&](const std::string& label, std::uint64_t) { appendText(row, label); });
    });
    each(of, 1, [&](const ReportedDistribution& one) {
      eachLabel(one, [&](const std::string&, std::uint64_t count) { appendRaw(row, count); });
    });
  }
  return row;
}

}  // namespace

void ClickHouseStore::add(const ExportedLine& line) {
  const std::int32_t partition = line.day / kDaysOfPartition;
  if (_batchSize >= kBatchSize ||
      (_batchPartitions.size() >= kPartitionsOfInsert && !_batchPartitions.contains(partition))) {
    sendBatch();
  }
  _batchPartitions.insert(partition);
  _batch.push_back({{line.day, line.device},
                    {line.revision, line.created.seconds, line.created.nanoseconds, line.digest},
                    rowOf(line)});
  _batchSize += _batch.back().row.size() + line.device.size() + sizeof(Arrived);
}

/// Sends the lines of a batch that come after what is stored, one for each device and day.
void ClickHouseStore::sendBatch() {
  readRules();
  std::erase_if(_batch, [this](const Arrived& line) {
    const bool isRefused =
        line.place.first < _firstDay ||
        (!_forgotten.empty() && _forgotten.contains(nameDigest(line.place.second)));
    if (isRefused) {
      count(Outcome::Refused);
    }
    return isRefused;
  });
  std::map<Place, Rank> ranks = ranksOf(_batch);
  std::map<Place, const Arrived*> sent;
  for (const Arrived& line : _batch) {
    const auto [stored, isNew] = ranks.try_emplace(line.place, line.rank);
    if (isNew || stored->second < line.rank) {
      count(isNew ? Outcome::New : Outcome::Replaced);
      stored->second = line.rank;
      sent[line.place] = &line;
    } else {
      count(stored->second == line.rank ? Outcome::Repeated : Outcome::Older);
    }
  }
  std::string rows;
  for (const auto& [place, line] : sent) {
    rows += line->row;
    _partitions.insert(place.first / kDaysOfPartition);
  }
  if (!rows.empty()) {
    _server.post(std::string("INSERT INTO ") + kLineTable + " FORMAT RowBinary", rows);
  }
  _batch.clear();
  _batchSize = 0;
  _batchPartitions.clear();
}

/// What the store has of the batch's devices and days.
std::map<ClickHouseStore::Place, ClickHouseStore::Rank> ClickHouseStore::ranksOf(
    const std::vector<Arrived>& batch) {
  std::map<Place, Rank> ranks;
  if (batch.empty()) {
    return ranks;
  }
  SentTable sent{"batch", "day Int32, device String", {}};
  DayRange days{batch.front().place.first, batch.front().place.first};
  for (const Arrived& line : batch) {
    days.from = std::min(days.from, line.place.first);
    days.to = std::max(days.to, line.place.first);
    appendRaw(sent.rows, line.place.first);
    appendText(sent.rows, line.place.second);
  }
  readRows(
      _server,
      std::string("SELECT day, device, revision, seconds, toInt64(nanoseconds), digest FROM ") +
          kLineTable + " WHERE " + within(days) + " AND (day, device) IN batch",
      [&](PackedReader& row) {
        Place place;
        place.first = row.raw<std::int32_t>();
        place.second = row.text();
        const auto revision = row.raw<std::int64_t>();
        const auto seconds = row.raw<std::int64_t>();
        const auto nanoseconds = row.raw<std::int64_t>();
        LineDigest digest{};
        for (std::uint8_t& byte : digest) {
          byte = row.raw<std::uint8_t>();
        }
        const Rank rank{revision, seconds, nanoseconds, digest};
        const auto [stored, isNew] = ranks.try_emplace(std::move(place), rank);
        stored->second = std::max(stored->second, rank);
      },
      &sent);
  return ranks;
}

void ClickHouseStore::finish() {
  if (!_batch.empty()) {
    sendBatch();
  }
  mergeParts();
}

/// Merges what was loaded, so that questions read it as it lies; but not where much would be
/// rewritten for little.
void ClickHouseStore::mergeParts() {
  constexpr std::uint64_t kMaxRewritten = 8;  // times what is new
  struct Lines {
    std::uint64_t all = 0;
    std::uint64_t mostOfPart = 0;
    bool isMerged = true;
  };
  std::map<std::int32_t, Lines> partitions;
  if (!_partitions.empty()) {
    for (const Part& part : parts()) {
      Lines& lines = partitions[part.partition];
      lines.all += part.rows;
      lines.isMerged = lines.all == part.rows && part.isMerged;
      lines.mostOfPart = std::max(lines.mostOfPart, part.isMerged ? part.rows : 0);
    }
  }
  for (const std::int32_t partition : _partitions) {
    const Lines& lines = partitions[partition];
    if (!lines.isMerged && (lines.all - lines.mostOfPart) * kMaxRewritten >= lines.all) {
      try {
        _server.post(std::string("OPTIMIZE TABLE ") + kLineTable + " PARTITION " +
                     std::to_string(partition) + " FINAL");
      } catch (const StoreFailure&) {
        // The lines are stored; the server merges when it comes to it.
      }
    }
  }
  _partitions.clear();
}

void ClickHouseStore::removeWhere(const std::string& condition) {
  _server.post(std::string("ALTER TABLE ") + kLineTable + " DELETE WHERE " + condition);
  constexpr auto kPause = std::chrono::milliseconds(100);
  while (
      countRows("SELECT 1 FROM system.mutations WHERE database = currentDatabase() AND table = '" +
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
  const Removal removal{
      countRows(std::string("SELECT day FROM ") + kLineTable + " FINAL WHERE " + condition),
      std::nullopt};
  if (removal.lines != 0) {
    removeWhere(condition);
  }
  return removal;
}

Removal ClickHouseStore::prune(std::int32_t days, std::int32_t latest) {
  Removal removal;
  std::int32_t first = _firstDay;
  whileUnchanged({}, [&] {
    readRows(_server,
             "SELECT day FROM (SELECT day FROM " + _source +
                 ") WHERE day <= " + std::to_string(latest) + " GROUP BY day HAVING count() >= " +
                 std::to_string(_least) + " ORDER BY day DESC LIMIT 1",
             [&](PackedReader& row) { first = std::max(first, row.raw<std::int32_t>() - days); });
  });
  std::string rule;
  appendText(rule, "first day");
  appendText(rule, std::to_string(first));
  _server.post(std::string("INSERT INTO ") + kRuleTable + " FORMAT RowBinary", rule);
  removal.firstDay = first;
  const std::string condition = "day < " + std::to_string(first);
  removal.lines =
      countRows(std::string("SELECT day FROM ") + kLineTable + " FINAL WHERE " + condition);
  std::set<std::int32_t> partitions;
  for (const Part& part : parts({0, first - 1})) {
    partitions.insert(part.partition);
  }
  for (const std::int32_t partition : partitions) {
    if ((partition + 1) * kDaysOfPartition <= first) {
      _server.post(std::string("ALTER TABLE ") + kLineTable + " DROP PARTITION " +
                   std::to_string(partition));
    } else if (countRows(std::string("SELECT day FROM ") + kLineTable + " WHERE " + condition) !=
               0) {
      removeWhere(condition);
    }
  }
  return removal;
}

}  // namespace vesprun
