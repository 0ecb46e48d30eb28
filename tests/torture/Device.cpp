#include "Device.h"

#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <fstream>
#include <nlohmann/json.hpp>
#include <sstream>
#include <stdexcept>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"

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

Companion::Companion(const std::vector<std::string>& command, const std::string& folder,
                     const std::string& input) {
  const TextFile in(input);
  _child = fork();
  if (_child == 0) {
    dup2(in.descriptor(), STDIN_FILENO);
    dup2(_output.descriptor(), STDOUT_FILENO);
    dup2(_output.descriptor(), STDERR_FILENO);
    alarm(60);
    if (chdir(folder.c_str()) == 0) {
      runInstead(command);
    }
    _exit(126);
  }
}

bool Companion::endsWithin(int milliseconds) {
  for (int waited = 0; !_ended && waited <= milliseconds; ++waited) {
    _ended = waitpid(_child, &_status, WNOHANG) == _child;
    if (!_ended) {
      usleep(1000);
    }
  }
  return _ended;
}

int Companion::status() {
  while (!_ended) {
    _ended = waitpid(_child, &_status, 0) == _child || errno != EINTR;
  }
  return WIFEXITED(_status) ? WEXITSTATUS(_status) : -1;
}

Device::Device(const Programs& programs, const fs::path& folder)
    : _programs(&programs), _path(folder.string()) {
  std::string output;
  setenv("SOURCE_DATE_EPOCH", "1709630102", 1);  // the same rows on every day
  if (control({"init", _path, "--sample"}, output) != 0 ||
      control({"counters", "dump"}, output) != 0) {
    throw std::runtime_error("no device can be made: " + output);
  }
  describe(kDescription);
  setDay(kFirstDay);
  writeFile(_path + "/Library/Logsmith/com.quill.Ferrywell.ptree", kTasking);
  fs::remove(_path + "/var/mobile/Library/Tallybook/TBDataStore.sqlitedb");
  std::string rows = movedRows(output);
  for (int day = kFirstDay - 2; day <= kFirstDay; ++day) {
    const std::string number = std::to_string(day);
    rows += "scalar\t" + number + "\tsecret.scalar\t7\n";
    rows += "sample\t" + number + "\tsecret.distribution\t7.5\t3600\n";
  }
  if (control({"counters", "import", "-"}, output, rows) != 0) {
    throw std::runtime_error("no counters can be made: " + output);
  }
}

Device::Device(const Device& original, const fs::path& folder)
    : _programs(original._programs), _path(folder.string()) {
  fs::remove_all(_path);
  fs::copy(original._path, _path, fs::copy_options::recursive);
  // What is old stays old.
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(original._path)) {
    if (entry.is_regular_file()) {
      fs::last_write_time(fs::path(_path) / entry.path().lexically_relative(original._path),
                          entry.last_write_time());
    }
  }
}

void Device::describe(const std::string& change) {
  auto description = nlohmann::ordered_json::parse(readFile(_path + "/device.json"));
  description.merge_patch(nlohmann::ordered_json::parse(change));
  writeFile(_path + "/device.json", description.dump());
}

void Device::setDay(int day) {
  constexpr std::int64_t kTimeOfDay = 9 * 3600 + 15 * 60 + 2;
  describe(R"({"clock": ")" + dateText({startOfDay(day).seconds + kTimeOfDay, 0}) + R"("})");
}

std::vector<std::string> Device::controlCommand(std::vector<std::string> words) const {
  words.insert(words.begin(), {_programs->vespctl, "-C", _path});
  return words;
}

int Device::control(const std::vector<std::string>& words, std::string& output,
                    const std::string& input) const {
  Companion program(controlCommand(words), "/", input);
  const int status = program.status();
  output = program.output();
  return status;
}

int Device::runDaily() const { return Companion(dailyCommand(), _path).status(); }

Sight Device::look() const {
  Sight sight;
  std::string error;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(_path)) {
    if (!entry.is_regular_file()) {
      continue;
    }
    const std::string name = fs::relative(entry.path(), _path).string();
    const bool leaves = name.starts_with("outbox/");
    const std::string content = leaves || name.ends_with(".ptree") ? readFile(entry.path()) : "";
    if (name.starts_with("outbox/logs/")) {
      sight.logs[name.substr(12)] = content;
    } else {
      sight.files.push_back(name);
    }
    if (leaves && content.find("secret") != std::string::npos) {
      sight.faults.push_back(name + " holds a key that no list names");
    }
    if ((name.ends_with(".ptree") && !readPtree(content, error)) ||
        (name.ends_with(".json") && leaves && !valueFromJsonText(content, error))) {
      sight.faults.push_back(name + " is half a document: " + error);
    } else if (name.ends_with(".jsonl")) {
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
    }
  }
  std::string dump;
  if (control({"counters", "dump"}, dump) != 0) {
    sight.faults.push_back("the counters cannot be read: " + dump);
  }
  std::istringstream rows(dump);
  for (std::string row; std::getline(rows, row);) {
    sight.counters.push_back(row);
  }
  std::ranges::sort(sight.files);
  return sight;
}

}  // namespace vesprun::torture
