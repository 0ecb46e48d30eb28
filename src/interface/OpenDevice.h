#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "platform/host/HostPlatform.h"
#include "vesprun/vesprun.h"

namespace vesprun {

/// Why an operation failed: for programs, and for people.
struct CallFailure {
  vesprun_error code = VESPRUN_ERROR_OTHER;
  std::string text;

  /// False, after taking both.
  bool set(vesprun_error why, std::string what) {
    code = why;
    text = std::move(what);
    return false;
  }
};

/// The device that this process has open, below the C and the C++ interface. Operations throw when
/// memory runs out; false, with the reason in `failure`, on any other failure. A process that was
/// forked after the device was opened is refused: both would write what was collected before.
class OpenDevice {
 public:
  /// Null with the reason in `failure`.
  static std::unique_ptr<OpenDevice> open(const std::string& path, CallFailure& failure);
  /// Writes what is collected, except in a forked process.
  ~OpenDevice();

  OpenDevice(const OpenDevice&) = delete;
  OpenDevice& operator=(const OpenDevice&) = delete;

  bool setScalar(std::string_view key, std::int64_t value, CallFailure& failure);
  bool addToScalar(std::string_view key, std::int64_t value, CallFailure& failure);
  bool addToDistribution(std::string_view key, double value, CallFailure& failure);
  bool checkpoint(CallFailure& failure);

  /// False in a process that was forked after the device was opened.
  bool isOfThisProcess(CallFailure& failure) const;

 private:
  explicit OpenDevice(std::unique_ptr<HostPlatform> platform);

  std::int32_t _process;
  std::unique_ptr<HostPlatform> _platform;
  std::unique_ptr<InstalledPlatform> _installed;
};

}  // namespace vesprun
