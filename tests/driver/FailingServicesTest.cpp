#include <sys/socket.h>

#include <filesystem>
#include <utility>

#include "buffers/DeviceBuffers.h"
#include "driver/ActiveAppInfoListener.h"
#include "driver/DailyDriver.h"
#include "platform/Guarded.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/messages/HostMainLoop.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "support/FailingPlatform.h"
#include "support/ScarceMemory.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

namespace fs = std::filesystem;

constexpr const char* kServiceName = "com.quill.aggregated.vesprun";

// Every service has something to do on it.
constexpr std::string_view kFullDevice =
    R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "UTC", "system": {"buildVersion": "2B"},
        "properties": {"DiskUsage": {"TotalDiskCapacity": 64000000000}, "InverseDeviceID": "f"},
        "userVolume": {"blockSize": 4096, "blocks": 15625000, "available": 3906250},
        "purgeable": {"RECLAIMER_TOTAL_AVAILABLE": 1}, "logBlacklist": ["115"],
        "languages": {"preferred": ["en"], "localizations": ["en"], "country": "US"},
        "apps": [{"bundle": "a", "user": true}],
        "kernel": {"pageSize": 4096, "ticks": {"value": 9, "numerator": 1, "denominator": 1},
                   "variables": {"kern.bootsessionuuid": "0"}, "snapshot": "snapshot.bin"},
        "channels": [{"name": "c", "value": 3}],
        "usage": {"records": [{"procName": "p", "since": {"date": "2024-03-05T00:00:00Z"},
                               "wifiInBytes": 4096}]},
        "registry": [{"class": "QuillQNS3NVMeController",
                      "properties": {"Controller Characteristics": {"num-bus": 1}},
                      "userClient": {"tunnel": [
            {"opcode": 13, "file": "13.bin"}, {"opcode": 11, "file": "11.bin"},
            {"opcode": 17, "file": "17.bin"}, {"opcode": 15, "file": "15.bin"}]}}]})";

// Little to do but for the messages.
constexpr std::string_view kListeningDevice =
    R"({"clock": "2024-03-05T09:15:02Z", "timeZone": "UTC", "submission": {"enabled": false},
        "kernel": {"variables": {"kern.bootsessionuuid": "1"}}})";

/// Whatever fails, the run ends well, the steps after it run, no file is left half-written, nothing
/// leaves that the whitelist does not name, and the next run finds or completes the day.
class FailingServices : public ::testing::Test {
 protected:
  explicit FailingServices(std::string_view description = kFullDevice) : original(description) {
    startActiveAppInfoAfresh();
    original.writeWhitelistJson(R"({"G": {"ScalarKeys": {"listed": {}},
                                          "DistributionKeys": {"listed": {"intervals": [1]}}}})");
    original.write("kernel/ecc/1.bin", Bytes(72));
    original.write("13.bin", Bytes());
    original.write("11.bin", bytesOf({1, 0, 0, 3, 7, 0, 0}));
    original.write("17.bin", telemetryList(1));
    original.write("15.bin", bytesOf({0, 9, 1, 0, 0, 0, 0, 5, 0, 0, 1}));
    original.write("snapshot.bin", SnapshotBuilder().thread(1, "VM_swapout", 5).bufferEnd().bytes);
    original.write("Library/Logsmith/com.quill.Ferrywell.ptree", kTasking);
    std::string error;
    const bool written = original.platform().counters().write(
        [](CounterStore& store) {
          for (const char* key : {"listed", "secret"}) {
            store.setScalar(TestDevice::kToday - 1, key, 1);
            store.appendSamples(TestDevice::kToday - 1, key, std::vector<Sample>{{1.0, 0}});
          }
          return true;
        },
        error);
    EXPECT_TRUE(written) << error;
    original.endProcess();
  }

  /// Runs the program's `work` on a copy of the device; false when fewer calls were made.
  template <typename Work>
  bool run(Faults& faults, std::size_t allocation, const Work& work) {
    TestDevice device("{}");
    device.endProcess();
    fs::copy(original.path(), device.path(),
             fs::copy_options::recursive | fs::copy_options::overwrite_existing);
    startActiveAppInfoAfresh();
    const bool ranOut = runOn(device, faults, allocation, work);
    const bool failed = ranOut || !faults.failed().empty();
    device.endProcess();
    expectWholeFiles(device);

    device.platform();
    runDailyDriver(std::vector<const char*>{"vesprun", "-d"});
    EXPECT_EQ(device.platform().preferences().LGSPreferencesGetIntegerValue(
                  "LastCrashLogSerializationDateInDaysSince1970", kServiceName),
              TestDevice::kToday - 1);
    device.endProcess();
    expectWholeFiles(device);
    return failed;
  }

  /// Once the tasks have begun, every step runs, but for the rest of the one that failed.
  static void expectEveryStep(const Faults& faults) {
    std::vector<std::string> missing;
    for (const char* operation :
         {"DiagnosticLogSubmissionEnabled", "OrreryCopyAnswer", "captureSnapshot", "sysctlbyname",
          "createUsageWorkspace", "TaplineCopyChannelsInCategories",
          "FLDumpAllOldStructuredDataLogs", "getPrefsKeyForDomainWithOptions",
          "rollTendmarkLogs"}) {
      if (!faults.called(operation)) {
        missing.emplace_back(operation);
      }
    }
    EXPECT_LE(missing.size(), 1U) << ::testing::PrintToString(missing);
  }

  TestDevice original;

 private:
  static constexpr std::string_view kTasking = R"(<?xml version="1.0" encoding="UTF-8"?>
