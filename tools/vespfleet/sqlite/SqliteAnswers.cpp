#include <algorithm>
#include <map>
#include <unordered_map>

#include "SqliteStoreParts.h"

namespace vesprun {
namespace {

/// The scalar values of a group of devices.
struct Scalars {
  std::vector<DeviceValue> values;
};

/// The distributions of a group of devices.
struct Distributions {
  struct Bucket {
    std::uint64_t count = 0;
    std::vector<std::int64_t> devices;
  };
  std::vector<Statistics> statistics;
  std::vector<std::int64_t> withHistogram;  ///< devices
  std::map<std::int64_t, Bucket> buckets;   ///< by the numbers of labels
};

std::uint64_t countDevices(std::vector<std::int64_t> devices) {
  std::sort(devices.begin(), devices.end());
  return static_cast<std::uint64_t>(std::unique(devices.begin(), devices.end()) - devices.begin());
}

}  // namespace

/// Gathers what a question asks for: one day after another, or all days.
template <typename Parts>
class SqliteStore::Gathering {
 public:
  using Finish = std::function<void(const AnsweredGroup& group, Parts&& parts)>;

  Gathering(SqliteStore& store, const Question& question, Finish finish)
      : _store(store), _question(question), _finish(std::move(finish)) {}

  Parts& at(const Origin& origin) {
    if (!_question.total && !_groups.empty() && _groups.begin()->second.from != origin.day) {
      flush();
    }
    const auto [found, isNew] = _groups.try_emplace(origin.member);
    Group& group = found->second;
    group.from = isNew ? origin.day : std::min(group.from, origin.day);
    group.to = isNew ? origin.day : std::max(group.to, origin.day);
    group.devices.push_back(origin.device);
    return group.parts;
  }

  /// Answers about what was gathered, by the members' texts.
  void flush() {
    std::map<MemberText, Group> byText;
    for (auto& [member, group] : _groups) {
      byText.emplace(_store.textOf(member), std::move(group));
    }
    for (auto& [text, group] : byText) {
      const AnsweredGroup answered{group.from, group.to, group.devices.size(),
                                   countDevices(std::move(group.devices)), text};
      _finish(answered, std::move(group.parts));
    }
    _groups.clear();
  }

 private:
  struct Group {
    std::int32_t from = 0;
    std::int32_t to = 0;
    std::vector<std::int64_t> devices;
    Parts parts;
  };

  SqliteStore& _store;
  const Question& _question;
  Finish _finish;
  std::map<std::int64_t, Group> _groups;
};

void SqliteStore::visitScalars(const Question& question, const VisitScalar& visit) {
  guarded([&] {
    const auto number = findNumber("key", question.key, KeyKind::Scalar);
    if (!number) {
      return;
    }
    Gathering<Scalars> gathering(
        *this, question, [&](const AnsweredGroup& group, Scalars&& scalars) {
          ScalarAnswer answered{group, std::nullopt};
          if (group.devices >= question.least) {
            answered.summary = summaryOf(std::move(scalars.values), question.least);
          }
          visit(answered);
        });
    for (const auto& [onDay, lines] : linesOf(question.days, question.by)) {
      visitEntries(onDay, *number, lines,
                   [&, day = onDay](PackedReader& entries, const Line* line) {
                     const std::int64_t value = entries.signedInteger();
                     if (line != nullptr) {
                       gathering.at({day, line->device, line->member})
                           .values.push_back({line->device, value});
                     }
                   });
    }
    gathering.flush();
  });
}

void SqliteStore::visitDistributions(const Question& question, const VisitDistribution& visit) {
  guarded([&] {
    const auto number = findNumber("key", question.key, KeyKind::Distribution);
    if (!number) {
      return;
    }
    Texts textOfLabel(*this);
    Gathering<Distributions> gathering(
        *this, question, [&](const AnsweredGroup& group, Distributions&& parts) {
          DistributionAnswer answered{group, std::nullopt, std::nullopt};
          if (group.devices >= question.least) {
            answered.statistics = mergedStatistics(std::move(parts.statistics));
            if (countDevices(std::move(parts.withHistogram)) >= question.least) {
              answered.histogram.emplace();
              for (auto& [label, bucket] : parts.buckets) {
                if (countDevices(std::move(bucket.devices)) >= question.least) {
                  answered.histogram->emplace(textOfLabel(label), bucket.count);
                }
              }
            }
          }
          visit(answered);
        });
    for (const auto& [onDay, lines] : linesOf(question.days, question.by)) {
      visitEntries(onDay, *number, lines,
                   [&, day = onDay](PackedReader& entries, const Line* line) {
                     const PackedDistribution packed = readDistribution(entries);
                     if (line == nullptr) {
                       return;
                     }
                     Distributions& parts = gathering.at({day, line->device, line->member});
                     parts.statistics.push_back(packed.statistics);
                     if (packed.hasHistogram) {
                       parts.withHistogram.push_back(line->device);
                     }
                     for (const auto& [label, count] : packed.counts) {
                       Distributions::Bucket& bucket = parts.buckets[label];
                       bucket.count += count;
                       bucket.devices.push_back(line->device);
                     }
                   });
    }
    gathering.flush();
  });
}

}  // namespace vesprun
