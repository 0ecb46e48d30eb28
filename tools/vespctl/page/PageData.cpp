#include "page/PageData.h"

#include <algorithm>
#include <charconv>
#include <sstream>
#include <utility>

#include "Command.h"
#include "common/Calendar.h"
#include "common/TextForm.h"
#include "page/Html.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

double dayOf(const Date& date) {
  return static_cast<double>(date.seconds) / static_cast<double>(kSecondsPerDay);
}

/// Hands on each line of a file that is a JSON object; how many are none.
template <typename Take>
std::size_t forEachObject(const std::string& file, Take take) {
  std::string error;
  bool missing = false;
  const std::optional<std::string> content = readWholeFile(file, error, &missing);
  if (!content && !missing) {
    throw CommandFailure(error);
  }
  std::size_t malformed = 0;
  std::istringstream lines(content.value_or(""));
  for (std::string line; std::getline(lines, line);) {
    std::optional<PropertyValue> value = valueFromJsonText(line, error);
    if (value && value->dict() != nullptr) {
      take(*value->dict());
    } else {
      ++malformed;
    }
  }
  return malformed;
}

/// The last text log's fields: the part after the head, "date time process: name:value;…".
PageData::StorageLog parseStorageLog(const std::string& name, const std::string& content) {
  constexpr std::string_view kDate = "Date: ";  // "2024-03-05 09:15:02 +0000"
  PageData::StorageLog log{name, std::nullopt, {}};
  std::istringstream lines(content);
  for (std::string line; std::getline(lines, line);) {
    constexpr std::size_t kDateLength = 10;
    constexpr std::size_t kTimeLength = 8;
    if (line.starts_with(kDate) && line.size() > kDate.size() + kDateLength + kTimeLength) {
      log.date = parseDateText(line.substr(kDate.size(), kDateLength) + 'T' +
                               line.substr(kDate.size() + kDateLength + 1, kTimeLength) + 'Z');
    }
    std::istringstream parts(line);
    for (std::string part; std::getline(parts, part, ';');) {
      const std::size_t colon = part.rfind(':');
      const std::size_t start = colon == std::string::npos ? colon : part.rfind(' ', colon);
      double value = 0;
      const char* const end = part.data() + part.size();
      if (colon != std::string::npos &&
          std::from_chars(part.data() + colon + 1, end, value).ptr == end) {
        log.fields[part.substr(start + 1, colon - start - 1)] = value;  // npos + 1 is 0
      }
    }
  }
  return log;
}

}  // namespace

PageData::PageData(const DeviceDirectory& directory) : submitted(readSubmittedLogs(directory)) {
  takeDays();
  takeLogs(directory);
  takeEvents(directory);
  takeRecords(directory);
}

void PageData::takeDays() {
  for (const SubmittedLog& log : submitted.logs) {
    days[log.day] = &log;
  }
  for (const auto& [day, log] : days) {
    for (const auto& [key, value] : *log->document.findDict("TBScalars")) {
      scalars[key].push_back({static_cast<double>(day), *value.number()});
    }
    const PropertyDict& histograms = *log->document.findDict("TBDistributionsHistogram");
    for (const auto& [key, value] : *log->document.findDict("TBDistributions")) {
      const PropertyArray& numbers = *value.array();
      const auto number = [&numbers](std::size_t i) { return numbers[i].number()->asDouble(); };
      distributions[key].push_back({day, number(0), number(1), number(2), number(3),
                                    *numbers[4].number(), histograms.findDict(key)});
    }
  }
}

void PageData::takeLogs(const DeviceDirectory& directory) {
  constexpr std::string_view kEnd = ".log";
  const std::string folder = directory.hostPath("outbox/logs");
  std::string error;
  const auto names = namesInFolder(folder, error);
  if (!names) {
    throw CommandFailure(error);
  }
  std::uint64_t newest = 0;
  for (const std::string& name : *names) {
    std::uint64_t number = 0;
    const char* const rest = std::from_chars(name.data(), name.data() + name.size(), number).ptr;
    std::string_view kind(rest, name.data() + name.size());
    if (rest == name.data() || !kind.starts_with('-') || !kind.ends_with(kEnd)) {
      continue;
    }
    kind.remove_prefix(1);
    kind.remove_suffix(kEnd.size());
    ++others["log " + std::string(kind)];
    if (!kind.starts_with("165-") || number < newest) {
      continue;
    }
    if (const auto content = readWholeFile(folder + '/' + name, error)) {
      storageLog = parseStorageLog(name, *content);
      newest = number;
    } else {
      unreadable.push_back({name, error, false});
    }
  }
}

void PageData::takeEvents(const DeviceDirectory& directory) {
  constexpr std::size_t kMostKept = 200;
  const std::size_t malformed =
      forEachObject(directory.hostPath("outbox/events.jsonl"), [this](PropertyDict& line) {
        const std::string* const text = line.findString("event");
        const std::string* const time = line.findString("time");
        const std::optional<Date> date = parseDateText(time != nullptr ? *time : "");
        const PropertyDict* const found = line.findDict("payload");
        PropertyDict payload = found != nullptr ? *found : PropertyDict();
        std::string name = text != nullptr ? *text : "";
        if (const PropertyValue* index = payload.find("msp_index")) {
          name += ", MSP " + textForm(*index);
        }
        auto& [count, newest] = events[name];
        ++count;
        newest.push_back({date ? dayOf(*date) : 0, std::move(payload)});
        if (newest.size() > 2 * kMostKept) {
          newest.erase(newest.begin(), newest.begin() + kMostKept);
        }
      });
  if (malformed > 0) {
    unreadable.push_back(
        {"events.jsonl", countedNoun(malformed, "line") + " cannot be read", true});
  }
}

void PageData::takeRecords(const DeviceDirectory& directory) {
  const std::size_t malformed =
      forEachObject(directory.hostPath("outbox/records.jsonl"), [this](const PropertyDict& line) {
        const PropertyValue* const type = line.find("type");
        ++others["record of type " + (type != nullptr ? textForm(*type) : "?")];
      });
  if (malformed > 0) {
    unreadable.push_back(
        {"records.jsonl", countedNoun(malformed, "line") + " cannot be read", true});
  }
}

}  // namespace vesprun