<ptree version="1.0"><dict><key>ScheduledTasking</key><dict><key>TaskingID</key><string>t</string>
<key>TaskingPayload</key><array>
<dict><key>User</key><string>mobile</string><key>Domain</key><string>a</string>
<key>Key</key><string>k</string><key>Value</key><true/></dict>
<dict><key>User</key><string>__logsmith__</string><key>Domain</key><string>b</string>
<key>Key</key><string>k</string><key>Value</key><true/></dict>
<dict><key>User</key><string>root</string><key>Domain</key><string>c</string>
<key>Key</key><string>k</string><key>Value</key><true/></dict>
</array></dict></dict></ptree>)";

  /// True when the allocation to fail, 0 for none, was reached. Services that note their calls
  /// would allocate as well, so they are watched only when none fails.
  template <typename Work>
  static bool runOn(TestDevice& device, Faults& faults, std::size_t allocation, const Work& work) {
    std::unique_ptr<Platform> failing;  // ends after the threads of the device's own platform
    try {
      std::string error;
      const std::unique_ptr<HostPlatform> host = HostPlatform::open(device.path(), error);
      if (!host) {
        return false;
      }
      failing = failingPlatform(*host, faults);
      const InstalledPlatform installed(allocation != 0 ? *host : *failing);
      allocationsLeft = allocation;
      work(*host);
      EXPECT_EQ(host->describedRegistry().openObjects(), 0U);
      EXPECT_EQ(host->describedRegistry().openConnections(), 0U);
    } catch (const std::bad_alloc&) {  // told on the standard error stream
    }
    return std::exchange(allocationsLeft, 0) == 0 && allocation != 0;
  }

  static void expectWholeFiles(const TestDevice& device) {
    std::string error;
    for (const fs::directory_entry& entry : fs::recursive_directory_iterator(device.path())) {
      const std::string name = entry.path().filename().string();
      const std::string path = fs::relative(entry.path(), device.path()).string();
      EXPECT_FALSE(name.starts_with('.') && name != ".log-number") << path;
      EXPECT_FALSE(name.ends_with("-journal")) << path;
      if (name.ends_with(".ptree")) {
        const std::string text = device.read(path);
        EXPECT_TRUE(readPtree(text, error)) << path << ": " << error << '\n' << text;
        EXPECT_THAT(text, ::testing::Not(::testing::HasSubstr("secret"))) << path;
      } else if (name.ends_with(".jsonl")) {
        std::string text = device.read(path);
        EXPECT_TRUE(text.empty() || text.ends_with('\n')) << path;
        std::istringstream lines(text);
        for (std::string line; std::getline(lines, line);) {
          EXPECT_TRUE(valueFromJsonText(line, error)) << path << ": " << error;
        }
      }
    }
  }
};

