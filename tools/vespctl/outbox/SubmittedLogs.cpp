#include "outbox/SubmittedLogs.h"

#include <algorithm>
#include <charconv>
#include <filesystem>
#include <map>
#include <optional>
#include <sstream>
#include <system_error>

#include "Command.h"
#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/files/WholeFile.h"

namespace vesprun {
namespace {

constexpr std::string_view kNameAfterNumber = "-193-log-aggregated.ptree";

std::optional<std::uint64_t> numberOf(std::string_view name) {
  std::uint64_t number = 0;
  const auto [end, error] = std::from_chars(name.data(), name.data() + name.size(), number);
  const std::string_view rest = name.substr(static_cast<std::size_t>(end - name.data()));
  return error == std::errc() && end - name.data() >= 4 && rest == kNameAfterNumber
             ? std::optional(number)
             : std::nullopt;
}

const char* faultOfDistribution(const PropertyValue& value) {
  const PropertyArray* numbers = value.array();
  const bool sound = numbers != nullptr && numbers->size() == 5 &&
                     std::all_of(numbers->begin(), numbers->end(),
                                 [](const PropertyValue& number) { return number.number(); }) &&
                     !numbers->back().number()->isFloatingPoint();
  return sound ? nullptr : "a distribution that is not five numbers";
}

bool isInteger(const PropertyValue& value) {
  return value.number() != nullptr && !value.number()->isFloatingPoint();
}

/// Null for a sound daily log.
const char* faultOf(const PropertyDict& log) {
  if (log.findDate("TBStartDate") == nullptr || log.findDate("TBLogCreationDate") == nullptr) {
    return "a date is missing";
  }
  if (log.findString("TBWhitelistDigest") == nullptr) {
    return "the whitelist digest is missing";
  }
  const PropertyDict* const scalars = log.findDict("TBScalars");
  const PropertyDict* const distributions = log.findDict("TBDistributions");
  const PropertyDict* const histograms = log.findDict("TBDistributionsHistogram");
  if (scalars == nullptr || distributions == nullptr || histograms == nullptr) {
    return "its scalars, distributions or histograms are missing";
  }
  for (const auto& [key, value] : *scalars) {
    if (!isInteger(value)) {
      return "a scalar that is no integer";
    }
  }
  for (const auto& [key, value] : *distributions) {
    if (const char* fault = faultOfDistribution(value)) {
      return fault;
    }
  }
  for (const auto& [key, value] : *histograms) {
    const PropertyDict* counts = value.dict();
    if (counts == nullptr || !std::all_of(counts->begin(), counts->end(), [](const auto& entry) {
          return isInteger(entry.second);
        })) {
      return "a histogram that is no dictionary of counts";
    }
  }
  return nullptr;
}

/// The highest revision of each day among pruned logs.
std::map<std::int32_t, std::int64_t> prunedRevisions(const DeviceDirectory& directory) {
  std::map<std::int32_t, std::int64_t> revisions;
  std::string error;
  bool missing = false;
  const auto content = readWholeFile(directory.hostPath("outbox/pruned.jsonl"), error, &missing);
  if (!content && !missing) {
    throw CommandFailure(error);
  }
  std::istringstream lines(content.value_or(""));
  for (std::string line; std::getline(lines, line);) {
    const auto value = valueFromJsonText(line, error);
    const PropertyDict* entries = value ? value->dict() : nullptr;
    const PropertyValue* day = entries != nullptr ? entries->find("day") : nullptr;
    const PropertyValue* revision = entries != nullptr ? entries->find("revision") : nullptr;
    if (day != nullptr && isInteger(*day) && revision != nullptr && isInteger(*revision)) {
      std::int64_t& highest = revisions[day->number()->asInt32()];
      highest = std::max(highest, revision->number()->asInt64());
    }
  }
  return revisions;
}

}  // namespace

SubmittedLogs readSubmittedLogs(const DeviceDirectory& directory) {
  const std::filesystem::path folder = directory.hostPath("outbox/logs");
  std::map<std::pair<std::uint64_t, std::string>, std::filesystem::path> files;
  std::error_code error;
  for (std::filesystem::directory_iterator entry(folder, error), end; !error && entry != end;
       entry.increment(error)) {
    const std::string name = entry->path().filename().string();
    if (const auto number = numberOf(name)) {
      files.emplace(std::pair(*number, name), entry->path());
    }
  }
  if (error && error != std::errc::no_such_file_or_directory) {
    throw CommandFailure(folder.string() + ": " + error.message());
  }
  std::map<std::int32_t, std::int64_t> revisions = prunedRevisions(directory);
  SubmittedLogs found;
  for (const auto& [order, file] : files) {
    std::string why;
    const auto content = readWholeFile(file.string(), why);
    std::optional<PropertyValue> document = content ? readPtree(*content, why) : std::nullopt;
    PropertyDict* const log = document ? document->dict() : nullptr;
    if (document) {
      const char* const fault = log != nullptr ? faultOf(*log) : "not a dictionary";
      why = fault != nullptr ? fault : "";
    }
    if (!why.empty()) {
      found.unreadable.push_back({order.second, why});
      continue;
    }
    const std::int32_t day = daysSince1970(*log->find("TBStartDate")->date());
    found.logs.push_back({order.second, day, ++revisions[day], std::move(*log)});
  }
  return found;
}

}  // namespace vesprun
