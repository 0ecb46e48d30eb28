#include <sys/socket.h>

#include <filesystem>
#include <sstream>
#include <utility>

#include "buffers/DeviceBuffers.h"
#include "driver/DailyDriver.h"
#include "platform/Guarded.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/messages/HostMainLoop.h"
#include "platform/host/messages/MessageFraming.h"
#include "platform/host/messages/ServiceSocket.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "support/Documents.h"
#include "support/ScarceMemory.h"
#include "telemetry/TodaysScalars.h"

namespace vesprun {
namespace {

namespace fs = std::filesystem;

constexpr const char* kServiceName = "com.quill.aggregated.vesprun";

// Every step leaves something on it.
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

/// Whichever allocation fails, the run ends well, no other step loses anything, no file is left
/// half-written, nothing leaves that the whitelist does not name, and the next run finds or
/// completes the day.
class ScarceMemory : public ::testing::Test {
 protected:
  ScarceMemory() : original(kFullDevice) {
    original.writeWhitelistJson(R"({"G": {"ScalarKeys": {"listed": {}},
                                          "DistributionKeys": {"listed": {"intervals": [1]}}}})");
    original.write("kernel/ecc/1.bin", Bytes(72));
    original.write("13.bin", StatisticsBufferBuilder().add(53, {17}).bytes());
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

  /// Runs `work` on copies of the device, with another allocation failing each time, until there
  /// are no more.
  template <typename Work>
  void failAllocations(std::size_t step, std::size_t least, const Work& work) {
    std::size_t allocation = 1;
    for (bool failed = true; failed; allocation += step) {
      SCOPED_TRACE(allocation);
      TestDevice device("{}");
      device.endProcess();
      fs::copy(original.path(), device.path(),
               fs::copy_options::recursive | fs::copy_options::overwrite_existing);
      failed = runOut(device, allocation, work);
      device.endProcess();
      expectWholeFiles(device);

      device.platform();
      expectOtherSteps(device);
      runDailyDriver(std::vector<const char*>{"vesprun", "-d"});
      EXPECT_TRUE(isDayStored(device));
      device.endProcess();
      expectWholeFiles(device);
      ASSERT_FALSE(HasFailure());
    }
    EXPECT_GT(allocation, least);
  }

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

  /// True when the allocation to fail was reached.
  template <typename Work>
  static bool runOut(TestDevice& device, std::size_t allocation, const Work& work) {
    try {
      HostPlatform& host = device.platform();
      allocationsLeft = allocation;
      work(host);
      EXPECT_EQ(host.describedRegistry().openObjects(), 0U);
      EXPECT_EQ(host.describedRegistry().openConnections(), 0U);
      device.endProcess();
    } catch (const std::bad_alloc&) {  // told on the standard error stream
    }
    return std::exchange(allocationsLeft, 0) == 0;
  }

  static bool isDayStored(TestDevice& device) {
    return device.platform().preferences().LGSPreferencesGetIntegerValue(
               "LastCrashLogSerializationDateInDaysSince1970", kServiceName) ==
           TestDevice::kToday - 1;
  }

  /// Once the tasks have begun, at most one step has left nothing.
  static void expectOtherSteps(TestDevice& device) {
    if (device.read("outbox/log.jsonl").find("daily tasks for day") == std::string::npos) {
      return;
    }
    const std::string records = device.read("outbox/records.jsonl");
    const Scalars scalars = todaysScalars(device);
    std::vector<std::string> missing;
    const auto look = [&missing](const char* step, bool left) {
      if (!left) {
        missing.emplace_back(step);
      }
    };
    look("report", !device.documents().empty());
    look("disk usage", scalars.contains("com.quill.homeshell.DiskUsageUserTotalBlocks"));
    look("ECC events", records.find("\"type\":172") != std::string::npos);
    look("reporting channels", scalars.contains("com.quill.tapline.c"));
    look("data usage", scalars.contains("datausage.wifiInKB.com.quill.p"));
    look("NAND info", scalars.contains("com.quill.NANDInfo.ExportVersion"));
    look("structured log", records.find("\"type\":176") != std::string::npos);
    look("tasking",
         device.read("outbox/notifications.jsonl").find("tasking_changed") != std::string::npos);
    look("stored day", isDayStored(device));
    EXPECT_LE(missing.size(), 1U) << ::testing::PrintToString(missing);
  }

  static void expectWholeFiles(const TestDevice& device) {
    for (const fs::directory_entry& entry : fs::recursive_directory_iterator(device.path())) {
      const std::string name = entry.path().filename().string();
      const std::string path = fs::relative(entry.path(), device.path()).string();
      SCOPED_TRACE(path);
      EXPECT_FALSE(name.starts_with(".unfinished") || name.ends_with("-journal"));
      if (name.ends_with(".ptree")) {
        const std::string text = device.read(path);
        valueOfPtree(text);
        EXPECT_THAT(text, ::testing::Not(::testing::HasSubstr("secret")));
      } else if (name.ends_with(".jsonl")) {
        std::string text = device.read(path);
        EXPECT_TRUE(text.empty() || text.ends_with('\n'));
        std::istringstream lines(text);
        for (std::string line; std::getline(lines, line);) {
          valueOfJson(line);
        }
      }
    }
  }

  TestDevice original;
};

TEST_F(ScarceMemory, AFailedAllocationCostsTheDailyRunOneStepAtMost) {
  failAllocations(13, 1000, [](HostPlatform& /*host*/) {
    runDailyDriver(std::vector<const char*>{"vesprun", "-d"});
  });
}

TEST_F(ScarceMemory, AFailedAllocationCostsTheListenerOneMessageOrStepAtMost) {
  failAllocations(17, 1000, [](HostPlatform& host) {
    FileDescriptor peer;
    dynamic_cast<HostMainLoop&>(host.mainLoop()).queueWork([&] {
      std::string error;
      peer = connectToService(host.directory(), kServiceName, 5, error);
      for (const int operation : {0, 2}) {
        const std::string frame =
            messageFrame(ptreeOf(PropertyDict{{"operation", operation}})).value();
        send(peer.get(), frame.data(), frame.size(), MSG_NOSIGNAL);
      }
    });
    runGuarded([] { runListenerMode(0.02); });
  });
}

}  // namespace
}  // namespace vesprun