class FailingDailyRun : public FailingServices {
 protected:
  bool runWithFault(Faults& faults, std::size_t allocation = 0) {
    const bool failed = run(faults, allocation, [](HostPlatform& /*host*/) {
      runDailyDriver(std::vector<const char*>{"vesprun", "-d"});
    });
    if (faults.called("DiagnosticLogSubmissionEnabled") ||
        faults.failed() == "TBClientCheckpoint") {
      expectEveryStep(faults);
    }
    return failed;
  }
};

TEST_F(FailingDailyRun, GoesOnWhicheverCallFails) {
  std::size_t call = 0;
  bool failed = true;
  while (failed) {
    Faults faults(Faults::Kind::Failure, ++call);
    failed = runWithFault(faults);
    SCOPED_TRACE(faults.failed() + ", call " + std::to_string(call));
    ASSERT_FALSE(HasFailure()) << faults.failed();
  }
  EXPECT_GT(call, 60U);
}

TEST_F(FailingDailyRun, GoesOnWhicheverCallRunsOutOfMemory) {
  std::size_t call = 0;
  bool failed = true;
  while (failed) {
    Faults faults(Faults::Kind::OutOfMemory, ++call);
    failed = runWithFault(faults);
    ASSERT_FALSE(HasFailure()) << faults.failed() << ", call " << call;
  }
  EXPECT_GT(call, 100U);
}

TEST_F(FailingDailyRun, SurvivesAllocationsThatFail) {
  constexpr std::size_t kStep = 29;
  std::size_t allocation = 1;
  bool failed = true;
  while (failed) {
    Faults faults(Faults::Kind::Failure, 0);
    failed = runWithFault(faults, allocation);
    ASSERT_FALSE(HasFailure()) << "allocation " << allocation;
    allocation += kStep;
  }
  EXPECT_GT(allocation, 1000U);
}

class FailingListener : public FailingServices {
 protected:
  FailingListener() : FailingServices(kListeningDevice) {}

  /// Operation 0 and 2, sent at once by one peer.
  static void listen(HostPlatform& host) {
    FileDescriptor peer;
    dynamic_cast<HostMainLoop&>(host.mainLoop()).queueWork([&] {
      std::string error;
      peer = connectToService(host.directory(), kServiceName, 5, error);
      for (const int operation : {0, 2}) {
        std::string document;
        EXPECT_TRUE(writePtree(PropertyDict{{"operation", operation}}, document, error)) << error;
        const std::string frame = messageFrame(document).value();
        send(peer.get(), frame.data(), frame.size(), MSG_NOSIGNAL);
      }
    });
    runGuarded([] { runListenerMode(0.02); });
  }

  void failEveryCall(Faults::Kind kind) {
    std::size_t call = 0;
    bool failed = true;
    while (failed) {
      Faults faults(kind, ++call);
      failed = run(faults, 0, listen);
      if (faults.called("PostNotification") && faults.failed() != "lock") {
        expectEveryStep(faults);
      }
      ASSERT_FALSE(HasFailure()) << faults.failed() << ", call " << call;
    }
    EXPECT_GT(call, 20U);
  }
};

TEST_F(FailingListener, GoesOnWhicheverCallFails) { failEveryCall(Faults::Kind::Failure); }

TEST_F(FailingListener, GoesOnWhicheverCallRunsOutOfMemory) {
  failEveryCall(Faults::Kind::OutOfMemory);
}

}  // namespace
}  // namespace vesprun
