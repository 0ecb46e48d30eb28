#include "platform/host/outbox/LogPruning.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <utility>

#include "common/Calendar.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/JsonLines.h"
#include "platform/host/outbox/DailyLogs.h"
#include "platform/host/outbox/LogName.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/LogNumbers.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

constexpr std::array kLineFiles{kRecordsFile, kEventsFile, kNotificationsFile, kSystemLogFile};

// About the size of a note on a removed log.
constexpr std::uint64_t kNoteBytes = 120;

/// True for a line that was written before `time`. One without a time stays.
bool isOlder(std::string_view text, const Date& time) {
  static constexpr std::string_view kBegin = "{\"time\":\"";
  if (text.starts_with(kBegin)) {  // as our lines do; most are not old and need no parsing
    const std::string_view rest = text.substr(kBegin.size());
    const std::optional<Date> date = parseDateText(rest.substr(0, rest.find('"')));
    if (date && *date >= time) {
      return false;
    }
  }
  std::string malformed;
  const std::optional<PropertyValue> line = valueFromJsonText(text, malformed);
  const PropertyDict* fields = line ? line->dict() : nullptr;
  const std::string* written = fields != nullptr ? fields->findString("time") : nullptr;
  const std::optional<Date> date = written != nullptr ? parseDateText(*written) : std::nullopt;
  return date && *date < time;
}

std::uint64_t bytesOfFiles(const HostPath& folder, bool isTop = true) {
  std::string ignored;
  std::uint64_t bytes = 0;
  for (const std::string& name :
       namesInFolder(folder, ignored).value_or(std::vector<std::string>())) {
    const HostPath path = folder.below(name);
    const std::optional<struct stat> status = path.status();
    if (status && S_ISREG(status->st_mode)) {
      bytes += static_cast<std::uint64_t>(status->st_size);
    } else if (status && S_ISDIR(status->st_mode) && isTop) {
      bytes += bytesOfFiles(path, false);
    }
  }
  return bytes;
}

}  // namespace

/// A log with its header; or a header whose log is gone, from a command that was killed.
struct LogPruning::Log {
  std::vector<std::string> files;  ///< the header last
  std::uint64_t bytes = 0;
  Date written;  ///< of the header only when the log is missing
};

/// By number.
std::vector<LogPruning::Log> LogPruning::readFolder() {
  const HostPath folder = _directory.hostPath(kLogFolder);
  std::string error;
  if (folder.status() && !_lock) {
    _lock = lockFolder(folder, error);
  }
  const std::optional<std::vector<std::string>> names =
      error.empty() ? namesInFolder(folder, error) : std::nullopt;
  if (!names) {
    _problems.push_back(error);
    return {};
  }
  std::map<std::pair<std::uint64_t, std::string>, Log> logs;
  for (const std::string& name : *names) {
    const std::optional<LogName> parsed = LogName::parse(name);
    const std::optional<struct stat> status = folder.below(name).status();
    if (!parsed || !status || !S_ISREG(status->st_mode) || _gone.contains(name)) {
      continue;
    }
    Log& log = logs[{parsed->number, parsed->base}];
    const bool isHeader = parsed->end == LogName::End::Header;
    if (log.files.empty() || !isHeader) {
      log.written = {status->st_mtim.tv_sec, static_cast<std::uint32_t>(status->st_mtim.tv_nsec)};
    }
    log.files.insert(isHeader ? log.files.end() : log.files.begin(), name);
    log.bytes += static_cast<std::uint64_t>(status->st_size);
  }
  std::vector<Log> sorted;
  sorted.reserve(logs.size());
  for (auto& [order, log] : logs) {
    sorted.push_back(std::move(log));
  }
  return sorted;
}

std::uint64_t LogPruning::bytesLeft() const {
  const std::uint64_t bytes = bytesOfFiles(_directory.hostPath(kOutbox));
  return bytes - std::min(bytes, _bytesGone);
}

template <typename IsOld>
void LogPruning::removeLines(std::string_view file, const IsOld& isOld, std::uint64_t maxBytes) {
  std::string error;
  const HostPath path = _directory.hostPath(file);
  JsonLines lines(path);
  std::optional<std::uint64_t> removed;
  if (_directory.isReadOnly()) {
    std::uint64_t bytes = 0;
    removed = lines.countRemoved(isOld, bytes, error, maxBytes);
    _bytesGone += bytes;
  } else {
    removed = lines.remove(isOld, error, maxBytes);
  }
  if (!removed) {
    _problems.push_back(error);
  } else if (*removed != 0) {
    _removedLines[path.name()] += *removed;
  }
}

