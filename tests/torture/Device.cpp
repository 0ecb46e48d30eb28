#include "Device.h"

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <fstream>
#include <map>
#include <nlohmann/json.hpp>
#include <regex>
#include <sstream>
#include <stdexcept>
#include <thread>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"
#include "vesprun/vesprun.h"

namespace vesprun::torture {
namespace {

namespace fs = std::filesystem;

// Laid over the sample device's description.
constexpr const char* kDescription = R"json({
  "timeZone": "UTC", "logLevel": "info",
  "system": {"buildVersion": "2B", "osVersion": "2.0", "systemVersion": "2.0 (2B)",
             "hardwareModel": "M", "systemID": "5ca1ab1e", "incidentID": "1"},
  "properties": {"DiskUsage": {"TotalDiskCapacity": 64000000000, "TotalDataAvailable": 9000000000,
                               "AmountDataAvailable": 8000000000}, "InverseDeviceID": "f"},
  "kernel": {"pageSize": 4096, "ticks": {"value": 9000000000, "numerator": 1, "denominator": 1},
             "variables": {"vm.swapusage": {"data": "AAAAAAEAAAAAAAAAAQAAAAAAAAABAAAAABAAAAAAAAA="}}},
  "userVolume": {"blockSize": 4096, "blocks": 15625000, "available": 3906250},
  "languages": {"preferred": ["en"], "localizations": ["en"], "country": "US"},
  "apps": [{"bundle": "a", "user": true}],
  "channels": [{"name": "c", "value": 3, "format": 1, "categories": 256}],
  "usage": {"records": [{"procName": "p", "since": {"date": "2024-03-01T00:00:00Z"},
                         "wifiInBytes": 1048576, "wifiOutBytes": 65536, "wwanInBytes": 4096,
                         "wwanOutBytes": 2048}]}
})json";

constexpr const char* kTasking = R"(<?xml version="1.0" encoding="UTF-8"?>
<ptree version="1.0"><dict><key>ScheduledTasking</key><dict><key>TaskingID</key><string>t</string>
<key>TaskingPayload</key><array>
<dict><key>User</key><string>mobile</string><key>Domain</key><string>a</string>
<key>Key</key><string>k</string><key>Value</key><true/></dict>
<dict><key>User</key><string>__logsmith__</string><key>Domain</key><string>b</string>
<key>Key</key><string>k</string><key>Value</key><true/></dict>
<dict><key>User</key><string>root</string><key>Domain</key><string>c</string>
<key>Key</key><string>k</string><key>Value</key><true/></dict>
</array></dict></dict></ptree>)";

const std::string kDatabase = "/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";

// The sample's days end today; the same rows, in the days before the first run.
std::string movedRows(const std::string& dump) {
  std::istringstream lines(dump);
  std::string moved;
  int offset = 0;
  for (std::string line; std::getline(lines, line);) {
    const std::size_t from = line.find('\t') + 1;
    const std::size_t to = line.find('\t', from);
    const int day = std::stoi(line.substr(from, to - from));
    offset = offset == 0 ? kFirstDay - 2 - day : offset;
    moved += line.replace(from, to - from, std::to_string(day + offset)) + '\n';
  }
  return moved;
}

}  // namespace

bool lacksCause(std::string_view message) { return message.ends_with(": "); }

std::string readFile(const fs::path& path) {
  std::ifstream file(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(file), {}};
}

void writeFile(const fs::path& path, const std::string& content) {
  fs::create_directories(path.parent_path());
  std::ofstream file(path, std::ios::binary | std::ios::trunc);
  if (!(file << content).flush()) {
    throw std::runtime_error(path.string() + " cannot be written");
  }
}

