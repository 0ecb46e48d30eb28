#pragma once

#include <gmock/gmock.h>

#include <functional>
#include <optional>
#include <string>

#include "support/TestDevice.h"

namespace vesprun {

/// A test of what talks to the storage controller. When a device ends, because the test does or
/// starts another, every handle has been given back.
class ControllerTest : public ::testing::Test {
 protected:
  ControllerTest();
  ~ControllerTest() override;

  /// A device with this registry (the inside of the array) and these other entries (with a comma
  /// before each), whose clock stands at `clock`, on the odd day 19787 unless told otherwise. In it
  /// "statistics.bin" is a small buffer that both statistics parsers take. No error is recorded.
  HostPlatform& start(const std::string& registry, const std::string& others = "",
                      const std::string& clock = "2024-03-05T09:15:02Z");

  /// Adds an answer to the device that `startController` makes.
  void answer(std::uint32_t opcode, std::uint32_t argument, const Bytes& bytes);
  /// A device on whose 64 GB volume a quarter is free, with a controller that gives these answers.
  /// `others` are further entries of the description, `registry` further ones of the registry.
  void startController(const std::string& className = "QuillQNS3NVMeController",
                       const std::string& others = "", const std::string& registry = "");

  TestDevice& device() { return *_device; }
  /// Expects that nothing is held that the registry gave out, and nothing was given back twice.
  void expectNothingHeld();
  /// Runs `operation` with its n-th call to the registry failing, for every n there is and no less
  /// than `least`; nothing stays held.
  void failEveryCall(const std::function<void()>& operation, std::size_t least);
  /// What `action` writes to the standard error stream.
  static std::string errorsOf(const std::function<void()>& action);

 private:
  void endDevice();

  std::optional<TestDevice> _device;
  std::string _tunnel;
  std::vector<std::pair<std::string, Bytes>> _files;
};

/// A registry entry of a class with these tunnel answers (the inside of the array) and other
/// entries of its user client.
std::string controller(const std::string& className, const std::string& tunnel = "",
                       const std::string& userClient = "");

/// A user volume of 64 GB of which a quarter is free.
inline const std::string kVolume =
    R"(, "userVolume": {"blockSize": 4096, "blocks": 15625000, "available": 3906250})";

/// The answer that "statistics.bin" is.
inline const std::string kStatisticsAnswer = R"({"opcode": 13, "file": "statistics.bin"})";

/// What is said when no controller can be matched, and recorded when one tells no size.
inline const std::string kNoMatch =
    "Failed to find matching service with DevRegServiceGetMatchingService, trying iterator...\n";
inline const std::string kSizeFailed =
    "executeTunnelCommand: DevRegConnectCallStructMethod failed while retrieving data size";

}  // namespace vesprun
