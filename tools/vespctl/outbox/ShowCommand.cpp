#include "outbox/ShowCommand.h"

#include <sys/stat.h>

#include <algorithm>
#include <deque>
#include <filesystem>
#include <iostream>
#include <sstream>
#include <utility>

#include "access/CommandDevice.h"
#include "access/Complaints.h"
#include "commandline/Arguments.h"
#include "commandline/Completion.h"
#include "common/Calendar.h"
#include "common/TextForm.h"
#include "outbox/DailyLogView.h"
#include "outbox/FirstReport.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/LogName.h"

namespace vesprun {
namespace {

std::string entryText(const PropertyDict& line, const char* key) {
  const PropertyValue* value = line.find(key);
  return value != nullptr ? printableText(textForm(*value)) : "";
}

/// What is wanted of the outbox.
struct Wanted {
  std::string kind;
  std::optional<GivenDay> sinceDay;
  std::optional<std::uint64_t> last;
  std::optional<Date> since;  ///< the start of that day
};

struct Line {
  std::size_t number;
  std::optional<PropertyDict> members;  ///< nothing for a line that cannot be read
};

bool isWanted(const PropertyDict* line, const Wanted& wanted) {
  const std::string* const time = line != nullptr ? line->findString("time") : nullptr;
  const std::optional<Date> date = parseDateText(time != nullptr ? *time : "");
  return !wanted.since || (date && *date >= *wanted.since);
}

/// Shows each line of the file; says which ones cannot be read.
template <typename Show>
void showLines(const DeviceDirectory& directory, const char* kind, const char* name,
               const Wanted& wanted, Show show) {
  const HostPath file = directory.hostPath(std::string("outbox/") + name);
  const auto showLine = [&](const Line& line) {
    if (!line.members) {
      const std::string fault = "line " + std::to_string(line.number) + " cannot be read";
      if (invocation().json) {
        complain(file.string() + ": " + fault);
      } else {
        std::cout << '(' << fault << ")\n";
      }
    } else if (invocation().json) {
      Json json{{"kind", kind}};
      json.update(Json(*line.members));
      printJson(json);
    } else {
      show(*line.members);
    }
  };
  std::deque<Line> last;
  std::size_t number = 0;
  forEachLine(file, [&](PropertyDict* members) {
    ++number;
    if (!isWanted(members, wanted)) {
      return;
    }
    last.push_back(
        {number, members != nullptr ? std::optional(std::move(*members)) : std::nullopt});
    if (!wanted.last) {
      showLine(last.front());
    }
    if (last.size() > wanted.last.value_or(0)) {
      last.pop_front();
    }
  });
  std::ranges::for_each(last, showLine);
}

void showEvents(const DeviceDirectory& directory, const Wanted& wanted) {
  const bool inFull = !wanted.kind.empty();
  showLines(directory, "event", "events.jsonl", wanted, [inFull](const PropertyDict& event) {
    const PropertyDict* fields = event.findDict("payload");
    std::cout << entryText(event, "time") << "  " << entryText(event, "event") << "  "
              << (fields != nullptr ? fields->size() : 0) << " fields\n";
    if (inFull && fields != nullptr) {
      for (const auto& [key, value] : *fields) {
        std::cout << "    " << printableText(key + " = " + textForm(value)) << '\n';
      }
    }
  });
}

/// The text form of a record, possibly cut short.
std::string recordText(const PropertyDict& record, bool inFull) {
  constexpr std::size_t kShownEntries = 8;
  if (inFull || record.size() <= kShownEntries) {
    return textForm(record);
  }
  PropertyDict first;
  for (auto entry = record.begin(); first.size() < kShownEntries; ++entry) {
    first.set(entry->first, entry->second);
  }
  return textForm(first) + " and " + std::to_string(record.size() - kShownEntries) + " more";
}

void showRecords(const DeviceDirectory& directory, const Wanted& wanted) {
  const bool inFull = !wanted.kind.empty();
  showLines(directory, "record", "records.jsonl", wanted, [inFull](const PropertyDict& line) {
    const PropertyDict* record = line.findDict("record");
    std::cout << entryText(line, "time") << "  type " << entryText(line, "type") << "  "
              << (record != nullptr ? printableText(recordText(*record, inFull)) : "") << '\n';
  });
}

void showNotifications(const DeviceDirectory& directory, const Wanted& wanted) {
  showLines(directory, "notification", "notifications.jsonl", wanted, [](const PropertyDict& line) {
    std::cout << entryText(line, "time") << "  " << entryText(line, "name") << '\n';
  });
}

void showSystemLog(const DeviceDirectory& directory, const Wanted& wanted) {
  showLines(directory, "message", "log.jsonl", wanted, [](const PropertyDict& line) {
    const PropertyValue* value = line.find("message");
    std::string message = value != nullptr ? textForm(*value) : "";
    message.erase(message.find_last_not_of('\n') + 1);  // some messages end their own line
    std::cout << entryText(line, "time") << "  " << entryText(line, "level") << "  "
              << printableText(message) << '\n';
  });
}

/// A text log; fields parted by semicolons get a line each.
void showText(const std::string& content, bool inFull) {
  constexpr std::size_t kShownFields = 24;
  std::vector<std::string> fields;
  std::istringstream lines(content);
  for (std::string line; std::getline(lines, line);) {
    std::istringstream parts(line);
    const char* indentation = "  ";
    for (std::string part; std::getline(parts, part, ';');) {
      fields.push_back(std::exchange(indentation, "    ") + printableText(part));
    }
  }
  const std::size_t shown = inFull ? fields.size() : std::min(fields.size(), kShownFields);
  for (std::size_t i = 0; i < shown; ++i) {
    std::cout << fields[i] << '\n';
  }
  if (shown < fields.size()) {
    std::cout << "    … " << fields.size() - shown << " more; vespctl show logs has all\n";
  }
}

HostPath headerOf(const HostPath& log) {
  return log.folder().below(
      std::filesystem::path(log.name()).replace_extension(".header.json").string());
}

void showLog(const HostPath& path, bool inFull) {
  const std::filesystem::path file = path.name();
  std::cout << printableText(path.name()) << '\n';
  const auto content = orFail([&](std::string& error) { return readWholeFile(path, error); });
  std::string error;
  if (const std::optional<std::string> text = readWholeFile(headerOf(path), error)) {
    const std::optional<PropertyValue> value = valueFromJsonText(*text, error);
    std::cout << "  header     " << printableText(value ? textForm(*value) : error) << '\n';
  }
  if (file.extension() != ".ptree") {
    showText(*content, inFull);
    return;
  }
  const std::optional<PropertyValue> log = readPtree(*content, error);
  if (log && log->dict() != nullptr) {
    showDailyLog(std::cout, *log->dict());
  } else {
    std::cout << "  cannot be read: " << printableText(log ? "not a dictionary" : error) << '\n';
  }
}

void printLog(const HostPath& path) {
  const std::filesystem::path file = path.name();
  Json header;
  Json document;
  Json text;
  std::string error;
  if (const auto content = readWholeFile(headerOf(path), error)) {
    header = jsonOrNull(valueFromJsonText(*content, error));
  }
  const auto content = orFail([&](std::string& why) { return readWholeFile(path, why); });
  if (file.extension() == ".ptree") {
    const std::optional<PropertyValue> log = readPtree(*content, error);
    document = jsonOrNull(log);
    if (!log) {
      complain(path.name() + ": " + error);
    }
  } else {
    text = *content;
  }
  printJson({{"kind", "log"},
             {"name", path.name()},
             {"header", std::move(header)},
             {"document", std::move(document)},
             {"text", std::move(text)}});
}

constexpr struct stat kNoFile {};

/// By number.
std::vector<HostPath> submittedFiles(const DeviceDirectory& directory, const Wanted& wanted) {
  std::vector<std::pair<std::uint64_t, HostPath>> numbered;
  for (const std::string& name : namesOfLogs(directory)) {
    const std::filesystem::path file = name;
    const HostPath path = directory.hostPath("outbox/logs/" + name);
    if (name.front() != '.' && (file.extension() == ".ptree" || file.extension() == ".log") &&
        (!wanted.since ||
         path.status().value_or(kNoFile).st_mtim.tv_sec >= wanted.since->seconds)) {
      numbered.emplace_back(logNumber(name).value_or(0), path);
    }
  }
  std::ranges::stable_sort(numbered, {}, [](const auto& log) { return log.first; });
  if (wanted.last && *wanted.last < numbered.size()) {
    numbered.erase(numbered.begin(), numbered.end() - static_cast<std::ptrdiff_t>(*wanted.last));
  }
  std::vector<HostPath> files;
  for (auto& [number, file] : numbered) {
    files.push_back(std::move(file));
  }
  return files;
}

void showLogs(const DeviceDirectory& directory, const Wanted& wanted) {
  for (const HostPath& file : submittedFiles(directory, wanted)) {
    if (invocation().json) {
      printLog(file);
    } else {
      showLog(file, !wanted.kind.empty());
    }
  }
}

struct Kind {
  const char* name;
  const char* title;
  void (*show)(const DeviceDirectory& directory, const Wanted& wanted);
};

constexpr Kind kKinds[] = {
    {"log", "system log", showSystemLog}, {"notifications", "notifications", showNotifications},
    {"events", "events", showEvents},     {"records", "structured records", showRecords},
    {"logs", "submitted logs", showLogs},
};

void show(Wanted wanted) {
  const auto* const known = std::ranges::find(kKinds, wanted.kind, &Kind::name);
  if (!wanted.kind.empty() && known == std::end(kKinds)) {
    throw CLI::ValidationError("unknown kind " + quotedText(wanted.kind) +
                               "; one of logs, events, records, notifications, log");
  }
  Complaints complaints;
  const auto device = openDeviceReadOnly(complaints);
  if (wanted.sinceDay) {
    wanted.since = startOfDay(wanted.sinceDay->on(device->tallybook().TBDaysSince1970()));
  }
  std::optional<WrappedOutput> wrapped;
  if (!invocation().json) {
    wrapped.emplace();
  }
  for (const Kind& kind : kKinds) {
    if (wanted.kind.empty() && !invocation().json) {
      std::cout << emphasized(std::string("\n== ") + kind.title) << '\n';
    }
    if (wanted.kind.empty() || &kind == known) {
      kind.show(device->directory(), wanted);
    }
  }
  if ((wanted.kind.empty() || wanted.kind == "logs") && !invocation().json) {
    if (const std::string note = whenFirstReport(*device); !note.empty()) {
      printText(note);
    }
  }
}

}  // namespace

void addShowCommand(CLI::App& command) {
  const auto wanted = std::make_shared<Wanted>();
  CLI::Option* const kind =
      command.add_option("KIND", wanted->kind,
                         "One kind in full: logs, events, records, notifications, or log (the "
                         "system's)");
  completeWith(kind, [] {
    std::vector<std::string> names;
    for (const Kind& known : kKinds) {
      names.emplace_back(known.name);
    }
    return names;
  });
  command.add_option("--last", wanted->last, "The newest N of each kind")
      ->type_name("N")
      ->transform(decimal<std::uint64_t>());
  addDay(command, "--since", wanted->sinceDay, "From the start of that day on");
  command.callback([wanted] { show(*wanted); });
}

}  // namespace vesprun
