#include <algorithm>
#include <array>
#include <cstring>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <sstream>

#include "Faults.h"
#include "platform/host/documents/PtreeReader.h"

namespace vesprun::torture {
namespace {

namespace fs = std::filesystem;

constexpr const char* kDailyLog = "-193-log-aggregated.ptree";

/// What a day and the next one leave behind when nothing goes wrong.
struct Reference {
  Device device;
  std::vector<Call> calls;
  Sight before;
  Sight after;
};

// A later start on the same day, and the first one of the next.
Faults finishTheDays(Device& device) {
  Faults faults;
  if (device.runDaily() != 0) {
    faults.emplace_back("a later run on the same day failed");
  }
  device.setDay(kFirstDay + 1);
  if (device.runDaily() != 0) {
    faults.emplace_back("the next day's run failed");
  }
  return faults;
}

std::set<std::string> keysOf(const std::string& document) {
  std::set<std::string> keys;
  std::string error;
  const auto value = readPtree(document, error);
  if (value && value->dict() != nullptr) {
    for (const auto& [name, part] : *value->dict()) {
      if (part.dict() != nullptr) {
        for (const auto& [key, ignored] : *part.dict()) {
          keys.emplace(key);
        }
      }
    }
  }
  return keys;
}

std::vector<std::string> dailyLogs(const Sight& sight) {
  std::vector<std::string> logs;
  for (const auto& [name, content] : sight.logs) {
    if (name.ends_with(kDailyLog)) {
      logs.push_back(content);
    }
  }
  return logs;
}

// Growth that an earlier day missed is counted by a later one, so days are added up.
std::map<std::string, long long> usageOf(const Sight& sight) {
  std::map<std::string, long long> sums;
  for (const std::string& row : sight.counters) {
    std::istringstream fields(row);
    std::string kind, day, key, value;
    for (std::string* field : {&kind, &day, &key, &value}) {
      std::getline(fields, *field, '\t');
    }
    if (key.starts_with("datausage.")) {
      sums[key] += std::stoll(value);
    }
  }
  return sums;
}

/// `whole`: the run was only interrupted, so that nothing may be missing in the end.
Faults judge(const Sight& sight, const Reference& reference, bool whole) {
  Faults faults = sight.faults;
  faults += missingFrom(reference.before.counters, sight.counters, "a counter is lost");
  std::vector<std::string> files = sight.files;
  if (!whole) {  // a document that could not be begun; the next one in its folder takes its place
    std::erase_if(files, [](const std::string& name) {
      return fs::path(name).filename().string().starts_with(".unfinished-");
    });
  }
  faults += missingFrom(files, reference.after.files, "a file is left over");
  if (usageOf(sight) != usageOf(reference.after)) {
    faults.emplace_back("data usage was lost or counted twice");
  }
  std::set<std::string> known;
  for (const std::string& log : dailyLogs(reference.after)) {
    known.merge(keysOf(log));
  }
  const std::vector<std::string> logs = dailyLogs(sight);
  for (const std::string& log : logs) {
    std::set<std::string> keys = keysOf(log);
    std::erase_if(keys, [&](const std::string& key) { return known.contains(key); });
    if (!keys.empty()) {
      faults.push_back("a log has a key of its own: " + *keys.begin());
    }
  }
  if (whole) {
    faults += missingFrom(reference.after.counters, sight.counters, "a row is missing");
    faults += missingFrom(sight.counters, reference.after.counters, "a row is too much");
    faults += missingFrom(dailyLogs(reference.after), logs, "a day's log is missing");
  }
  return faults;
}

/// A call that fails costs one step of the day at most, once the day's work has begun.
Faults lostSteps(const Device& device, const Sight& sight) {
  if (readFile(device.path() + "/outbox/log.jsonl").find("daily tasks for day") ==
      std::string::npos) {
    return {};
  }
  const auto hasLog = [&](const char* ending) {
    return std::ranges::any_of(sight.logs,
                               [=](const auto& log) { return log.first.ends_with(ending); });
  };
  const auto counts = [&](const char* key) {
    const std::string text = '\t' + std::to_string(kFirstDay) + '\t' + key;
    return std::ranges::any_of(sight.counters, [&](const std::string& row) {
      return row.find(text) != std::string::npos;
    });
  };
  const std::pair<const char*, bool> steps[] = {
      {"daily log", hasLog(kDailyLog)},
      {"storage log", hasLog("-165-StorageStatus.log")},
      {"records", !readFile(device.path() + "/outbox/records.jsonl").empty()},
      {"counters", counts("datausage.") || counts("com.quill.tapline.")},
      {"tasking", std::ranges::count(sight.files, "var/mobile/Library/Preferences/a.ptree") != 0},
  };
  std::string lost;
  for (const auto& [name, done] : steps) {
    lost += done ? "" : std::string(lost.empty() ? "" : ", ") + name;
  }
  return lost.find(',') == std::string::npos ? Faults()
                                             : Faults{"more than one step lost: " + lost};
}

/// What others left for the device is used, or the log says why not.
Faults silence(const Device& device, const Outcome& outcome, int error) {
  const std::string& place = outcome.place;
  const auto holds = [&place](const std::string& part) { return place.find(part) != place.npos; };
  const auto begins = [&place](const char* call) { return place.starts_with(call); };
  // Looking for left-overs beside a preference file is no reading of it.
  const bool isTidying = begins("getdents") && holds("/Library/Logsmith");
  const bool isInput =
      holds(device.path()) && !isTidying &&
      std::ranges::any_of(std::to_array({"/device.json", "/kernel/", "/controller/",
                                         "/Library/Logsmith", "/Whitelist"}),
                          holds) &&
      std::ranges::any_of(std::to_array({"openat", "read", "pread", "getdents"}), begins);
  const std::string said = readFile(device.path() + "/outbox/log.jsonl") + outcome.standardError;
  return isInput && said.find(std::strerror(error)) == std::string::npos
             ? Faults{"nothing is said of " + place}
             : Faults();
}

Faults runWithFault(const Reference& reference, const fs::path& folder, const Fault& fault,
                    bool started) {
  Device device(reference.device, folder);
  const bool killed = fault.kind == Fault::Kind::Kill;
  const Outcome outcome = runTraced(device.dailyCommand(), device.path(), fault);
  Faults faults = judgeRun(outcome, killed, started);
  if (!outcome.happened) {
    return faults;  // threads make their calls in another order each time
  }
  const Sight halfway = device.look();
  faults += halfway.faults;
  if (fault.kind == Fault::Kind::Error) {
    faults += lostSteps(device, halfway);
    faults += silence(device, outcome, fault.error);
  }
  faults += finishTheDays(device);
  faults += judge(device.look(), reference, killed || fault.kind == Fault::Kind::Short);
  if (!faults.empty()) {
    faults.push_back("the fault came at: " + outcome.place);
  }
  return faults;
}

std::shared_ptr<Reference> makeReference(const Programs& programs, const fs::path& folder) {
  fs::create_directories(folder);
  auto reference =
      std::make_shared<Reference>(Reference{Device(programs, folder / "original"), {}, {}, {}});
  reference->before = reference->device.look();
  Device device(reference->device, folder / "reference");
  Outcome outcome = runTraced(device.dailyCommand(), device.path());
  Faults faults = judgeRun(outcome, false, true);
  faults += outcome.notDurable;
  faults += finishTheDays(device);
  reference->after = device.look();
  faults += reference->after.faults;
  if (dailyLogs(reference->after).size() != 2) {
    faults.emplace_back("two days did not make two logs");
  }
  if (!faults.empty()) {
    std::string text = "without any fault:";
    for (const std::string& fault : faults) {
      text += "\n  " + fault;
    }
    throw std::runtime_error(text);
  }
  reference->calls = std::move(outcome.calls);
  return reference;
}

std::vector<Case> failingCalls(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                               bool full) {
  const auto reference = makeReference(programs, folder / "calls");
  return faultsOfCalls("", reference->calls, seed, full, true,
                       [=](const fs::path& work, const Fault& fault, bool started) {
                         return runWithFault(*reference, work, fault, started);
                       });
}

std::vector<Case> fullDisk(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                           bool full) {
  const auto reference = makeReference(programs, folder / "disk");
  std::uint64_t written = 0;
  for (const Call& call : reference->calls) {
    const std::string name = nameOfCall(call.number);
    written += (name == "write" || name == "pwrite64") && call.path.starts_with(folder.string())
                   ? call.size
                   : 0;
  }
  const std::uint64_t step = full ? 61 : 997;
  std::vector<Case> cases;
  for (std::uint64_t room = seed % step; room < written; room += step) {
    const Fault fault{.kind = Fault::Kind::DiskFull, .room = room};
    cases.push_back(
        {"disk full after " + std::to_string(room) + " bytes",
         [=](const fs::path& work) { return runWithFault(*reference, work, fault, true); }});
  }
  return cases;
}

/// Another program that changes the device while the daily run goes on.
struct Neighbour {
  std::string name;
  std::vector<std::string> command;
  std::vector<std::string> question;  ///< what `vespctl` is asked afterwards, without the device
  std::string answer;
};

Faults runBeside(const Reference& reference, const fs::path& folder, std::size_t call,
                 const Neighbour& neighbour) {
  Device device(reference.device, folder);
  std::unique_ptr<Companion> companion;
  const bool isDaily = neighbour.command.empty();
  const auto start = [&] {
    companion = std::make_unique<Companion>(
        isDaily ? device.dailyCommand() : device.controlCommand(neighbour.command), device.path());
    // A neighbour that waits for a lock of the paused run goes on after it.
    companion->endsWithin(30);
  };
  const Outcome outcome =
      runTraced(device.dailyCommand(), device.path(),
                {.kind = Fault::Kind::Pause, .call = call, .whilePaused = start});
  Faults faults = judgeRun(outcome, false, true);
  if (!companion) {
    return faults;
  }
  if (companion->status() != 0) {
    faults.push_back("the neighbour failed: " + companion->output());
  }
  std::string answer;
  if (!isDaily) {
    device.control(neighbour.question, answer);
    if (answer.find(neighbour.answer) == std::string::npos) {
      faults.push_back("what the neighbour wrote is lost");
    }
  }
  if (neighbour.name == "counters") {
    return faults += device.look().faults;
  }
  faults += finishTheDays(device);
  const Sight sight = device.look();
  faults += judge(sight, reference, true);
  if (dailyLogs(sight).size() != 2) {
    faults.push_back(std::to_string(dailyLogs(sight).size()) + " logs of two days");
  }
  return faults;
}

std::vector<Case> neighbours(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                             bool full) {
  const auto reference = makeReference(programs, folder / "neighbours");
  const std::string day = std::to_string(kFirstDay);
  const std::vector<Neighbour> others = {
      {"daily run", {}, {}, {}},
      {"preferences",
       {"prefs", "set", "com.quill.aggregated.vesprun", "torture", "7"},
       {"prefs", "get", "com.quill.aggregated.vesprun", "torture"},
       "7"},
      {"counters",
       {"counters", "add", "linux.torture", "7"},
       {"counters", "dump"},
       "scalar\t" + day + "\tlinux.torture\t7\n"},
  };
  std::vector<Case> cases;
  const std::size_t step = full ? 3 : 23;
  for (std::size_t call = firstOwnCall(reference->calls) + seed % step;
       call < reference->calls.size(); call += step) {
    for (const Neighbour& neighbour : others) {
      cases.push_back(
          {neighbour.name + " beside call " + std::to_string(call),
           [=](const fs::path& work) { return runBeside(*reference, work, call, neighbour); }});
    }
  }
  return cases;
}

std::string damaged(std::string content, const std::string& how, std::mt19937& random) {
  if (content.empty()) {
    return how == "noise" ? std::string(100, '\xff') : content;
  }
  if (how == "cut") {
    content.resize(random() % content.size());
  } else if (how == "flipped") {
    char& byte = content[random() % content.size()];
    byte = static_cast<char>(static_cast<unsigned char>(byte) ^ (1U << (random() % 8)));
  } else if (how == "torn") {
    // A block that was never written.
    const std::size_t from = random() % content.size();
    content.replace(from, std::min<std::size_t>(512, content.size() - from), 512, '\0');
  } else {
    std::ranges::generate(content, [&] { return static_cast<char>(random()); });
  }
  return content;
}

std::vector<Case> damages(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                          bool full) {
  const auto original = std::make_shared<Device>(programs, folder / "damages");
  original->runDaily();
  original->setDay(kFirstDay + 1);
  std::vector<Case> cases;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(original->path())) {
    const std::string name = fs::relative(entry.path(), original->path()).string();
    if (!entry.is_regular_file() || name.starts_with("outbox/logs/")) {
      continue;
    }
    for (const char* how : {"cut", "flipped", "torn", "noise"}) {
      for (std::uint32_t time = 0; time < (full ? 20U : 2U); ++time) {
        const std::uint32_t ownSeed = seed * 31 + time;
        cases.push_back({name + " " + how + " " + std::to_string(time), [=](const fs::path& work) {
                           Device device(*original, work);
                           std::mt19937 random(ownSeed);
                           const fs::path path = fs::path(device.path()) / name;
                           writeFile(path, damaged(readFile(path), how, random));
                           Faults faults;
                           for (int run = 0; run < 2; ++run) {
                             if (const int status = device.runDaily(); status != 0) {
                               faults.push_back("exit status " + std::to_string(status));
                             }
                           }
                           for (const std::string& fault : device.look().faults) {
                             if (!fault.starts_with(name) && !fault.starts_with("the counters")) {
                               faults.push_back(fault);
                             }
                           }
                           return faults;
                         }});
      }
    }
  }
  return cases;
}

/// A clock that mostly goes on by a day, and sometimes stays, goes back or jumps ahead.
Faults liveThrough(const Device& original, const fs::path& folder, std::uint32_t seed, int days) {
  Device device(original, folder);
  std::mt19937 random(seed);
  Faults faults;
  std::vector<std::string> expected;
  int day = kFirstDay + static_cast<int>(random() % 3650);
  int stored = kFirstDay - 1;
  for (int lived = 0; lived < days && faults.empty(); ++lived) {
    const auto jump = random() % 100;
    day += jump < 80   ? 1
           : jump < 88 ? 0
           : jump < 94 ? -static_cast<int>(random() % 40)
                       : static_cast<int>(random() % 400);
    device.setDay(day);
    std::string output;
    if (device.control({"counters", "set", "linux.memory.pagedInKiB", "65536"}, output) != 0 ||
        device.control({"counters", "set", "linux.memory.pagedInKiB", "65536", "--day",
                        std::to_string(day - 1)},
                       output) != 0) {
      faults.push_back("a counter cannot be set: " + output);
    }
    if (device.runDaily() != 0) {
      faults.emplace_back("the run failed");
    }
    if (day - 1 > stored) {
      stored = day - 1;
      expected.push_back(std::to_string(day - 1));
    }
    if (dailyLogs(device.look()).size() != expected.size()) {
      faults.push_back("day " + std::to_string(day) + ", the " + std::to_string(lived) +
                       ". start: " + std::to_string(dailyLogs(device.look()).size()) +
                       " logs instead of " + std::to_string(expected.size()));
    }
  }
  return faults;
}

std::vector<Case> years(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                        bool full) {
  const auto original = std::make_shared<Device>(programs, folder / "years");
  original->describe(R"({"registry": null})");
  original->runDaily();
  for (const fs::directory_entry& entry :
       fs::directory_iterator(original->path() + "/outbox/logs")) {
    fs::remove(entry.path());
  }
  std::vector<Case> cases;
  for (std::uint32_t year = 0; year < (full ? 100U : 10U); ++year) {
    cases.push_back({"year " + std::to_string(year), [=](const fs::path& work) {
                       return liveThrough(*original, work, seed * 1000 + year, 365);
                     }});
  }
  return cases;
}

}  // namespace

std::vector<Scenario> dailyScenarios() {
  return {
      {"every call of a daily run fails or is its last", failingCalls},
      {"the disk gets full during a daily run", fullDisk},
      {"others write during a daily run", neighbours},
      {"files are damaged", damages},
      {"the clock jumps through ten years", years},
  };
}

}  // namespace vesprun::torture