namespace {

/// Recorded files of a small machine that has counted for `hours`.
void recordMachine(const fs::path& root, std::uint64_t hours) {
  const std::string n = std::to_string(hours * 3600);
  const std::string ticks = std::to_string(hours * 360000);
  writeFile(root / "proc/sys/kernel/random/boot_id", "6f0c1e2d-0000-4000-8000-000000000001\n");
  writeFile(root / "proc/uptime", n + ".00 " + n + ".00\n");
  writeFile(root / "proc/stat", "cpu  " + ticks + " 0 " + ticks + " " + ticks + " 0 0 0 0 0 0\n" +
                                    "ctxt " + n + "\nprocesses " + n + "\n");
  writeFile(root / "proc/meminfo", "MemTotal: 9000000 kB\nMemAvailable: 4000000 kB\n");
  writeFile(root / "proc/vmstat", "pgpgin " + n + "\npgpgout " + n + "\noom_kill 3\n");
  writeFile(root / "proc/pressure/io",
            "some avg10=0.00 avg60=0.00 avg300=0.00 total=" + n +
                "000\nfull avg10=0.00 avg60=0.00 avg300=0.00 total=" + n + "000\n");
  for (const char* disk : {"sda", "sdb"}) {
    const fs::path block = root / "sys/block" / disk;
    writeFile(block / "stat", n + " 0 " + n + " 1 " + n + " 0 " + n + " 1 0 " + n + " 2\n");
    writeFile(block / "diskseq", "1\n");
  }
  const fs::path statistics = root / "sys/class/net/eth0/statistics";
  for (const char* name : {"rx_bytes", "tx_bytes", "rx_packets", "tx_packets"}) {
    writeFile(statistics / name, n + '\n');
  }
  writeFile(root / "sys/class/net/eth0/ifindex", "2\n");
  writeFile(root / "sys/class/thermal/thermal_zone0/type", "cpu\n");
  writeFile(root / "sys/class/thermal/thermal_zone0/temp", "41000\n");
}

/// Every row adds to what is counted, so that none may be taken twice.
std::string importedRows() {
  std::string rows;
  for (int row = 0; row < 300; ++row) {
    rows += "sample\t" + std::to_string(kFirstDay) + "\tlinux.imported." + std::to_string(row) +
            "\t" + std::to_string(row) + "\t0\n";
  }
  return rows;
}

}  // namespace

Companion::Companion(const std::vector<std::string>& command, const std::string& folder) {
  _child = start(command, folder, _output.descriptor(), _output.descriptor(), false);
}

void Companion::endsOrWaits() {
  const fs::path tasks = "/proc/" + std::to_string(_child) + "/task";
  for (int asleep = 0; asleep < 10;) {
    _ended = waitpid(_child, &_status, WNOHANG) == _child;
    if (_ended) {
      return;
    }
    bool sleep = true;
    std::error_code gone;
    for (const fs::directory_entry& task : fs::directory_iterator(tasks, gone)) {
      const std::string stat = readFile(task.path() / "stat");
      sleep = sleep && stat.find(") S ") != std::string::npos;
    }
    asleep = sleep ? asleep + 1 : 0;
    usleep(1000);
  }
}

int Companion::status() {
  while (!_ended) {
    _ended = waitpid(_child, &_status, 0) == _child || errno != EINTR;
  }
  return WIFEXITED(_status) ? WEXITSTATUS(_status) : -1;
}

int countWithLibrary(const char* directory) {
  vesprun_device* const device = vesprun_open(directory);
  const bool done = device != nullptr && vesprun_add_to_scalar(device, "linux.library", 7) == 0 &&
                    vesprun_add_to_distribution(device, "linux.library.d", 7.5) == 0 &&
                    vesprun_checkpoint(device) == 0;
  if (!done) {
    std::fprintf(stderr, "library: %s\n", vesprun_last_error());
  }
  vesprun_close(device);
  return done ? 0 : 1;
}

Device::Device(const fs::path& folder) : _path(folder.string()) {
  std::string output;
  setenv("SOURCE_DATE_EPOCH", "1709630102", 1);  // the same rows on every day
  if (run("init @ --sample", output) != 0 || run("counters dump", output) != 0) {
    throw std::runtime_error("no device can be made: " + output);
  }
  describe(kDescription);
  run("day " + std::to_string(kFirstDay), output);
  writeFile(_path + "/Library/Logsmith/com.quill.Ferrywell.ptree", kTasking);
  fs::remove(_path + kDatabase);
  std::string rows = movedRows(output);
  for (int day = kFirstDay - 2; day <= kFirstDay; ++day) {
    const std::string number = std::to_string(day);
    rows += "scalar\t" + number + "\tsecret.scalar\t7\n";
    rows += "sample\t" + number + "\tsecret.distribution\t7.5\t3600\n";
  }
  writeFile(_path + "/rows", rows);
  if (run("counters import @/rows", output) != 0) {
    throw std::runtime_error("no counters can be made: " + output);
  }
  fs::remove(_path + "/rows");
}

