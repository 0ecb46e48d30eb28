#include <gmock/gmock.h>

#include <algorithm>
#include <set>

#include "NANDInfo/structuredlog/NANDLogWriter.h"
#include "driver/ActiveAppInfoListener.h"
#include "driver/DailyDriver.h"
#include "driver/DailyTasks.h"
#include "driver/TaskingSync.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/outbox/HostOutbox.h"
#include "platform/host/preferences/HostPreferences.h"
#include "platform/host/preferences/PreferenceServices.h"
#include "platform/host/services/HostDeviceInformation.h"
#include "platform/host/services/HostKernel.h"
#include "report/KernelMemoryStatistics.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre, ::testing::SizeIs;

/// A device whose services note what they are asked, and fail where told.
class NotedDevice : public TestDevice {
 public:
  explicit NotedDevice(const std::string& entries = "", bool hasWhitelist = true)
      : TestDevice(R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "UTC")" + entries + '}') {
    if (hasWhitelist) {
      writeWhitelistJson(R"({"G": {"ScalarKeyPrefixes": {"": {}}}})");
    }
    platform().tallybook().TBClientAddValueForScalarKey("k", 1);
    platform().tallybook().TBClientCheckpoint();
    platform().kernel = _kernel;
    platform().logsmith = _outbox;
    platform().deviceInformation = _information;
    platform().tallybook = _tallybook;
    platform().preferences = _preferences;
    platform().systemConfiguration = _configuration;
    platform().messageService = _messages;
  }

  std::vector<std::string> calls;
  std::string failing;  ///< what throws as if memory ran out

  /// The calls among `known`, without repeats of one in a row.
  std::vector<std::string> among(const std::set<std::string>& known) const {
    std::vector<std::string> found;
    for (const std::string& call : calls) {
      if (known.contains(call) && (found.empty() || found.back() != call)) {
        found.push_back(call);
      }
    }
    return found;
  }

 private:
  void note(std::string_view call) {
    calls.emplace_back(call);
    if (call == failing) {
      throw std::bad_alloc();
    }
  }

  struct NotedKernel : HostKernel {
    explicit NotedKernel(NotedDevice& owner)
        : HostKernel(owner.platform().description(), owner.platform().directory(),
                     owner.platform().systemLog()),
          device(owner) {}
    int sysctlbyname(const std::string& name, std::span<std::uint8_t> buffer,
                     std::size_t& length) override {
      device.note(name);
      return HostKernel::sysctlbyname(name, buffer, length);
    }
    NotedDevice& device;
  };
  struct NotedOutbox : HostOutbox {
    explicit NotedOutbox(NotedDevice& owner)
        : HostOutbox(owner.platform().directory(), owner.platform().description(),
                     owner.platform().clock(), owner.platform().systemLog()),
          device(owner) {}
    std::string LGSOSVersion() override {
      device.note("OS version");
      return HostOutbox::LGSOSVersion();
    }
    PropertyDict CopySystemVersionDictionary() override {
      device.note("build");
      return HostOutbox::CopySystemVersionDictionary();
    }
    bool LGSWriteLogForSubmission(std::string_view type, std::string_view name,
                                  const PropertyDict* header, const LogWriter& writer) override {
      return HostOutbox::LGSWriteLogForSubmission(type, name, header, [&](const auto& handle) {
        writer([&](std::string_view bytes) {
          device.note("written");
          return handle(bytes);
        });
      });
    }
    NotedDevice& device;
  };
  struct NotedInformation : HostDeviceInformation {
    explicit NotedInformation(NotedDevice& owner)
        : HostDeviceInformation(owner.platform().description(), owner.platform().directory()),
          device(owner) {}
    std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) override {
      device.note(question);
      return HostDeviceInformation::OrreryCopyAnswer(question);
    }
    std::string GetSysIDWithDescription(bool withDescription) override {
      device.note("system");
      return HostDeviceInformation::GetSysIDWithDescription(withDescription);
    }
    std::string GetHardwareModel() override {
      device.note("model");
      return HostDeviceInformation::GetHardwareModel();
    }
    std::string GetIncidentID() override {
      device.note("incident");
      return HostDeviceInformation::GetIncidentID();
    }
    std::string processName() override {
      device.note("process");
      return HostDeviceInformation::processName();
    }
    NotedDevice& device;
  };
  struct NotedTallybook : HostTallybook {
    explicit NotedTallybook(NotedDevice& owner)
        : HostTallybook(owner.platform().directory(), owner.platform().clock(),
                        owner.platform().preferences(), owner.platform().systemLog()),
          device(owner) {}
    std::int32_t TBDaysSince1970() override {
      device.note("today");
      return HostTallybook::TBDaysSince1970();
    }
    Date dateForDaysSince1970(std::int32_t day) override {
      device.note("start");
      return HostTallybook::dateForDaysSince1970(day);
    }
    NotedDevice& device;
  };
  struct NotedPreferences : HostPreferences {
    explicit NotedPreferences(NotedDevice& owner)
        : HostPreferences(owner.platform().directory(), owner.platform().clock(),
                          owner.platform().systemLog()),
          device(owner) {}
    std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view key,
                                                        std::string_view domain) override {
      device.note(key);
      return HostPreferences::LGSPreferencesGetValue(key, domain);
    }
    void LGSPreferencesSetValue(std::optional<std::string_view> key,
                                std::optional<PropertyValue> value,
                                std::string_view domain) override {
      device.note("set " + std::string(key.value_or("")));
      HostPreferences::LGSPreferencesSetValue(key, std::move(value), domain);
    }
    NotedDevice& device;
  };
  struct NotedConfiguration : HostSystemConfiguration {
    explicit NotedConfiguration(NotedDevice& owner)
        : HostSystemConfiguration(owner.platform().description(), owner.platform().directory(),
                                  owner.platform().clock(), owner.platform().systemLog()),
          device(owner) {}
    PropertyArray getLogBlacklist() override {
      device.note("blacklist");
      return HostSystemConfiguration::getLogBlacklist();
    }
    NotedDevice& device;
  };
  struct NotedMessages : MessageService {
    explicit NotedMessages(NotedDevice& owner) : device(owner) {}
    std::unique_ptr<ServiceListener> createListener(std::string_view /*name*/,
                                                    MessageHandler /*handler*/) override {
      device.note("listener");
      return nullptr;
    }
    NotedDevice& device;
  };

  NotedKernel _kernel{*this};
  NotedOutbox _outbox{*this};
  NotedInformation _information{*this};
  NotedTallybook _tallybook{*this};
  NotedPreferences _preferences{*this};
  NotedConfiguration _configuration{*this};
  NotedMessages _messages{*this};
};

