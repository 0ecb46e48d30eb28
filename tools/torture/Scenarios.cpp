#include "Scenarios.h"

#include <algorithm>
#include <cstring>
#include <map>
#include <memory>
#include <random>
#include <set>
#include <sstream>

#include "TracedRun.h"
#include "platform/host/documents/PtreeReader.h"

namespace vesprun::torture {
namespace {

namespace fs = std::filesystem;

using Faults = std::vector<std::string>;
constexpr const char* kDailyLog = "-193-log-aggregated.ptree";

/// What a day and the next one leave behind when nothing goes wrong.
struct Reference {
  Device device;
  std::vector<Call> calls;
  Sight before;
  Sight after;
};

Faults& operator+=(Faults& faults, const Faults& more) {
  faults.insert(faults.end(), more.begin(), more.end());
  return faults;
}

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
          keys.insert(key);
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

Faults missingFrom(const std::vector<std::string>& wanted, const std::vector<std::string>& there,
                   const std::string& what) {
  Faults faults;
  const std::set<std::string_view> known(there.begin(), there.end());
  for (const std::string& one : wanted) {
    if (!known.contains(one)) {
      faults.push_back(what + ": " + one.substr(0, 200));
    }
  }
  if (faults.size() > 3) {
    faults.resize(3);
  }
  return faults;
}

// Growth that an earlier day missed is counted by a later one, so days are added up.
std::map<std::string, long long> usageOf(const Sight& sight) {
  std::map<std::string, long long> sums;
  for (const std::string& row : sight.counters) {
    std::istringstream fields(row);
    std::string kind;
    std::string day;
    std::string key;
    std::string value;
    std::getline(fields, kind, '\t');
    std::getline(fields, day, '\t');
    std::getline(fields, key, '\t');
    std::getline(fields, value, '\t');
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
  faults += missingFrom(sight.files, reference.after.files, "a file is left over");
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

Faults judgeRun(const Outcome& outcome, bool killed, bool started) {
  Faults faults;
  if (outcome.late) {
    faults.push_back("took longer than " + std::to_string(kLongestRun) + " seconds");
  } else if (!killed && outcome.signal != 0) {
    faults.push_back(std::string("ended by a signal: ") + strsignal(outcome.signal) + "; " +
                     outcome.standardError);
  } else if (!killed && started && outcome.status != 0) {
    faults.push_back("exit status " + std::to_string(outcome.status) + "; " +
                     outcome.standardError);
  }
  return faults;
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
  faults += device.look().faults;
  faults += finishTheDays(device);
  faults += judge(device.look(), reference, killed || fault.kind == Fault::Kind::Short);
  return faults;
}

std::shared_ptr<Reference> makeReference(const Programs& programs, const fs::path& folder) {
  fs::create_directories(folder);
  auto reference = std::make_shared<Reference>(
      Reference{Device(programs, folder / "original"), {}, {}, {}});
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

// Before it, the system's loader is at work: what fails there keeps the program from starting.
std::size_t firstOwnCall(const Reference& reference) {
  const auto own = std::ranges::find_if(reference.calls, [](const Call& call) {
    return call.path.ends_with("/device.json");
  });
  return static_cast<std::size_t>(own - reference.calls.begin());
}

std::vector<Case> failingCalls(const Programs& programs, const fs::path& folder,
                               std::uint32_t seed, bool full) {
  const auto reference = makeReference(programs, folder / "calls");
  const std::size_t own = firstOwnCall(*reference);
  std::vector<Case> cases;
  std::mt19937 random(seed);
  for (std::size_t index = 0; index < reference->calls.size(); ++index) {
    const Call& call = reference->calls[index];
    const std::string place = ":" + nameOfCall(call.number) + ":" + std::to_string(index + 1);
    const bool started = index >= own;
    const auto add = [&](const std::string& what, Fault fault) {
      fault.call = index + 1;
      cases.push_back({what + place, [=](const fs::path& work) {
                         return runWithFault(*reference, work, fault, started);
                       }});
    };
    const std::vector<int>& errors = fittingErrors(call.number);
    const std::size_t one = errors.empty() ? 0 : random() % errors.size();
    for (std::size_t each = 0; each < errors.size(); ++each) {
      if (full || each == one) {
        add(strerrorname_np(errors[each]), {.kind = Fault::Kind::Error, .error = errors[each]});
      }
    }
    if (transfersBytes(call.number) && started) {
      add("short", {.kind = Fault::Kind::Short});
    }
    add("kill", {.kind = Fault::Kind::Kill});
  }
  return cases;
}

std::vector<Case> fullDisk(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                           bool full) {
  const auto reference = makeReference(programs, folder / "disk");
  std::uint64_t written = 0;
  for (const Call& call : reference->calls) {
    const std::string name = nameOfCall(call.number);
    written += (name == "write" || name == "pwrite64") &&
                       call.path.starts_with(folder.string())
                   ? call.size
                   : 0;
  }
  const std::uint64_t step = full ? 61 : 997;
  std::vector<Case> cases;
  for (std::uint64_t room = seed % step; room < written; room += step) {
    const Fault fault{.kind = Fault::Kind::DiskFull, .room = room};
    cases.push_back({"disk full after " + std::to_string(room) + " bytes",
                     [=](const fs::path& work) {
                       return runWithFault(*reference, work, fault, true);
                     }});
  }
  return cases;
}

}  // namespace

std::vector<Scenario> scenarios() {
  return {
      {"every call of a daily run fails or is its last", failingCalls},
      {"the disk gets full during a daily run", fullDisk},
  };
}

}  // namespace vesprun::torture
