#include <algorithm>
#include <cstdio>

#include "ClickHouseSql.h"
#include "ClickHouseStore.h"

namespace vesprun {
namespace {

/// The quantiles as the server takes them: its quantile q of n values is the one behind ⌊q·n⌋
/// others, so that a little less than q gives the ⌈q·n⌉-th smallest.
std::string quantileLevels() {
  std::string levels;
  for (const int percent : kPercents) {
    char level[32];
    std::snprintf(level, sizeof level, "%.10f", percent / 100.0 - 1e-10);
    levels.append(levels.empty() ? "" : ", ").append(level);
  }
  return levels;
}

std::uint64_t rankOf(int percent, std::uint64_t count) {
  return (static_cast<std::uint64_t>(percent) * count + 99) / 100;
}

/// Columns by which a question's answers are parted.
struct Grouping {
  explicit Grouping(const Question& question)
      : day(question.total ? "toInt32(0)" : "day"),
        member(question.by == Member::None ? "emptyArrayString()" : "member") {
    const std::string by = question.by == Member::None ? "" : "member";
    columns = question.total ? by : by.empty() ? "day" : "day, " + by;
    clause = columns.empty() ? "" : " GROUP BY " + columns;
  }
  std::string day;     ///< as a result
  std::string member;  ///< as a result
  std::string columns;
  std::string clause;
};

/// The values of a question's key, from a table.
std::string valuesOf(const Question& question, KeyKind kind, const std::string& source,
                     const std::string& columns) {
  const std::string share = std::to_string(shareOf(question.key, kind));
  const std::string at =
      "indexOf(" + std::string(keysOf(kind)) + share + ", " + literal(question.key) + ") AS at";
  return "(SELECT * FROM (SELECT day" + (question.total ? std::string(", device") : std::string()) +
         (question.by == Member::None ? "" : ", " + columnOf(question.by) + " AS member") + ", " +
         at + ", " + columns + " FROM " + source + " WHERE " + within(question.days) +
         ") WHERE at != 0)";
}

std::string shared(const Question& question, KeyKind kind, const char* name) {
  return column(name, shareOf(question.key, kind));
}

std::string scalarsOf(const Question& question, const std::string& source) {
  return valuesOf(question, KeyKind::Scalar, source,
                  shared(question, KeyKind::Scalar, "values") + "[at] AS value");
}

/// With means, deviations and counts.
std::string distributionsOf(const Question& question, const std::string& source) {
  const std::string figures = shared(question, KeyKind::Distribution, "figures");
  return valuesOf(question, KeyKind::Distribution, source,
                  figures + "[4 * at - 1] AS mean, " + figures + "[4 * at] AS deviation, " +
                      shared(question, KeyKind::Distribution, "counts") + "[at] AS number, " +
                      shared(question, KeyKind::Distribution, "histograms") + "[at] AS counted");
}

}  // namespace

/// For each group the values that `least` devices lie at or below, and at or above.
std::map<ClickHouseStore::GroupKey, std::pair<std::int64_t, std::int64_t>> ClickHouseStore::edgesOf(
    const Question& question) {
  const Grouping grouping(question);
  std::map<GroupKey, std::pair<std::int64_t, std::int64_t>> edges;
  for (const bool isLowest : {true, false}) {
    const std::string values = scalarsOf(question, _source);
    const std::string edge = isLowest ? "min(value)" : "max(value)";
    const std::string of = grouping.columns.empty() ? "" : grouping.columns + ", ";
    const std::string ofDevices =
        question.total
            ? "(SELECT " + of + edge + " AS edge FROM " + values + " GROUP BY " + of + "device)"
            : "(SELECT " + of + "value AS edge FROM " + values + ")";
    const std::string limit = std::to_string(question.least);
    readRows(_server,
             "SELECT " + grouping.day + ", " + grouping.member +
                 (isLowest ? ", max(edge)" : ", min(edge)") + " FROM (SELECT " + of + "edge FROM " +
                 ofDevices + " ORDER BY " + of + "edge" + (isLowest ? "" : " DESC") + " LIMIT " +
                 limit + (grouping.columns.empty() ? "" : " BY " + grouping.columns) + ")" +
                 grouping.clause,
             [&](PackedReader& row) {
               const auto day = row.raw<std::int32_t>();
               MemberText member = readText(row);
               const auto value = row.raw<std::int64_t>();
               auto& [lowest, greatest] = edges[{day, std::move(member)}];
               (isLowest ? lowest : greatest) = value;
             });
  }
  return edges;
}

void ClickHouseStore::visitScalars(const Question& question, const VisitScalar& visit) {
  const Grouping grouping(question);
  std::map<GroupKey, ScalarAnswer> answers;
  whileUnchanged(question.days, [&] {
    answers.clear();
    bool hasEdges = false;  // quantiles with few values at one side
    readRows(_server,
             "SELECT " + grouping.day + ", toInt32(min(day)), toInt32(max(day)), " +
                 grouping.member + ", count(), " +
                 (question.total ? "uniqExact(device)" : "count()") + ", " + kHigherSum + ", " +
                 kLowerSum + ", quantilesExact(" + quantileLevels() + ")(value) FROM " +
                 scalarsOf(question, _source) + grouping.clause,
             [&](PackedReader& row) {
               ScalarAnswer answer;
               AnsweredGroup& group = answer.group;
               const auto day = row.raw<std::int32_t>();
               group.from = row.raw<std::int32_t>();
               group.to = row.raw<std::int32_t>();
               group.member = readText(row);
               group.deviceDays = row.raw<std::uint64_t>();
               group.devices = row.raw<std::uint64_t>();
               const auto higher = row.raw<std::int64_t>();
               const auto lower = row.raw<std::int64_t>();
               const auto quantiles = readArray<std::int64_t>(row);
               if (group.deviceDays == 0 || quantiles.size() != std::size(kPercents)) {
                 return;
               }
               if (group.devices >= question.least) {
                 constexpr Int128 kHalf = Int128{1} << 32;
                 const auto count = static_cast<std::int64_t>(group.deviceDays);
                 answer.summary.emplace(Summary{meanOf(higher * kHalf + lower, count), {}});
                 answer.summary->quantiles.assign(quantiles.begin(), quantiles.end());
                 const auto days = static_cast<std::uint64_t>(group.to - group.from) + 1;
                 hasEdges =
                     hasEdges || rankOf(kPercents[0], group.deviceDays) < question.least * days + 1;
               }
               answers[{day, group.member}] = std::move(answer);
             });
    if (hasEdges) {
      const auto edges = edgesOf(question);
      for (auto& [key, answer] : answers) {
        const auto found = edges.find(key);
        if (found != edges.end() && answer.summary) {
          for (auto& quantile : answer.summary->quantiles) {
            if (*quantile < found->second.first || *quantile > found->second.second) {
              quantile.reset();
            }
          }
        }
      }
    }
  });
  for (const auto& [key, answer] : answers) {
    visit(answer);
  }
}

/// The told labels of each group's histograms, with their counts.
ClickHouseStore::LabelCounts ClickHouseStore::labelsOf(const Question& question) {
  const Grouping grouping(question);
  LabelCounts labels;
  readRows(
      _server,
      "SELECT " + grouping.day + ", " + grouping.member + ", label, toUInt64(sum(bucket)) FROM " +
          valuesOf(question, KeyKind::Distribution, _source,
                   shared(question, KeyKind::Distribution, "labels") + "[at] AS labels, " +
                       shared(question, KeyKind::Distribution, "buckets") + "[at] AS buckets") +
          " ARRAY JOIN labels AS label, buckets AS bucket GROUP BY " +
          (grouping.columns.empty() ? "" : grouping.columns + ", ") + "label HAVING " +
          (question.total ? "uniqExact(device)" : "count()") +
          " >= " + std::to_string(question.least),
      [&](PackedReader& row) {
        const auto day = row.raw<std::int32_t>();
        MemberText member = readText(row);
        std::string label = row.text();
        const auto counted = row.raw<std::uint64_t>();
        labels[{day, std::move(member)}][std::move(label)] = counted;
      });
  return labels;
}

void ClickHouseStore::visitDistributions(const Question& question, const VisitDistribution& visit) {
  struct Merged {
    AnsweredGroup group;
    std::vector<Statistics> parts;
    std::uint64_t withHistogram = 0;
  };
  const Grouping grouping(question);
  std::map<GroupKey, Merged> merged;
  LabelCounts labels;
  whileUnchanged(question.days, [&] {
    merged.clear();
    // 18.16 finds what a function takes from around it only where that is selected, too.
    const std::string carried =
        "at_day, first, last, about, found, total, means, numbers, deviations, tallied";
    // A week after another, which the server has in memory: what is merged twice goes to a mean
    // that is known.
    for (const WeekState& state : weeks(question.days)) {
      const std::int32_t begin = state.week.number * kDaysOfPartition;
      Question ofWeek = question;
      ofWeek.days.from = std::max(question.days.from, begin);
      ofWeek.days.to = std::min(question.days.to, begin + kDaysOfPartition - 1);
      readRows(
          _server,
          "SELECT at_day, first, last, about, found, total, near, middle, deviations + "
          "arraySum(arrayMap((m, c) -> c * (m - middle) * (m - middle), means, numbers)), tallied "
          "FROM (SELECT " +
              carried +
              ", near, near + arraySum(arrayMap((m, c) -> (m - near) * (c / total), means, "
              "numbers)) AS middle FROM (SELECT " +
              carried +
              ", arraySum(arrayMap((m, c) -> m * (c / total), means, numbers)) AS near FROM "
              "(SELECT " +
              grouping.day + " AS at_day, toInt32(min(day)) AS first, toInt32(max(day)) AS last, " +
              grouping.member +
              " AS about, count() AS found, toInt64(sum(number)) AS total, groupArray(mean) AS "
              "means, groupArray(number) AS numbers, sum(deviation) AS deviations, "
              "countIf(counted != 0) AS tallied FROM " +
              distributionsOf(ofWeek, _source) + grouping.clause + "))) WHERE found != 0",
          [&](PackedReader& row) {
            const auto day = row.raw<std::int32_t>();
            const auto first = row.raw<std::int32_t>();
            const auto last = row.raw<std::int32_t>();
            MemberText member = readText(row);
            const auto found = row.raw<std::uint64_t>();
            Statistics part;
            part.count = row.raw<std::int64_t>();
            row.raw<double>();
            part.mean = row.raw<double>();
            part.deviations = row.raw<double>();
            const auto withHistogram = row.raw<std::uint64_t>();
            Merged& of = merged[{day, member}];
            of.group.member = std::move(member);
            of.group.from = of.parts.empty() ? first : std::min(of.group.from, first);
            of.group.to = of.parts.empty() ? last : std::max(of.group.to, last);
            of.group.deviceDays += found;
            of.group.devices = of.group.deviceDays;
            of.withHistogram += withHistogram;
            of.parts.push_back(part);
          });
    }
    if (question.total && !merged.empty()) {
      readRows(_server,
               "SELECT " + grouping.member +
                   ", uniqExact(device), uniqExactIf(device, counted != 0) FROM " +
                   distributionsOf(question, _source) + grouping.clause,
               [&](PackedReader& row) {
                 const MemberText member = readText(row);
                 const auto devices = row.raw<std::uint64_t>();
                 const auto withHistogram = row.raw<std::uint64_t>();
                 if (const auto found = merged.find({0, member}); found != merged.end()) {
                   found->second.group.devices = devices;
                   found->second.withHistogram = withHistogram;
                 }
               });
    }
    labels = std::any_of(merged.begin(), merged.end(),
                         [&](const auto& of) { return of.second.withHistogram >= question.least; })
                 ? labelsOf(question)
                 : LabelCounts();
  });
  for (auto& [key, of] : merged) {
    DistributionAnswer answer{of.group, std::nullopt, std::nullopt};
    if (of.group.devices >= question.least) {
      answer.statistics = mergedStatistics(std::move(of.parts));
      if (of.withHistogram >= question.least) {
        answer.histogram = std::move(labels[key]);
      }
    }
    visit(answer);
  }
}

}  // namespace vesprun