const std::string kSetStoredDay = "set LastCrashLogSerializationDateInDaysSince1970";

TEST(ServiceOrder, ADayIsServedOnceWhateverFails) {
  NotedDevice device;
  for (const std::string& failing : {kSetStoredDay, std::string("today")}) {
    device.failing = failing;
    aaiRequested = true;
    handlePeerMessage(PropertyDict{{"operation", 2}});
    EXPECT_FALSE(aaiRequested) << failing;
  }
  EXPECT_EQ(std::ranges::count(device.calls, kSetStoredDay), 1);
  device.failing = kSetStoredDay;
  EXPECT_NO_THROW(runDayCheck(nullptr));
}

TEST(ServiceOrder, ListenerModeNeedsNeitherListenerNorLoop) {
  struct FailingLoop : MainLoop {
    SliceResult runMainLoopSlice(double /*seconds*/) override { throw std::bad_alloc(); }
  } loop;
  NotedDevice device;
  device.platform().mainLoop = loop;
  device.failing = "listener";
  aaiRequested = true;
  runListenerMode(0.01);
  EXPECT_EQ(std::ranges::count(device.calls, kSetStoredDay), 1);
}

TEST(ServiceOrder, TheReportAsksInItsOrder) {
  {
    NotedDevice device("", false);
    runDailyTasks(TestDevice::kToday, nullptr);
    EXPECT_THAT(device.among({"InternalBuild"}), SizeIs(1));
  }
  NotedDevice device(R"(, "kernel": {"variables": {"vm.vmtc_total": {"u32": 1},
      "kern.memorystatus_freeze_pageouts": {"u64": 1048576}}})");
  runDailyTasks(TestDevice::kToday, nullptr);
  EXPECT_THAT(device.among({"TaskingID", "TaskingDigest", "TaskingPayload", "start",
                            "LastOSVersion", "OS version", "written", "build"}),
              ElementsAre("TaskingID", "TaskingDigest", "TaskingPayload", "start", "LastOSVersion",
                          "OS version", "written", "build"));
  EXPECT_EQ(std::ranges::count(device.calls, "written"), 1);
  // Each condition when its first row is due, and once.
  EXPECT_THAT(
      device.among({"vm.vmtc_total", "vm.vmtc_undiagnosed", "kern.memorystatus_freeze_pageouts",
                    "kern.memorystatus_thaw_count_since_boot", "vm.swapusage",
                    "kern.memorystatus_freezer_process_considered_count",
                    "kern.memorystatus_freezer_below_threshold_count",
                    "kern.memorystatus_freezer_thaw_percentage",
                    "kern.memorystatus_freezer_refreeze_count"}),
      ElementsAre("vm.vmtc_total", "vm.vmtc_undiagnosed", "kern.memorystatus_freeze_pageouts",
                  "kern.memorystatus_thaw_count_since_boot", "vm.swapusage",
                  "kern.memorystatus_freezer_process_considered_count",
                  "kern.memorystatus_freezer_below_threshold_count",
                  "kern.memorystatus_freezer_thaw_percentage",
                  "kern.memorystatus_freezer_refreeze_count"));
  EXPECT_EQ(std::ranges::count(device.calls, "kern.memorystatus_freeze_pageouts"), 1);
}

TEST(ServiceOrder, TheOtherStepsAskInTheirOrder) {
  NotedDevice device;
  syncTaskingAndOSChange();
  EXPECT_THAT(device.among({"today", "build", "LastOSUpdate", "blacklist", "disabledLogs"}),
              ElementsAre("today", "build", "LastOSUpdate", "blacklist", "disabledLogs"));
  const PropertyDict fields{{"k", 1}};
  NLW_WriteLog("165", &fields);
  EXPECT_THAT(device.among({"SSLastLoggedAt", "process", "system", "model", "incident",
                            "InverseDeviceID", "written"}),
              ElementsAre("SSLastLoggedAt", "process", "system", "model", "incident",
                          "InverseDeviceID", "written"));
}

}  // namespace
}  // namespace vesprun
