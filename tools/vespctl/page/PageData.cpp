#include "page/PageData.h"

#include <charconv>
#include <sstream>
#include <utility>

#include "access/CommandDevice.h"
#include "common/Calendar.h"
#include "common/TextForm.h"
#include "page/Quantity.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/LogName.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

double dayOf(const Date& date) {
  return static_cast<double>(date.seconds) / static_cast<double>(kSecondsPerDay);
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

void PageData::takeDays() {
  for (const SubmittedLog& log : submitted) {
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

void PageData::takeSystems(const DeviceDirectory& directory) {
  if (const auto boot = scalars.find("linux.time.boots"); boot != scalars.end()) {
    for (const Value& value : boot->second) {
      if (value.value.asInt64() > 0) {
        boots.push_back(static_cast<std::int32_t>(value.day));
      }
    }
  }
  const auto notes =
      orFail([&](std::string& error) { return readSubmittedNotes(directory, error); });
  for (const auto& [day, log] : days) {
    const auto noted = notes->find(log->name);
    if (noted == notes->end() || !noted->second.build) {
      continue;
    }
    const std::string model = noted->second.model.value_or("");
    if (systems.empty() || systems.back().build != *noted->second.build ||
        systems.back().model != model) {
      systems.push_back({day, day, *noted->second.build, model});
    }
    systems.back().lastDay = day;
  }
}

void PageData::takeError(const PropertyDict& line) {
  constexpr std::size_t kMaxKept = 20;
  const std::string* const level = line.findString("level");
  const std::string* const message = line.findString("message");
  const std::string* const time = line.findString("time");
  if (level == nullptr || *level != "error" || message == nullptr) {
    return;
  }
  ++errors.count;
  errors.newest.push_back((time != nullptr ? *time + " " : "") + *message);
  if (errors.newest.size() > kMaxKept) {
    errors.newest.erase(errors.newest.begin());
  }
}

void PageData::takeLogs(const DeviceDirectory& directory) {
  std::uint64_t newest = 0;
  for (const std::string& name : namesOfLogs(directory)) {
    const std::optional<LogName> log = LogName::parse(name);
    if (!log || log->end != LogName::End::Text) {
      continue;
    }
    const std::string_view kind = log->kind();
    ++others["log " + std::string(kind)];
    if (!kind.starts_with("165-") || log->number < newest) {
      continue;
    }
    std::string error;
    if (const auto content = readWholeFile(directory.hostPath(kLogFolder).below(name), error)) {
      storageLog = parseStorageLog(name, *content);
      newest = log->number;
    } else {
      unreadable.push_back({name, error, false});
    }
  }
}

template <typename Take>
void PageData::takeLines(const DeviceDirectory& directory, std::string_view file, Take take) {
  std::size_t malformed = 0;
  forEachLine(directory.hostPath(file), [&](const PropertyDict* line) {
    if (line != nullptr) {
      take(*line);
    } else {
      ++malformed;
    }
  });
  if (malformed > 0) {
    unreadable.push_back({HostPath(std::string(file)).name(),
                          countedNoun(malformed, "line") + " cannot be read", true});
  }
}

void PageData::takeEvent(const PropertyDict& line) {
  constexpr std::size_t kMaxKept = 200;
  const std::string* const text = line.findString("event");
  const std::string* const time = line.findString("time");
  const std::optional<Date> date = parseDateText(time != nullptr ? *time : "");
  const PropertyDict* const payload = line.findDict("payload");
  Event event{date ? dayOf(*date) : 0, payload != nullptr ? *payload : PropertyDict()};
  std::string name = text != nullptr ? *text : "";
  if (const PropertyValue* index = event.payload.find("msp_index")) {
    name += ", MSP " + textForm(*index);
  }
  auto& [count, newest] = events[name];
  ++count;
  newest.push_back(std::move(event));
  if (newest.size() > 2 * kMaxKept) {
    newest.erase(newest.begin(), newest.begin() + kMaxKept);
  }
}

void PageData::takeRecord(const PropertyDict& line) {
  const PropertyValue* const type = line.find("type");
  ++others["record of type " + (type != nullptr ? textForm(*type) : "?")];
}

PageData::PageData(const DeviceDirectory& directory) {
  unreadable = forEachSubmittedLog(
      directory, [this](SubmittedLog&& log) { submitted.push_back(std::move(log)); });
  takeDays();
  takeSystems(directory);
  takeLogs(directory);
  takeLines(directory, kSystemLogFile, [this](const PropertyDict& line) { takeError(line); });
  takeLines(directory, kEventsFile, [this](const PropertyDict& line) { takeEvent(line); });
  takeLines(directory, kRecordsFile, [this](const PropertyDict& line) { takeRecord(line); });
}

}  // namespace vesprun
