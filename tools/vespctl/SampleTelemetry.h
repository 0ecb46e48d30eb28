#pragma once

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

namespace vesprun {

// What a sample device tells beside its storage controller, as entries of device.json.

/// "channels": readings of a device at work, among them one that is no simple integer.
nlohmann::ordered_json sampleChannels();

/// The entry of "registry" that NVRAM counters are read from.
nlohmann::ordered_json sampleNVRAMEntry();

/// "usage": the network interfaces of this machine as processes that have counted since its start,
/// and two apps that have counted for an hour.
nlohmann::ordered_json sampleUsage();

/// A file of the device.
struct SampleFile {
  std::string devicePath;
  std::string content;
};

/// Two events in the kernel's ECC queue.
std::vector<SampleFile> sampleECCEvents();

}  // namespace vesprun
