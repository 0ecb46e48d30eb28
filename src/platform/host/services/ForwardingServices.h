#pragma once

#include <md5.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>

#include "platform/DailyWorkLock.h"
#include "platform/DiagnosticHeader.h"
#include "platform/EventHub.h"
#include "platform/FileSystem.h"
#include "platform/InstalledApplications.h"
#include "platform/Logsmith.h"
#include "platform/MessageDigest.h"
#include "platform/NotificationCenter.h"
#include "platform/Orrery.h"
#include "platform/ProcessInformation.h"
#include "platform/PtreeSerialization.h"
#include "platform/Reclaimer.h"
#include "platform/SupportLibrary.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/device/Outbox.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/files/FileLock.h"
#include "platform/host/files/WholeFile.h"

// Services that only pass on what the description, Linux, the outbox or another room has.

namespace vesprun {

template <typename T, typename Live>
T describedOr(const std::optional<T>& described, Live live) {
  return described ? *described : live();
}

/// Locks the device directory itself: no file is left behind, and the kernel frees the lock when
/// its process ends.
class HostDailyWorkLock final : public DailyWorkLock {
 public:
  HostDailyWorkLock(const DeviceDirectory& directory, SystemLog& log)
      : _directory(directory), _log(log) {}

  bool lock(double seconds) override {
    if (_held) {
      return true;
    }
    const std::chrono::milliseconds longestWait(static_cast<std::int64_t>(seconds * 1000));
    std::string error;
    bool busy = false;
    _held =
        FolderLock::take(_directory.path(), error, FolderLock::Kind::Exclusive, longestWait, &busy);
    if (!_held) {
      _log.write(LogLevel::Error, error);
    }
    return !busy;
  }

 private:
  const DeviceDirectory& _directory;
  SystemLog& _log;
  std::optional<FolderLock> _held;
};

class HostDiagnosticHeader : public DiagnosticHeader {
 public:
  explicit HostDiagnosticHeader(const SystemDescription& description) : _description(description) {}

  std::string GetSysIDWithDescription(bool withDescription) override {
    return (withDescription ? "machine " : "") +
           describedOr(_description.systemID, live::machineIdentifier);
  }
  std::string GetHardwareModel() override {
    return describedOr(_description.hardwareModel, live::hardwareModel);
  }
  std::string GetSystemVersion() override {
    return describedOr(_description.systemVersion, live::osVersion);
  }
  /// A described identifier is the same for every log.
  std::string GetIncidentID() override {
    return describedOr(_description.incidentID, live::newIdentifier);
  }

 private:
  const SystemDescription& _description;
};

/// Writes events to `outbox/events.jsonl`.
class HostEventHub : public EventHub {
 public:
  HostEventHub(const EventHubDescription& description, Outbox& outbox)
      : _description(description), _outbox(outbox) {}

  bool sendEventLazyIsAvailable() override { return _description.available; }
  bool EventHubIsEventUsed(std::string_view event) override {
    return !_description.used || _description.used->contains(event);
  }
  bool EventHubSendEventLazy(std::string_view event, const PayloadBuilder& build) override {
    if (!_description.available || _description.fails.contains(event)) {
      return false;
    }
    return !EventHubIsEventUsed(event) ||
           _outbox.append("events.jsonl", {{"event", event}, {"payload", build()}});
  }

 private:
  const EventHubDescription& _description;
  Outbox& _outbox;
};

/// The files of the device directory. A file that is there but cannot be read leaves an error in
/// the system log.
class HostFileSystem : public FileSystem {
 public:
  HostFileSystem(const DeviceDirectory& directory,
                 const AnswerDescription<FileSystemStatistics>& userVolume, SystemLog& log)
      : _directory(directory), _userVolume(userVolume), _log(log) {}

  std::optional<std::string> readFile(const std::string& path) override {
    std::string error;
    bool missing = false;
    std::optional<std::string> content = readWholeFile(_directory.hostPath(path), error, &missing);
    if (!content && !missing) {
      _log.write(LogLevel::Error, error);
    }
    return content;
  }
  std::optional<std::uint64_t> fileSize(const std::string& path) override {
    struct stat status {};
    return stat(_directory.hostPath(path).c_str(), &status) == 0
               ? std::optional(static_cast<std::uint64_t>(status.st_size))
               : std::nullopt;
  }
  std::optional<FileSystemStatistics> statfs(const std::string& path) override {
    if (path != "/private/var") {
      return live::volume(_directory.hostPath(path));
    }
    return _userVolume.isLive() ? live::volume(_directory.path()) : _userVolume.value;
  }

 private:
  const DeviceDirectory& _directory;
  const AnswerDescription<FileSystemStatistics>& _userVolume;
  SystemLog& _log;
};

class HostInstalledApplications : public InstalledApplications {
 public:
  explicit HostInstalledApplications(const DeviceDescription& description)
      : _description(description) {}

