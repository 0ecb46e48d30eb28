#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "platform/FileSystem.h"
#include "platform/Kernel.h"
#include "platform/SystemLog.h"
#include "vesprun/PropertyDict.h"

namespace vesprun {

/// When it is absent, the running Linux system answers; null in the document means no answer.
template <typename T>
using DescribedAnswer = std::optional<std::optional<T>>;

/// What the description says, or else the live answer.
template <typename T, typename Live>
T describedOr(const std::optional<T>& described, Live live) {
  return described ? *described : live();
}

struct ApplicationDescription {
  std::string bundle;
  bool user;
};

/// As the kernel gives it: numbers little-endian, a text with its final NUL.
struct KernelVariable {
  static KernelVariable text(const std::string& text) {
    return {Bytes(text.c_str(), text.c_str() + text.size() + 1), true};
  }

  Bytes bytes;
  bool isText = false;
};

struct ChannelDescription {
  std::string name;
  std::int64_t value;
  std::int64_t format = 1;
  std::uint64_t categories = 256;
};

/// The usage feed's reply, and when. Null: it never replies.
struct UsageDescription {
  PropertyArray records;
  double delaySeconds = 0.0;
};

struct TunnelAnswerDescription {
  std::uint32_t opcode;
  std::uint32_t argument = 0;
  std::uint32_t kind = 0;
  std::optional<std::string> file{};      ///< absent: no bytes
  std::optional<std::uint32_t> size{};    ///< absent: the file's length
  std::optional<std::uint64_t> length{};  ///< absent: the file's length
  std::uint32_t sizeError = 0;
  std::uint32_t dataError = 0;
};

struct ContentDeletionDescription {
  std::uint32_t value = 0;
  std::uint32_t length = 4;
  std::uint32_t error = 0;
};

struct UserClientDescription {
  std::uint32_t openError = 0;
  std::uint32_t closeError = 0;
  std::vector<TunnelAnswerDescription> tunnel;
  std::optional<ContentDeletionDescription> contentDeletion;
  /// By method number and four-character code.
  std::map<std::uint32_t, std::map<std::uint32_t, std::uint64_t>> scalarMethods;
};

struct RegistryEntryDescription {
  std::string className;
  std::vector<std::string> conformsTo;
  bool matching = true;
  PropertyDict properties;
  std::vector<RegistryEntryDescription> children;
  std::optional<UserClientDescription> userClient;
};

/// The content of `device.json`. Where an entry is absent, the running Linux system answers
/// ("live") unless stated otherwise.
struct DeviceDescription {
  using Names = std::set<std::string, std::less<>>;
  struct Ticks {
    std::uint64_t value;
    TickRatio ratio;
  };

  std::optional<Date> clock;  ///< present: the clock stops at it
  std::optional<std::string> timeZone;
  LogLevel logLevel = LogLevel::Info;
  struct {
    std::optional<std::string> buildVersion;
    std::optional<std::string> osVersion;
    std::optional<std::string> systemVersion;
    std::optional<std::string> hardwareModel;
    std::optional<std::string> systemID;
    std::optional<std::string> incidentID;
  } system;
  struct {
    bool internalBuild = false;
    DescribedAnswer<PropertyDict> diskUsage;
    std::optional<std::string> inverseDeviceID;  ///< absent: no answer
  } properties;
  DescribedAnswer<FileSystemStatistics> userVolume;
  struct {
    bool enabled = true;
    bool fails = false;
  } submission;
  PropertyArray logBlacklist;
  struct {
    bool available = true;
    std::optional<Names> used;  ///< absent: every event is wanted
    Names fails;
  } events;
  std::optional<std::vector<ApplicationDescription>> apps;
  struct {
    std::optional<std::vector<std::string>> preferred;
    std::optional<std::vector<std::string>> localizations;
    DescribedAnswer<std::string> country;
  } languages;
  struct {
    bool available = true;
    Names missing;
  } supportLibrary;
  DescribedAnswer<PropertyDict> purgeable;  ///< absent: the device lacks the service
  struct {
    std::optional<std::uint64_t> pageSize;
    DescribedAnswer<Ticks> ticks;  ///< null: the ratio cannot be read
    std::map<std::string, KernelVariable, std::less<>> variables;
    std::optional<std::string> snapshotFile;
    std::optional<int> eccError;
  } kernel;
  std::vector<RegistryEntryDescription> registry;
  std::vector<ChannelDescription> channels;
  bool liveChannels = false;  ///< the running system's instead
  /// Who may count which keys through a socket: a user, or "*", and the beginnings of keys.
  std::map<std::string, std::vector<std::string>, std::less<>> senders = {{"*", {"app."}}};
  DescribedAnswer<UsageDescription> usage;  ///< absent: an empty reply at once
};

/// Values, and marks within texts that look like more of them: each takes far more memory than its
/// text.
inline constexpr std::ptrdiff_t kMaxDescribedValues = 1'000'000;

/// Nothing, with the entry or line in `error`, when the text is malformed.
std::optional<DeviceDescription> readDeviceDescription(const std::string& text, std::string& error);

}  // namespace vesprun
