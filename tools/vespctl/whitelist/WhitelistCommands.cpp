#include "whitelist/WhitelistCommands.h"

#include <chrono>
#include <iostream>

#include "access/CommandDevice.h"
#include "access/ReadOnlyDevice.h"
#include "commandline/Arguments.h"
#include "commandline/Results.h"
#include "report/ReportSources.h"
#include "whitelist/ChangesForms.h"
#include "whitelist/WhitelistCheck.h"
#include "whitelist/WhitelistInstallation.h"

namespace vesprun {
namespace {

/// A whitelist that the command line names, or the device's own.
struct Input {
  std::string name;
  std::string bytes;
  WhitelistDocument document;
  std::int32_t today;  ///< of the device where the file is its own, else of the machine
};

WhitelistDocument parse(const std::string& name, std::string_view bytes) {
  std::string error;
  std::optional<WhitelistDocument> document = WhitelistDocument::read(bytes, error);
  if (!document) {
    throw CommandFailure(name + ": " + error);
  }
  return *std::move(document);
}

Input readWhitelist(const std::string& file) {
  std::string bytes = readInput(file);
  const auto now = std::chrono::system_clock::now();
  const auto today = std::chrono::floor<std::chrono::days>(now).time_since_epoch().count();
  WhitelistDocument document = parse(inputName(file), bytes);
  return {inputName(file), std::move(bytes), std::move(document), static_cast<std::int32_t>(today)};
}

Input readOwnWhitelist() {
  const ReadOnlyDevice opened;
  const HostPath path = opened.device->directory().hostPath(TBConfig::path());
  std::string bytes = *orFail([&](std::string& error) { return readWholeFile(path, error); });
  WhitelistDocument document = parse(path, bytes);
  return {path, std::move(bytes), std::move(document), platform().tallybook().TBDaysSince1970()};
}

Input readWhitelistOrOwn(const std::string& file) {
  return file.empty() ? readOwnWhitelist() : readWhitelist(file);
}

struct CheckArguments {
  std::string file;
  std::vector<std::string> required;
  std::optional<GivenDay> today;
};

void printFindings(const CheckArguments& arguments) {
  const Input input = readWhitelistOrOwn(arguments.file);
  const std::int32_t today = arguments.today ? arguments.today->on(input.today) : input.today;
  const std::vector<WhitelistFinding> findings =
      checkWhitelist(input.document, today, arguments.required);
  if (invocation().json) {
    Json array = Json::array();
    for (const WhitelistFinding& finding : findings) {
      array.push_back({{"group", finding.group},
                       {"list", jsonOrNull(finding.list)},
                       {"key", jsonOrNull(finding.key)},
                       {"finding", finding.finding},
                       {"line", finding.line},
                       {"detail", finding.detail}});
    }
    printJson(array);
  } else if (findings.empty()) {
    printText(input.name + ": nothing is wrong");
  }
  for (const WhitelistFinding& finding : findings) {
    if (!invocation().json) {
      printText(placeOf(finding, input.name) + ": " + finding.detail, 4);
    }
  }
  invocation().status = findings.empty() ? 0 : 1;
}

void printEntries(const std::string& file) {
  const Input input = readWhitelistOrOwn(file);
  Table table({{"Line", Table::Align::Right},
               {"Group"},
               {"List"},
               {"Key"},
               {"Options"},
               {"Owner"},
               {"Reason"},
               {"Expires"}});
  const auto textOrNothing = [](const std::string* text) {
    return text != nullptr ? shortened(*text) : std::string();
  };
  const auto print = [&]<typename Options>(Options, const auto& group, const auto& list,
                                           const auto& entry) {
    const PropertyDict* written = entry.dict();
    const EntryMetadata metadata = EntryMetadata::read(written, aboutOf(*group.dict()));
    std::optional<ReadOptions> read;
    if (written != nullptr && Options::read(*written)) {
      read = readPart<Options>(*written);
    }
    if (invocation().json) {
      std::string json;
      const auto append = [&json](const char* name, const auto* value) {
        json.append(json.empty() ? "{\"" : ",\"").append(name).append("\":");
        if (value == nullptr) {
          json += "null";
        } else if constexpr (std::is_convertible_v<decltype(*value), PropertyValue>) {
          json += jsonText(PropertyValue(*value));
        } else {
          appendJsonText(*value, json);
        }
      };
      append("group", &group.name);
      append("list", &list.name);
      append("key", &entry.name);
      append("options", read ? &*read : nullptr);
      append("owner", metadata.owner);
      append("reason", metadata.reason);
      append("expires", metadata.expires);
      std::cout << json << ",\"line\":" << entry.line << "}\n";
      return;
    }
    constexpr bool kIsDistribution = std::is_same_v<Options, DistributionOptions>;
    table.addRow({std::to_string(entry.line), shortened(group.name), list.name,
                  shortened(entry.name),
                  read ? shortened(optionsText(*read, kIsDistribution)) : "cannot be read",
                  textOrNothing(metadata.owner), textOrNothing(metadata.reason),
                  metadata.expires != nullptr ? dateText(*metadata.expires) : std::string()});
  };
  for (const auto& group : input.document.groups()) {
    if (group.dict() == nullptr) {
      continue;
    }
    for (const auto& list : group.below) {
      for (const auto& entry : list.below) {
        if (list.dict() != nullptr && entry.value != nullptr) {
          withKindOfList(list.name, [&](auto kind) { print(kind, group, list, entry); });
        }
      }
    }
  }
  if (!invocation().json) {
    table.printOr("No entries.");
  }
}

/// What another whitelist would change on the installed device.
WhitelistChanges changesOnDevice(const Complaints& complaints, const std::string& name,
                                 std::string_view bytes) {
  const std::unique_ptr<TBConfig> after = TBConfig::fromBytes(bytes);
  if (!after) {
    parse(name, bytes);  // tells the line
    complaints.fail(name + ": is not a whitelist");
  }
  const std::unique_ptr<TBConfig> before = TBConfig::init();
  const std::vector<std::string_view> sources = ownScalarKeys();
  KeySet scalars(sources.begin(), sources.end());
  KeySet distributions;
  if (!forEachRow([&](bool isDistribution, std::string_view key) {
        (isDistribution ? distributions : scalars).emplace(key);
      })) {
    complaints.fail(kUnreadableCounters);
  }
  return compareOnDevice(before.get(), *after, scalars, distributions);
}

struct DiffArguments {
  std::vector<std::string> files;
  bool markdown = false;
  bool exitCode = false;
};

void printDifferences(const DiffArguments& arguments) {
  const auto differences = [&]() -> WhitelistChanges {
    if (arguments.files.size() == 2) {
      const Input before = readWhitelist(arguments.files[0]);
      return compareDocuments(before.document, readWhitelist(arguments.files[1]).document);
    }
    const std::string& file = arguments.files[0];
    const std::string bytes = readInput(file);
    const ReadOnlyDevice opened;
    WhitelistChanges changes = changesOnDevice(opened.complaints, inputName(file), bytes);
    opened.complaints.print();
    return changes;
  };
  const WhitelistChanges changes = differences();
  if (invocation().json) {
    std::cout << jsonText(changes) << '\n';
  } else if (arguments.markdown) {
    printChangesAsMarkdown(changes);
  } else {
    printChanges(changes);
  }
  constexpr int kStatusOfMore = 3;
  invocation().status = arguments.exitCode && changes.revealMore() ? kStatusOfMore : 0;
}

void install(const std::string& file, bool force) {
  const Input input = readWhitelist(file);
  const std::vector<WhitelistFinding> findings = checkWhitelist(input.document, input.today);
  const auto isGrave = [](const WhitelistFinding& finding) { return finding.isGrave(); };
  const auto first = std::ranges::find_if(findings, isGrave);
  if (first != findings.end() && !force) {
    const auto others = std::ranges::count_if(findings, isGrave) - 1;
    throw CommandFailure(
        "not installed, since keys would leave otherwise than their entries say: " +
        placeOf(*first, input.name) +
        (others == 0 ? "" : ", and " + std::to_string(others) + " more") +
        "; \"vespctl whitelist check\" tells what to do, --force installs it nevertheless");
  }
  const DeviceDirectory directory = openDirectory(Access::Changing);
  const WhitelistChanges changes = [&input] {
    const ReadOnlyDevice opened;
    return changesOnDevice(opened.complaints, input.name, input.bytes);
  }();
  std::string previous;
  orFail([&](std::string& error) {
    return installWhitelist(directory, input.bytes, previous, error);
  });
  if (invocation().json) {
    std::cout << jsonText(changes) << '\n';
    return;
  }
  printChanges(changes);
  std::cout << '\n';
  printText(previous.empty() ? "Installed."
                             : "Installed. To go back: vespctl -C \"" + directory.path() +
                                   "\" whitelist install \"" + previous + '"');
}

void addCheck(CLI::App& command) {
  const auto arguments = std::make_shared<CheckArguments>();
  command.add_option("FILE", arguments->file,
                     "The whitelist, instead of the device's own; - for standard input");
  command.add_option("--require", arguments->required, "What each entry must tell")
      ->type_name("owner,reason,expires")
      ->allow_extra_args(false)
      ->delimiter(',')
      ->check(CLI::IsMember({"owner", "reason", "expires"}).description(""));
  addDay(command, "--today", arguments->today, "The day to judge what expires by");
  command.callback([arguments] { printFindings(*arguments); });
}

void addList(CLI::App& command) {
  const auto file = std::make_shared<std::string>();
  command.add_option("FILE", *file,
                     "The whitelist, instead of the device's own; - for standard input");
  command.callback([file] { printEntries(*file); });
}

void addDiff(CLI::App& command) {
  const auto arguments = std::make_shared<DiffArguments>();
  command
      .add_option("FILE", arguments->files,
                  "The new whitelist, or the old and the new one; - for standard input")
      ->required()
      ->expected(1, 2);
  command.add_flag("--markdown", arguments->markdown, "Prints tables to paste into a review")
      ->excludes(command.get_option("--json"));
  command.add_flag("--exit-code", arguments->exitCode,
                   "Exit status 3 when anything more leaves, or not only coarser");
  command.callback([arguments] { printDifferences(*arguments); });
}

void addInstall(CLI::App& command) {
  struct InstallArguments {
    std::string file;
    bool force = false;
  };
  const auto arguments = std::make_shared<InstallArguments>();
  command.add_option("FILE", arguments->file, "The whitelist; - for standard input")->required();
  command.add_flag("--force", arguments->force, "Installs it in spite of what check finds");
  command.callback([arguments] { install(arguments->file, arguments->force); });
}

constexpr Command kWhitelistCommands[] = {
    {"check", "Tells what is wrong or useless in a whitelist; exit status 1 when there is anything",
     addCheck},
    {"list", "Lists the entries of a whitelist, who wants them, why and until when", addList},
    {"diff", "Tells what another whitelist would let out, keep back or round otherwise", addDiff},
    {"install", "Makes a file the device's whitelist, and keeps the one before", addInstall},
};

}  // namespace

void addWhitelistCommands(CLI::App& command) { addCommands(command, kWhitelistCommands); }

}  // namespace vesprun
