#include "platform/host/figures/Collection.h"

#include <gmock/gmock.h>
#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <filesystem>
#include <map>
#include <sstream>

#include "platform/host/counters/HostTallybook.h"
#include "support/HostServiceTest.h"
#include "support/TestDevice.h"

namespace vesprun {
namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

using Counted = std::map<std::string, std::string>;  ///< a scalar or "sampled:" and samples, by key

constexpr const char* kBoot = "proc/sys/kernel/random/boot_id";
constexpr const char* kStat = "sys/block/sda/stat";
constexpr const char* kReads = "linux.disk.reads.sda";

/// A device, and the /proc and /sys of a machine.
class CollectionTest : public ::testing::Test {
 protected:
  bool collect() {
    const auto work = [this](CounterStore& store) {
      complaints = collectFigures(store, machine.path(), device.platform().clock().now());
      return true;
    };
    return device.platform().counters().write(work, error);
  }

  /// What lies in the counters of the day.
  Counted counted() {
    Counted counted;
    const auto read = [&](CounterStore& store) {
      store.readScalars("", day, day, [&](std::string_view key, int, std::int64_t value, bool&) {
        counted[std::string(key)] = std::to_string(value);
      });
      store.readDistributions("", day, day, [&](std::string_view key, int, auto& values, bool&) {
        double value = 0;
        for (int second = 0; values.getNextValueSecondsInDayOffset(value, &second);) {
          EXPECT_EQ(second, 33302);
          std::string& samples = counted[std::string(key)];
          samples += samples.empty() ? "sampled:" : ",";
          samples += std::to_string(static_cast<int>(value));
        }
      });
    };
    EXPECT_TRUE(device.platform().counters().read(read, error)) << error;
    return counted;
  }
  std::string counted(const std::string& key) { return counted()[key]; }

