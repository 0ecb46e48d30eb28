#pragma once

#include <cstdint>
#include <map>
#include <string>

#include "support/TestDevice.h"

namespace vesprun {

using Scalars = std::map<std::string, std::int64_t>;

/// Those of today's scalars whose keys begin with `prefix` that the last checkpoint has written.
inline Scalars writtenScalars(TestDevice& device, std::string_view prefix = "") {
  Scalars scalars;
  device.platform()
      .tallybook()
      .initWithDefaultPath()
      ->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
          prefix, TestDevice::kToday, TestDevice::kToday,
          [&](std::string_view key, std::int32_t, std::int64_t value, bool&) {
            scalars[std::string(key)] = value;
          });
  return scalars;
}

/// Today's scalars whose keys begin with `prefix`.
inline Scalars todaysScalars(TestDevice& device, std::string_view prefix = "") {
  device.platform().tallybook().TBClientCheckpoint();
  return writtenScalars(device, prefix);
}

/// The text of a device.json: the clock of `TestDevice` and further entries.
inline std::string deviceWith(std::string_view entries) {
  return R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "UTC", )" + std::string(entries) + "}";
}

}  // namespace vesprun
