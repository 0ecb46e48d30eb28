#include "support/FailingPlatform.h"

namespace vesprun {
namespace {

/// A service in front of the real one.
template <typename Service>
class Failing : public Service {
 public:
  Failing(Service& service, Faults& operations) : real(service), faults(operations) {}

 protected:
  bool fails(const std::string& operation) { return faults.fails(operation); }
  Service& sound(const std::string& operation) {
    faults.passes(operation);
    return real;
  }

  Service& real;
  Faults& faults;
};

struct FailingClock : Failing<Clock> {
  using Failing::Failing;
  Date now() override { return sound(__func__).now(); }
  std::string localDateText(const Date& date) override {
    return sound(__func__).localDateText(date);
  }
};

struct FailingDailyWorkLock : Failing<DailyWorkLock> {
  using Failing::Failing;
  bool lock(double seconds) override { return !fails(__func__) && real.lock(seconds); }
};

/// The registry with the calls that a test can watch, but for what gives handles back.
struct FailingRegistry : WatchedRegistry {
  FailingRegistry(DeviceRegistry& registry, Faults& operations)
      : WatchedRegistry(registry), faults(operations) {}
  bool isToFail(const Call& call) override {
    return call.operation != "close" && faults.fails(call.operation);
  }
  Faults& faults;
};

struct FailingDiagnosticHeader : Failing<DiagnosticHeader> {
  using Failing::Failing;
  std::string GetSysIDWithDescription(bool withDescription) override {
    return sound(__func__).GetSysIDWithDescription(withDescription);
  }
  std::string GetHardwareModel() override { return sound(__func__).GetHardwareModel(); }
  std::string GetSystemVersion() override { return sound(__func__).GetSystemVersion(); }
  std::string GetIncidentID() override { return sound(__func__).GetIncidentID(); }
};

struct FailingEventHub : Failing<EventHub> {
  using Failing::Failing;
  bool sendEventLazyIsAvailable() override {
    return !fails(__func__) && real.sendEventLazyIsAvailable();
  }
  bool EventHubIsEventUsed(std::string_view event) override {
    return !fails(__func__) && real.EventHubIsEventUsed(event);
  }
  bool EventHubSendEventLazy(std::string_view event, const PayloadBuilder& build) override {
    return !fails(__func__) && real.EventHubSendEventLazy(event, build);
  }
};

struct FailingFileSystem : Failing<FileSystem> {
  using Failing::Failing;
  std::optional<std::string> readFile(const std::string& path) override {
    return fails(__func__) ? std::nullopt : real.readFile(path);
  }
  std::optional<std::uint64_t> fileSize(const std::string& path) override {
    return fails(__func__) ? std::nullopt : real.fileSize(path);
  }
  std::optional<FileSystemStatistics> statfs(const std::string& path) override {
    return fails(__func__) ? std::nullopt : real.statfs(path);
  }
};

struct FailingInstalledApplications : Failing<InstalledApplications> {
  using Failing::Failing;
  void EnumerateInstalledBundles(const Visitor& visitor) override {
    sound(__func__).EnumerateInstalledBundles(visitor);
  }
};

struct FailingKernel : Failing<Kernel> {
  using Failing::Failing;
  int sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                   std::size_t& length) override {
    constexpr int kInputOutput = 5;
    return fails(__func__) ? kInputOutput : real.sysctlbyname(name, buffer, length);
  }
  bool acknowledgeECCEvent() override { return !fails(__func__) && real.acknowledgeECCEvent(); }
  std::uint64_t pageSize() override { return sound(__func__).pageSize(); }
  std::uint64_t monotonicTicks() override { return sound(__func__).monotonicTicks(); }
  std::optional<TickRatio> tickRatio() override {
    return fails(__func__) ? std::nullopt : real.tickRatio();
  }
  std::optional<Bytes> captureSnapshot(std::uint32_t captureFlags) override {
    return fails(__func__) ? std::nullopt : real.captureSnapshot(captureFlags);
  }
};

struct FailingLanguages : Failing<Languages> {
  using Failing::Failing;
  std::vector<std::string> preferredLanguages() override {
    return sound(__func__).preferredLanguages();
  }
  std::vector<std::string> systemLocalizations() override {
    return sound(__func__).systemLocalizations();
  }
  std::vector<std::string> bestLocalizations(const std::vector<std::string>& available,
                                             const std::vector<std::string>& preferred) override {
    return sound(__func__).bestLocalizations(available, preferred);
  }
  std::optional<std::string> localeCountryCode() override {
    return fails(__func__) ? std::nullopt : real.localeCountryCode();
  }
};

struct FailingLogFile : Failing<LogFileHandle> {
  using Failing::Failing;
  bool write(std::string_view bytes) override { return sound(__func__).write(bytes); }
};

struct FailingLogsmith : Failing<Logsmith> {
  using Failing::Failing;
  bool DiagnosticLogSubmissionEnabled() override {
    return !fails(__func__) && real.DiagnosticLogSubmissionEnabled();
  }
  bool LGSWriteLogForSubmission(std::string_view logType, std::string_view logName,
                                const PropertyDict* header, const LogWriter& writer) override {
    return !fails(__func__) &&
           real.LGSWriteLogForSubmission(logType, logName, header, [&](LogFileHandle& file) {
             FailingLogFile failing(file, faults);
             writer(failing);
           });
  }
  std::string LGSOSVersion() override { return sound(__func__).LGSOSVersion(); }
  PropertyDict CopySystemVersionDictionary() override {
    return sound(__func__).CopySystemVersionDictionary();
  }
  bool FLLogStructuredData(std::int32_t type, const PropertyDict& record) override {
    return !fails(__func__) && real.FLLogStructuredData(type, record);
  }
  void FLDumpAllOldStructuredDataLogs() override {
    sound(__func__).FLDumpAllOldStructuredDataLogs();
  }
  void rollTendmarkLogs() override { sound(__func__).rollTendmarkLogs(); }
};

struct FailingMainLoop : Failing<MainLoop> {
  using Failing::Failing;
  SliceResult runMainLoopSlice(double seconds) override {
    return sound(__func__).runMainLoopSlice(seconds);
  }
};

struct FailingMessageDigest : Failing<MessageDigest> {
  using Failing::Failing;
  std::array<std::uint8_t, 16> md5(std::string_view bytes) override {
    return sound(__func__).md5(bytes);
  }
};

struct FailingMessageService : Failing<MessageService> {
  using Failing::Failing;
  std::unique_ptr<ServiceListener> createListener(std::string_view name) override {
    return fails(__func__) ? nullptr : real.createListener(name);
  }
};

struct FailingMurmur : Failing<Murmur> {
  using Failing::Failing;
  /// A feed that fails answers without records.
  struct Feed : UsageFeed {
    Feed(std::shared_ptr<UsageFeed> feed, Faults& operations)
        : real(std::move(feed)), faults(operations) {}
    void usageToDateForNameKindReply(const std::set<std::string>& names, UsageNameKind kind,
                                     ReplyHandler reply) override {
      if (faults.fails(__func__)) {
        reply(nullptr);
      } else {
        real->usageToDateForNameKindReply(names, kind, std::move(reply));
      }
    }
    std::shared_ptr<UsageFeed> real;
    Faults& faults;
  };
  std::shared_ptr<UsageWorkspace> createUsageWorkspace(std::string_view endpoint) override {
    return sound(__func__).createUsageWorkspace(endpoint);
  }
  std::shared_ptr<UsageFeed> createUsageFeed(std::shared_ptr<UsageWorkspace> workspace) override {
    return std::make_shared<Feed>(sound(__func__).createUsageFeed(std::move(workspace)), faults);
  }
};

struct FailingNotificationCenter : Failing<NotificationCenter> {
  using Failing::Failing;
  void PostNotification(std::string_view name) override { sound(__func__).PostNotification(name); }
};

struct FailingOrrery : Failing<Orrery> {
  using Failing::Failing;
  std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) override {
    return fails(__func__) ? std::nullopt : real.OrreryCopyAnswer(question);
  }
};