  const std::int32_t day = TestDevice::kToday;
  TestDevice device;
  TemporaryFolder machine;
  std::vector<std::string> complaints;
  std::string error;
};

/// The lines of a text, and the parts between bars of each.
std::vector<std::vector<std::string>> table(const std::string& text) {
  std::vector<std::vector<std::string>> rows;
  std::istringstream lines(text);
  for (std::string line; std::getline(lines >> std::ws, line);) {
    std::istringstream parts(line);
    rows.emplace_back();
    for (std::string part; std::getline(parts, part, '|');) {
      part.erase(0, part.find_first_not_of(' '));
      rows.back().push_back(part.substr(0, part.find_last_not_of(' ') + 1));
    }
    rows.back().resize(6);
  }
  return rows;
}

TEST_F(CollectionTest, MachinesOfAllKindsAreCounted) {
  const struct {
    const char* name;
    const char* files;  ///< path, content at first and content then, where a semicolon ends a line
    const char* counted;  ///< key without "linux." and value, in any order
  } machines[] = {{"a virtual machine without devices and swap space", R"(
sys/block/loop0/stat | 1 0 2 0 | 5 0 9 0
proc/meminfo | SwapTotal: 0 kB;SwapFree: 0 kB; | SwapTotal: 0 kB;SwapFree: 0 kB;
)",
                   ""},
                  {"a laptop with NVMe storage", R"(
proc/stat                  | cpu  1099 50 300 9000 77 20 5 0 0 0; cpu0 9 9; intr 9 8; ctxt 5000; processes 100 | cpu  1250 50 399 12000 60 20 205 40 0 0; cpu0 1 1; intr 10 8; ctxt 5999; processes 107;
proc/uptime                | 100.99 190.10; | 133.25 250.00;
proc/meminfo               | MemTotal: 16 kB;MemAvailable: 9 kB | MemTotal: 16 kB;MemAvailable:    4194304 kB;AnonPages: 2047 kB;Cached: 1 kB;Dirty: 1024 kB;SwapFree: 3000 kB;
proc/pressure/cpu          | some avg10=0.00 avg60=0.00 avg300=0.00 total=1999; | some avg10=1.53 avg60=0.20 avg300=0.05 total=2001;full avg10=0.00 total=7000;
sys/power/suspend_stats/success | 4 | 5
sys/block/nvme0n1/stat     | 10 0 101 7 20 0 200 9 0 50 60 0 0 0 0 0 0; | 15 0 103 8 20 0 209 9 3 51 60 0 0 0 0 0 0;
sys/block/nvme0c0n1/stat   | 1 1 1 1 1 1 1 1 1 1 | 9 9 9 9 9 9 9 9 9 9
sys/class/net/wlp2s0/statistics/rx_bytes          | 1023 | 2049;
sys/class/net/enx0123456789ab/statistics/tx_bytes | 0    | 2048
sys/class/net/enxba9876543210/statistics/tx_bytes | 0    | 1024
sys/class/net/wlp2s0.7/statistics/rx_bytes        | 0    | 2048
sys/class/net/veth1a2b/statistics/tx_bytes        | 0    | 2048
sys/class/net/lo/statistics/tx_bytes              | 0    | 2048
sys/class/hwmon/hwmon3/name          | nvme; | nvme;
sys/class/hwmon/hwmon3/temp1_input   | 30000 | 45999;
sys/class/hwmon/hwmon3/temp2_input   | 30000 | 38850;
sys/class/thermal/thermal_zone0/type | INT3400 Thermal; | INT3400 Thermal;
sys/class/thermal/thermal_zone0/temp | 20000 | -5500
sys/class/thermal/thermal_zone1/temp | 20000 | 20000
sys/devices/system/cpu/cpufreq/policy0/scaling_cur_freq  | 1 | 800000
sys/devices/system/cpu/cpufreq/policy12/scaling_cur_freq | 1 | 2400999
sys/class/nvme/nvme0/device/aer_dev_correctable | RxErr 0;TOTAL_ERR_COR 2; | RxErr 3;TOTAL_ERR_COR 5;
)",
                   R"(
cpu.userSeconds 2  cpu.niceSeconds 0  cpu.systemSeconds 0  cpu.idleSeconds 30
cpu.interruptSeconds 0  cpu.softInterruptSeconds 2  cpu.stolenSeconds 0  cpu.contextSwitches 999
cpu.forks 7  cpu.frequencyMHz sampled:2400  time.upSeconds 33  time.suspends 1
memory.availableMiB sampled:4096
memory.anonymousMiB sampled:1  memory.cachedMiB sampled:0  memory.dirtyMiB sampled:1
memory.swapFreeMiB sampled:2
pressure.cpuSomeMilliseconds 1  disk.reads.nvme0n1 5  disk.readKiB.nvme0n1 1
disk.readMilliseconds.nvme0n1 1  disk.writes.nvme0n1 0  disk.writtenKiB.nvme0n1 4
disk.writeMilliseconds.nvme0n1 0  disk.busyMilliseconds.nvme0n1 1  network.receivedKiB.wlp2s0 2
network.sentKiB.enx 3  temperature.sensorCelsius.nvme sampled:45
temperature.zoneCelsius.INT3400_Thermal sampled:-5  temperature.zoneCelsius.thermal_zone1 sampled:20
nvme.correctedErrors 3)"},
                  {"a phone with UFS and eMMC", R"(
sys/bus/platform/devices/1d84000.ufshc/health_descriptor/eol_info               | 0x01 | 0x02;
sys/bus/platform/devices/1d84000.ufshc/health_descriptor/life_time_estimation_a | 0x01 | 0x0B;
sys/bus/platform/devices/1d84000.ufshc/health_descriptor/life_time_estimation_b | 0x01 | 0x00;
sys/block/mmcblk1/device/life_time      | 0x01 0x01 | 0x02 0x0a;
sys/block/mmcblk1/device/pre_eol_info   | 0x01      | 0x03;
sys/class/net/wwan0/carrier_down_count  | 1         | 3
proc/vmstat | pgmajfault 10;nr_free 1;oom_kill 1; | pgmajfault 1000;nr_free 1;oom_kill 3;
)",
                   R"(
ufs.endOfLifeLevel sampled:2  ufs.usedLifeATenths sampled:11  emmc.usedLifeATenths sampled:2
emmc.usedLifeBTenths sampled:10
emmc.endOfLifeLevel sampled:3  network.linkLosses.wwan0 2  memory.majorFaults 990
memory.oomKills 2)"},
                  {"a server with EDAC", R"(
sys/devices/system/edac/mc/mc0/ce_count     | 5  | 9
sys/devices/system/edac/mc/mc1/ce_count     | 0  | 1
sys/devices/system/edac/mc/mc0/ue_count     | 0  | 0
sys/class/watchdog/watchdog0/bootstatus     | 32 | 32
)",
                   R"(