void LogPruning::removeBefore(const Date& time) {
  std::vector<Log> logs = readFolder();
  std::erase_if(logs, [&time](const Log& log) { return log.written >= time; });
  remove(logs);
  for (const std::string_view file : kLineFiles) {
    removeLines(
        file, [&time](std::string_view line) { return isOlder(line, time); }, kMaxLinesFile);
  }
}

void LogPruning::removeUntilBelow(std::uint64_t bytes) {
  std::uint64_t ofLines = 0;
  for (const std::string_view file : kLineFiles) {
    const std::optional<struct stat> status = _directory.hostPath(file).status();
    ofLines += status ? static_cast<std::uint64_t>(status->st_size) : 0;
  }
  if (bytes != 0 && ofLines - std::min(ofLines, _bytesGone) >= bytes) {
    for (const std::string_view file : kLineFiles) {
      removeLines(
          file, [](std::string_view) { return false; }, bytes / 8);
    }
  }
  std::size_t before = 0;
  do {  // again, since the notes of what was removed take room too
    before = _removed.size();
    std::uint64_t left = bytesLeft();
    std::vector<Log> logs = readFolder();
    auto end = logs.begin();
    for (; end != logs.end() && left >= bytes; ++end) {
      left -= std::min(left, end->bytes);
    }
    logs.erase(end, logs.end());
    remove(logs);
  } while (_removed.size() != before);
}

void LogPruning::tidy() {
  std::string error;
  if (_directory.isReadOnly()) {
    return;
  }
  removeLeftOvers(_directory.hostPath(kLogFolder));
  readFolder();  // for its lock
  if (!removeStaleNotes(_directory, error)) {
    _problems.push_back(error);
  }
}

void LogPruning::remove(const std::vector<Log>& logs) {
  if (logs.empty()) {
    return;
  }
  std::string error;
  const LogNumbers numbers(_directory);
  const std::optional<std::uint64_t> newest = numbers.newest(error);
  if (!newest || (!_directory.isReadOnly() && !numbers.remember(*newest, true, error))) {
    _problems.push_back(error);
    return;
  }
  for (const Log* const log : noteDailyLogs(logs).value_or(std::vector<const Log*>())) {
    removeFiles(*log);
  }
  if (!_directory.isReadOnly()) {
    numbers.remember(*newest, false, error);
  }
  std::ranges::stable_sort(_removed, {}, [](const std::string& name) { return *logNumber(name); });
}

/// Removes the logs that need no note, which makes room for notes on a full disk, and returns the
/// others once their notes are durable.
std::optional<std::vector<const LogPruning::Log*>> LogPruning::noteDailyLogs(
    const std::vector<Log>& logs) {
  std::vector<const Log*> named;
  for (const Log& log : logs) {
    if (isDailyLogName(log.files.front())) {
      named.push_back(&log);
    } else {
      removeFiles(log);
    }
  }
  if (named.empty()) {
    return std::nullopt;
  }
  std::string error;
  std::map<std::string, DailyLog> daily;
  const auto unreadable = forEachDailyLog(
      _directory,
      [&](DailyLog&& log) {
        _step();
        log.document = {};
        daily.emplace(log.name, std::move(log));
      },
      error);
  if (!unreadable) {
    _problems.push_back(error);
    return std::nullopt;
  }
  std::vector<const Log*> due;
  std::vector<LogNote> notes;
  for (const Log* const log : named) {
    const std::string& name = log->files.front();
    const auto fault = std::ranges::find(*unreadable, name, &UnreadableLog::name);
    if (const auto found = daily.find(name); found != daily.end()) {
      due.push_back(log);
      if (!found->second.isNoted) {
        notes.push_back({name, 0, found->second.day, found->second.revision});
      }
    } else if (fault == unreadable->end() || fault->wasRead) {
      removeFiles(*log);
    } else {  // most likely a daily log
      _problems.push_back(fault->why);
    }
  }
  if (_directory.isReadOnly()) {
    const std::uint64_t room = notes.size() * kNoteBytes;
    _bytesGone -= std::min(_bytesGone, room);
  } else if (!addLogNotes(_directory, kPrunedFile, _now, notes, error)) {
    _problems.push_back(error);
    return std::nullopt;
  }
  return due;
}

void LogPruning::removeFiles(const Log& log) {
  _step();
  if (_directory.isReadOnly()) {
    _gone.insert(log.files.begin(), log.files.end());
    _bytesGone += log.bytes;
    _removed.push_back(log.files.front());
    return;
  }
  for (const std::string& name : log.files) {
    const HostPath path = _directory.hostPath(kLogFolder).below(name);
    if (removeFile(path)) {
      if (name == log.files.front() || LogName::parse(name)->end != LogName::End::Header) {
        _removed.push_back(name);
      }
    } else if (errno != ENOENT) {
      _problems.push_back(systemError(path));
      return;
    }
  }
}

}  // namespace vesprun