struct FailingPreferences : Failing<Preferences> {
  using Failing::Failing;
  std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view key,
                                                      std::string_view domain) override {
    return fails(__func__) ? std::nullopt : real.LGSPreferencesGetValue(key, domain);
  }
  void LGSPreferencesSetValue(std::optional<std::string_view> key,
                              std::optional<PropertyValue> value,
                              std::string_view domain) override {
    sound(__func__).LGSPreferencesSetValue(key, std::move(value), domain);
  }
  bool LGSPreferencesSynchronize(std::string_view domain) override {
    return !fails(__func__) && real.LGSPreferencesSynchronize(domain);
  }
};

struct FailingProcessInformation : Failing<ProcessInformation> {
  using Failing::Failing;
  std::string processName() override { return sound(__func__).processName(); }
  std::int32_t processIdentifier() override { return sound(__func__).processIdentifier(); }
};

struct FailingPtreeSerialization : Failing<PtreeSerialization> {
  using Failing::Failing;
  std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) override {
    return fails(__func__) ? std::nullopt : real.parse(bytes, error);
  }
  std::optional<std::string> serialize(const PropertyDict& dict, std::string& error) override {
    return fails(__func__) ? std::nullopt : real.serialize(dict, error);
  }
};

struct FailingReclaimer : Failing<Reclaimer> {
  using Failing::Failing;
  bool isAvailable() override { return !fails(__func__) && real.isAvailable(); }
  std::optional<PropertyDict> ReclaimerCopyItemizedPurgeableSpaceWithInfo(
      const PropertyDict& options) override {
    return fails(__func__) ? std::nullopt
                           : real.ReclaimerCopyItemizedPurgeableSpaceWithInfo(options);
  }
};

