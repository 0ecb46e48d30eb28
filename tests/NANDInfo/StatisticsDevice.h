#pragma once

#include <string>

#include "buffers/DeviceBuffers.h"
#include "platform/host/documents/JsonForm.h"
#include "support/ControllerTest.h"

namespace vesprun {

/// A test with answers of its own to tunnel commands, on a 64 GB volume that is three quarters
/// full.
class StatisticsDevice : public ControllerTest {
 protected:
  static inline const std::string kVolume =
      R"(, "userVolume": {"blockSize": 4096, "blocks": 15625000, "available": 3906250})";

  /// Adds an answer to the device that `startController` makes.
  void answer(std::uint32_t opcode, std::uint32_t argument, const Bytes& bytes) {
    const std::string numbers = std::to_string(opcode) + R"(, "argument": )";
    const std::string file = std::to_string(opcode) + '-' + std::to_string(argument);
    _tunnel += (_tunnel.empty() ? R"({"opcode": )" : R"(, {"opcode": )") + numbers +
               std::to_string(argument) + R"(, "file": ")" + file + "\"}";
    _files.emplace_back(file, bytes);
  }
  /// `others` are further entries of the description, `registry` further ones of the registry.
  void startController(const std::string& className = "QuillQNS3NVMeController",
                       const std::string& others = "", const std::string& registry = "") {
    start(controller(className, std::exchange(_tunnel, {})) + registry, kVolume + others);
    for (const auto& [file, content] : std::exchange(_files, {})) {
      device().write(file, content);
    }
  }

 private:
  std::string _tunnel;
  std::vector<std::pair<std::string, Bytes>> _files;
};

}  // namespace vesprun
