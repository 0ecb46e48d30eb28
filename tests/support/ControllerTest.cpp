#include "support/ControllerTest.h"

#include <utility>

#include "buffers/DeviceBuffers.h"
#include "common/ProcessState.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "support/WatchedRegistry.h"

namespace vesprun {

ControllerTest::ControllerTest() { endDevice(); }

ControllerTest::~ControllerTest() { endDevice(); }

HostPlatform& ControllerTest::start(const std::string& registry, const std::string& others,
                                    const std::string& clock) {
  endDevice();
  _device.emplace(R"({"clock": ")" + clock + R"(", "logLevel": "debug", "registry": [)" + registry +
                  ']' + others + '}');
  StatisticsBufferBuilder statistics;
  statistics.add(53, {17}).add(4, {1000}).add(11, {3});
  _device->write("statistics.bin", statistics.bytes());
  return _device->platform();
}

void ControllerTest::answer(std::uint32_t opcode, std::uint32_t argument, const Bytes& bytes) {
  const std::string file = std::to_string(opcode) + '-' + std::to_string(argument);
  _tunnel += (_tunnel.empty() ? R"({"opcode": )" : R"(, {"opcode": )") + std::to_string(opcode) +
             R"(, "argument": )" + std::to_string(argument) + R"(, "file": ")" + file + "\"}";
  _files.emplace_back(file, bytes);
}

void ControllerTest::startController(const std::string& className, const std::string& others,
                                     const std::string& registry) {
  start(controller(className, std::exchange(_tunnel, {})) + registry, kVolume + others);
  for (const auto& [file, content] : std::exchange(_files, {})) {
    device().write(file, content);
  }
}

void ControllerTest::endDevice() {
  if (_device) {
    expectNothingHeld();
    _device.reset();
  }
  ProcessState::startAfresh();
}

void ControllerTest::expectNothingHeld() {
  const HostDeviceRegistry& registry = _device->platform().describedRegistry();
  EXPECT_EQ(registry.openObjects(), 0u);
  EXPECT_EQ(registry.openConnections(), 0u);
  EXPECT_EQ(registry.falseReleases(), 0u);
}

void ControllerTest::failEveryCall(const std::function<void()>& operation, std::size_t least) {
  WatchedRegistry watched(_device->platform());
  std::size_t failing = 0;
  errorsOf([&] {
    do {
      watched.failCall(++failing);
      operation();
      expectNothingHeld();
    } while (watched.calls().size() >= failing);
  });
  EXPECT_GT(failing, least);
}

std::string ControllerTest::errorsOf(const std::function<void()>& action) {
  testing::internal::CaptureStderr();
  action();
  return testing::internal::GetCapturedStderr();
}

std::string controller(const std::string& className, const std::string& tunnel,
                       const std::string& userClient) {
  return R"({"class": ")" + className + R"(", "userClient": {"tunnel": [)" + tunnel + ']' +
         userClient + "}}";
}

}  // namespace vesprun
