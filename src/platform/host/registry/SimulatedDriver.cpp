#include "platform/host/registry/SimulatedDriver.h"

#include <algorithm>
#include <bit>
#include <cstring>
#include <limits>

#include "common/LittleEndian.h"
#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

static_assert(std::endian::native == std::endian::little, "answers are little-endian");

struct DriverClass {
  std::string_view name;
  std::uint32_t tunnelMethod;
  std::optional<std::uint32_t> contentDeletionMethod;
};

constexpr DriverClass kDriverClasses[] = {
    {"QuillQNS3NVMeController", 9, std::nullopt},
    {"QuillEmbeddedNVMeController", 9, std::nullopt},
    {"ORUStorage", 8, 5},
};

constexpr std::size_t kRequestSize = 24;
constexpr std::uint32_t kSizePhase = 1;
constexpr std::uint32_t kListKindShift = 2;
constexpr std::uint32_t kListKindMask = 0xFF;

}  // namespace

bool conformsTo(const RegistryEntryDescription& entry, std::string_view className) {
  return entry.className == className || std::find(entry.conformsTo.begin(), entry.conformsTo.end(),
                                                   className) != entry.conformsTo.end();
}

RegistryResult SimulatedDriver::callStructMethod(std::uint32_t method,
                                                 std::span<const std::uint8_t> input,
                                                 std::span<std::uint8_t> output,
                                                 std::uint64_t& outputLength) {
  for (const DriverClass& driver : kDriverClasses) {
    if (conformsTo(_entry, driver.name)) {
      if (method == driver.tunnelMethod) {
        return tunnel(input, output, outputLength);
      }
      if (method == driver.contentDeletionMethod) {
        return contentDeletion(input, output, outputLength);
      }
    }
  }
  return kBadArgument;
}

RegistryResult SimulatedDriver::tunnel(std::span<const std::uint8_t> input,
                                       std::span<std::uint8_t> output,
                                       std::uint64_t& outputLength) {
  if (input.size() != kRequestSize) {
    return kBadArgument;
  }
  const std::uint32_t flags = loadLittleEndian<std::uint32_t>(&input[4]);
  const auto& answers = _entry.userClient->tunnel;
  const auto answer =
      std::find_if(answers.begin(), answers.end(), [&](const TunnelAnswerDescription& candidate) {
        return candidate.opcode == loadLittleEndian<std::uint32_t>(&input[0]) &&
               candidate.argument == loadLittleEndian<std::uint32_t>(&input[8]) &&
               candidate.kind == (flags >> kListKindShift & kListKindMask);
      });
  if (answer == answers.end()) {
    return kBadArgument;
  }
  const bool asksForSize = (flags & kSizePhase) != 0;
  if (const RegistryResult error = asksForSize ? answer->sizeError : answer->dataError) {
    return error;
  }
  std::string error;
  const std::optional<std::string> content =
      answer->file ? readWholeFile(_directory.hostPath(*answer->file), error) : std::string();
  if (!content) {
    _log.write(LogLevel::Error, "Storage controller: " + error);
    return kBadArgument;
  }
  if (!answer->size && content->size() > std::numeric_limits<std::uint32_t>::max()) {
    return kBadArgument;
  }
  const std::uint32_t size = answer->size.value_or(static_cast<std::uint32_t>(content->size()));
  if (output.size() < (asksForSize ? sizeof size : size)) {
    return kBadArgument;
  }
  if (asksForSize) {
    std::memcpy(output.data(), &size, sizeof size);
    outputLength = sizeof size;
  } else {
    std::copy_n(content->begin(), std::min(content->size(), output.size()), output.begin());
    outputLength = answer->length.value_or(content->size());
  }
  return kRegistrySuccess;
}

RegistryResult SimulatedDriver::contentDeletion(std::span<const std::uint8_t> input,
                                                std::span<std::uint8_t> output,
                                                std::uint64_t& outputLength) {
  const auto& answer = _entry.userClient->contentDeletion;
  if (!answer || !input.empty() || output.size() < sizeof answer->value) {
    return kBadArgument;
  }
  if (answer->error != 0) {
    return answer->error;
  }
  std::memcpy(output.data(), &answer->value, sizeof answer->value);
  outputLength = answer->length;
  return kRegistrySuccess;
}

RegistryResult SimulatedDriver::callScalarMethod(std::uint32_t method, std::uint64_t input,
                                                 std::uint64_t& output) {
  const auto& methods = _entry.userClient->scalarMethods;
  const auto codes = methods.find(method);
  if (codes == methods.end()) {
    return kBadArgument;
  }
  const auto answer = input <= std::numeric_limits<std::uint32_t>::max()
                          ? codes->second.find(static_cast<std::uint32_t>(input))
                          : codes->second.end();
  if (answer == codes->second.end()) {
    return kError;
  }
  output = answer->second;
  return kRegistrySuccess;
}

}  // namespace vesprun