memory.correctedErrors 5  memory.uncorrectedErrors 0  time.watchdogResets 0)"}};
  for (const auto& [name, files, expected] : machines) {
    SCOPED_TRACE(name);
    std::filesystem::remove_all(machine.path());
    std::filesystem::remove_all(device.path("var/mobile/Library/Tallybook"));
    machine.write(kBoot, "a-1\n");
    for (const std::size_t time : {1U, 2U}) {
      EXPECT_THAT(counted(), IsEmpty()) << "the first time only remembers";
      for (std::vector<std::string>& file : table(files)) {
        std::ranges::replace(file[time], ';', '\n');
        machine.write(file[0], file[time]);
      }
      collect();
    }
    Counted all{{"linux.time.boots", "0"}};
    std::istringstream pairs(expected);
    for (std::string key, value; pairs >> key >> value;) {
      all["linux." + key] = value;
    }
    EXPECT_EQ(counted(), all);
  }
}

TEST_F(CollectionTest, GrowthGoesOnFromWhatIsKnown) {
  // What happens, the boot, the disk's identity and reads, or "-", and the scalars reads and boots.
  for (const std::vector<std::string>& step : table(R"(
      a mark                                        | a | 1 | 100             |                 |
      growth                                        | a | 1 | 130             | 30              | 0
      none                                          | a | 1 | 130             | 30              | 0
      backwards: counts from 0                      | a | 1 | 7               | 37              | 0
      another disk of the same name, which has more | a | 2 | 10              | 47              | 0
      vanished                                      | a | 2 | -               | 47              | 0
      came back                                     | a | 2 | 15              | 52              | 0
      unreadable for once                           | a | 2 | ?               | 52              | 0
      and readable                                  | a | 2 | 25              | 62              | 0
      a new boot with more reads                    | b | 1 | 1000            | 1062            | 1
      the boot is not known                         | - | 1 | 1100            | 1062            | 1
      and known again, still the same               | b | 1 | 1200            | 1262            | 1
      a new boot without the disk                   | c | - | -               | 1262            | 2
      which comes later                             | c | - | 8               | 1270            | 2
      a number too high for a count                 | c | - | 281474976710657 | 1270            | 2
      the highest count                             | c | - | 281474976710656 | 281474976711918 | 2)")) {
    SCOPED_TRACE(step[0]);
    std::filesystem::remove_all(machine.path());
    machine.write("sys/block/loop0/stat", "0");
    for (const auto& [file, content] :
         {std::pair(kBoot, step[1]), std::pair("sys/block/sda/diskseq", step[2]),
          std::pair(kStat, step[3])}) {
      if (content != "-") {
        machine.write(file, content);
      }
    }
    ASSERT_TRUE(collect()) << error;
    EXPECT_EQ(counted(kReads) + '|' + counted("linux.time.boots"), step[4] + '|' + step[5]);
  }
}

TEST_F(CollectionTest, WhatWasNotThereTheFirstTime) {
  machine.write(kBoot, "a");
  machine.write("sys/block/sda/diskseq", "1");  // a disk, but nothing to read of it
  collect();
  machine.write("proc/vmstat", "oom_kill 5\n");
  machine.write(kStat, "100");
  machine.write("sys/block/sdb/stat", "20");
  machine.write("sys/class/nvme/nvme0/device/aer_dev_fatal", "TOTAL_ERR_FATAL 4\n");
  collect();
  EXPECT_EQ(counted("linux.disk.reads.sdb"), "20") << "plugged in since";
  machine.write("proc/vmstat", "oom_kill 6\n");
  machine.write("sys/class/nvme/nvme0/device/aer_dev_fatal", "TOTAL_ERR_FATAL 5\n");
  machine.write(kStat, "101");
  collect();
  EXPECT_EQ(counted("linux.memory.oomKills"), "1") << "grown before nobody knows when";
  EXPECT_EQ(counted("linux.nvme.fatalErrors"), "1") << "its folder could not be read";
  EXPECT_EQ(counted(kReads), "1");
  std::filesystem::remove(machine.path(kBoot));
  machine.write("sys/class/watchdog/watchdog0/bootstatus", "32");
  collect();
  EXPECT_THAT(
      complaints,
      ElementsAre(
          "left out: /proc/sys/kernel/random/boot_id: not known; growth waits until it is"));
  machine.write(kBoot, "a");
  collect();
  EXPECT_EQ(counted("linux.time.watchdogResets"), "") << "it may have been there before";
}

