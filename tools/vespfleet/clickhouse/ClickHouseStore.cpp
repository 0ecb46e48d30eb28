#include "ClickHouseStore.h"

#include <endian.h>

#include <algorithm>
#include <chrono>
#include <cstring>
#include <thread>

#include "ClickHouseSql.h"

namespace vesprun {
namespace {

constexpr std::size_t kBatchSize = 48U * 1024 * 1024;  // one is sent while the next is filled
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

template <KeyKind kKind, typename Reported>
auto inShares(const std::vector<Reported>& all) {
  std::array<std::vector<const Reported*>, sharesOf(kKind)> shares;
  for (const Reported& one : all) {
    shares[shareOf(one.key, kKind)].push_back(&one);
  }
  return shares;
}

/// Appends what is behind day and device in a row of the table of lines.
void appendReport(std::string& row, const ExportedLine& line) {
  appendRaw(row, engineRank(line));
  appendRaw(row, line.revision);
  appendRaw(row, line.created.seconds);
  appendRaw(row, static_cast<std::uint32_t>(line.created.nanoseconds));
  row.append(line.digest.begin(), line.digest.end());
  appendTexts(row, line.build);
  appendTexts(row, line.model);
  appendTexts(row, line.whitelist);
  const auto each = [&row](const auto& entries, std::size_t figures, const auto& append) {
    appendVarint(row, entries.size() * figures);
    for (const auto* entry : entries) {
      append(*entry);
    }
  };
  for (const auto& of : inShares<KeyKind::Scalar>(line.scalars)) {
    each(of, 1, [&](const ReportedScalar& one) { appendText(row, one.key); });
    each(of, 1, [&](const ReportedScalar& one) { appendRaw(row, one.value); });
  }
  const Histogram none;
  const auto eachLabel = [&](const ReportedDistribution& one, const auto& append) {
    const Histogram& counts = one.values.histogram ? *one.values.histogram : none;
    appendVarint(row, counts.size());
    for (const auto& [label, count] : counts) {
      append(label, count);
    }
  };
  for (const auto& of : inShares<KeyKind::Distribution>(line.distributions)) {
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
}

}  // namespace

void ClickHouseStore::add(const ExportedLine& line) {
  const std::int32_t partition = line.day / kDaysOfPartition;
  if (_batch.rows.size() + _batch.lines.size() * sizeof(Batch::Line) >= kBatchSize ||
      (_batchPartitions.size() >= kPartitionsOfInsert && !_batchPartitions.contains(partition))) {
    sendBatch();
  }
  _batchPartitions.insert(partition);
  std::string& rows = _batch.rows;
  rows.reserve(kBatchSize);
  Batch::Line added{rows.size(), 0, line.device.size(), 0, line.day, {}};
  added.rank = {line.revision, line.created.seconds, line.created.nanoseconds, line.digest};
  appendRaw(rows, line.day);
  appendText(rows, line.device);
  added.placeSize = rows.size() - added.begin;
  appendReport(rows, line);
  added.size = rows.size() - added.begin;
  _batch.lines.push_back(added);
}

/// Sends a batch while the next one is filled.
void ClickHouseStore::sendBatch() {
  waitForBatch();
  _sent = std::async(std::launch::async,
                     [this, batch = std::move(_batch)]() mutable { send(std::move(batch)); });
  _batch = {};
  _batchPartitions.clear();
}

void ClickHouseStore::waitForBatch() {
  if (_sent.valid()) {
    _sent.get();
  }
}

/// Sorts lines by day and device, as the table does, and those of one place as they came.
void ClickHouseStore::sort(Batch& batch) {
  struct Place {
    std::int32_t day;
    std::uint64_t head;  ///< eight bytes of the device, behind those that all have in common
    std::size_t line;
  };
  const std::vector<Batch::Line>& lines = batch.lines;
  std::string_view common = lines.empty() ? "" : batch.device(lines.front());
  for (const Batch::Line& line : lines) {
    const std::string_view device = batch.device(line).substr(0, common.size());
    common = {common.data(), static_cast<std::size_t>(
                                 std::mismatch(device.begin(), device.end(), common.begin()).first -
                                 device.begin())};
  }
  std::vector<Place> places;
  places.reserve(lines.size());
  for (const Batch::Line& line : lines) {
    const std::string_view rest = batch.device(line).substr(common.size());
    std::uint64_t head = 0;
    std::memcpy(&head, rest.data(), std::min(rest.size(), sizeof head));
    places.push_back({line.day, be64toh(head), places.size()});
  }
  std::sort(places.begin(), places.end(), [&](const Place& left, const Place& right) {
    if (left.day != right.day || left.head != right.head) {
      return std::tie(left.day, left.head) < std::tie(right.day, right.head);
    }
    const int order = batch.device(lines[left.line]).compare(batch.device(lines[right.line]));
    return order != 0 ? order < 0 : left.line < right.line;
  });
  std::vector<Batch::Line> sorted;
  sorted.reserve(lines.size());
  for (const Place& place : places) {
    sorted.push_back(lines[place.line]);
  }
  batch.lines = std::move(sorted);
}

/// Sends the lines of a batch that come after what is stored, one for each device and day, in the
/// order of the table: the server then need not sort them.
void ClickHouseStore::send(Batch batch) {
  readRules();
  std::vector<Batch::Line>& lines = batch.lines;
  std::erase_if(lines, [&](const Batch::Line& line) {
    const bool isRefused =
        line.day < _firstDay ||
        (!_forgotten.empty() && _forgotten.contains(nameDigest(batch.device(line))));
    if (isRefused) {
      count(Outcome::Refused);
    }
    return isRefused;
  });
  if (lines.empty()) {
    return;
  }
  sort(batch);
  const SentTable places = placesOf(batch);
  const std::uint64_t lastBlock = blocks();
  const Ranks stored = ranksOf(batch, places);
  std::string rows;
  rows.reserve(batch.rows.size());
  std::set<std::int32_t> sentWeeks;
  for (auto line = lines.begin(); line != lines.end();) {
    const std::int32_t week = line->day / kDaysOfPartition;
    _weeks.insert(week);  // of known lines, too: they may be from a killed load
    const std::string_view place = batch.place(*line);
    const auto known = stored.find(place);
    const Rank* rank = known != stored.end() ? &known->second : nullptr;
    const Batch::Line* sent = nullptr;
    for (; line != lines.end() && batch.place(*line) == place; ++line) {
      if (rank != nullptr && !(*rank < line->rank)) {
        count(*rank == line->rank ? Outcome::Repeated : Outcome::Older);
      } else {
        count(rank == nullptr ? Outcome::New : Outcome::Replaced);
        rank = &line->rank;
        sent = &*line;
      }
    }
    if (sent != nullptr) {
      rows += batch.row(*sent);
      sentWeeks.insert(week);
    }
  }
  batch.rows = std::string();  // "= {}" would keep its memory
  if (!rows.empty()) {
    _server.post(std::string("INSERT INTO ") + kLineTable + " FORMAT RowBinary", rows);
    if (blocks() != lastBlock + sentWeeks.size()) {
      settleRivals(batch, places);
    }
  }
}

/// Another load sent lines since the look-up. Where one has a rank of this batch to the second, the
/// line that comes after the others is sent once more, so that it is the last.
void ClickHouseStore::settleRivals(const Batch& batch, const SentTable& places) {
  const std::string stored = std::string(" FROM ") + kLineTable + " WHERE " + isAmong(batch);
  _server.ask(std::string("INSERT INTO ") + kLineTable + " SELECT *" + stored +
                  " AND (day, device, digest) IN (SELECT day, device, argMax(digest, (seconds, "
                  "nanoseconds, digest))" +
                  stored + " GROUP BY day, device, rank HAVING min(digest) != max(digest))",
              &places, [](std::string_view) {});
}

/// How many blocks of rows were ever sent.
std::uint64_t ClickHouseStore::blocks() {
  std::uint64_t last = 0;
  for (const WeekState& state : weeks()) {
    last = std::max(last, state.week.lastBlock);
  }
  return last;
}

SentTable ClickHouseStore::placesOf(const Batch& batch) {
  SentTable places{"batch", "day Int32, device String", {}};
  for (const Batch::Line& line : batch.lines) {
    places.rows += batch.place(line);
  }
  return places;
}

/// Has a stored line a place of the sorted batch? By day and device the server reads only where the
/// lines may be. By a hash it reads all lines of those days, which takes less time where many are
/// sought; another place can have the same.
std::string ClickHouseStore::isAmong(const Batch& batch) {
  constexpr std::size_t kMany = 100;
  const std::string hash = "bitXor(sipHash64(device), toUInt64(day))";
  return within({batch.lines.front().day, batch.lines.back().day}) + " AND " +
         (batch.lines.size() < kMany ? "(day, device) IN batch"
                                     : hash + " IN (SELECT " + hash + " FROM batch)");
}

/// What the store has of the batch's devices and days.
ClickHouseStore::Ranks ClickHouseStore::ranksOf(const Batch& batch, const SentTable& places) {
  Ranks ranks;
  readRows(
      _server,
      std::string("SELECT day, device, revision, seconds, toInt64(nanoseconds), digest FROM ") +
          kLineTable + " WHERE " + isAmong(batch) +
          " UNION ALL SELECT toInt32(-1), '', toInt64(0), toInt64(0), toInt64(0), "
          "toFixedString('', 32)",  // so that the answer is never empty
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
      &places);
  return ranks;
}

void ClickHouseStore::finish() {
  if (!_batch.lines.empty()) {
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
  constexpr std::size_t kWeeksAtOnce = 100;
  constexpr std::uint64_t kRowsAtOnce = 1'000'000;  // an answer does not take long
  std::vector<WeekState> loaded = weeks();
  std::erase_if(loaded, [this](const WeekState& state) {
    return state.isUnique || !_weeks.contains(state.week.number);
  });
  for (std::span<const WeekState> rest = loaded; !rest.empty();) {
    std::size_t count = 0;
    std::uint64_t rows = 0;
    do {
      rows += rest[count++].week.rows;
    } while (count < std::min(rest.size(), kWeeksAtOnce) &&
             rows + rest[count].week.rows <= kRowsAtOnce);
    settle(rest.first(count));
    rest = rest.subspan(count);
  }
}

/// Some of the loaded weeks, which the server counts at once.
void ClickHouseStore::settle(std::span<const WeekState> states) {
  constexpr std::uint64_t kMaxRewritten = 8;                         // times what is new
  constexpr std::uint64_t kAlwaysMerged = std::uint64_t{512} << 20;  // bytes
  std::string condition;
  for (const WeekState& state : states) {
    const std::int32_t first = state.week.number * kDaysOfPartition;
    condition += condition.empty() ? "" : " OR ";
    condition += within({first, first + kDaysOfPartition - 1});
  }
  std::vector<std::pair<std::int32_t, std::uint64_t>> lines;  // by week
  readRows(_server,
           "SELECT toInt32(intDiv(day, " + std::to_string(kDaysOfPartition) +
               ")) AS week, toUInt64(count()) FROM (SELECT day FROM " + kLineTable +
               " FINAL WHERE " + condition + ") GROUP BY week",
           [&](PackedReader& row) {
             const auto week = row.raw<std::int32_t>();
             lines.emplace_back(week, row.raw<std::uint64_t>());
           });
  const std::vector<WeekState> now = weeks();
  std::string unique;
  for (const auto& [week, bytes, mostOfPart, isUnique] : states) {
    const bool isCounted =
        std::find(lines.begin(), lines.end(), std::pair(week.number, week.rows)) != lines.end();
    if (isCounted && std::any_of(now.begin(), now.end(), [&week = week](const WeekState& state) {
          return state.week == week;
        })) {
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
