#include <algorithm>

#include "ClickHouseSql.h"
#include "ClickHouseStore.h"

namespace vesprun {

void ClickHouseStore::visitKeys(const VisitKey& visit) {
  std::map<std::pair<std::string, KeyKind>, ReportedKey> keys;
  whileUnchanged({}, [&] {
    keys.clear();
    for (const KeyKind kind : {KeyKind::Scalar, KeyKind::Distribution}) {
      for (std::size_t share = 0; share < sharesOf(kind); ++share) {
        const std::string names = column(keysOf(kind), share);
        readRows(_server,
                 "SELECT key, uniqExact(device), uniqExact(day) FROM (SELECT day, device, " +
                     names + " FROM " + _source + ") ARRAY JOIN " + names + " AS key GROUP BY key",
                 [&](PackedReader& row) {
                   ReportedKey key{row.text(), kind, 0, 0};
                   key.devices = row.raw<std::uint64_t>();
                   key.days = row.raw<std::uint64_t>();
                   keys[{key.key, kind}] = key;
                 });
      }
    }
  });
  for (const auto& [name, key] : keys) {
    visit(key);
  }
}

bool ClickHouseStore::hasKey(std::string_view key, KeyKind kind) {
  const std::string names = column(keysOf(kind), shareOf(key, kind));
  return isAnywhere(names, "has(" + names + ", " + literal(key) + ")");
}

bool ClickHouseStore::hasMember(Member by, const std::string& value) {
  return isAnywhere(columnOf(by) + " AS member", "has(member, " + literal(value) + ")");
}

bool ClickHouseStore::isAnywhere(const std::string& columns, const std::string& condition) {
  bool found = false;
  whileUnchanged({}, [&] {
    found = countRows("SELECT 1 FROM (SELECT " + columns + " FROM " + _source + ") WHERE " +
                      condition + " LIMIT 1") != 0;
  });
  return found;
}

void ClickHouseStore::visitLastDays(Member by, const VisitDevices& visit) {
  std::map<std::pair<std::int32_t, MemberText>, std::uint64_t> counts;
  whileUnchanged({}, [&] {
    counts.clear();
    readRows(_server,
             "SELECT last, text, toUInt64(count()) FROM (SELECT max(day) AS last, argMax(member, "
             "day) AS text FROM (SELECT day, device, " +
                 columnOf(by) + " AS member FROM " + _source +
                 ") GROUP BY device) GROUP BY last, text",
             [&](PackedReader& row) {
               const auto day = row.raw<std::int32_t>();
               MemberText text = readText(row);
               const auto devices = row.raw<std::uint64_t>();
               counts[{day, std::move(text)}] = devices;
             });
  });
  for (const auto& [place, devices] : counts) {
    visit(place.first, place.second, devices);
  }
}

void ClickHouseStore::visitSpreads(const ComparedGroups& groups, const VisitSpreads& visit) {
  const std::string side = "has(" + columnOf(groups.by) + ", " + literal(groups.values[1]) + ")";
  const std::string prefix = groups.prefix.empty() ? ""
                                                   : " AND substring(key, 1, " +
                                                         std::to_string(groups.prefix.size()) +
                                                         ") = " + literal(groups.prefix);
  std::map<std::pair<std::string, KeyKind>, KeySpreads> spreads;
  const auto ask = [&](std::size_t share, KeyKind kind) {
    const bool isScalar = kind == KeyKind::Scalar;
    const std::string keys = column(keysOf(kind), share);
    const std::string values = column(isScalar ? "values" : "figures", share);
    const std::string numbers = column("counts", share);
    // A device's mean; of equal values the value itself. They are summed up in two halves, too, so
    // that great ones do not take the place of small ones.
    const std::string sum = isScalar
                                ? "(toFloat64(" + std::string(kHigherSum) +
                                      ") * 4294967296 + toFloat64(" + kLowerSum + ")) / count()"
                                : "sum(value * number) / sum(number)";
    const std::string joined = isScalar ? keys + " AS key, " + values + " AS value"
                                        : keys + " AS key, arrayFilter((f, i) -> i % 4 = 3, " +
                                              values + ", arrayEnumerate(" + values +
                                              ")) AS value, " + numbers + " AS number";
    readRows(_server,
             "SELECT key, side, count(), sum(floor(mean / 4294967296)), sum(mean - floor(mean / "
             "4294967296) * 4294967296), varSampStable(mean), min(mean), max(mean) FROM "
             "(SELECT key, side, device, if(min(value) = max(value), toFloat64(any(value)), " +
                 sum + ") AS mean FROM (SELECT key, side, device, value" +
                 (isScalar ? "" : ", number") + " FROM (SELECT device, " + side +
                 " AS side, (side OR has(" + columnOf(groups.by) + ", " +
                 literal(groups.values[0]) + ")) AS wanted, " + keys + ", " + values +
                 (isScalar ? "" : ", " + numbers) + " FROM " + _source + " WHERE " +
                 within(groups.days) + ") ARRAY JOIN " + joined + " WHERE wanted" + prefix +
                 ") GROUP BY key, side, device) GROUP BY key, side",
             [&](PackedReader& row) {
               std::string key = row.text();
               const std::size_t of = row.raw<std::uint8_t>() != 0 ? 1 : 0;
               Spread spread;
               spread.count = row.raw<std::uint64_t>();
               const long double higher = row.raw<double>();
               const long double lower = row.raw<double>();
               spread.mean = (higher * 4294967296 + lower) / static_cast<long double>(spread.count);
               spread.variance = row.raw<double>();
               const auto lowest = row.raw<double>();
               const auto greatest = row.raw<double>();
               if (areEqual(lowest, greatest, !isScalar)) {
                 spread.variance = 0;
                 spread.mean = lowest;
               }
               KeySpreads& found = spreads[{key, kind}];
               found.key = std::move(key);
               found.kind = kind;
               found.groups[of] = spread;
             });
  };
  whileUnchanged(groups.days, [&] {
    spreads.clear();
    for (const KeyKind kind : {KeyKind::Scalar, KeyKind::Distribution}) {
      for (std::size_t share = 0; share < sharesOf(kind); ++share) {
        ask(share, kind);
      }
    }
  });
  for (auto& [key, found] : spreads) {
    visit(std::move(found));
  }
}

void ClickHouseStore::visitLines(const DayRange& days, const std::string& prefix,
                                 const VisitLine& visit) {
  std::string columns = "SELECT day, device, revision, build, model";
  visitShared([&](const std::string& name, const char*) { columns += ", " + name; });
  const auto readLine = [&](PackedReader& row) {
    ExportedLine line;
    line.day = row.raw<std::int32_t>();
    line.device = row.text();
    line.revision = row.raw<std::int64_t>();
    line.build = readText(row);
    line.model = readText(row);
    for (std::size_t share = 0; share < sharesOf(KeyKind::Scalar); ++share) {
      auto scalars = readArray<std::string>(row);
      const auto values = readArray<std::int64_t>(row);
      for (std::size_t i = 0; i < scalars.size(); ++i) {
        if (scalars[i].starts_with(prefix)) {
          line.scalars.push_back({std::move(scalars[i]), values.at(i)});
        }
      }
    }
    for (std::size_t share = 0; share < sharesOf(KeyKind::Distribution); ++share) {
      auto distributions = readArray<std::string>(row);
      const auto figures = readArray<double>(row);
      const auto counts = readArray<std::int64_t>(row);
      const auto histograms = readArray<std::uint8_t>(row);
      std::vector<std::vector<std::string>> labels;
      for (std::uint64_t left = row.varint(); left > 0; --left) {
        labels.push_back(readArray<std::string>(row));
      }
      std::vector<std::vector<std::uint64_t>> buckets;
      for (std::uint64_t left = row.varint(); left > 0; --left) {
        buckets.push_back(readArray<std::uint64_t>(row));
      }
      for (std::size_t i = 0; i < distributions.size(); ++i) {
        if (!distributions[i].starts_with(prefix)) {
          continue;
        }
        ReportedDistribution one{std::move(distributions[i]),
                                 {{figures.at(4 * i), figures.at(4 * i + 1), figures.at(4 * i + 2),
                                   figures.at(4 * i + 3), counts.at(i)},
                                  std::nullopt}};
        if (histograms.at(i) != 0) {
          one.values.histogram.emplace();
          for (std::size_t label = 0; label < labels.at(i).size(); ++label) {
            (*one.values.histogram)[labels[i][label]] = buckets.at(i).at(label);
          }
        }
        line.distributions.push_back(std::move(one));
      }
    }
    const auto byKey = [](const auto& left, const auto& right) { return left.key < right.key; };
    std::sort(line.scalars.begin(), line.scalars.end(), byKey);
    std::sort(line.distributions.begin(), line.distributions.end(), byKey);
    visit(line);
  };
  // The server holds an answer until it is whole: a few lines are asked for by the week, which it
  // reads as a whole anyway, and many by the day.
  constexpr std::uint64_t kMaxLines = 100'000;
  for (const WeekState& state : weeks(days)) {
    const std::int32_t begin = state.week.number * kDaysOfPartition;
    const std::int32_t first = std::max(days.from, begin);
    const std::int32_t last = std::min(days.to, begin + kDaysOfPartition - 1);
    const std::int32_t step = state.week.rows <= kMaxLines ? kDaysOfPartition : 1;
    for (std::int32_t day = first; day <= last; day += step) {
      readRows(_server,
               columns + " FROM " + kLineTable + " FINAL WHERE " +
                   within({day, std::min(day + step - 1, last)}) + " ORDER BY day, device",
               readLine, nullptr, UINT64_MAX);
    }
  }
}

}  // namespace vesprun