TEST_F(CollectionTest, BadFilesAreLeftOutAndToldOnce) {
  const std::string path = "proc/pressure/io";
  const auto holding = [&](const std::string& content) {
    return [=, this] { machine.write(path, content); };
  };
  const struct {
    std::function<void()> make;
    const char* complaint;
  } cases[] = {
      {holding(""), "empty"},
      {holding(std::string("some total=5\0\n", 14)), "not plain text"},
      {holding("some total=5\xC3\xA4\n"), "not plain text"},
      {holding("some total=5\n" + std::string(256 * 1024, ' ')), "longer than 256 KiB"},
      {holding("some avg10=0\nfull total=x\n"),
       "some total= is missing, full total= is not a number"},
      {holding("some total=\nfull total=9000\n"), "some total= is missing"},
      {holding("some total=12x\nfull total=9000\n"), "some total= is not a number"},
      {holding("some total=0x1G\nfull total=9000\n"), "some total= is not a number"},
      {holding("some total=5.5.5\nfull total=9000\n"), "some total= is not a number"},
      {holding("some total=-9\nfull total=9000\n"), "some total= is out of range"},
      {holding("some total=99999999999999999999\nfull total=9000\n"),
       "some total= is not a number"},
      {[&] { mkfifo(machine.path(path).c_str(), 0600); }, "not a regular file"},
      {[&] { machine.write(path + "/a", ""); }, "not a regular file"},
      {[&] { std::filesystem::create_symlink("io", machine.path(path)); },
       "Too many levels of symbolic links"},
  };
  machine.write(kBoot, "a");
  machine.write(path, "some total=1000\nfull total=9000\n");
  collect();
  for (const auto& [make, complaint] : cases) {
    SCOPED_TRACE(complaint);
    std::filesystem::remove_all(machine.path(path));
    make();
    collect();
    if (complaints.empty()) {  // the reason was the same the last time
      machine.write(kBoot, machine.read(kBoot) + "a");
      collect();
    }
    EXPECT_THAT(complaints, ElementsAre("left out: /" + path + ": " + complaint));
    EXPECT_EQ(counted("linux.pressure.ioSomeMilliseconds"), "");
    collect();
    EXPECT_THAT(complaints, IsEmpty());
  }
  std::filesystem::remove_all(machine.path(path));
  collect();
  EXPECT_THAT(complaints, IsEmpty()) << "missing";
  machine.write(path, "some total=5999\nfull total=9000\n");
  collect();
  std::filesystem::remove_all(machine.path(path));
  cases[std::size(cases) - 1].make();
  collect();
  EXPECT_THAT(complaints, IsEmpty()) << "told before it could be read for once";
  EXPECT_EQ(counted("linux.pressure.ioSomeMilliseconds"), "5") << "since the start";
}

TEST_F(CollectionTest, TooManyDevicesAndOddNamesDoNotPileUp) {
  machine.write(kStat, "1");
  collect();
  for (int disk = 0; disk < 512; ++disk) {
    machine.write("sys/block/nvme" + std::to_string(disk) + "n1/stat", "5");
  }
  machine.write(kStat, "3");
  collect();
  EXPECT_THAT(complaints, ElementsAre("left out: /sys/block/: more than 512 devices"));
  EXPECT_EQ(counted(kReads), "");
  std::filesystem::remove_all(machine.path("sys/block/nvme0n1"));
  machine.write("sys/class/net/enp<&\xFFname/statistics/rx_packets", "5");
  machine.write("sys/class/hwmon/hwmon0/name", std::string(50, 'x') + "\nsecond line");
  machine.write("sys/class/hwmon/hwmon0/temp1_input", "50000");
  collect();
  EXPECT_EQ(counted(kReads), "2");
  EXPECT_EQ(counted("linux.disk.reads.nvme99n1"), "5");
  machine.write("sys/class/net/enp<&\xFFname/statistics/rx_packets", "6");
  collect();
  EXPECT_EQ(counted("linux.network.receivedPackets.enp___name"), "1");
  EXPECT_EQ(counted("linux.temperature.sensorCelsius." + std::string(40, 'x')), "sampled:50,50");
}

TEST_F(CollectionTest, GrowthIsCountedOnceWhateverHappensToTheProcess) {
  machine.write(kStat, "0");
  collect();
  machine.write(kStat, "5");
  {
    const FileSizeLimit fullDisk(16384);
    EXPECT_FALSE(collect());
  }
  EXPECT_THAT(counted(), IsEmpty());
  std::array<pid_t, 3> others{};
  for (pid_t& process : others) {
    process = startProcess([&] {
      for (int i = 0; i < 10; ++i) {
        collect();
      }
    });
  }
  for (int reads = 6; reads <= 30; ++reads) {
    machine.write("sys/block/aside", std::to_string(reads));
    std::filesystem::rename(machine.path("sys/block/aside"), machine.path("sys/block/sda/stat"));
    collect();
  }
  for (const pid_t other : others) {
    EXPECT_TRUE(hasSucceeded(other));
  }
  EXPECT_EQ(counted(kReads), "30");
}

}  // namespace
}  // namespace vesprun
