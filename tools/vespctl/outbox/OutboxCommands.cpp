#include <algorithm>
#include <filesystem>
#include <iostream>
#include <sstream>
#include <utility>

#include "Command.h"
#include "common/TextForm.h"
#include "outbox/DailyLogView.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

std::string entryText(const PropertyDict& line, const char* key) {
  const PropertyValue* value = line.find(key);
  return value != nullptr ? printableText(textForm(*value)) : "";
}

/// Shows each line of the file; says which ones cannot be read.
template <typename Show>
void showLines(const HostPath& file, Show show) {
  int number = 0;
  forEachLine(contentIfThere(file), [&](const PropertyDict* line) {
    ++number;
    if (line != nullptr) {
      show(*line);
    } else {
      std::cout << "(line " << number << " cannot be read)\n";
    }
  });
}

void showEvents(const DeviceDirectory& directory, bool inFull) {
  showLines(directory.hostPath(kEventsFile), [inFull](const PropertyDict& event) {
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

void showRecords(const DeviceDirectory& directory, bool inFull) {
  showLines(directory.hostPath(kRecordsFile), [inFull](const PropertyDict& line) {
    const PropertyDict* record = line.findDict("record");
    std::cout << entryText(line, "time") << "  type " << entryText(line, "type") << "  "
              << (record != nullptr ? printableText(recordText(*record, inFull)) : "") << '\n';
  });
}

void showNotifications(const DeviceDirectory& directory) {
  showLines(directory.hostPath(kNotificationsFile), [](const PropertyDict& line) {
    std::cout << entryText(line, "time") << "  " << entryText(line, "name") << '\n';
  });
}

void showSystemLog(const DeviceDirectory& directory) {
  showLines(directory.hostPath(kSystemLogFile), [](const PropertyDict& line) {
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
    std::cout << "    … " << fields.size() - shown << " more; vespctl show DIR logs has all\n";
  }
}

void showLog(const HostPath& path, bool inFull) {
  const std::filesystem::path file = path.name();
  std::cout << printableText(path.name()) << '\n';
  const auto content = orFail([&](std::string& error) { return readWholeFile(path, error); });
  const HostPath header =
      path.folder().below(std::filesystem::path(file).replace_extension(".header.json").string());
  std::string error;
  if (const std::optional<std::string> text = readWholeFile(header, error)) {
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

void showLogs(const DeviceDirectory& directory, bool inFull) {
  for (const std::string& name : namesOfLogs(directory)) {
    if (name.front() != '.' && (name.ends_with(".ptree") || name.ends_with(".log"))) {
      showLog(directory.hostPath(kLogFolder).below(name), inFull);
    }
  }
}

void showTitle(const char* title) { std::cout << "\n== " << title << '\n'; }

void showAll(const DeviceDirectory& directory) {
  showTitle("system log");
  showSystemLog(directory);
  showTitle("notifications");
  showNotifications(directory);
  showTitle("events");
  showEvents(directory, false);
  showTitle("structured records");
  showRecords(directory, false);
  showTitle("submitted logs");
  showLogs(directory, false);
}

}  // namespace

void addOutboxCommands(CLI::App& vespctl) {
  const auto path = std::make_shared<std::string>();
  CLI::App* show =
      addDeviceCommand(vespctl, "show", "Shows what the runs left in the outbox", *path);
  show->callback([show, path] {
    if (show->get_subcommands().empty()) {
      showAll(openDirectory(*path));
    }
  });
  const auto addPart = [&](const char* name, const char* description, auto showPart) {
    show->add_subcommand(name, description)->callback([path, showPart] {
      showPart(openDirectory(*path));
    });
  };
  addPart("logs", "The submitted logs alone, in full",
          [](const DeviceDirectory& device) { showLogs(device, true); });
  addPart("events", "The analytics events alone, with their payloads",
          [](const DeviceDirectory& device) { showEvents(device, true); });
  addPart("records", "The structured records alone, in full",
          [](const DeviceDirectory& device) { showRecords(device, true); });
  addPart("notifications", "The posted notifications alone", showNotifications);
  addPart("log", "The system log alone", showSystemLog);
  allowOneCommand(*show, false);
}

}  // namespace vesprun
