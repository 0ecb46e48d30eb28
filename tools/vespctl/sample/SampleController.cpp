#include "sample/SampleController.h"

#include <string>
#include <string_view>

#include "Command.h"
#include "platform/host/files/AtomicFile.h"
#include "sample/SampleStatistics.h"

namespace vesprun {
namespace {

constexpr std::string_view kFolder = "controller";

// Tunnel opcodes.
constexpr std::uint32_t kMagazine = 10;
constexpr std::uint32_t kValidity = 11;
constexpr std::uint32_t kStatistics = 13;
constexpr std::uint32_t kDefects = 15;
constexpr std::uint32_t kTelemetry = 17;
constexpr std::uint32_t kMSPStatistics = 221;

/// The snapshots that the magazine holds, in hours back.
constexpr std::uint32_t kMagazineHours[] = {0, 4, 8, 12, 16, 20, 24, 168, 720};

/// Writes one buffer after another and collects the answers that they are.
class Answers {
 public:
  explicit Answers(const DeviceDirectory& directory) : _directory(directory) {
    std::string error;
    if (!directory.makeFolder(kFolder, error)) {
      throw CommandFailure(error);
    }
  }

  /// `selection` adds what besides the opcode selects the answer.
  void add(std::uint32_t opcode, const std::string& name, const Bytes& content,
           const PropertyDict& selection = {}) {
    const std::string file = std::string(kFolder) + '/' + name + ".bin";
    std::string error;
    if (!replaceFile(_directory.hostPath(file), std::string(content.begin(), content.end()),
                     error)) {
      throw CommandFailure(error);
    }
    PropertyDict answer{{"opcode", opcode}};
    answer.merge(selection);
    answer.set("file", file);
    _answers.emplace_back(std::move(answer));
  }

  PropertyArray take() { return std::move(_answers); }

 private:
  const DeviceDirectory& _directory;
  PropertyArray _answers;
};

PropertyArray writeBuffers(const DeviceDirectory& directory, const Date& now) {
  Answers answers(directory);
  answers.add(kStatistics, "statistics", sampleStatistics(now, 0));
  for (std::uint32_t index = 0; index < kSampleMSPs; ++index) {
    answers.add(kMSPStatistics, "msp-" + std::to_string(index), sampleMSPStatistics(index),
                {{"argument", index}});
  }
  for (const std::uint32_t hours : kMagazineHours) {
    answers.add(kMagazine, "magazine-" + std::to_string(hours), sampleStatistics(now, hours),
                {{"argument", hours}});
  }
  answers.add(kValidity, "validity", sampleValidity());
  for (std::uint32_t kind = 0; kind < 3; ++kind) {
    answers.add(kTelemetry, "telemetry-" + std::to_string(kind), sampleTelemetry(kind),
                {{"kind", kind}});
  }
  answers.add(kDefects, "defects", sampleDefects());
  return answers.take();
}

PropertyDict imageService() {
  const PropertyDict sizes{{"dBIC", 98304}, {"dLTH", 16384}};
  const PropertyDict updates{{"ifw1", 6}, {"dBIC", 2}, {"dLTH", 1}, {"dCfg", 3},
                             {"fCfg", 1}, {"nefw", 4}, {"LPEM", 2}};
  return {
      {"class", "QuillNVMeEAN"},
      {"userClient", PropertyDict{{"scalarMethods", PropertyDict{{"3", sizes}, {"7", updates}}}}}};
}

}  // namespace

PropertyDict writeSampleController(const DeviceDirectory& directory, const Date& now) {
  PropertyDict controller{
      {"class", "QuillQNS3NVMeController"},
      {"properties", PropertyDict{{"Controller Characteristics",
                                   PropertyDict{{"chip-id", "KX4"},
                                                {"manufacturer-id", "453c98b3"},
                                                {"num-bus", kSampleBuses},
                                                {"nand-device-desc", kSampleNandDescription}}}}},
      {"children", PropertyArray{imageService()}},
      {"userClient", PropertyDict{{"tunnel", writeBuffers(directory, now)}}}};
  return controller;
}

}  // namespace vesprun
