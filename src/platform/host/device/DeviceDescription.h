#pragma once

#include <cstddef>
#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <variant>
#include <vector>

#include "common/PropertyDict.h"
#include "platform/FileSystem.h"
#include "platform/Kernel.h"
#include "platform/SystemLog.h"

namespace vesprun {

// What `device.json` says of a device. Where an entry may be absent, the running Linux system
// answers in its place ("live") unless said otherwise.

/// An entry that can be absent (the live answer holds) or null (there is no answer).
template <typename T>
struct AnswerDescription {
  bool isNull = false;
  std::optional<T> value;

  bool isLive() const { return !isNull && !value; }
};

struct SystemDescription {
  std::optional<std::string> buildVersion;
  std::optional<std::string> osVersion;
  std::optional<std::string> systemVersion;
  std::optional<std::string> hardwareModel;
  std::optional<std::string> systemID;
  std::optional<std::string> incidentID;
};

struct DevicePropertyDescription {
  bool internalBuild = false;
  AnswerDescription<PropertyDict> diskUsage;
  std::optional<std::string> inverseDeviceID;  ///< absent: no answer
};

struct SubmissionDescription {
  bool enabled = true;
  bool fails = false;
};

struct EventHubDescription {
  bool available = true;
  std::optional<std::set<std::string, std::less<>>> used;  ///< absent: every event is wanted
  std::set<std::string, std::less<>> fails;
};

struct ApplicationDescription {
  std::string bundle;
  bool user;
};

struct LanguageDescription {
  std::optional<std::vector<std::string>> preferred;
  std::optional<std::vector<std::string>> localizations;
  AnswerDescription<std::string> country;
};

struct SupportLibraryDescription {
  bool available = true;
  std::set<std::string, std::less<>> missing;
};

/// The content of a kernel variable; text is stored without its final NUL.
using KernelVariable = std::variant<std::uint32_t, std::uint64_t, std::string, Bytes>;

struct KernelDescription {
  struct Ticks {
    std::uint64_t value;
    TickRatio ratio;
  };

  std::optional<std::uint64_t> pageSize;
  AnswerDescription<Ticks> ticks;  ///< null: the ratio cannot be read
  std::map<std::string, KernelVariable, std::less<>> variables;
  std::optional<std::string> snapshotFile;
  std::optional<int> eccError;
};

struct ChannelDescription {
  std::string name;
  std::int64_t value;
  std::int64_t format = 1;
  std::uint64_t categories = 256;
};

/// What the usage feed replies, and when. Null records: it never replies.
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
  /// Method number, then four-character code, to the scalar that is answered.
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

struct DeviceDescription {
  std::optional<Date> clock;  ///< present: the time stands still at it
  std::optional<std::string> timeZone;
  LogLevel logLevel = LogLevel::Info;
  SystemDescription system;
  DevicePropertyDescription properties;
  AnswerDescription<FileSystemStatistics> userVolume;
  SubmissionDescription submission;
  PropertyArray logBlacklist;
  EventHubDescription events;
  std::optional<std::vector<ApplicationDescription>> apps;
  LanguageDescription languages;
  SupportLibraryDescription supportLibrary;
  bool purgeableServiceAvailable = false;
  std::optional<PropertyDict> purgeable;  ///< absent: the service, if there is one, has no answer
  KernelDescription kernel;
  std::vector<RegistryEntryDescription> registry;
  std::vector<ChannelDescription> channels;
  bool liveChannels = false;                  ///< the running system's instead
  AnswerDescription<UsageDescription> usage;  ///< absent: an empty reply at once
};

/// The longest `device.json`, in bytes: 16 MiB.
inline constexpr std::size_t kLongestDeviceDescription = std::size_t{16} << 20;

/// Reads the text of a `device.json`. Nothing, with a text in `error` that names the entry or the
/// line, when it is not one.
std::optional<DeviceDescription> readDeviceDescription(const std::string& text, std::string& error);

}  // namespace vesprun
