#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "outbox/SubmittedLogs.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// All that the page shows of a device's outbox, read once. Later members refer to earlier ones.
struct PageData {
  struct Value {
    double day;  ///< since 1970, with a fraction for a time within the day
    Number value;
  };
  using Series = std::vector<Value>;

  struct DistributionDay {
    std::int32_t day;
    double minimum, maximum, mean, squaredDeviations;
    Number count;
    const PropertyDict* histogram;  ///< null: none
  };

  struct Event {
    double day;
    PropertyDict payload;
  };

  /// The events of one name; those of each MSP apart.
  struct Events {
    std::size_t count = 0;
    std::vector<Event> newest;  ///< a few hundred at most, in the order of their lines
  };

  /// The fields of a submitted text log of type 165, "name:value;name:value".
  struct StorageLog {
    std::string name;
    std::optional<Date> date;
    std::map<std::string, double, std::less<>> fields;
  };

  /// Days on which one build of the system reported.
  struct SystemDay {
    std::int32_t day;  ///< the first
    std::int32_t lastDay;
    std::string build;
    std::string model;
  };

  /// Lines of level error in the system log.
  struct Errors {
    std::size_t count = 0;
    std::vector<std::string> newest;  ///< a few, in their order
  };

  explicit PageData(const DeviceDirectory& directory);
  PageData(const PageData&) = delete;
  PageData& operator=(const PageData&) = delete;

  std::vector<SubmittedLog> submitted;               ///< by number
  std::map<std::int32_t, const SubmittedLog*> days;  ///< the last revision of each
  std::map<std::string_view, Series> scalars;        ///< by key, by day
  std::map<std::string_view, std::vector<DistributionDay>> distributions;
  std::map<std::string, Events> events;       ///< by name
  std::optional<StorageLog> storageLog;       ///< the newest
  std::map<std::string, std::size_t> others;  ///< what else was submitted, and how often
  std::vector<UnreadableLog> unreadable;      ///< files, and lines of files
  std::vector<std::int32_t> boots;            ///< days on which the system was started
  std::vector<SystemDay> systems;             ///< by day; those of logs that say it
  Errors errors;

 private:
  void takeDays();
  void takeSystems(const DeviceDirectory& directory);
  void takeError(const PropertyDict& line);
  void takeLogs(const DeviceDirectory& directory);
  template <typename Take>
  void takeLines(const DeviceDirectory& directory, std::string_view file, Take take);
  void takeEvent(const PropertyDict& line);
  void takeRecord(const PropertyDict& line);
};

}  // namespace vesprun
