#include "platform/host/outbox/DailyLogs.h"

#include <algorithm>
#include <map>
#include <optional>
#include <set>

#include "common/Calendar.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/LogName.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

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

/// The notes of pruned logs by number, and the highest revision of each day among those passed.
class Revisions {
 public:
  explicit Revisions(const DeviceDirectory& directory) : _directory(directory) {}

  /// Call again when a log has gone since its folder was read: its note was written before that.
  bool readNotes(std::string& error) {
    std::optional<std::vector<LogNote>> notes = readLogNotes(_directory, kPrunedFile, error);
    _notes = std::move(notes).value_or(std::vector<LogNote>());
    std::ranges::stable_sort(_notes, {}, &LogNote::number);
    _next = 0;
    return notes.has_value();
  }

  /// Sets the revision of the next log by number. A log that was noted as removed, and was not,
  /// keeps the noted one.
  void set(DailyLog& log, std::uint64_t number) {
    for (; _next < _notes.size() && _notes[_next].number < number; ++_next) {
      count(_notes[_next]);
    }
    for (std::size_t i = _next; i < _notes.size() && _notes[i].number == number; ++i) {
      if (_notes[i].name == log.name && _notes[i].day == log.day) {
        log.isNoted = true;
        count(_notes[i]);
        log.revision = _notes[i].revision;
        return;
      }
    }
    log.revision = ++_highest[log.day];
  }

 private:
  void count(const LogNote& note) {
    std::int64_t& highest = _highest[note.day];
    highest = std::max(highest, note.revision);
  }

  const DeviceDirectory& _directory;
  std::vector<LogNote> _notes;
  std::size_t _next = 0;
  std::map<std::int32_t, std::int64_t> _highest;
};

}  // namespace

bool isDailyLogName(std::string_view name) {
  const std::optional<LogName> log = LogName::parse(name);
  return log && log->isDailyLog();
}

std::optional<std::vector<UnreadableLog>> forEachDailyLog(
    const DeviceDirectory& directory, const std::function<void(DailyLog&& log)>& take,
    std::string& error) {
  const auto names = namesInFolder(directory.hostPath(kLogFolder), error);
  Revisions revisions(directory);
  if (!names || !revisions.readNotes(error)) {
    return std::nullopt;
  }
  std::set<std::pair<std::uint64_t, std::string>> files;
  for (const std::string& name : *names) {
    if (isDailyLogName(name)) {
      files.emplace(*logNumber(name), name);
    }
  }
  std::vector<UnreadableLog> unreadable;
  for (const auto& [number, name] : files) {
    std::string why;
    bool missing = false;
    const auto content = readWholeFile(directory.hostPath(kLogFolder).below(name), why, &missing);
    if (missing) {
      if (!revisions.readNotes(error)) {
        return std::nullopt;
      }
      continue;
    }
    std::optional<PropertyValue> document = content ? readPtree(*content, why) : std::nullopt;
    PropertyDict* const entries = document ? document->dict() : nullptr;
    if (document) {
      const char* const fault = entries != nullptr ? faultOf(*entries) : "not a dictionary";
      why = fault != nullptr ? fault : "";
    }
    if (!why.empty()) {
      unreadable.push_back({name, why, content.has_value()});
      continue;
    }
    DailyLog log;
    log.name = name;
    log.day = daysSince1970(*entries->find("TBStartDate")->date());
    revisions.set(log, number);
    log.document = std::move(*entries);
    take(std::move(log));
  }
  return unreadable;
}

}  // namespace vesprun