  void EnumerateInstalledBundles(const Visitor& visitor) override {
    for (const auto& [bundle, user] : describedOr(_description.apps, live::applications)) {
      visitor(bundle, user ? BundleType::User : BundleType::System);
    }
  }

 private:
  const DeviceDescription& _description;
};

/// Submitted logs and records lie in the outbox until someone collects them: the housekeeping of
/// old logs has nothing to do.
class HostLogsmith : public Logsmith {
 public:
  HostLogsmith(const DeviceDescription& description, Outbox& outbox)
      : _description(description), _outbox(outbox) {}

  bool DiagnosticLogSubmissionEnabled() override { return _description.submission.enabled; }
  bool LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const PropertyDict* header, const LogWriter& writer) override {
    return !_description.submission.fails && _outbox.submitLog(logType, logName, header, writer);
  }
  std::string LGSOSVersion() override {
    return describedOr(_description.system.osVersion, live::osVersion);
  }
  PropertyDict CopySystemVersionDictionary() override {
    return {{"ProductBuildVersion", describedOr(_description.system.buildVersion, live::osBuild)}};
  }
  bool FLLogStructuredData(std::int32_t type, const PropertyDict& record) override {
    return _outbox.append("records.jsonl", {{"type", type}, {"record", record}});
  }
  void FLDumpAllOldStructuredDataLogs() override {}
  void rollTendmarkLogs() override {}

 private:
  const DeviceDescription& _description;
  Outbox& _outbox;
};

class HostMessageDigest : public MessageDigest {
 public:
  std::array<std::uint8_t, 16> md5(std::string_view bytes) override {
    MD5_CTX context;
    MD5Init(&context);
    MD5Update(&context, reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    std::array<std::uint8_t, 16> digest{};
    MD5Final(digest.data(), &context);
    return digest;
  }
};

/// Writes notifications to `outbox/notifications.jsonl`.
class HostNotificationCenter : public NotificationCenter {
 public:
  explicit HostNotificationCenter(Outbox& outbox) : _outbox(outbox) {}

  void PostNotification(std::string_view name) override {
    _outbox.append("notifications.jsonl", {{"name", name}});
  }

 private:
  Outbox& _outbox;
};

class HostOrrery : public Orrery {
 public:
  HostOrrery(const DevicePropertyDescription& description, const DeviceDirectory& directory)
      : _description(description), _directory(directory) {}

  std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) override {
    if (question == "InternalBuild") {
      return _description.internalBuild;
    }
    if (question == "DiskUsage") {
      return _description.diskUsage.isLive() ? liveDiskUsage() : _description.diskUsage.value;
    }
    return question == "InverseDeviceID" ? _description.inverseDeviceID : std::nullopt;
  }

 private:
  std::optional<PropertyDict> liveDiskUsage() const {
    const std::optional<FileSystemStatistics> volume = live::volume(_directory.path());
    if (!volume) {
      return std::nullopt;
    }
    const auto bytes = [&](std::uint64_t blocks) {
      return static_cast<std::int64_t>(blocks * volume->blockSize);
    };
    return PropertyDict{
        {std::string(kDiskUsageTotalDiskCapacity), bytes(volume->blocks)},
        {std::string(kDiskUsageTotalDataAvailable), bytes(volume->availableBlocks)},
        {std::string(kDiskUsageAmountDataAvailable), bytes(volume->availableBlocks)}};
  }

  const DevicePropertyDescription& _description;
  const DeviceDirectory& _directory;
};

/// On the device the job's process is vesprun, whichever program runs it here.
class HostProcessInformation : public ProcessInformation {
 public:
  std::string processName() override { return "vesprun"; }
  std::int32_t processIdentifier() override { return getpid(); }
};

class HostPtreeSerialization final : public PtreeSerialization {
 public:
  std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) override {
    return readPtree(bytes, error);
  }
  std::optional<std::string> serialize(const PropertyDict& dict, std::string& error) override {
    std::string document;
    return writePtree(dict, document, error) ? std::optional(std::move(document)) : std::nullopt;
  }
};

/// Gives the described answer for every volume.
class HostReclaimer : public Reclaimer {
 public:
  explicit HostReclaimer(const DeviceDescription& description) : _description(description) {}

  bool isAvailable() override { return _description.purgeableServiceAvailable; }
  std::optional<PropertyDict> ReclaimerCopyItemizedPurgeableSpaceWithInfo(
      const PropertyDict& /*options*/) override {
    return _description.purgeable;
  }

 private:
  const DeviceDescription& _description;
};

/// The library is simulated: `Preferences` does what it offers.
class HostSupportLibrary : public SupportLibrary {
 public:
  explicit HostSupportLibrary(const SupportLibraryDescription& description)
      : _description(description) {}

  bool load() override { return _description.available; }
  bool offers(std::string_view symbol) override { return !_description.missing.contains(symbol); }

 private:
  const SupportLibraryDescription& _description;
};

}  // namespace vesprun
