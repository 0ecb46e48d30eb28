#include <array>
#include <cstdio>
#include <iostream>
#include <memory>
#include <set>

#include "Load.h"
#include "Printing.h"
#include "StoreAddress.h"
#include "commandline/Arguments.h"
#include "commandline/Completion.h"
#include "commandline/Program.h"
#include "common/Calendar.h"
#include "exchange/FigureRows.h"
#include "page/FleetPage.h"
#include "page/PageFile.h"
#include "platform/Clock.h"
#include "platform/host/files/StandardStreams.h"
#include "store/Comparison.h"
#include "store/FleetStore.h"

namespace vesprun {
namespace {

// Before the command-line library makes its own global objects.
[[gnu::constructor(101)]] void prepare() { exitWithoutMemory("vespfleet", 1); }

bool isJson() { return invocation().json; }

std::int32_t today() { return static_cast<std::int32_t>(std::time(nullptr) / kSecondsPerDay); }

/// What the command line says of a question.
struct Asked {
  std::string store;
  Question question;
  GivenDays days;
  ComparedGroups groups;
  std::vector<std::string> devices;
  std::int32_t keptDays = 0;

  DayRange range() const { return {days.first(today()), days.last(today())}; }
};

std::unique_ptr<FleetStore> openStore(const std::string& address, StoreUse use = StoreUse::Ask) {
  return openFleetStore(address, use);
}

void addStore(CLI::App& command, std::string& store) {
  command.add_option("STORE", store, "An SQLite file, or http(s)://HOST:PORT/DATABASE")
      ->required()
      ->check(CLI::Validator(storeFault, ""))
      ->type_name("");
}

std::shared_ptr<Asked> addAsked(CLI::App& command) {
  const auto asked = std::make_shared<Asked>();
  addStore(command, asked->store);
  return asked;
}

void addLeast(CLI::App& command, std::uint64_t& least) {
  command.add_option("--least", least, "Answers over fewer devices than this only count them")
      ->type_name("N")
      ->transform(decimal<std::uint64_t>());
}

CLI::Option* addBy(CLI::App& command, Member& by, bool withWhitelist) {
  std::map<std::string, Member> names{{"build", Member::Build}, {"model", Member::Model}};
  if (withWhitelist) {
    names.emplace("whitelist", Member::Whitelist);
  }
  const std::string choice = withWhitelist ? "build, model or whitelist" : "build or model";
  CLI::Option* const option = command.add_option_function<std::string>(
      "--by",
      [&by, names, choice](const std::string& name) {
        const auto found = names.find(name);
        if (found == names.end()) {
          throw CLI::ValidationError("--by", "is one of " + choice);
        }
        by = found->second;
      },
      "Parts the devices by " + choice);
  completeWith(option, [names] {
    std::vector<std::string> words;
    for (const auto& [name, member] : names) {
      words.push_back(name);
    }
    return words;
  });
  return option->type_name("MEMBER");
}

const char* kindName(KeyKind kind) { return kind == KeyKind::Scalar ? "scalar" : "distribution"; }

// Commands.

void addLoad(CLI::App& command) {
  struct Given {
    std::string store;
    std::vector<std::string> paths;
    std::optional<int> least;
    bool spools = false;
  };
  const auto given = std::make_shared<Given>();
  addStore(command, given->store);
  command.add_option("PATH", given->paths, "Files and folders of lines, - for standard input")
      ->required()
      ->type_name("");
  command
      .add_option("--least", given->least,
                  "The least number of devices of a store that is made, 5 unless given")
      ->type_name("N")
      ->transform(decimal<int>())
      ->check(CLI::Range(kMinLeast, std::numeric_limits<int>::max()));
  command.add_flag(
      "--spool", given->spools,
      "Removes files once they are stored; what has malformed lines goes to rejected/");
  command.callback([given] {
    const LoadCounts counts = loadFiles(given->store, given->least, given->paths, given->spools);
    const auto& [added, replaced, repeated, older, refused] = counts.outcomes;
    if (isJson()) {
      Results({}, true).print({{"lines", counts.lines},
                               {"new", added},
                               {"replaced", replaced},
                               {"repeated", repeated},
                               {"older", older},
                               {"malformed", counts.malformed},
                               {"refused", refused}});
    } else {
      std::cout << counts.lines << " lines: " << added << " new, " << replaced
                << " in place of earlier ones, " << repeated << " repeated, " << older << " older, "
                << counts.malformed << " malformed, " << refused << " refused\n";
    }
    invocation().status = counts.malformed != 0 || counts.failed ? 1 : 0;
  });
}

void addKeys(CLI::App& command) {
  const auto asked = addAsked(command);
  command.callback([asked] {
    const auto store = openStore(asked->store);
    Results results({"key", "kind", "devices", "days"}, isJson());
    bool isAny = false;
    store->visitKeys([&](const ReportedKey& key) {
      if (key.devices < store->least()) {
        return;
      }
      isAny = true;
      if (results.isJson()) {
        results.print({{"key", key.key},
                       {"kind", kindName(key.kind)},
                       {"devices", key.devices},
                       {"days", key.days}});
      } else {
        results.addRow(
            {key.key, kindName(key.kind), std::to_string(key.devices), std::to_string(key.days)});
      }
    });
    if (!isAny && !results.isJson()) {
      std::cout << "No key comes from " << store->least() << " devices or more.\n";
    }
  });
}

void addDevices(CLI::App& command) {
  const auto asked = addAsked(command);
  addBy(command, asked->question.by, false);
  command.callback([asked] {
    const Member by = asked->question.by;
    std::vector<std::string> titles{"last day", "devices"};
    if (by != Member::None) {
      titles.insert(titles.begin() + 1, nameOf(by));
    }
    Results results(std::move(titles), isJson());
    openStore(asked->store)
        ->visitLastDays(by, [&](std::int32_t day, const MemberText& member, std::uint64_t devices) {
          if (results.isJson()) {
            JsonLine line{{"day", day}};
            if (by != Member::None) {
              line[nameOf(by)] = member ? JsonLine(*member) : JsonLine();
            }
            line["devices"] = devices;
            results.print(line);
            return;
          }
          std::vector<std::string> row{dateOfDay(day), std::to_string(devices)};
          if (by != Member::None) {
            row.insert(row.begin() + 1, member.value_or("none"));
          }
          results.addRow(std::move(row));
        });
  });
}

std::shared_ptr<Asked> addQuestion(CLI::App& command) {
  const auto asked = addAsked(command);
  command.add_option("KEY", asked->question.key, "The key")->required()->type_name("");
  addDays(command, asked->days);
  addBy(command, asked->question.by, true);
  command.add_flag("--total", asked->question.total, "All days together");
  addLeast(command, asked->question.least);
  return asked;
}

template <void (*print)(FleetStore&, const Question&, bool)>
void addQuestionCommand(CLI::App& command) {
  const auto asked = addQuestion(command);
  command.callback([asked] {
    const auto store = openStore(asked->store);
    asked->question.days = asked->range();
    asked->question.least = std::max(asked->question.least, store->least());
    print(*store, asked->question, isJson());
  });
}

void addCompare(CLI::App& command) {
  const auto asked = addAsked(command);
  const auto addGroup = [&](const char* name, std::string& value, const char* help) {
    completeWith(command.add_option(name, value, help)->required()->type_name(""), [asked] {
      std::set<std::string> members;
      openStore(asked->store)
          ->visitLastDays(asked->groups.by,
                          [&](std::int32_t, const MemberText& member, std::uint64_t) {
                            members.insert(member.value_or(std::string()));
                          });
      members.erase(std::string());
      return std::vector<std::string>(members.begin(), members.end());
    });
  };
  addGroup("A", asked->groups.values[0], "The devices to compare with");
  addGroup("B", asked->groups.values[1], "The devices that are compared");
  addBy(command, asked->groups.by, true)->required();
  addDays(command, asked->days);
  command.add_option("--key", asked->groups.prefix, "Only keys that begin so")->type_name("PREFIX");
  addLeast(command, asked->question.least);
  command.callback([asked] {
    ComparedGroups& groups = asked->groups;
    if (groups.values[0] == groups.values[1]) {
      throw CLI::ValidationError("A and B are the same");
    }
    const auto store = openStore(asked->store);
    groups.days = asked->range();
    for (const std::string& value : groups.values) {
      if (!store->hasMember(groups.by, value)) {
        throw StoreFailure(asked->store + ": no line has the " + nameOf(groups.by) + ' ' + value);
      }
    }
    printComparison(compareKeys(*store, groups, std::max(asked->question.least, store->least())),
                    isJson());
  });
}

void addDump(CLI::App& command) {
  const auto asked = addAsked(command);
  command.add_option("--key", asked->groups.prefix, "Only keys that begin so")->type_name("PREFIX");
  addDays(command, asked->days);
  command.callback([asked] {
    const auto store = openStore(asked->store);
    std::cout << FigureRows::kColumns;
    store->visitLines(asked->range(), asked->groups.prefix, [](const ExportedLine& line) {
      FigureRows rows({line.device, line.day, line.revision, line.build, line.model});
      for (const ReportedScalar& scalar : line.scalars) {
        rows.addScalar(scalar.key, scalar.value);
      }
      for (const ReportedDistribution& distribution : line.distributions) {
        const Statistics& values = distribution.values.statistics;
        rows.addDistribution(
            distribution.key,
            std::array{values.minimum, values.maximum, values.mean, values.deviations},
            values.count);
      }
      for (const ReportedDistribution& distribution : line.distributions) {
        if (distribution.values.histogram) {
          for (const auto& [label, count] : *distribution.values.histogram) {
            rows.addBucket(distribution.key, label, count);
          }
        }
      }
      std::cout << rows.text();
    });
  });
}

void addForget(CLI::App& command) {
  const auto asked = addAsked(command);
  command.add_option("DEVICE", asked->devices, "Devices, by their names")
      ->required()
      ->type_name("");
  command.callback([asked] {
    const Removal removal = openStore(asked->store, StoreUse::Change)->forget(asked->devices);
    if (isJson()) {
      Results({}, true).print({{"devices", asked->devices.size()}, {"lines", removal.lines}});
    } else {
      std::cout << removal.lines << " lines removed; further ones will be refused\n";
    }
  });
}

void addPrune(CLI::App& command) {
  const auto asked = addAsked(command);
  command.add_option("--days", asked->keptDays, "Days to keep before the newest")
      ->required()
      ->type_name("N")
      ->transform(decimal<std::int32_t>())
      ->check(CLI::Range(0, 100'000));
  command.callback([asked] {
    const Removal removal =
        openStore(asked->store, StoreUse::Change)->prune(asked->keptDays, today() + 1);
    if (isJson()) {
      Results({}, true).print(
          {{"lines", removal.lines}, {"firstDay", removal.firstDay.value_or(0)}});
    } else {
      std::cout << removal.lines << " lines removed; those before "
                << dateOfDay(removal.firstDay.value_or(0)) << " will be refused\n";
    }
  });
}

void addPage(CLI::App& command) {
  struct Wanted {
    std::string store;
    std::string file;
    std::string title;
  };
  const auto wanted = std::make_shared<Wanted>();
  addStore(command, wanted->store);
  command.add_option("FILE", wanted->file, "Where to write it, instead of standard output")
      ->type_name("");
  command.add_option("--title", wanted->title, "At the top, instead of the number of devices")
      ->type_name("TEXT");
  command.callback([wanted] {
    const auto store = openStore(wanted->store);
    writePage(wanted->file, fleetPage(*store, wanted->title));
  });
}

constexpr Command kCommands[] = {
    {"load", "Takes lines that vespctl export wrote", addLoad},
    {"keys", "Lists the keys, with their devices and days", addKeys},
    {"devices", "Tells how many devices have which day as their last", addDevices},
    {"scalar", "Summarizes a scalar over the devices, a line for each day",
     addQuestionCommand<printScalars>},
    {"distribution", "Merges a distribution of the devices, a line for each day",
     addQuestionCommand<printDistributions>},
    {"compare", "Tells which keys differ between two groups of devices", addCompare},
    {"dump", "Prints what is stored as CSV, for other programs", addDump, Form::Own},
    {"page", "Writes one HTML page of what the devices reported", addPage, Form::Own},
    {"forget", "Removes all that devices sent, and refuses more", addForget},
    {"prune", "Removes old days, and refuses them from then on", addPrune},
    {"completion", "Prints the completion script for a shell", addCompletionCommand, Form::Own},
};

}  // namespace
}  // namespace vesprun

int main(int argc, char** argv) {
  std::ios::sync_with_stdio(false);
  return vesprun::runProgram(
      {"vespfleet", "Keeps the daily logs of many devices and answers questions about them.",
       vesprun::kCommands},
      argc, argv);
}
