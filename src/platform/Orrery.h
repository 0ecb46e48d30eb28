#pragma once

#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

// The entries of the answer to "DiskUsage", a dictionary: signed 64-bit byte counts.
inline constexpr std::string_view kDiskUsageTotalDiskCapacity = "TotalDiskCapacity";
inline constexpr std::string_view kDiskUsageTotalDataAvailable = "TotalDataAvailable";
inline constexpr std::string_view kDiskUsageAmountDataAvailable = "AmountDataAvailable";

/// The platform's device-property query.
class Orrery {
 public:
  virtual ~Orrery() = default;

  /// The answer to a question such as "DiskUsage", if the platform has one.
  virtual std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) = 0;

  /// True when the answer is the boolean true.
  bool OrreryGetBoolAnswer(std::string_view question) {
    const std::optional<PropertyValue> answer = OrreryCopyAnswer(question);
    return answer && answer->boolean() != nullptr && *answer->boolean();
  }
};

}  // namespace vesprun
