#pragma once

#include <gmock/gmock.h>

#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "platform/host/HostPlatform.h"
#include "support/TemporaryFolder.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// A real device directory in a temporary folder, and its platform, which is installed. The folder
/// goes with it.
class TestDevice : public TemporaryFolder {
 public:
  /// A device whose clock stands at 2024-03-05 09:15:02 UTC, day 19787, unless `description`, the
  /// text of its device.json, says otherwise.
  explicit TestDevice(std::string_view description = kDescription);
  ~TestDevice();

  static constexpr std::string_view kDescription =
      R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "UTC", "logLevel": "debug"})";
  static constexpr std::int32_t kToday = 19787;

  using TemporaryFolder::write;
  void write(std::string_view name, const Bytes& content) const {
    write(name, std::string(content.begin(), content.end()));
  }
  /// The content of a file; empty when there is none.
  std::string read(std::string_view devicePath) const;
  bool exists(std::string_view devicePath) const;

  /// Writes the whitelist given as a JSON object of groups.
  void writeWhitelistJson(std::string_view groups) const;

  /// The platform; after `endProcess` a new one. Fails the test when there can be none.
  HostPlatform& platform();
  /// Ends the process: what services hold back is written, what the process remembers is forgotten.
  /// The next `platform()` is a new one.
  void endProcess();

  /// The lines of an outbox file as dictionaries.
  std::vector<PropertyDict> lines(std::string_view file) const;
  /// "level: message" of each line of the system log.
  std::vector<std::string> log() const;
  /// The submitted logs that are ptree documents, in order.
  std::vector<PropertyDict> documents() const;

 private:
  std::unique_ptr<HostPlatform> _platform;
  std::unique_ptr<InstalledPlatform> _installed;
};

}  // namespace vesprun
