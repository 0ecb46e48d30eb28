#include "ClickHouseStore.h"

#include <algorithm>
#include <chrono>
#include <thread>

#include "ClickHouseSql.h"

namespace vesprun {
namespace {

constexpr std::size_t kBatchSize = 24U * 1024 * 1024;  // one is sent while the next is filled
constexpr std::size_t kPartitionsOfInsert = 90;        // servers refuse more than 100

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
std::string rowOf(const ExportedLine& line, std::size_t& placeSize) {
  std::string row;
  appendRaw(row, line.day);
  appendText(row, line.device);
  placeSize = row.size();
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
  Arrived& arrived = _batch.emplace_back();
  arrived.day = line.day;
  arrived.rank = {line.revision, line.created.seconds, line.created.nanoseconds, line.digest};
  arrived.row = rowOf(line, arrived.placeSize);
  _batchSize += arrived.row.size() + sizeof(Arrived);
}

/// Sends a batch while the next one is filled.
void ClickHouseStore::sendBatch() {
  waitForBatch();
  _sent = std::async(std::launch::async,
                     [this, batch = std::move(_batch)]() mutable { send(std::move(batch)); });
  _batch.clear();
  _batchSize = 0;
  _batchPartitions.clear();
}

void ClickHouseStore::waitForBatch() {
  if (_sent.valid()) {
    _sent.get();
  }
}

/// Sends the lines of a batch that come after what is stored, one for each device and day.
void ClickHouseStore::send(std::vector<Arrived> batch) {
  readRules();
  std::erase_if(batch, [this](const Arrived& line) {
    PackedReader place(line.place());
    const bool isRefused = place.raw<std::int32_t>() < _firstDay ||
                           (!_forgotten.empty() && _forgotten.contains(nameDigest(place.text())));
    if (isRefused) {
      count(Outcome::Refused);
    }
    return isRefused;
  });
  struct Current {
    const Rank* rank = nullptr;
    Arrived* sent = nullptr;
  };
  const Ranks stored = ranksOf(batch);
  std::unordered_map<std::string_view, Current, KeyHash> places;
  places.reserve(batch.size());
  for (Arrived& line : batch) {
    const auto [place, isFirst] = places.try_emplace(line.place());
    auto& [rank, sent] = place->second;
    if (const auto known = isFirst ? stored.find(line.place()) : stored.end();
        known != stored.end()) {
      rank = &known->second;
    }
    if (rank != nullptr && !(*rank < line.rank)) {
      count(*rank == line.rank ? Outcome::Repeated : Outcome::Older);
      continue;
    }
    count(rank == nullptr ? Outcome::New : Outcome::Replaced);
    if (sent != nullptr) {
      sent->isSent = false;
    }
    line.isSent = true;
    place->second = {&line.rank, &line};
  }
  std::string rows;
  for (const Arrived& line : batch) {
    // Of known lines, too: they may be from a killed load.
    _weeks.insert(line.day / kDaysOfPartition);
    if (line.isSent) {
      rows += line.row;
    }
  }
  if (!rows.empty()) {
    _server.post(std::string("INSERT INTO ") + kLineTable + " FORMAT RowBinary", rows);
  }
}

/// What the store has of the batch's devices and days.
ClickHouseStore::Ranks ClickHouseStore::ranksOf(const std::vector<Arrived>& batch) {
  Ranks ranks;
  if (batch.empty()) {
    return ranks;
  }
  SentTable sent{"batch", "day Int32, device String", {}};
  DayRange days{batch.front().day, batch.front().day};
  for (const Arrived& line : batch) {
    days.from = std::min(days.from, line.day);
    days.to = std::max(days.to, line.day);
    sent.rows += line.place();
  }
  readRows(
      _server,
      std::string("SELECT day, device, revision, seconds, toInt64(nanoseconds), digest FROM ") +
          kLineTable + " WHERE " + within(days) +
          " AND (day, device) IN batch UNION ALL SELECT toInt32(-1), '', toInt64(0), toInt64(0), "
          "toInt64(0), toFixedString('', 32)",  // so that the answer is never empty
      [&](PackedReader& row) {
        const char* const begin = row.position();
        row.raw<std::int32_t>();
        row.text();
        const std::string_view place(begin, row.position());
        const auto revision = row.raw<std::int64_t>();
        const auto seconds = row.raw<std::int64_t>();
        const auto nanoseconds = row.raw<std::int64_t>();
        LineDigest digest{};
        for (std::uint8_t& byte : digest) {
          byte = row.raw<std::uint8_t>();
        }
        const Rank rank{revision, seconds, nanoseconds, digest};
        const auto [stored, isNew] = ranks.try_emplace(std::string(place), rank);
        stored->second = std::max(stored->second, rank);
      },
      &sent);
  return ranks;
}

void ClickHouseStore::finish() {
  if (!_batch.empty()) {
    sendBatch();
  }
  waitForBatch();
  try {
    settleWeeks();
  } catch (const StoreFailure&) {
    // The lines are stored; the server merges when it comes to it, and as long when it is asked.
  }
  _weeks.clear();
}

/// Sees to it that questions read what was loaded as it lies. A week that has no line twice is
/// noted; another is merged, but not where much would be rewritten for little.
void ClickHouseStore::settleWeeks() {
  constexpr std::uint64_t kMaxRewritten = 8;                         // times what is new
  constexpr std::uint64_t kAlwaysMerged = std::uint64_t{512} << 20;  // bytes
  std::string unique;
  for (const auto& [week, bytes, mostOfPart, isUnique] : weeks()) {
    if (isUnique || !_weeks.contains(week.number)) {
      continue;
    }
    if (hasNoneTwice(week)) {
      appendRaw(unique, week.number);
      appendRaw(unique, week.lastBlock);
      appendRaw(unique, week.rows);
    } else if (bytes <= kAlwaysMerged || (week.rows - mostOfPart) * kMaxRewritten >= week.rows) {
      _server.post(std::string("OPTIMIZE TABLE ") + kLineTable + " PARTITION " +
                   std::to_string(week.number) + " FINAL");
    }
  }
  if (!unique.empty()) {
    _server.post(std::string("INSERT INTO ") + kUniqueTable + " FORMAT RowBinary", unique);
  }
}

bool ClickHouseStore::hasNoneTwice(const Week& week) {
  const std::int32_t first = week.number * kDaysOfPartition;
  const DayRange days{first, first + kDaysOfPartition - 1};
  const std::uint64_t lines =
      countRows(std::string("SELECT day FROM ") + kLineTable + " FINAL WHERE " + within(days));
  const std::vector<WeekState> now = weeks(days);
  return lines == week.rows && now.size() == 1 && now.front().week == week;
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
  for (const WeekState& state : weeks({0, first - 1})) {
    if ((state.week.number + 1) * kDaysOfPartition <= first) {
      _server.post(std::string("ALTER TABLE ") + kLineTable + " DROP PARTITION " +
                   std::to_string(state.week.number));
    } else if (countRows(std::string("SELECT day FROM ") + kLineTable + " WHERE " + condition) !=
               0) {
      removeWhere(condition);
    }
  }
  return removal;
}

}  // namespace vesprun
