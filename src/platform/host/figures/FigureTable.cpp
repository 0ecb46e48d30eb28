#include "platform/host/figures/FigureTable.h"

#include <algorithm>
#include <iterator>

namespace vesprun {
namespace {

// Far above what a system counts between two starts, and low enough that sums do not overflow.
constexpr std::int64_t kMaxCount = std::int64_t{1} << 48;

constexpr LinuxFigure counter(std::string_view file, std::string_view field, std::string_view key,
                              std::string_view unit, std::int64_t divisor, std::string_view why) {
  return {file, field, key, unit, FigureKind::Counter, divisor, 0, kMaxCount, why};
}

constexpr std::int32_t kMebibytes[] = {64, 256, 1024, 2048, 4096, 8192, 16384, 65536};
constexpr std::int32_t kMegahertz[] = {500, 1000, 1500, 2000, 2500, 3000, 4000, 5000};
constexpr std::int32_t kDegrees[] = {0, 20, 30, 40, 50, 60, 70, 80, 90, 100};
constexpr std::int32_t kTenths[] = {1, 2, 3, 4, 5, 6, 7, 8, 9, 10};
constexpr std::int32_t kSpareLevels[] = {1, 2};

constexpr LinuxFigure memory(std::string_view field, std::string_view key, std::string_view why,
                             std::string_view unlessZero = {}) {
  return {"/proc/meminfo", field, key,        "MiB",     FigureKind::Gauge, 1024, 0,
          1 << 30,         why,   kMebibytes, unlessZero};
}

constexpr LinuxFigure temperature(std::string_view file, std::string_view key,
                                  std::string_view why) {
  return {file, "1", key, "degrees Celsius", FigureKind::Gauge, 1000, -60, 200, why, kDegrees};
}

// 1: up to a tenth is used; 11: more than all; 0: not known.
constexpr LinuxFigure usedLife(std::string_view file, std::string_view field, std::string_view key,
                               std::string_view why) {
  return {file, field, key, "tenths", FigureKind::Gauge, 1, 1, 11, why, kTenths};
}

// 1: normal, 2: most reserved blocks are used, 3: nearly all.
constexpr LinuxFigure endOfLife(std::string_view file, std::string_view key) {
  return {file,        "1", key, "level", FigureKind::Gauge, 1, 1, 3, "spare blocks run out",
          kSpareLevels};
}

constexpr const char* kStat = "/proc/stat";
constexpr const char* kVmstat = "/proc/vmstat";
constexpr const char* kDisk = "/sys/block/<disk>/stat";

constexpr LinuxFigure kFigures[] = {
    {"/proc/sys/kernel/random/boot_id", "1", "linux.time.boots", "count", FigureKind::Boots, 1, 0,
     1, "starts of the system"},
    counter("/proc/uptime", "1", "linux.time.upSeconds", "s", 1, "time since the start"),
    counter("clock", "awake 1", "linux.time.awakeSeconds", "s", 1, "time in use"),
    counter("clock", "asleep 1", "linux.time.asleepSeconds", "s", 1, "time suspended"),
    counter("/sys/power/suspend_stats/success", "1", "linux.time.suspends", "count", 1,
            "how often it goes to sleep"),
    counter("/sys/power/suspend_stats/fail", "1", "linux.time.failedSuspends", "count", 1,
            "drivers that keep it awake"),
    // Bit 5: the watchdog caused the last start.
    {"/sys/class/watchdog/<watchdog>/bootstatus", "1", "linux.time.watchdogResets", "count",
     FigureKind::Counter, 32, 0, 1, "starts after the machine hung and was reset"},

    // Without the time spent waiting for disks, which the kernel lets run backwards.
    counter(kStat, "cpu 1", "linux.cpu.userSeconds", "s", 100, "work of programs"),
    counter(kStat, "cpu 2", "linux.cpu.niceSeconds", "s", 100,
            "work of programs that give way to others"),
    counter(kStat, "cpu 3", "linux.cpu.systemSeconds", "s", 100, "work of the kernel for programs"),
    counter(kStat, "cpu 4", "linux.cpu.idleSeconds", "s", 100, "what the processors have left"),
    counter(kStat, "cpu 6", "linux.cpu.interruptSeconds", "s", 100, "work for devices"),
    counter(kStat, "cpu 7", "linux.cpu.softInterruptSeconds", "s", 100,
            "work for devices that could wait, the network most of all"),
    counter(kStat, "cpu 8", "linux.cpu.stolenSeconds", "s", 100, "time that the host took away"),
    counter(kStat, "ctxt 1", "linux.cpu.contextSwitches", "count", 1, "how much runs at once"),
    counter(kStat, "processes 1", "linux.cpu.forks", "count", 1, "how much is started"),
    {"/sys/devices/system/cpu/cpufreq/<policy>/scaling_cur_freq", "1", "linux.cpu.frequencyMHz",
     "MHz", FigureKind::Gauge, 1000, 1, 20000, "how fast the fastest processor runs", kMegahertz},

    memory("MemAvailable: 1", "linux.memory.availableMiB", "does the memory suffice"),
    memory("AnonPages: 1", "linux.memory.anonymousMiB", "what programs hold"),
    memory("Cached: 1", "linux.memory.cachedMiB", "what is kept of files"),
    memory("Dirty: 1", "linux.memory.dirtyMiB", "what a loss of power would cost"),
    memory("SwapFree: 1", "linux.memory.swapFreeMiB", "does the swap space suffice",
           "SwapTotal: 1"),
    counter(kVmstat, "pgpgin 1", "linux.memory.pagedInKiB", "KiB", 1, "what is read from disks"),
    counter(kVmstat, "pgpgout 1", "linux.memory.pagedOutKiB", "KiB", 1, "what is written to disks"),
    counter(kVmstat, "pswpin 1", "linux.memory.swappedInPages", "pages", 1, "memory is short"),
    counter(kVmstat, "pswpout 1", "linux.memory.swappedOutPages", "pages", 1,
            "memory is short, and the storage wears"),
    counter(kVmstat, "pgmajfault 1", "linux.memory.majorFaults", "count", 1,
            "programs that waited for a page"),
    counter(kVmstat, "oom_kill 1", "linux.memory.oomKills", "count", 1,
            "programs that were killed for want of memory"),
    counter("/sys/devices/system/edac/mc/<controller>/ce_count", "1",
            "linux.memory.correctedErrors", "count", 1, "memory that is going bad"),
    counter("/sys/devices/system/edac/mc/<controller>/ue_count", "1",
            "linux.memory.uncorrectedErrors", "count", 1, "memory that is bad"),

    counter("/proc/pressure/cpu", "some total=", "linux.pressure.cpuSomeMilliseconds", "ms", 1000,
            "work that waited for a processor"),
    counter("/proc/pressure/memory", "some total=", "linux.pressure.memorySomeMilliseconds", "ms",
            1000, "work that waited for memory"),
    counter("/proc/pressure/memory", "full total=", "linux.pressure.memoryFullMilliseconds", "ms",
            1000, "time in which all work waited for memory"),
    counter("/proc/pressure/io", "some total=", "linux.pressure.ioSomeMilliseconds", "ms", 1000,
            "work that waited for a disk"),
    counter("/proc/pressure/io", "full total=", "linux.pressure.ioFullMilliseconds", "ms", 1000,
            "time in which all work waited for a disk"),

    // Sectors are of 512 bytes, whatever the disk's own are.
    counter(kDisk, "1", "linux.disk.reads.", "count", 1, "how often a disk is read"),
    counter(kDisk, "3", "linux.disk.readKiB.", "KiB", 2, "how much is read"),
    counter(kDisk, "4", "linux.disk.readMilliseconds.", "ms", 1, "how long reads take"),
    counter(kDisk, "5", "linux.disk.writes.", "count", 1, "how often a disk is written"),
    counter(kDisk, "7", "linux.disk.writtenKiB.", "KiB", 2, "how fast a disk wears"),
    counter(kDisk, "8", "linux.disk.writeMilliseconds.", "ms", 1, "how long writes take"),
    counter(kDisk, "10", "linux.disk.busyMilliseconds.", "ms", 1, "how much a disk has left"),

    counter("/sys/class/net/<interface>/statistics/rx_bytes", "1", "linux.network.receivedKiB.",
            "KiB", 1024, "how much comes over the network"),
    counter("/sys/class/net/<interface>/statistics/tx_bytes", "1", "linux.network.sentKiB.", "KiB",
            1024, "how much goes over the network"),
    counter("/sys/class/net/<interface>/statistics/rx_packets", "1",
            "linux.network.receivedPackets.", "count", 1, "in how many pieces it comes"),
    counter("/sys/class/net/<interface>/statistics/tx_packets", "1", "linux.network.sentPackets.",
            "count", 1, "in how many pieces it goes"),
    counter("/sys/class/net/<interface>/statistics/rx_errors", "1", "linux.network.receiveErrors.",
            "count", 1, "a bad cable, driver or radio link"),
    counter("/sys/class/net/<interface>/statistics/tx_errors", "1", "linux.network.sendErrors.",
            "count", 1, "a bad driver or device"),
    counter("/sys/class/net/<interface>/carrier_down_count", "1", "linux.network.linkLosses.",
            "count", 1, "a cable or radio link that comes and goes"),

    temperature("/sys/class/thermal/<zone>/temp", "linux.temperature.zoneCelsius.",
                "parts that run hot"),
    temperature("/sys/class/hwmon/<chip>/<sensor>", "linux.temperature.sensorCelsius.",
                "parts that run hot, NVMe storage among them"),

    usedLife("/sys/block/<card>/device/life_time", "1", "linux.emmc.usedLifeATenths",
             "wear of the storage"),
    usedLife("/sys/block/<card>/device/life_time", "2", "linux.emmc.usedLifeBTenths",
             "wear of its other cells"),
    endOfLife("/sys/block/<card>/device/pre_eol_info", "linux.emmc.endOfLifeLevel"),
    usedLife("/sys/bus/platform/devices/<ufs>/health_descriptor/life_time_estimation_a", "1",
             "linux.ufs.usedLifeATenths", "wear of the storage"),
    usedLife("/sys/bus/platform/devices/<ufs>/health_descriptor/life_time_estimation_b", "1",
             "linux.ufs.usedLifeBTenths", "wear of its other cells"),
    endOfLife("/sys/bus/platform/devices/<ufs>/health_descriptor/eol_info",
              "linux.ufs.endOfLifeLevel"),
    counter("/sys/class/nvme/<nvme>/device/aer_dev_correctable", "TOTAL_ERR_COR 1",
            "linux.nvme.correctedErrors", "count", 1, "a bad link to the storage"),
    counter("/sys/class/nvme/<nvme>/device/aer_dev_nonfatal", "TOTAL_ERR_NONFATAL 1",
            "linux.nvme.nonfatalErrors", "count", 1, "transfers that were lost"),
    counter("/sys/class/nvme/<nvme>/device/aer_dev_fatal", "TOTAL_ERR_FATAL 1",
            "linux.nvme.fatalErrors", "count", 1, "storage that was lost and reset"),
};

// Whole disks and interfaces of hardware only: others carry the same traffic once more, and may
// come and go without end.
constexpr DeviceClass kClasses[] = {
    {"<disk>", "sd@ hd@ vd@ xvd@ dasd@ nvme#n# mmcblk# pmem#", ".", "diskseq"},
    {"<interface>", "eth# en* wl* ww* ib* usb# rmnet_data#", ".", "ifindex"},
    {"<policy>", "policy#", "", ""},
    {"<controller>", "mc#", "", ""},
    {"<zone>", "thermal_zone#", "type", ""},
    {"<chip>", "hwmon#", "name", ""},
    {"<sensor>", "temp#_input", "", ""},
    {"<card>", "mmcblk#", "", ""},
    {"<ufs>", "*.ufs *.ufshc *.ufshci *.ufshcd", "", ""},
    {"<nvme>", "nvme#", "", ""},
    {"<watchdog>", "watchdog#", "", ""},
};

// A file is read once for the rows that stand together.
constexpr bool rowsOfAFileAreTogether() {
  for (std::size_t row = 1; row < std::size(kFigures); ++row) {
    const std::string_view file = kFigures[row].file;
    for (std::size_t other = 0; file != kFigures[row - 1].file && other < row; ++other) {
      if (kFigures[other].file == file) {
        return false;
      }
    }
  }
  return true;
}
static_assert(rowsOfAFileAreTogether());

constexpr bool classesOfFilesAreKnown() {
  for (const LinuxFigure& figure : kFigures) {
    std::string_view rest = figure.file;
    for (std::size_t begin; (begin = rest.find('<')) != std::string_view::npos;) {
      rest.remove_prefix(begin);
      const std::string_view name = rest.substr(0, rest.find('>') + 1);
      if (std::ranges::find(kClasses, name, &DeviceClass::name) == std::end(kClasses)) {
        return false;
      }
      rest.remove_prefix(name.size());
    }
  }
  return true;
}
static_assert(classesOfFilesAreKnown());

bool matches(std::string_view name, std::string_view pattern) {
  const std::size_t special = pattern.find_first_of("#@*");
  if (special == std::string_view::npos) {
    return name == pattern;
  }
  if (!name.starts_with(pattern.substr(0, special))) {
    return false;
  }
  name.remove_prefix(special);
  const std::string_view rest = pattern.substr(special + 1);
  if (pattern[special] == '*') {
    while (!name.empty() && name.front() != '.' && !matches(name, rest)) {
      name.remove_prefix(1);
    }
    return matches(name, rest);
  }
  const bool wantsDigits = pattern[special] == '#';
  const auto end = std::ranges::find_if_not(
      name, [=](char c) { return wantsDigits ? c >= '0' && c <= '9' : c >= 'a' && c <= 'z'; });
  const auto length = static_cast<std::size_t>(end - name.begin());
  return length > 0 && matches(name.substr(length), rest);
}

}  // namespace

const std::span<const LinuxFigure> linuxFigures = kFigures;
const std::span<const DeviceClass> linuxDeviceClasses = kClasses;

bool matchesPatterns(std::string_view name, std::string_view patterns) {
  while (!patterns.empty()) {
    const std::size_t end = std::min(patterns.find(' '), patterns.size());
    if (matches(name, patterns.substr(0, end))) {
      return true;
    }
    patterns.remove_prefix(std::min(end + 1, patterns.size()));
  }
  return false;
}

}  // namespace vesprun