// All copies have the same name, since pages tell it.
Device::Device(const Device& original, const fs::path& folder)
    : _path((folder / "device").string()) {
  fs::remove_all(_path);
  fs::create_directories(folder);
  if (!fs::exists(original._path)) {
    return;
  }
  fs::copy(original._path, _path, fs::copy_options::recursive);
  // What is old stays old.
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(original._path)) {
    if (entry.is_regular_file()) {
      fs::last_write_time(fs::path(_path) / entry.path().lexically_relative(original._path),
                          entry.last_write_time());
    }
  }
}

void Device::describe(const std::string& change) const {
  auto description = nlohmann::ordered_json::parse(readFile(_path + "/device.json"));
  description.merge_patch(nlohmann::ordered_json::parse(change));
  writeFile(_path + "/device.json", description.dump());
}

std::vector<std::string> Device::commandLine(const std::string& words) const {
  std::vector<std::string> line;
  std::istringstream stream(words);
  for (std::string word; stream >> word;) {
    line.push_back(word.front() == '@' ? _path + word.substr(1) : word);
  }
  if (line.front() == "vesprun") {
    line.front() = VESPRUN_PROGRAM;
  } else if (line.front() == "library") {
    line = {fs::read_symlink("/proc/self/exe").string(), "--count-in", _path};
  } else {
    line.insert(line.begin(), {VESPCTL_PROGRAM, "-C", _path});
    if (line[3] == "init") {
      line.erase(line.begin() + 1, line.begin() + 3);
    }
  }
  return line;
}

int Device::run(const std::string& words, std::string& output) const {
  const std::size_t space = words.find(' ');
  const std::string argument = space == std::string::npos ? "" : words.substr(space + 1);
  if (words.starts_with("day ")) {
    constexpr std::int64_t kTimeOfDay = 9 * 3600 + 15 * 60 + 2;
    const Date time{startOfDay(std::stoi(argument)).seconds + kTimeOfDay, 0};
    describe(R"({"clock": ")" + dateText(time) + R"("})");
  } else if (words.starts_with("garbage ")) {
    writeFile(_path + argument, std::string(5000, 'x'));
  } else if (words.starts_with("remove ")) {
    fs::remove(_path + argument);
  } else if (words == "stray-journal") {  // which must not be played into the new file
    fs::rename(_path + kDatabase, _path + kDatabase + "-journal");
  } else if (words == "machines") {
    for (const std::uint64_t number : {1U, 2U, 3U}) {
      recordMachine(_path + "/machine-" + std::to_string(number), number * number);
    }
  } else if (words == "rows") {
    writeFile(_path + "/rows", importedRows());
  } else if (words == "without-controller") {
    describe(R"({"registry": null})");
  } else {
    Companion program(commandLine(words), words.starts_with("vesprun") ? _path : "/");
    const int status = program.status();
    output = program.output();
    return status;
  }
  return 0;
}

Faults Device::run(const std::vector<std::string>& steps) const {
  Faults faults;
  for (const std::string& step : steps) {
    std::string output;
    const bool mayFail = step.starts_with('?');
    if (run(step.substr(mayFail ? 1 : 0), output) != 0 && !mayFail) {
      faults.push_back("\"" + step + "\" failed: " + output);
    }
  }
  return faults;
}

