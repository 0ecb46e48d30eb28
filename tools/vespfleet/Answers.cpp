#include "Answers.h"

#include <algorithm>
#include <map>

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
  std::map<std::string, Bucket> buckets;
};

std::uint64_t countDevices(std::vector<std::int64_t> devices) {
  std::sort(devices.begin(), devices.end());
  return static_cast<std::uint64_t>(std::unique(devices.begin(), devices.end()) - devices.begin());
}

/// Gathers what a question asks for: one day after another, or all days.
template <typename Parts>
class Gathering {
 public:
  using Finish = std::function<void(const AnsweredGroup& group, Parts&& parts)>;

  Gathering(FleetStore& store, const Question& question, Finish finish)
      : _store(store), _question(question), _finish(std::move(finish)) {}

  Parts& at(const Origin& origin) {
    if (!_question.total && !_groups.empty() && _groups.begin()->second.from != origin.day) {
      flush();
    }
    _any = true;
    const auto [found, isNew] = _groups.try_emplace(origin.member);
    Group& group = found->second;
    group.from = isNew ? origin.day : std::min(group.from, origin.day);
    group.to = isNew ? origin.day : std::max(group.to, origin.day);
    group.devices.push_back(origin.device);
    return group.parts;
  }

  /// Answers about what was gathered, by the members' texts. False when there was nothing at all.
  bool flush() {
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
    return _any;
  }

 private:
  struct Group {
    std::int32_t from = 0;
    std::int32_t to = 0;
    std::vector<std::int64_t> devices;
    Parts parts;
  };

  FleetStore& _store;
  const Question& _question;
  Finish _finish;
  std::map<std::int64_t, Group> _groups;
  bool _any = false;
};

void requireKey(FleetStore& store, const std::string& key, KeyKind kind) {
  const bool isScalar = kind == KeyKind::Scalar;
  if (!store.hasKey(key, kind)) {
    const bool isOther = store.hasKey(key, isScalar ? KeyKind::Distribution : KeyKind::Scalar);
    throw StoreFailure(key + ": " + (isOther ? "is a " : "the store has no such ") +
                       (isScalar == isOther ? "distribution" : "scalar"));
  }
}

}  // namespace

void answerScalar(FleetStore& store, const Question& question,
                  const std::function<void(const ScalarAnswer&)>& answer) {
  Gathering<Scalars> gathering(store, question, [&](const AnsweredGroup& group, Scalars&& scalars) {
    ScalarAnswer answered{group, std::nullopt};
    if (group.devices >= question.least) {
      answered.summary = summaryOf(std::move(scalars.values), question.least);
    }
    answer(answered);
  });
  store.visitScalars(question.key, question.days, question.by,
                     [&](const Origin& origin, std::int64_t value) {
                       gathering.at(origin).values.push_back({origin.device, value});
                     });
  if (!gathering.flush()) {
    requireKey(store, question.key, KeyKind::Scalar);
  }
}

void answerDistribution(FleetStore& store, const Question& question,
                        const std::function<void(const DistributionAnswer&)>& answer) {
  Gathering<Distributions> gathering(
      store, question, [&](const AnsweredGroup& group, Distributions&& parts) {
        DistributionAnswer answered{group, std::nullopt, std::nullopt};
        if (group.devices >= question.least) {
          answered.statistics = mergedStatistics(std::move(parts.statistics));
          if (countDevices(std::move(parts.withHistogram)) >= question.least) {
            answered.histogram.emplace();
            for (auto& [label, bucket] : parts.buckets) {
              if (countDevices(std::move(bucket.devices)) >= question.least) {
                answered.histogram->emplace(label, bucket.count);
              }
            }
          }
        }
        answer(answered);
      });
  store.visitDistributions(question.key, question.days, question.by,
                           [&](const Origin& origin, Distribution&& values) {
                             Distributions& parts = gathering.at(origin);
                             parts.statistics.push_back(values.statistics);
                             if (values.histogram) {
                               parts.withHistogram.push_back(origin.device);
                               for (const auto& [label, count] : *values.histogram) {
                                 Distributions::Bucket& bucket = parts.buckets[label];
                                 bucket.count += count;
                                 bucket.devices.push_back(origin.device);
                               }
                             }
                           });
  if (!gathering.flush()) {
    requireKey(store, question.key, KeyKind::Distribution);
  }
}

}  // namespace vesprun
