#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <vector>

#include "FleetStore.h"
#include "Statistics.h"

namespace vesprun {

/// A question about one key.
struct Question {
  std::string key;
  DayRange days;
  Member by = Member::None;
  bool total = false;       ///< all days together
  std::uint64_t least = 0;  ///< an answer over fewer devices only counts them
};

/// What devices an answer is about.
struct AnsweredGroup {
  std::int32_t from = 0;  ///< the first day, or the only one
  std::int32_t to = 0;
  std::uint64_t deviceDays = 0;
  std::uint64_t devices = 0;
  MemberText member;
};

struct ScalarAnswer {
  AnsweredGroup group;
  std::optional<Summary> summary;  ///< nothing of too few devices
};

struct DistributionAnswer {
  AnsweredGroup group;
  std::optional<Statistics> statistics;  ///< nothing of too few devices
  std::optional<Histogram> histogram;
};

/// Answers a question, by day and then by the text of the member. Throws `StoreFailure`, also for a
/// key that the store does not have.
void answerScalar(FleetStore& store, const Question& question,
                  const std::function<void(const ScalarAnswer&)>& answer);
void answerDistribution(FleetStore& store, const Question& question,
                        const std::function<void(const DistributionAnswer&)>& answer);

}  // namespace vesprun