Sight Device::look(bool numbered) const {
  Sight sight;
  std::string error;
  const auto addLines = [&sight](const std::string& what, const std::string& text) {
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
      sight.facts.insert(what + line);
    }
  };
  // Without the time, which is that of the run that records them.
  const auto addECCEvents = [&sight](const std::string& text) {
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
      const std::size_t type = line.find("\"type\":172,");
      if (type != std::string::npos) {
        sight.facts.insert("ECC event " + line.substr(type));
      }
    }
  };
  // First of all: it moves a damaged database aside, and says so.
  std::string counters;
  const bool isRead = run("counters dump", counters) == 0 || run("counters dump", counters) == 0;
  if (isRead) {
    addLines("counter ", counters);
  } else {
    sight.faults.push_back("the counters cannot be read: " + counters);
  }
  std::set<std::string> numbers;
  int withoutHeader = 0;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(_path)) {
    if (!entry.is_regular_file()) {
      continue;
    }
    std::string name = fs::relative(entry.path(), _path).string();
    const bool leaves = name.starts_with("outbox/");
    const bool isDocument = name.ends_with(".ptree") || name.ends_with(".html");
    const std::string content = leaves || isDocument ? readFile(entry.path()) : "";
    if (leaves && content.find("secret") != std::string::npos) {
      sight.faults.push_back(name + " holds a key that no list names");
    }
    if ((name.ends_with(".ptree") && !readPtree(content, error)) ||
        (name.ends_with(".json") && leaves && !valueFromJsonText(content, error))) {
      sight.faults.push_back(name + " is half a document: " + error);
    }
    if (name.ends_with(".jsonl")) {
      std::istringstream lines(content);
      for (std::string line; std::getline(lines, line);) {
        const auto value = valueFromJsonText(line, error);
        if (!value || value->dict() == nullptr) {
          sight.faults.push_back(name + " has half a line: " + error);
          continue;
        }
        const std::string* const message = value->dict()->findString("message");
        if (message != nullptr && lacksCause(*message)) {
          sight.faults.push_back(name + " does not say why: " + *message);
        }
      }
      if (name.ends_with("/submitted.jsonl") && !numbered) {
        // Without the numbers, the same line twice must still be seen.
        static const std::regex number("(\"name\":\")[0-9]+");
        std::map<std::string, int> counts;
        std::istringstream notes(std::regex_replace(content, number, "$1"));
        for (std::string note; std::getline(notes, note);) {
          sight.facts.insert(name + " has " + note + " #" + std::to_string(++counts[note]));
        }
      } else if (!name.ends_with("/log.jsonl")) {
        addLines(name + " has ", content);
      }
      if (name.ends_with("/records.jsonl")) {
        addECCEvents(content);
      }
    } else if (name.starts_with("outbox/logs/") && name.find("/.") == std::string::npos) {
      const std::size_t number = name.find('-');
      if (name.ends_with("-193-log-aggregated.ptree")) {
        ++sight.dailyLogs;
        if (!fs::exists(_path + '/' + name.substr(0, name.rfind('.')) + ".header.json")) {
          sight.facts.insert("without header: " + (numbered ? name : name.substr(number)) + " " +
                             std::to_string(++withoutHeader));
        }
      }
      if (!name.ends_with(".header.json") && !numbers.insert(name.substr(0, number)).second) {
        sight.faults.push_back(name + " has the number of another log");
      }
      name = "log " + (numbered || number == std::string::npos ? name : name.substr(number));
      static const std::regex process("vesprun\\[[0-9]+\\]");
      sight.facts.insert(name + ": " + std::regex_replace(content, process, "vesprun[PID]"));
      continue;
    }
    if (name == "outbox/log.jsonl") {
      continue;
    }
    if (isDocument && name.find("/Preferences/") != std::string::npos) {
      // Their order is that in which they were set for the first time.
      const std::optional<PropertyValue> root = readPtree(content, error);
      for (const auto& [key, value] : root && root->dict() ? *root->dict() : PropertyDict()) {
        sight.facts.insert("content of " + name + ": " + std::string(key) + ' ' + jsonText(value));
      }
    } else if (isDocument) {
      sight.facts.insert("content of " + name + ": " + content);
    }
    sight.facts.insert("file " + name);
  }
  if (numbered) {
    std::string output;
    run("export --device d", output);
    addLines("export ", output);
  }
  // Growth that an earlier day missed is counted by a later one, so days are added up.
  std::map<std::string, long long> sums;
  std::istringstream rows(isRead ? counters : "");
  for (std::string kind, day, key, value; rows >> kind >> day >> key >> value;) {
    if (key.starts_with("datausage.")) {
      sums[key] += std::stoll(value);
    }
    std::getline(rows, value);
  }
  for (const auto& [key, sum] : sums) {
    sight.facts.insert("sum of " + key + " is " + std::to_string(sum));
  }
  return sight;
}

}  // namespace vesprun::torture
