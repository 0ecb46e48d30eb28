#include <algorithm>
#include <iterator>
#include <memory>
#include <sstream>

#include "Faults.h"

namespace vesprun::torture {
namespace {

namespace fs = std::filesystem;

/// A `vespctl` command on a device; `judge` says what is wrong after a run with a fault.
struct Command {
  std::string name;
  std::shared_ptr<Device> original;
  std::vector<std::string> words;
  std::function<Faults(Device& device, const Outcome& outcome, bool killed)> judge;
};

Faults runCommand(const Command& command, const fs::path& folder, const Fault& fault,
                  bool started) {
  Device device(*command.original, folder);
  const bool killed = fault.kind == Fault::Kind::Kill;
  const Outcome outcome = runTraced(device.controlCommand(command.words), device.path(), fault);
  Faults faults = judgeRun(outcome, killed, started, 1);
  if (outcome.status == 1 && outcome.standardError.empty()) {
    faults.emplace_back("it failed without a word");
  }
  faults += command.judge(device, outcome, killed);
  if (!faults.empty()) {
    faults.push_back("the fault came at: " + outcome.place);
  }
  return faults;
}

std::vector<Case> casesOf(const Command& command, const fs::path& folder, std::uint32_t seed,
                          bool full) {
  Device device(*command.original, folder / "reference");
  const Outcome reference = runTraced(device.controlCommand(command.words), device.path());
  Faults wrong = reference.notDurable;
  wrong += judgeRun(reference, false, true);
  wrong += command.judge(device, reference, false);
  if (!wrong.empty()) {
    throw std::runtime_error(command.name + " without any fault: " + wrong.front());
  }
  return faultsOfCalls(command.name + ":", reference.calls, seed, full, false,
                       [=](const fs::path& work, const Fault& fault, bool started) {
                         return runCommand(command, work, fault, started);
                       });
}

/// All lines or none, and never "done" without them.
std::vector<Case> importsInto(const std::shared_ptr<Device>& original, const std::string& name,
                              const fs::path& folder, std::uint32_t seed, bool full) {
  std::string rows;
  for (int row = 0; row < 300; ++row) {
    rows += "scalar\t" + std::to_string(kFirstDay) + "\tlinux.imported." + std::to_string(row) +
            "\t" + std::to_string(row) + '\n';
  }
  writeFile(original->path() + "/rows", rows);
  const std::vector<std::string> words{"counters", "import", original->path() + "/rows"};
  const std::vector<std::string> before = original->look().counters;
  Device device(*original, folder / "imported");
  std::string output;
  device.control(words, output);
  const std::vector<std::string> after = device.look().counters;
  const auto judge = [=](Device& changed, const Outcome& outcome, bool /*killed*/) {
    const Sight sight = changed.look();
    Faults faults = sight.faults;
    if (sight.counters != before && sight.counters != after) {
      faults.emplace_back("some lines are there and some are not");
    }
    if (outcome.status == 0 && sight.counters != after) {
      faults.emplace_back("it said done, and nothing is there");
    }
    return faults;
  };
  return casesOf({name, original, words, judge}, folder, seed, full);
}

std::vector<Case> imports(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                          bool full) {
  const auto original = std::make_shared<Device>(programs, folder / "imports");
  std::vector<Case> cases = importsInto(original, "import", folder, seed, full);
  const auto emptied = std::make_shared<Device>(*original, folder / "emptied");
  const std::string database =
      emptied->path() + "/var/mobile/Library/Tallybook/TBDataStore.sqlitedb";
  fs::rename(database, database + "-journal");  // which must not be played into the new file
  std::ranges::move(importsInto(emptied, "first import", folder, seed, full),
                    std::back_inserter(cases));
  return cases;
}

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

/// Growth is counted once, whichever of three collections fails.
std::vector<Case> collections(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                              bool full) {
  const auto original = std::make_shared<Device>(programs, folder / "collections");
  const auto stage = [=](int number) {
    return (folder / ("machine-" + std::to_string(number))).string();
  };
  for (int number = 1; number <= 3; ++number) {
    const auto growth = static_cast<std::uint64_t>(number);
    recordMachine(stage(number), growth * growth);
  }
  const auto collect = [=](Device& device, int number) {
    Faults faults;
    std::string output;
    if (device.control({"collect", "--root", stage(number)}, output) != 0) {
      faults.push_back("a collection failed: " + output);
    }
    return faults;
  };
  const auto figures = [](const Sight& sight) {
    std::vector<std::string> rows = sight.counters;
    std::erase_if(rows, [](const std::string& row) {
      return !row.starts_with("scalar") || row.find("\tlinux.") == std::string::npos;
    });
    return rows;
  };
  collect(*original, 1);
  Device device(*original, folder / "collected");
  collect(device, 2);
  collect(device, 3);
  const std::vector<std::string> expected = figures(device.look());
  const auto judge = [=](Device& changed, const Outcome& /*outcome*/, bool /*killed*/) {
    Faults faults = collect(changed, 3);
    const Sight sight = changed.look();
    faults += sight.faults;
    faults += missingFrom(expected, figures(sight), "growth is not what it was");
    faults += missingFrom(figures(sight), expected, "growth from nowhere");
    return faults;
  };
  return casesOf({"collect", original, {"collect", "--root", stage(2)}, judge}, folder, seed, full);
}

/// Whatever happened to one prune, the next one leaves the same behind, and so does a run after it.
std::vector<Case> prunes(const Programs& programs, const fs::path& folder, std::uint32_t seed,
                         bool full) {
  constexpr int kLater = kFirstDay + 40;
  const auto original = std::make_shared<Device>(programs, folder / "prunes");
  original->runDaily();
  original->setDay(kLater);
  std::string output;
  for (const int day : {kLater - 35, kLater - 1}) {
    original->control(
        {"counters", "set", "linux.memory.pagedInKiB", "7", "--day", std::to_string(day)}, output);
  }
  original->control({"run", "--", "-f"}, output);
  const std::vector<std::string> words{"prune", "--counters", "30", "--outbox", "30"};
  const auto end = [=](Device& device) {
    std::string printed;
    std::string found = std::to_string(device.control(words, printed));
    for (const char* const file : {"pruned.jsonl", "events.jsonl", "records.jsonl"}) {
      found += readFile(device.path() + "/outbox/" + file);
    }
    for (const auto& [name, content] : device.look().logs) {
      found += name + '\n';
    }
    found += std::to_string(device.control({"run", "--", "-f"}, printed));
    for (const char* const command : {"counters dump", "export --device d"}) {
      std::istringstream stream(command);
      device.control({std::istream_iterator<std::string>(stream), {}}, printed);
      found += printed;
    }
    return found;
  };
  Device device(*original, folder / "pruned");
  const std::string expected = end(device);
  const auto judge = [=](Device& changed, const Outcome& /*outcome*/, bool /*killed*/) {
    return end(changed) == expected ? Faults() : Faults{"the next prune ends otherwise"};
  };
  std::vector<Case> cases = casesOf({"prune", original, words, judge}, folder, seed, full);
  if (!full) {  // between two of these calls, nothing on the device changes
    std::erase_if(cases, [](const Case& one) {
      constexpr const char* kChanging[] = {"write",   "sync:", ":unlink",
                                           ":rename", ":link", "trunc"};
      return std::ranges::none_of(
          kChanging, [&one](const char* call) { return one.name.find(call) != std::string::npos; });
    });
  }
  return cases;
}

}  // namespace

std::vector<Scenario> commandScenarios() {
  return {
      {"every call of an import fails or is its last", imports},
      {"every call of a collection fails or is its last", collections},
      {"every call of a prune fails or is its last", prunes},
  };
}

}  // namespace vesprun::torture
