#pragma once

#include <string>
#include <vector>

#include "common/Date.h"
#include "common/PropertyValue.h"

namespace vesprun {

// What a sample device tells beside its storage controller, as entries of device.json.

/// "channels": readings of a device at work, among them one that is no simple integer.
PropertyArray sampleChannels();

/// The entry of "registry" that NVRAM counters are read from.
PropertyDict sampleNVRAMEntry();

/// "usage": the network interfaces of this machine as processes that have counted since its start,
/// and two apps that have counted for an hour at `now`.
PropertyDict sampleUsage(const Date& now);

/// A file of the device.
struct SampleFile {
  std::string devicePath;
  Bytes content;
};

/// Two events in the kernel's ECC queue.
std::vector<SampleFile> sampleECCEvents();

}  // namespace vesprun