struct FailingServicesClient : Failing<LGSServicesClient> {
  using Failing::Failing;
  void setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                           std::string_view user, std::string_view domain,
                                           std::optional<PropertyValue> value) override {
    sound(__func__).setPreferenceForUserInDomainToValue(key, user, domain, std::move(value));
  }
  void deletePreferenceForUserInDomain(std::optional<std::string_view> key, std::string_view user,
                                       std::string_view domain) override {
    sound(__func__).deletePreferenceForUserInDomain(key, user, domain);
  }
  void synchronizeAllUsers() override { sound(__func__).synchronizeAllUsers(); }
};

struct FailingSupportLibrary : Failing<SupportLibrary> {
  using Failing::Failing;
  bool load() override { return !fails(__func__) && real.load(); }
  bool offers(std::string_view symbol) override { return !fails(__func__) && real.offers(symbol); }
};

struct FailingSystemConfiguration : Failing<LGSSystemConfiguration> {
  using Failing::Failing;
  std::optional<PropertyValue> getPrefsKeyForDomainWithOptions(std::string_view key,
                                                               std::string_view domain,
                                                               std::uint32_t options) override {
    return fails(__func__) ? std::nullopt
                           : real.getPrefsKeyForDomainWithOptions(key, domain, options);
  }
  void setPrefsKeyValueForDomainWithSync(std::optional<std::string_view> key,
                                         std::optional<PropertyValue> value,
                                         std::string_view domain, bool sync) override {
    sound(__func__).setPrefsKeyValueForDomainWithSync(key, std::move(value), domain, sync);
  }
  void synchronize() override { sound(__func__).synchronize(); }
  PropertyArray getLogBlacklist() override { return sound(__func__).getLogBlacklist(); }
};

