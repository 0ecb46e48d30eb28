#include "days/LogPruning.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <map>
#include <optional>
#include <utility>

#include "Command.h"
#include "common/Calendar.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/device/LogNumbers.h"
#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/Files.h"
#include "platform/host/files/JsonLines.h"

namespace vesprun {
namespace {

constexpr std::string_view kHeaderEnd = ".header.json";

/// The name of a log or header without its end.
std::optional<std::string> baseOf(const std::string& name) {
  for (const std::string_view end :
       {kHeaderEnd, std::string_view(".ptree"), std::string_view(".log")}) {
    if (name.ends_with(end)) {
      return name.substr(0, name.size() - end.size());
    }
  }
  return std::nullopt;
}

std::uint64_t bytesOfFiles(const std::string& folder) {
  std::uint64_t bytes = 0;
  std::error_code failure;
  using Files = std::filesystem::recursive_directory_iterator;
  for (Files file(folder, failure), end; !failure && file != end; file.increment(failure)) {
    struct stat status {};
    if (lstat(file->path().c_str(), &status) == 0 && S_ISREG(status.st_mode)) {
      bytes += static_cast<std::uint64_t>(status.st_size);
    }
  }
  return bytes;
}

}  // namespace

/// A log with its header; or a header whose log is gone, from a command that was killed.
struct LogPruning::Log {
  std::vector<std::string> files;  ///< the header last
  std::uint64_t bytes = 0;
  Date written;  ///< of the header only when there is no log
};

/// By number.
std::vector<LogPruning::Log> LogPruning::readFolder() {
  const HostPath folder = _directory.hostPath("outbox/logs");
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
    const std::optional<std::uint64_t> number = logNumber(name);
    const std::optional<std::string> base = baseOf(name);
    const std::optional<struct stat> found = folder.below(name).status();
    if (!number || !base || !found || !S_ISREG(found->st_mode)) {
      continue;
    }
    const struct stat& status = *found;
    Log& log = logs[{*number, *base}];
    const bool isHeader = name.ends_with(kHeaderEnd);
    const Date written{status.st_mtim.tv_sec, static_cast<std::uint32_t>(status.st_mtim.tv_nsec)};
    if (log.files.empty() || !isHeader) {
      log.written = written;
    }
    log.files.insert(isHeader ? log.files.end() : log.files.begin(), name);
    log.bytes += static_cast<std::uint64_t>(status.st_size);
  }
  std::vector<Log> sorted;
  sorted.reserve(logs.size());
  for (auto& [order, log] : logs) {
    sorted.push_back(std::move(log));
  }
  return sorted;
}

void LogPruning::removeBefore(const Date& time) {
  std::vector<Log> logs = readFolder();
  std::erase_if(logs, [&time](const Log& log) { return log.written >= time; });
  remove(logs);
}

void LogPruning::removeUntilBelow(std::uint64_t bytes) {
  std::size_t before = 0;
  do {  // again, since the notes of what was removed take room too
    before = _removed.size();
    std::uint64_t left = bytesOfFiles(_directory.hostPath("outbox").string());
    std::vector<Log> logs = readFolder();
    auto end = logs.begin();
    for (; end != logs.end() && left >= bytes; ++end) {
      left -= std::min(left, end->bytes);
    }
    logs.erase(end, logs.end());
    remove(logs);
  } while (_removed.size() != before);
}

void LogPruning::remove(const std::vector<Log>& logs) {
  if (logs.empty()) {
    return;
  }
  std::string error;
  const LogNumbers numbers(_directory);
  const std::optional<std::uint64_t> newest = numbers.newest(error);
  if (!newest || !numbers.remember(*newest, true, error)) {
    _problems.push_back(error);
    return;
  }
  std::vector<const Log*> noted;
  try {
    noted = noteDailyLogs(logs);
  } catch (const CommandFailure& failure) {
    _problems.emplace_back(failure.what());
  }
  for (const Log* const log : noted) {
    unlinkFiles(*log);
  }
  numbers.remember(*newest, false, error);
  std::ranges::stable_sort(_removed, {}, [](const std::string& name) { return *logNumber(name); });
}

/// Removes the logs that need no note, which makes room for notes on a full disk, and returns the
/// others once their notes are durable. Throws `CommandFailure`.
std::vector<const LogPruning::Log*> LogPruning::noteDailyLogs(const std::vector<Log>& logs) {
  std::vector<const Log*> named;
  for (const Log& log : logs) {
    if (isDailyLogName(log.files.front())) {
      named.push_back(&log);
    } else {
      unlinkFiles(log);
    }
  }
  if (named.empty()) {
    return {};
  }
  std::map<std::string, SubmittedLog> daily;
  const auto unreadable = forEachSubmittedLog(_directory, [&daily](SubmittedLog&& log) {
    log.document = {};
    daily.emplace(log.name, std::move(log));
  });
  std::vector<const Log*> due;
  for (const Log* const log : named) {
    const std::string& name = log->files.front();
    const auto fault = std::ranges::find(unreadable, name, &UnreadableLog::name);
    if (daily.contains(name)) {
      due.push_back(log);
    } else if (fault == unreadable.end() || fault->wasRead) {
      unlinkFiles(*log);
    } else {  // most likely a daily log
      _problems.push_back(fault->why);
    }
  }
  JsonLines notes(_directory.hostPath(kPrunedLogsFile));
  bool isFlushed = true;
  for (const Log* const log : due) {
    const SubmittedLog& noted = daily[log->files.front()];
    if (!noted.isNoted) {
      isFlushed = false;
      const std::string note = jsonText(PropertyDict{{"time", dateText(_now)},
                                                     {"name", noted.name},
                                                     {"day", noted.day},
                                                     {"revision", noted.revision}});
      orFail([&](std::string& error) { return notes.append(note, error); });
    }
  }
  orFail([&](std::string& error) { return isFlushed || notes.flush(error); });
  return due;
}

void LogPruning::unlinkFiles(const Log& log) {
  for (const std::string& name : log.files) {
    const HostPath path = _directory.hostPath("outbox/logs/" + name);
    if (removeFile(path)) {
      if (name == log.files.front() || !name.ends_with(kHeaderEnd)) {
        _removed.push_back(name);
      }
    } else if (errno != ENOENT) {
      _problems.push_back(systemError(path));
      return;
    }
  }
}

}  // namespace vesprun
