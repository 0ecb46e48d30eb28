#include "sample/SampleDevice.h"

#include <cstdlib>
#include <map>
#include <vector>

#include "access/CommandDevice.h"
#include "collect/StarterWhitelist.h"
#include "common/Calendar.h"
#include "platform/host/counters/CounterLines.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/NumberText.h"
#include "platform/host/documents/PtreeWriter.h"
#include "sample/SampleCounters.h"
#include "sample/SampleData.h"
#include "sample/SampleDescription.h"

namespace vesprun {
namespace {

void writeSampleWhitelist(const DeviceDirectory& directory) {
  std::string document;
  orFail([&](std::string& error) {
    const auto whitelist = valueFromJsonText(sampleData().at("whitelist").dump(), error);
    return whitelist && writePtree(*whitelist, document, error);
  });
  writeWhitelist(directory, document);
}

/// A day of the sample: its scalars are readings of one moment, its distributions a burst of
/// readings that is spread over the day.
struct DayReadings {
  std::map<std::string, std::int64_t> scalars;
  std::map<std::string, std::vector<double>> distributions;
};

void recordDay(CounterStore& store, std::int32_t day, const DayReadings& readings) {
  for (const auto& [key, value] : readings.scalars) {
    store.setScalar(day, key, value);
  }
  for (const auto& [key, values] : readings.distributions) {
    std::vector<Sample> samples;
    for (const double value : values) {
      const std::size_t offset = samples.size() * kSecondsPerDay / values.size();
      samples.push_back({value, static_cast<std::int32_t>(offset)});
    }
    store.appendSamples(day, key, samples);
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
  orFail([&](std::string& error) { return counters.write(record, error); });
}

/// The time of the controller's statistics: now, or SOURCE_DATE_EPOCH, which makes the same bytes
/// each time.
Date sampleTime(Clock& clock) {
  const char* const epoch = std::getenv("SOURCE_DATE_EPOCH");
  std::int64_t seconds = 0;
  return epoch != nullptr && parseWholeText(epoch, seconds) ? Date{seconds, 0} : clock.now();
}

}  // namespace

void fillSampleDevice(const std::string& directory) {
  const auto device =
      orFail([&](std::string& error) { return HostPlatform::open(directory, error); });
  writeSampleWhitelist(device->directory());
  recordCounters(*device);
  describeSampleDevice(device->directory(), sampleTime(device->clock()));
}

}  // namespace vesprun