struct FailingSystemLog : Failing<SystemLog> {
  using Failing::Failing;
  bool keeps(LogLevel level) const override { return real.keeps(level); }
  void write(LogLevel level, std::string_view message) override {
    sound(__func__).write(level, message);
  }
};

struct FailingTallybook : Failing<Tallybook> {
  using Failing::Failing;
  /// A history that fails has no rows.
  struct History : TBHistory {
    History(std::unique_ptr<TBHistory> history, Faults& operations)
        : real(std::move(history)), faults(operations) {}
    bool scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
        std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
        const ScalarRowHandler& rowHandler) override {
      return !faults.fails(__func__) &&
             real->scalarsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
                 keyPrefix, minDay, maxDay, rowHandler);
    }
    bool distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
        std::string_view keyPrefix, std::int32_t minDay, std::int32_t maxDay,
        const DistributionRowHandler& rowHandler) override {
      return !faults.fails(__func__) &&
             real->distributionsForKeyPrefixMinDaysSince1970MaxDaysSince1970RowHandler(
                 keyPrefix, minDay, maxDay, rowHandler);
    }
    std::unique_ptr<TBHistory> real;
    Faults& faults;
  };
  std::int32_t TBDaysSince1970() override { return sound(__func__).TBDaysSince1970(); }
  Date dateForDaysSince1970(std::int32_t day) override {
    return sound(__func__).dateForDaysSince1970(day);
  }
  void TBClientCheckpoint() override {
    if (!fails(__func__)) {
      real.TBClientCheckpoint();
    }
  }
  void TBClientSetValueForScalarKey(std::string_view key, std::int64_t value) override {
    sound(__func__).TBClientSetValueForScalarKey(key, value);
  }
  void TBClientAddValueForScalarKey(std::string_view key, std::int64_t value) override {
    sound(__func__).TBClientAddValueForScalarKey(key, value);
  }
  std::unique_ptr<TBHistory> initWithDefaultPath() override {
    return std::make_unique<History>(sound(__func__).initWithDefaultPath(), faults);
  }
};

struct FailingTapline : Failing<Tapline> {
  using Failing::Failing;
  struct Subscription : TaplineSubscription {
    Subscription(std::unique_ptr<TaplineSubscription> subscription, Faults& operations)
        : real(std::move(subscription)), faults(operations) {}
    std::unique_ptr<TaplineChannels> TaplineCreateSamples() override {
      return faults.fails(__func__) ? nullptr : real->TaplineCreateSamples();
    }
    std::unique_ptr<TaplineSubscription> real;
    Faults& faults;
  };
  std::unique_ptr<TaplineChannels> TaplineCopyChannelsInCategories(
      std::uint64_t categoryMask, std::uint64_t firstSelection,
      std::uint64_t secondSelection) override {
    return fails(__func__) ? nullptr
                           : real.TaplineCopyChannelsInCategories(categoryMask, firstSelection,
                                                                  secondSelection);
  }
  std::unique_ptr<TaplineSubscription> TaplineCreateSubscription(
      const TaplineChannels& wanted, std::unique_ptr<TaplineChannels>& subscribed) override {
    return fails(__func__) ? nullptr
                           : std::make_unique<Subscription>(
                                 real.TaplineCreateSubscription(wanted, subscribed), faults);
  }
};

struct FailingUserDefaults : Failing<UserDefaults> {
  using Failing::Failing;
  std::optional<PropertyValue> valueForKey(std::string_view key) override {
    return fails(__func__) ? std::nullopt : real.valueForKey(key);
  }
  void setValueForKey(std::optional<PropertyValue> value, std::string_view key) override {
    sound(__func__).setValueForKey(std::move(value), key);
  }
  bool synchronize() override { return !fails(__func__) && real.synchronize(); }
};

class FailingPlatform : public Platform {
 public:
  FailingPlatform(HostPlatform& real, Faults& operations) : host(real), faults(operations) {}

