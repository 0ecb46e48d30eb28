#include "sample/SampleDevice.h"

#include <string_view>
#include <vector>

#include "Command.h"
#include "common/Date.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/files/AtomicFile.h"
#include "sample/SampleCounters.h"
#include "sample/SampleDescription.h"

namespace vesprun {
namespace {

constexpr std::string_view kWhitelistFolder = "Library/Application Support/Tallybook";
constexpr std::string_view kWhitelistFile = "Whitelist_Stagebox.ptree";

/// A key, or the beginning of keys, that may leave the device, and how coarsely.
struct WhitelistRow {
  const char* group;
  const char* table;
  const char* key;
  PropertyDict options;
};

PropertyDict whitelist() {
  const PropertyArray latencies{50, 75, 100, 150, 300, 1000};
  const PropertyArray switches{1, 10, 100};
  const WhitelistRow rows[] = {
      {"Memory", "ScalarKeys", "host.memory.MemTotal", {{"sig_fig", 2}}},
      {"Memory", "ScalarKeys", "host.memory.MemFree", {{"bucket_interval", 65536}}},
      {"Memory",
       "ScalarKeys",
       "host.memory.MemAvailable",
       {{"bucket_interval", 65536}, {"sig_fig", 3}}},
      {"Memory", "ScalarKeys", "com.quill.kernel.swapusage", {}},
      {"Memory", "DistributionKeys", "host.memory.availableKB", {}},
      {"Latency", "DistributionKeyPrefixes", "host.latency.", {{"intervals", latencies}}},
      {"Storage", "ScalarKeyPrefixes", "host.disk.", {{"sig_fig", 3}}},
      {"Storage", "ScalarKeyPrefixes", "com.quill.NANDInfo.NumLogical", {{"sig_fig", 4}}},
      {"Storage", "ScalarKeyPrefixes", "com.quill.NANDInfo.NumPhysical", {{"sig_fig", 4}}},
      {"Storage", "ScalarKeys", "com.quill.NANDInfo.UserPartitionPEPercentUsed", {}},
      {"Storage", "ScalarKeyPrefixes", "com.quill.homeshell.", {}},
      {"Network", "ScalarKeyPrefixes", "host.network.", {{"sig_fig", 2}}},
      {"Network", "ScalarKeyPrefixes", "datausage.", {}},
      {"Channels", "ScalarKeyPrefixes", "com.quill.tapline.", {}},
      {"Job", "ScalarKeys", "com.quill.logsmith.tlyd.database.size", {}},
      {"Job", "ScalarKeys", "com.quill.logsmith.tlyd.database.corruptions", {}},
      {"Job", "ScalarKeys", "com.quill.usage.cur_boot_session_cpu_uptime", {}},
      // Left out on any device but an internal one.
      {"InternalTesting", "ScalarKeyPrefixes", "host.scheduler.", {}},
      {"InternalTesting", "DistributionKeyPrefixes", "host.scheduler.", {{"intervals", switches}}},
      // A tasking, or `prefs set com.quill.da Experiment false`, switches this one off.
      {"Experiment", "ScalarKeys", "host.memory.Dirty", {}},
      {"Experiment", "ScalarKeys", "host.memory.Writeback", {}},
  };
  PropertyDict groups;
  for (const auto& [group, table, key, options] : rows) {
    const auto inner = [](const PropertyDict& outer, const char* name) {
      const PropertyValue* value = outer.find(name);
      return value != nullptr ? *value->dict() : PropertyDict();
    };
    PropertyDict tables = inner(groups, group);
    PropertyDict keys = inner(tables, table);
    keys.set(key, options);
    tables.set(table, keys);
    groups.set(group, tables);
  }
  return groups;
}

void writeWhitelist(const DeviceDirectory& directory) {
  std::string document;
  std::string error;
  const auto folder = directory.makeFolder(kWhitelistFolder, error);
  if (!folder || !writePtree(whitelist(), document, error) ||
      !replaceFile(*folder + '/' + std::string(kWhitelistFile), document, error)) {
    throw CommandFailure(error);
  }
}

/// The readings of one moment stand for a day, those of a burst for its hours.
struct DayReadings {
  std::vector<ScalarReading> scalars;
  std::vector<DistributionReadings> distributions;
};

void recordDay(CounterStore& store, std::int32_t day, const DayReadings& readings) {
  for (const ScalarReading& reading : readings.scalars) {
    store.setScalar(day, reading.key, reading.value);
  }
  for (const DistributionReadings& readingsOfKey : readings.distributions) {
    const std::size_t count = readingsOfKey.values.size();
    std::vector<Sample> samples;
    for (const double value : readingsOfKey.values) {
      const std::size_t offset = samples.size() * kSecondsPerDay / count;
      samples.push_back({value, static_cast<std::int32_t>(offset)});
    }
    store.appendSamples(day, readingsOfKey.key, samples);
  }
}

/// The first readings are those of the day before yesterday, the second ones those of yesterday.
void recordCounters(HostPlatform& device) {
  HostTallybook& counters = device.counters();
  const std::int32_t yesterday = counters.TBDaysSince1970() - 1;
  const DayReadings earlier{readKernelCounters(), takeReadingBurst()};
  const DayReadings later{readKernelCounters(), takeReadingBurst()};
  const auto record = [&](CounterStore& store) {
    recordDay(store, yesterday - 1, earlier);
    recordDay(store, yesterday, later);
    return true;
  };
  std::string error;
  if (!counters.write(record, error)) {
    throw CommandFailure(error);
  }
}

}  // namespace

void fillSampleDevice(const std::string& directory) {
  const std::unique_ptr<HostPlatform> device = openDevice(directory);
  writeWhitelist(device->directory());
  recordCounters(*device);
  describeSampleDevice(device->directory(), device->clock().now());
}

}  // namespace vesprun
