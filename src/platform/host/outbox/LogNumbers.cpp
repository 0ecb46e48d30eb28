#include "platform/host/outbox/LogNumbers.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <charconv>

#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/LogName.h"
#include "platform/host/outbox/LogNotes.h"
#include "platform/host/outbox/OutboxFiles.h"

namespace vesprun {
namespace {

constexpr std::string_view kNumberFile = "outbox/.log-number";

/// What changes with every log that is added, removed or noted as removed.
std::string stateOf(const DeviceDirectory& directory) {
  const struct stat nothing {};
  const struct stat folder = directory.hostPath(kLogFolder).status().value_or(nothing);
  const struct stat pruned = directory.hostPath(kPrunedFile).status().value_or(nothing);
  return std::to_string(folder.st_mtim.tv_sec) + '.' + std::to_string(folder.st_mtim.tv_nsec) +
         ' ' + std::to_string(pruned.st_size);
}

/// Sets a modification time of the folder that no change produces: changes are rounded to ticks of
/// the system's clock. False when the file system cannot keep it.
bool markFolder(const DeviceDirectory& directory) {
  const FileDescriptor folder = openFolder(directory.hostPath(kLogFolder));
  timespec times[2] = {{0, UTIME_OMIT}, {}};
  clock_gettime(CLOCK_REALTIME, &times[1]);
  struct stat status {};
  return futimens(folder.get(), times) == 0 && fstat(folder.get(), &status) == 0 &&
         status.st_mtim.tv_sec == times[1].tv_sec && status.st_mtim.tv_nsec == times[1].tv_nsec;
}

/// Takes the number off the front.
std::optional<std::uint64_t> takeNumber(std::string_view& text) {
  std::uint64_t number = 0;
  const auto [rest, problem] = std::from_chars(text.data(), text.data() + text.size(), number);
  text.remove_prefix(static_cast<std::size_t>(rest - text.data()));
  return problem == std::errc() ? std::optional(number) : std::nullopt;
}

}  // namespace

LogNumbers::LogNumbers(const DeviceDirectory& directory)
    : _directory(directory), _stateBefore(stateOf(directory)) {}

std::optional<std::uint64_t> LogNumbers::newest(std::string& error) const {
  std::string ignored;
  const std::string kept = readWholeFile(_directory.hostPath(kNumberFile), ignored).value_or("");
  std::string_view state = kept;
  const std::optional<std::uint64_t> remembered = takeNumber(state);
  if (remembered && state.starts_with(' ' + _stateBefore + '\n')) {
    return remembered;
  }
  const std::optional<std::vector<std::string>> names =
      namesInFolder(_directory.hostPath(kLogFolder), error);
  if (!names) {
    return std::nullopt;
  }
  std::uint64_t newest = remembered.value_or(0);
  for (const std::string& name : *names) {
    newest = std::max(newest, logNumber(name).value_or(0));
  }
  // Notes that cannot be read must not keep a log from being submitted.
  for (const LogNote& note :
       readLogNotes(_directory, kPrunedFile, ignored).value_or(std::vector<LogNote>())) {
    newest = std::max(newest, note.number);
  }
  return newest;
}

bool LogNumbers::remember(std::uint64_t number, bool durably, std::string& error) const {
  const HostPath path = _directory.hostPath(kNumberFile);
  const FileDescriptor file = openToChange(path, O_WRONLY | O_CREAT, error);
  if (!file.isOpen()) {
    return false;
  }
  // Written in place and by one call: whenever the power goes, the old or the new number is there,
  // and both are right. Nothing is flushed just for a log.
  const std::string content = std::to_string(number) + ' ' +
                              (markFolder(_directory) ? stateOf(_directory) : "unknown") + '\n';
  if (pwrite(file.get(), content.data(), content.size(), 0) !=
          static_cast<ssize_t>(content.size()) ||
      (durably && fsync(file.get()) != 0)) {
    error = systemError(path);
    return false;
  }
  return !durably || flushFolder(_directory.hostPath(kOutbox), error);
}

}  // namespace vesprun