  Clock& clock() override { return _clock; }
  DailyWorkLock& dailyWorkLock() override { return _dailyWorkLock; }
  DeviceRegistry& deviceRegistry() override { return _deviceRegistry; }
  DiagnosticHeader& diagnosticHeader() override { return _diagnosticHeader; }
  EventHub& eventHub() override { return _eventHub; }
  FileSystem& fileSystem() override { return _fileSystem; }
  InstalledApplications& installedApplications() override { return _installedApplications; }
  Kernel& kernel() override { return _kernel; }
  Languages& languages() override { return _languages; }
  Logsmith& logsmith() override { return _logsmith; }
  MainLoop& mainLoop() override { return _mainLoop; }
  MessageDigest& messageDigest() override { return _messageDigest; }
  MessageService& messageService() override { return _messageService; }
  Murmur& murmur() override { return _murmur; }
  NotificationCenter& notificationCenter() override { return _notificationCenter; }
  Orrery& orrery() override { return _orrery; }
  Preferences& preferences() override { return _preferences; }
  ProcessInformation& processInformation() override { return _processInformation; }
  PtreeSerialization& ptreeSerialization() override { return _ptreeSerialization; }
  Reclaimer& reclaimer() override { return _reclaimer; }
  LGSServicesClient& servicesClient() override { return _servicesClient; }
  SupportLibrary& supportLibrary() override { return _supportLibrary; }
  LGSSystemConfiguration& systemConfiguration() override { return _systemConfiguration; }
  SystemLog& systemLog() override { return _systemLog; }
  Tallybook& tallybook() override { return _tallybook; }
  Tapline& tapline() override { return _tapline; }
  UserDefaults& userDefaults() override { return _userDefaults; }

 private:
  HostPlatform& host;
  Faults& faults;
  FailingClock _clock{host.clock(), faults};
  FailingDailyWorkLock _dailyWorkLock{host.dailyWorkLock(), faults};
  FailingRegistry _deviceRegistry{host.deviceRegistry(), faults};
  FailingDiagnosticHeader _diagnosticHeader{host.diagnosticHeader(), faults};
  FailingEventHub _eventHub{host.eventHub(), faults};
  FailingFileSystem _fileSystem{host.fileSystem(), faults};
  FailingInstalledApplications _installedApplications{host.installedApplications(), faults};
  FailingKernel _kernel{host.kernel(), faults};
  FailingLanguages _languages{host.languages(), faults};
  FailingLogsmith _logsmith{host.logsmith(), faults};
  FailingMainLoop _mainLoop{host.mainLoop(), faults};
  FailingMessageDigest _messageDigest{host.messageDigest(), faults};
  FailingMessageService _messageService{host.messageService(), faults};
  FailingMurmur _murmur{host.murmur(), faults};
  FailingNotificationCenter _notificationCenter{host.notificationCenter(), faults};
  FailingOrrery _orrery{host.orrery(), faults};
  FailingPreferences _preferences{host.preferences(), faults};
  FailingProcessInformation _processInformation{host.processInformation(), faults};
  FailingPtreeSerialization _ptreeSerialization{host.ptreeSerialization(), faults};
  FailingReclaimer _reclaimer{host.reclaimer(), faults};
  FailingServicesClient _servicesClient{host.servicesClient(), faults};
  FailingSupportLibrary _supportLibrary{host.supportLibrary(), faults};
  FailingSystemConfiguration _systemConfiguration{host.systemConfiguration(), faults};
  FailingSystemLog _systemLog{host.systemLog(), faults};
  FailingTallybook _tallybook{host.tallybook(), faults};
  FailingTapline _tapline{host.tapline(), faults};
  FailingUserDefaults _userDefaults{host.userDefaults(), faults};
};

}  // namespace

std::unique_ptr<Platform> failingPlatform(HostPlatform& host, Faults& faults) {
  return std::make_unique<FailingPlatform>(host, faults);
}

}  // namespace vesprun
