#include "Scenarios.h"

#include <sys/stat.h>
#include <sys/syscall.h>

#include <algorithm>
#include <array>
#include <cstring>
#include <iterator>
#include <memory>
#include <random>
#include <sstream>
#include <stdexcept>

namespace vesprun::torture {
namespace {

namespace fs = std::filesystem;

using Facts = std::set<std::string>;

/// A command on a device, in which something goes wrong.
struct Scenario {
  const char* name;
  std::vector<std::string> before;  ///< what the device has gone through
  std::string command;
  std::vector<std::string> after;  ///< what completes it, whatever went wrong
  enum class Promise {
    Steps,   ///< a failing call costs one step at most, and nothing that was there
    Whole,   ///< what it changes is all there or not at all
    Again,   ///< in the end nothing differs
    Figures  ///< none in the scalars; what others do at the same time is judged whole
  } promise;
  int worst;                          ///< the highest exit status
  bool numbered;                      ///< logs keep their numbers
  std::vector<std::string> others{};  ///< which write at the same time
};

using Promise = Scenario::Promise;

const std::vector<Scenario>& scenarios() {
  static const std::vector<std::string> ages = {
      "vesprun -d",
      "day 19827",
      "counters set linux.memory.pagedInKiB 7 --day 19792",
      "counters set linux.memory.pagedInKiB 7 --day 19826",
      "run -- -f",
      "remove /outbox/.log-number"};
  static const std::string prune = "prune --counters 30 --outbox 30 --outbox-size 0";
  static const std::vector<Scenario> list = {
      {"daily",
       {"machines", "collect --root @/machine-1"},
       "vesprun -d",
       {"vesprun -d", "day 19788", "vesprun -d"},
       Promise::Steps,
       0,
       false,
       {"vesprun -d", "run -- -f", "prune --counters 30 --outbox 30", "catch-up",
        "collect --root @/machine-2", "prefs set com.quill.aggregated.vesprun torture 7",
        "counters add linux.torture 7"}},
      {"import", {"rows"}, "counters import @/rows", {}, Promise::Whole, 1, true},
      {"first import",
       {"rows", "stray-journal"},
       "counters import @/rows",
       {},
       Promise::Whole,
       1,
       true},
      {"library",
       {},
       "library",
       {},
       Promise::Whole,
       1,
       true,
       {"library", "counters add linux.library 1"}},
      {"damaged counters",
       {"garbage /var/mobile/Library/Tallybook/TBDataStore.sqlitedb"},
       "counters add linux.a 1",
       {},
       Promise::Whole,
       1,
       true,
       {"counters add linux.b 1"}},
      {"collect",
       {"machines", "collect --root @/machine-1"},
       "collect --root @/machine-2",
       {"collect --root @/machine-3"},
       Promise::Figures,
       1,
       true},
      {"catch-up",
       {},
       "catch-up --last 7",
       {"catch-up --last 7"},
       Promise::Again,
       1,
       false,
       {"catch-up --last 7"}},
      {"structured log",
       {},
       "nand structured-log --force",
       {},
       Promise::Figures,
       1,
       false,
       {"prune --outbox 30"}},
      {"prefs set",
       {},
       "prefs set com.quill.aggregated.vesprun torture 7",
       {},
       Promise::Whole,
       1,
       true,
       {"prefs set com.quill.aggregated.vesprun other 8"}},
      {"init",
       {},
       "init @/new --sample",
       {"?init @/new --sample"},  // refused when it is complete
       Promise::Again,
       1,
       true},
      {"page",
       {"vesprun -d"},
       "page @/page.html",
       {"page @/page.html"},
       Promise::Again,
       1,
       true,
       {"page @/page.html", "run -- -f"}},
      {"prune",
       ages,
       prune,
       {prune, "run -- -f"},
       Promise::Again,
       1,
       true,
       {prune, "run -- -f", "counters add linux.torture 7",
        "counters set linux.old 7 --day 19700"}},
  };
  return list;
}

/// What a scenario leaves behind when nothing goes wrong.
struct Reference {
  const Scenario& scenario;
  Device device;
  std::vector<Call> calls{};
  Facts before{};
  Facts done{};
  Facts after{};
};

/// What of `wanted` is not `there`, each as a fault that begins with `what`; a few at most.
Faults missing(const Facts& wanted, const Facts& there, const std::string& what) {
  Faults faults;
  std::ranges::set_difference(wanted, there, std::back_inserter(faults));
  faults.resize(std::min<std::size_t>(faults.size(), 3));
  for (std::string& fault : faults) {
    fault = what + ": " + fault.substr(0, 300);
  }
  return faults;
}

Faults& operator+=(Faults& faults, const Faults& more) {
  faults.insert(faults.end(), more.begin(), more.end());
  return faults;
}

template <typename Test>
Facts those(const Facts& facts, Test test) {
  Facts found;
  std::ranges::copy_if(facts, std::inserter(found, found.end()), test);
  return found;
}

auto beginsWith(std::string start) {
  return [start = std::move(start)](const std::string& fact) { return fact.starts_with(start); };
}

/// Hangs, signals, exit statuses and error texts. `started`: not while the loader was at work.
Faults judgeRun(const Outcome& outcome, const Fault& fault, bool started, int worst) {
  const bool killed = fault.kind == Fault::Kind::Kill;
  Faults faults;
  if (outcome.late) {
    faults.push_back("took longer than " + std::to_string(kMaxRunSeconds) + " seconds");
  } else if (!killed && started && outcome.signal != 0) {
    faults.push_back(std::string("ended by a signal: ") + strsignal(outcome.signal));
  } else if (!killed && started && outcome.status > worst) {
    faults.push_back("exit status " + std::to_string(outcome.status));
  } else if (outcome.status == 1 && outcome.standardError.empty() && !fault.lasts) {
    faults.emplace_back("it failed without a word");
  }
  std::istringstream lines(outcome.standardError);
  for (std::string line; std::getline(lines, line);) {
    if (lacksCause(line)) {
      faults.push_back("it does not say why: " + line);
    }
  }
  if (!faults.empty()) {
    faults.back() += "; " + outcome.standardError;
  }
  return faults;
}

/// A call that fails costs one step of the day at most, once the day's work has begun.
Faults lostSteps(const Reference& reference, const Device& device, const Facts& facts) {
  const std::string log = readFile(device.path() + "/outbox/log.jsonl");
  if (log.find("daily tasks for day") == std::string::npos) {
    return {};
  }
  const std::string today = "counter scalar\t" + std::to_string(kFirstDay) + '\t';
  std::string lost;
  int count = 0;
  for (const std::vector<std::string>& starts :
       {std::vector<std::string>{"log -193-"},
        {"log -165-"},
        {"outbox/records.jsonl"},
        {today + "datausage.", today + "com.quill.tapline."},
        {"file var/mobile/Library/Preferences/a.ptree"}}) {
    const auto has = [&starts](const Facts& there) {
      return std::ranges::any_of(starts, [&there](const std::string& start) {
        return std::ranges::any_of(there, beginsWith(start));
      });
    };
    if (has(reference.done) && !has(facts)) {
      lost += ' ' + starts.front();
      ++count;
    }
  }
  return count < 2 ? Faults() : Faults{"more than one step lost:" + lost};
}

/// What others left for the device is used, or the log says why not.
Faults silence(const Device& device, const Outcome& outcome, int error) {
  const std::string& place = outcome.place;
  const auto holds = [&place](const std::string& part) { return place.find(part) != place.npos; };
  // Looking for left-overs beside a preference file does not read it.
  const bool isTidying = place.ends_with("/Library/Logsmith");
  const bool isInput =
      holds(device.path()) && !isTidying &&
      std::ranges::any_of(std::to_array({"/device.json", "/kernel/", "/controller/",
                                         "/Library/Logsmith", "/Whitelist"}),
                          holds) &&
      std::ranges::any_of(std::to_array({"openat", "read", "pread", "getdents"}),
                          [&](const char* call) { return place.starts_with(call); });
  const std::string said = readFile(device.path() + "/outbox/log.jsonl") + outcome.standardError;
  return isInput && said.find(std::strerror(error)) == std::string::npos
             ? Faults{"nothing is said of " + place}
             : Faults();
}

/// A daily log up to what it says of tasking, which stands last.
std::string withoutTasking(const std::string& log) {
  return log.substr(0, log.find("<key>TBTasking</key>"));
}

Faults runWithFault(const Reference& reference, const fs::path& folder, const Fault& fault,
                    bool started) {
  const Scenario& scenario = reference.scenario;
  const Device device(reference.device, folder);
  const bool killed = fault.kind == Fault::Kind::Kill;
  const Outcome outcome = runTraced(device.commandLine(scenario.command), device.path(), fault);
  Faults faults = judgeRun(outcome, fault, started, scenario.worst);
  if (!outcome.happened) {
    return faults;  // threads make their calls in another order each time
  }
  const Sight halfway = device.look(scenario.numbered);
  faults += halfway.faults;
  if (scenario.promise == Promise::Steps && fault.kind == Fault::Kind::Error && !fault.lasts) {
    faults += lostSteps(reference, device, halfway.facts);
    faults += silence(device, outcome, fault.error);
  }
  // How often counters were damaged is lost with the call that counts it.
  const auto isContent = [](const std::string& fact) {
    return !fact.starts_with("file ") && fact.find("DatabaseCorruptionCount") == std::string::npos;
  };
  const Facts content = those(halfway.facts, isContent);
  const bool isDone = content == those(reference.done, isContent);
  if (scenario.promise == Promise::Whole && !isDone &&
      (outcome.status == 0 || content != those(reference.before, isContent))) {
    faults.emplace_back("some of it is there and some is not");
  }
  if (killed) {
    Facts usual = reference.before;
    usual.insert(reference.done.begin(), reference.done.end());
    faults += missing(those(halfway.facts, beginsWith("without header: ")), usual, "odd");
  }
  faults += device.run(scenario.after);
  const Sight end = device.look(scenario.numbered);
  faults += end.faults;
  Facts kept;
  std::ranges::set_intersection(reference.before, reference.after, std::inserter(kept, kept.end()));
  faults += missing(those(kept, isContent), end.facts, "lost");
  const bool isWhole = killed || fault.kind == Fault::Kind::Short;
  Facts wanted = reference.after;
  Facts there = end.facts;
  if (scenario.promise == Promise::Figures) {
    const auto isFigure = [](const std::string& fact) {
      return fact.starts_with("counter scalar") && fact.find("\tlinux.") != std::string::npos;
    };
    wanted = those(wanted, isFigure);
    there = those(there, isFigure);
  } else if (scenario.promise == Promise::Steps && !isWhole) {
    const auto isOfADay = [](const std::string& fact) {
      return fact.starts_with("sum ") || fact.starts_with("ECC event ");
    };
    const auto isFile = [](const std::string& fact) {
      return fact.starts_with("file ") && fact.find("/.") == std::string::npos;
    };
    faults += missing(those(there, isFile), reference.after, "left over");
    wanted = those(wanted, isOfADay);
    there = those(there, isOfADay);
  } else if (scenario.promise == Promise::Whole) {
    wanted = there;
  } else if (!isWhole) {
    // An operating system's change may be announced by no log and remembered by the next one, a
    // note may be lost, and a document that could not be begun is replaced by the next one in its
    // folder.
    const auto counts = [](const std::string& fact) {
      return fact.find(".header.json: ") == std::string::npos &&
             !fact.starts_with("without header: ") &&
             fact.find("com.quill.aggregated.vesprun.ptree: LastOSVersion ") == fact.npos &&
             fact.find("outbox/submitted.jsonl") == fact.npos &&
             !(fact.starts_with("file ") && fact.find("/.") != std::string::npos);
    };
    wanted = those(wanted, counts);
    there = those(there, counts);
  }
  const bool submits = std::ranges::any_of(reference.done, [&reference](const std::string& fact) {
    return fact.starts_with("log -193-") && !reference.before.contains(fact);
  });
  if (killed && submits) {
    // A log that was submitted just before the kill is submitted once more, then perhaps with the
    // preferences that tasking has set meanwhile; one that was under way leaves its unfinished
    // file. A change of the system is then announced by no log, and one of the preferences to
    // nobody; the newest number is found again.
    std::erase_if(wanted, [&there](const std::string& fact) {
      return !there.contains(fact) && (fact.starts_with("log -193-log-aggregated.header.json: ") ||
                                       fact.find("notifications.jsonl") != std::string::npos ||
                                       fact == "file outbox/.log-number");
    });
    std::set<std::string> logs;
    std::ranges::transform(wanted, std::inserter(logs, logs.end()), withoutTasking);
    const std::string oneMoreWithoutHeader =
        ' ' + std::to_string(1 + those(wanted, beginsWith("without header: ")).size());
    std::erase_if(there, [&](const std::string& fact) {
      return !wanted.contains(fact) &&
             ((fact.starts_with("log -193-") && logs.contains(withoutTasking(fact))) ||
              (fact.starts_with("outbox/submitted.jsonl has ") && fact.ends_with(" #2")) ||
              (fact.starts_with("without header: ") && fact.ends_with(oneMoreWithoutHeader)) ||
              fact.starts_with("file outbox/logs/.unfinished-"));
    });
  }
  faults += missing(wanted, there, "missing in the end");
  faults += missing(there, wanted, "too much in the end");
  if (!faults.empty()) {
    faults.push_back("the fault came at: " + outcome.place);
  }
  return faults;
}

std::shared_ptr<Reference> makeReference(const Scenario& scenario, const fs::path& folder) {
  fs::create_directories(folder);
  auto reference = std::make_shared<Reference>(Reference{scenario, Device(folder / "original")});
  Faults faults = reference->device.run(scenario.before);
  // What is damaged cannot be looked at without being moved aside.
  reference->before = Device(reference->device, folder / "before").look(scenario.numbered).facts;
  const Device device(reference->device, folder / "reference");
  Outcome outcome = runTraced(device.commandLine(scenario.command), device.path());
  faults += judgeRun(outcome, {}, true, 0);
  faults += outcome.notDurable;
  reference->done = device.look(scenario.numbered).facts;
  faults += device.run(scenario.after);
  const Sight end = device.look(scenario.numbered);
  reference->after = end.facts;
  faults += end.faults;
  if (!faults.empty()) {
    std::string text = std::string(scenario.name) + " without any fault:";
    for (const std::string& fault : faults) {
      text += "\n  " + fault;
    }
    throw std::runtime_error(text);
  }
  reference->calls = std::move(outcome.calls);
  return reference;
}

/// The place of the program's first own call. Before it the system's loader is at work, whose last
/// act is to let go of its list of libraries; what fails there keeps the program from starting.
std::size_t firstOwnCall(const std::vector<Call>& calls) {
  const auto last = std::ranges::find(calls, SYS_munmap, &Call::number);
  return static_cast<std::size_t>(last - calls.begin()) + 1;
}

/// Errors of one kind are much the same: in a scenario, of a call, on files of one name but for its
/// numbers. Where the steps of a day go on without each other, what is only read counts as well.
std::string kindOf(const Reference& reference, const Call& call) {
  std::string kind = reference.scenario.name + (' ' + nameOfCall(call.number));
  if (call.changes || reference.scenario.promise == Promise::Steps) {
    kind += call.path.substr(0, call.path.find(".unfinished-"));
    std::erase_if(kind, [](char c) { return c >= '0' && c <= '9'; });
  }
  return kind;
}

/// Each call fails, once or from then on, transfers half, or is the last one.
std::vector<Case> failingCalls(const std::shared_ptr<Reference>& reference, const Choice& choice) {
  const std::vector<Call>& calls = reference->calls;
  const std::size_t own = firstOwnCall(calls);
  std::vector<Case> cases;
  std::mt19937 random(choice.seed);
  for (std::size_t index = 0; index < calls.size(); ++index) {
    const Call& call = calls[index];
    const bool started = index >= own;
    const auto add = [&](const std::string& what, Fault fault) {
      fault.call = index + 1;
      const std::string name =
          std::string(reference->scenario.name) + ':' + what + ':' + nameOfCall(call.number);
      const std::string kind =
          started && fault.kind == Fault::Kind::Error ? kindOf(*reference, call) : std::string();
      cases.push_back(
          {name + ':' + std::to_string(index + 1),
           [=](const fs::path& work) { return runWithFault(*reference, work, fault, started); },
           kind});
    };
    const std::vector<int>& errors = fittingErrors(call.number);
    const std::size_t one = errors.empty() ? 0 : random() % errors.size();
    for (std::size_t each = 0; each < errors.size(); ++each) {
      if (choice.full || each == one) {
        Fault fault{.kind = Fault::Kind::Error, .number = call.number, .error = errors[each]};
        add(strerrorname_np(errors[each]), fault);
        fault.lasts = true;
        if (call.changes || choice.full) {
          add(std::string(strerrorname_np(errors[each])) + " from then on", fault);
        }
      }
    }
    if (started && transfersBytes(call.number)) {
      add("short", {.kind = Fault::Kind::Short, .number = call.number});
    }
    // Between two calls that change something, an end is the same at each.
    if (call.changes || choice.full) {
      add("kill", {.kind = Fault::Kind::Kill});
    }
  }
  return cases;
}

std::vector<Case> fullDisk(const std::shared_ptr<Reference>& reference, const Choice& choice) {
  std::uint64_t written = 0;
  for (const Call& call : reference->calls) {
    written += call.size;
  }
  const std::uint64_t step = written / (choice.full ? 400 : 20) + 1;
  std::vector<Case> cases;
  for (std::uint64_t room = choice.seed % step; room < written; room += step) {
    const Fault fault{.kind = Fault::Kind::DiskFull, .room = room};
    cases.push_back(
        {std::string(reference->scenario.name) + ":disk full after:" + std::to_string(room),
         [=](const fs::path& work) { return runWithFault(*reference, work, fault, true); }});
  }
  return cases;
}

/// Another program changes the device while this one waits in the midst of its work: the same is
/// there in the end as when one had come after the other.
Faults runBeside(const Reference& reference, const fs::path& folder, std::size_t call,
                 const std::string& other, const std::array<Sight, 2>& ends) {
  const Scenario& scenario = reference.scenario;
  const Device device(reference.device, folder);
  std::unique_ptr<Companion> companion;
  const auto start = [&] {
    companion = std::make_unique<Companion>(device.commandLine(other), device.path());
    companion->endsOrWaits();
  };
  // How often memory is asked for differs with the length of a path.
  const auto behind = reference.calls.begin() + static_cast<std::ptrdiff_t>(call);
  const int number = std::prev(behind)->number;
  const auto ordinal = std::ranges::count(reference.calls.begin(), behind, number, &Call::number);
  const Outcome outcome = runTraced(device.commandLine(scenario.command), device.path(),
                                    {.kind = Fault::Kind::Pause,
                                     .call = static_cast<std::size_t>(ordinal),
                                     .number = number,
                                     .ofItsKind = true,
                                     .whilePaused = start});
  Faults faults = judgeRun(outcome, {}, true, 0);
  if (!companion) {
    return faults;
  }
  if (companion->status() != 0) {
    faults.push_back("the other failed: " + companion->output());
  }
  faults += device.run(scenario.after);
  const Sight end = device.look(false);
  faults += end.faults;
  if (std::ranges::none_of(ends, [&end](const Sight& one) {
        return one.facts == end.facts && one.dailyLogs == end.dailyLogs;
      })) {
    faults.push_back(std::to_string(end.dailyLogs) +
                     " daily logs, and it is neither as after one "
                     "and then the other, nor the other way round");
    faults += missing(ends[0].facts, end.facts, "missing");
    faults += missing(end.facts, ends[0].facts, "too much");
  }
  return faults;
}

std::vector<Case> others(const std::shared_ptr<Reference>& reference, const fs::path& folder,
                         const Choice& choice) {
  const Scenario& scenario = reference->scenario;
  std::vector<Case> cases;
  for (const std::string& other : scenario.others) {
    std::array<Sight, 2> ends;
    for (const bool otherFirst : {false, true}) {
      const Device device(reference->device, folder / "in-turn");
      std::vector<std::string> steps = {scenario.command, other};
      if (otherFirst) {
        std::swap(steps[0], steps[1]);
      }
      steps.insert(steps.end(), scenario.after.begin(), scenario.after.end());
      const Faults faults = device.run(steps);
      if (!faults.empty()) {
        throw std::runtime_error(faults.front());
      }
      ends[otherFirst ? 1 : 0] = device.look(false);
    }
    // What another does matters between a look and a change, and before a lock.
    std::vector<std::size_t> places;
    for (std::size_t call = firstOwnCall(reference->calls); call < reference->calls.size();
         ++call) {
      if (reference->calls[call].changes || reference->calls[call].number == SYS_flock) {
        places.push_back(call);
      }
    }
    const std::size_t step = choice.full ? 1 : places.size() / 30 + 1;
    for (std::size_t index = 0; index < places.size(); ++index) {
      const Call& call = reference->calls[places[index]];
      const bool isLock = call.number == SYS_flock;
      // A moment before, the new file looks like one that was left.
      const bool isUnfinished = call.path.find(".unfinished-") != std::string::npos;
      if (!isLock && index % step != choice.seed % step) {
        continue;
      }
      const std::string name = std::string(scenario.name) + " beside " + other + ':';
      const std::string number = std::to_string(places[index] + 1);
      cases.push_back({name + number,
                       [=](const fs::path& work) {
                         return runBeside(*reference, work, places[index] + 1, other, ends);
                       },
                       !isLock        ? name
                       : step < 3     ? name + number
                       : isUnfinished ? name + "unfinished"
                                      : name});
    }
  }
  return cases;
}

std::vector<Case> casesOf(const Scenario& scenario, const fs::path& folder, const Choice& choice) {
  const auto reference = makeReference(scenario, folder / scenario.name);
  std::vector<Case> cases = failingCalls(reference, choice);
  std::ranges::move(fullDisk(reference, choice), std::back_inserter(cases));
  std::ranges::move(others(reference, folder, choice), std::back_inserter(cases));
  return cases;
}

void damage(const fs::path& path, const std::string& how, std::mt19937& random) {
  std::string content = readFile(path);
  const std::size_t place = content.empty() ? 0 : random() % content.size();
  if (how == "pipe") {
    fs::remove(path);
    if (mkfifo(path.c_str(), 0600) != 0) {
      throw std::runtime_error(path.string() + ": no pipe can be made");
    }
    return;
  }
  if (how == "cut") {
    content.resize(place);
  } else if (how == "flipped" && !content.empty()) {
    content[place] =
        static_cast<char>(static_cast<unsigned char>(content[place]) ^ (1U << (random() % 8)));
  } else if (how == "torn") {  // a block that was never written
    content.replace(place, std::min<std::size_t>(512, content.size() - place), 512, '\0');
  } else {
    content.resize(std::max<std::size_t>(content.size(), 100));
    std::ranges::generate(content, [&] { return static_cast<char>(random()); });
  }
  writeFile(path, content);
}

Faults runDamaged(const Device& original, const fs::path& work, const std::string& name,
                  const std::string& how, std::uint32_t seed) {
  const Device device(original, work);
  std::mt19937 random(seed);
  damage(fs::path(device.path()) / name, how, random);
  Faults faults = device.run({"vesprun -d", "vesprun -d"});
  for (const char* const command :
       {"prune --counters 3 --outbox 3", "catch-up", "collect --root @/machine-2", "export"}) {
    std::string output;
    if (const int status = device.run(command, output); status != 0 && status != 1) {
      faults.push_back(std::string(command) + " ended with " + std::to_string(status));
    }
  }
  for (const std::string& fault : device.look(false).faults) {
    if (!fault.starts_with(name) && !fault.starts_with("the counters")) {
      faults.push_back(fault);
    }
  }
  return faults;
}

std::vector<Case> damages(const fs::path& folder, const Choice& choice) {
  const auto original = std::make_shared<Device>(folder / "damages");
  original->run({"machines", "collect --root @/machine-1", "vesprun -d", "day 19788"});
  writeFile(original->path() + "/kernel/ecc/0009.bin", std::string(72, '\1'));
  std::vector<Case> cases;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(original->path())) {
    const std::string name = fs::relative(entry.path(), original->path()).string();
    if (!entry.is_regular_file() || name.starts_with("outbox/logs/") ||
        name.starts_with("machine")) {
      continue;
    }
    for (const std::string how : {"pipe", "cut", "flipped", "torn", "noise"}) {
      for (std::uint32_t time = 0; time < (how == "pipe" ? 1U : choice.full ? 20U : 2U); ++time) {
        cases.push_back({name + ' ' + how + ':' + std::to_string(time),
                         [=, seed = choice.seed * 31 + time](const fs::path& work) {
                           return runDamaged(*original, work, name, how, seed);
                         },
                         how == "pipe" ? name : std::string()});
      }
    }
  }
  return cases;
}

/// A clock that mostly goes on by a day, and sometimes stays, goes back or jumps ahead.
Faults liveThrough(const Device& original, const fs::path& folder, std::uint32_t seed) {
  const Device device(original, folder);
  std::mt19937 random(seed);
  Faults faults;
  std::size_t expected = 0;
  int day = kFirstDay + static_cast<int>(random() % 3650);
  int stored = kFirstDay - 1;
  for (int lived = 0; lived < 365 && faults.empty(); ++lived) {
    const auto jump = random() % 100;
    day += jump < 80   ? 1
           : jump < 88 ? 0
           : jump < 94 ? -static_cast<int>(random() % 40)
                       : static_cast<int>(random() % 400);
    const std::string count = "counters set linux.memory.pagedInKiB 65536 --day ";
    faults += device.run({"day " + std::to_string(day), count + std::to_string(day),
                          count + std::to_string(day - 1), "vesprun -d"});
    if (day - 1 > stored) {
      stored = day - 1;
      ++expected;
    }
    const std::size_t logs = device.look(false).dailyLogs;
    if (logs != expected) {
      faults.push_back("day " + std::to_string(day) + ", the " + std::to_string(lived) +
                       ". start: " + std::to_string(logs) + " logs instead of " +
                       std::to_string(expected));
    }
  }
  return faults;
}

std::vector<Case> years(const fs::path& folder, const Choice& choice) {
  const auto original = std::make_shared<Device>(folder / "years");
  original->run({"without-controller", "vesprun -d"});
  fs::remove_all(original->path() + "/outbox/logs");
  std::vector<Case> cases;
  for (std::uint32_t year = 0; year < (choice.full ? 100U : 10U); ++year) {
    cases.push_back({"year:" + std::to_string(year),
                     [=, seed = choice.seed * 1000 + year](const fs::path& work) {
                       return liveThrough(*original, work, seed);
                     }});
  }
  return cases;
}

}  // namespace

std::vector<CaseList> caseLists() {
  std::vector<CaseList> lists{{"the clock jumps through ten years", years}};  // they take longest
  for (const Scenario& scenario : scenarios()) {
    lists.push_back({scenario.name, [&scenario](const fs::path& folder, const Choice& choice) {
                       return casesOf(scenario, folder, choice);
                     }});
  }
  lists.push_back({"files are damaged", damages});
  return lists;
}

}  // namespace vesprun::torture
