#include "status/Findings.h"

#include <sys/statvfs.h>

#include <algorithm>
#include <filesystem>
#include <functional>
#include <limits>
#include <memory>
#include <set>

#include "access/CommandDevice.h"
#include "commandline/Arguments.h"
#include "common/Calendar.h"
#include "config/TBConfig.h"
#include "days/MissingReports.h"
#include "driver/DailyTasks.h"
#include "outbox/SubmittedLogs.h"
#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/figures/Collection.h"
#include "platform/host/figures/FigureTable.h"
#include "platform/host/files/JsonLines.h"
#include "platform/host/outbox/OutboxFiles.h"
#include "whitelist/WhitelistCheck.h"

namespace vesprun {
namespace {

using Keys = std::set<std::string, std::less<>>;

/// What the counter database tells.
struct Counted {
  Keys scalars;
  Keys distributions;
  std::int64_t today = 0;  ///< keys
  std::optional<Date> collected;

  template <typename Options>
  const Keys& keysOf() const {
    return std::is_same_v<Options, ScalarOptions> ? scalars : distributions;
  }
};

/// Reads it whole, so that damage shows wherever it is. Nothing, with a text in `error`, when it
/// cannot be read.
std::optional<Counted> readCounters(HostPlatform& device, std::int32_t today, std::string& error) {
  using Days = std::numeric_limits<std::int32_t>;
  Counted counted;
  const auto count = [&](Keys& keys, std::string_view key, std::int32_t day) {
    if (keys.find(key) == keys.end()) {
      keys.emplace(key);
    }
    counted.today += day == today ? 1 : 0;
  };
  const auto read = [&](CounterStore& store) {
    counted = {};
    store.readScalars("", Days::min(), Days::max(),
                      [&](std::string_view key, std::int32_t day, std::int64_t, bool&) {
                        count(counted.scalars, key, day);
                      });
    store.readDistributions("", Days::min(), Days::max(),
                            [&](std::string_view key, std::int32_t day,
                                TBHistoryDistributionEnumerator& values, bool&) {
                              count(counted.distributions, key, day);
                              double value = 0;
                              while (values.getNextValueSecondsInDayOffset(value, nullptr)) {
                              }
                            });
    counted.collected = lastCollection(store);
  };
  return device.counters().read(read, error) ? std::optional(std::move(counted)) : std::nullopt;
}

/// Gathers the findings of one device.
class Findings {
 public:
  Findings(HostPlatform& device, DeviceStatus& status)
      : _device(device), _directory(device.directory()), _status(status) {}

  void judge() {
    judgeFiles();
    judgeSpace();
    judgeCounters();
    judgeWhitelist();
    judgeExpiry();
    judgeStoredDay();
    judgeMissedDays();
    judgeCollection();
    judgeErrors();
  }

 private:
  void tell(std::string_view finding, std::string detail) {
    _status.findings.push_back({finding, std::move(detail)});
  }

  std::string pathOf(std::string_view devicePath) const {
    return _directory.hostPath(devicePath).string();
  }

  /// Also counts the bytes in the outbox.
  void judgeFiles() {
    struct stat owner {};
    if (lstat((_directory.path() + "/.").c_str(), &owner) != 0) {
      throw CommandFailure(systemError(_directory.path()));
    }
    std::string first;
    std::size_t others = 0;
    const auto judge = [&](const std::string& path, const struct stat& status) {
      const mode_t needed = S_ISDIR(status.st_mode) ? S_IWUSR | S_IXUSR : S_IWUSR;
      std::string fault;
      if (status.st_uid != owner.st_uid) {
        fault = path + ": belongs to " + nameOfUser(status.st_uid) + ", not to " +
                nameOfUser(owner.st_uid) + ": sudo chown -h " + nameOfUser(owner.st_uid) + " '" +
                path + '\'';
      } else if (!S_ISLNK(status.st_mode) && (status.st_mode & needed) != needed) {
        fault = path + ": its owner may not write it: chmod u+rwX '" + path + '\'';
      } else {
        return;
      }
      others += first.empty() ? 0U : 1U;
      first = first.empty() ? fault : first;
    };
    judge(_directory.path(), owner);
    const std::string outbox = pathOf(kOutbox) + '/';
    std::error_code failure;
    std::filesystem::recursive_directory_iterator entry(
        _directory.path(), std::filesystem::directory_options::skip_permission_denied, failure);
    for (; !failure && entry != std::filesystem::recursive_directory_iterator();
         entry.increment(failure)) {
      struct stat status {};
      const std::string& path = entry->path().native();
      if (lstat(path.c_str(), &status) == 0) {  // else it has gone meanwhile
        judge(path, status);
        _status.outboxBytes += S_ISREG(status.st_mode) && path.starts_with(outbox)
                                   ? static_cast<std::uint64_t>(status.st_size)
                                   : 0;
      }
    }
    if (failure && first.empty()) {
      first = _directory.path() + ": " + failure.message();
    }
    struct statvfs volume {};
    if (statvfs(_directory.path().c_str(), &volume) == 0 && (volume.f_flag & ST_RDONLY) != 0) {
      first = _directory.path() + ": on a file system that is mounted read-only";
    }
    if (!first.empty()) {
      tell("not writable",
           first + (others == 0 ? "" : " (and " + std::to_string(others) + " more like it)"));
    }
  }

  void judgeSpace() {
    constexpr std::uint64_t kMinBytes = 16 * 1024 * 1024;
    constexpr std::uint64_t kMinFiles = 100;
    struct statvfs volume {};
    struct stat owner {};
    if (statvfs(_directory.path().c_str(), &volume) != 0 ||
        stat(_directory.path().c_str(), &owner) != 0) {
      throw CommandFailure(systemError(_directory.path()));
    }
    const bool isRoot = owner.st_uid == 0;
    const std::uint64_t bytes =
        std::uint64_t{isRoot ? volume.f_bfree : volume.f_bavail} * volume.f_frsize;
    const std::uint64_t files = isRoot ? volume.f_ffree : volume.f_favail;
    // A file system without a table of inodes has 0 of them.
    if (bytes < kMinBytes || (volume.f_files != 0 && files < kMinFiles)) {
      tell("no space", _directory.path() + ": " + groupedDigits(bytes / 1024) + " KiB and " +
                           groupedDigits(files) +
                           " inodes are free on its file system: make room there, or \"vespctl "
                           "prune --outbox-size MIB\"");
    }
  }

  void judgeCounters() {
    std::string error;
    _counted = readCounters(_device, _status.today, error);
    _status.keysToday = _counted ? _counted->today : 0;
    std::string detail =
        _counted ? ""
                 : error +
                       ": the next daily run moves a damaged database aside and begins a new "
                       "one; copy it before, if it matters";
    std::string ignored;
    const auto names = namesInFolder(_directory.hostPath(kCounterFolder), ignored);
    for (const std::string& name : names.value_or(std::vector<std::string>())) {
      if (detail.empty() && name.starts_with(kDamagedDatabase)) {
        const std::string path = pathOf(kCounterFolder) + '/' + name;
        detail = path +
                 ": a damaged database was moved aside, and its counters are not reported; "
                 "when nobody needs it any more: rm '" +
                 path + '\'';
      }
    }
    if (!detail.empty()) {
      tell("damaged database", std::move(detail));
    }
  }

  void judgeWhitelist() {
    const std::string path = pathOf(TBConfig::path());
    _config = TBConfig::init();
    std::string error;
    const auto bytes = readWholeFile(_directory.hostPath(TBConfig::path()), error);
    if (bytes) {
      _document = WhitelistDocument::read(*bytes, error);
    }
    if (!_config || !_document) {
      tell("no whitelist", path + ": " +
                               (error.starts_with(path) ? error.substr(path.size() + 2) : error) +
                               ": nothing leaves this device; make one its whitelist with "
                               "\"vespctl whitelist install FILE\"");
      return;
    }
    _status.whitelist = _config->configFileDigest();
    const std::vector<WhitelistFinding> all = checkWhitelist(*_document, _status.today);
    constexpr std::string_view kFaults[] = {"wrong kind", "unknown list", "unreadable options",
                                            "unread option"};
    const auto isFault = [&](const WhitelistFinding& finding) {
      return std::ranges::find(kFaults, finding.finding) != std::end(kFaults);
    };
    if (const auto first = std::ranges::find_if(all, isFault); first != all.end()) {
      tell("faulty whitelist", placeOf(*first, path) + ": " + first->detail +
                                   "; \"vespctl whitelist check\" tells all");
    }
  }

  /// Those that expired and under which something is counted.
  template <typename Options>
  void findExpired(std::vector<std::string>& found) const {
    const Keys& keys = _counted->keysOf<Options>();
    const Date today = startOfDay(_status.today);
    const auto judge = [&](std::string_view key, const WhitelistEntry<Options>& entry,
                           bool isCounted) {
      if (!isCounted || !entry.options) {
        return;
      }
      const EntryMetadata metadata =
          EntryMetadata::read(entry.written->dict(), aboutOfGroup(*entry.group));
      if (metadata.expires != nullptr && *metadata.expires < today) {
        found.push_back(inQuotes(key) + " (" + dateText(*metadata.expires).substr(0, 10) + ')');
      }
    };
    const WhitelistTable<Options>& table = _config->tables().of<Options>();
    for (const auto& [key, entry] : table.keys()) {
      judge(key, entry, keys.find(key) != keys.end());
    }
    for (const auto& [prefix, entry] : table.prefixes()) {
      const auto first = keys.lower_bound(prefix);
      judge(prefix, entry, first != keys.end() && first->starts_with(prefix));
    }
  }

  const PropertyDict* aboutOfGroup(std::string_view name) const {
    for (const WhitelistDocument::Node& group : _document->groups()) {
      if (group.name == name && group.dict() != nullptr) {
        return aboutOf(*group.dict());
      }
    }
    return nullptr;
  }

  void judgeExpiry() {
    if (!_status.whitelist || !_counted) {
      return;
    }
    std::vector<std::string> found;
    findExpired<ScalarOptions>(found);
    findExpired<DistributionOptions>(found);
    if (!found.empty()) {
      tell("expired keys",
           found.front() +
               (found.size() == 1 ? "" : " and " + std::to_string(found.size() - 1) + " more") +
               " in " + pathOf(TBConfig::path()) +
               " should not leave any more: take them out, or give them a later date; \"vespctl "
               "whitelist check\" names all");
    }
  }

  void judgeStoredDay() {
    const std::int64_t stored =
        _device.preferences().LGSPreferencesGetIntegerValue(kStoredDayKey, kOwnDomain);
    constexpr std::int64_t kLast = std::numeric_limits<std::int64_t>::max();
    _status.nextReport =
        std::max<std::int64_t>(dayBefore(_status.today), stored == kLast ? kLast : stored + 1);
    if (stored >= _status.today) {
      tell("stored day ahead",
           "the last daily run stored day " + std::to_string(stored) +
               ", so none is due before that day has passed: if the clock is right now, \"vespctl "
               "prefs set " +
               std::string(kOwnDomain) + ' ' + std::string(kStoredDayKey) + ' ' +
               std::to_string(std::int64_t{_status.today} - 2) + '"');
    }
  }

  void judgeMissedDays() {
    constexpr std::uint32_t kDaysOfCatchUp = 7;
    if (!_counted) {
      return;
    }
    std::string days;
    for (const std::int32_t day : submitMissingReports(_device, kDaysOfCatchUp, true).submitted) {
      days.append(days.empty() ? "" : ", ").append(dateOfDay(day));
    }
    if (!days.empty()) {
      tell("missed days", days + ": counted, but not reported; \"vespctl catch-up\" does it");
    }
  }

  /// Whether the whitelist names a key that `collect` writes, itself or by a prefix.
  template <typename Options>
  bool namesFigure(const LinuxFigure& figure) const {
    const WhitelistTable<Options>& table = _config->tables().of<Options>();
    if (table.decide(figure.key).entry != nullptr) {
      return true;
    }
    const auto goesOn = [&](const auto& entry) {
      return figure.key.ends_with('.') && entry.first.starts_with(figure.key);
    };
    return std::ranges::any_of(table.keys(), goesOn) ||
           std::ranges::any_of(table.prefixes(), goesOn);
  }

  void judgeCollection() {
    if (!_status.whitelist || !_counted) {
      return;
    }
    const bool isWanted = std::ranges::any_of(linuxFigures, [this](const LinuxFigure& figure) {
      return figure.kind == FigureKind::Gauge ? namesFigure<DistributionOptions>(figure)
                                              : namesFigure<ScalarOptions>(figure);
    });
    const std::optional<Date>& last = _counted->collected;
    if (isWanted &&
        (!last || secondsBetween(*last, _device.clock().now()) > double{kSecondsPerDay})) {
      tell("no collection",
           (last ? "the last collection was at " + dateText(*last) : "nothing was collected yet") +
               ", but the whitelist wants figures of this machine: \"vespctl collect\" now, and "
               "\"systemctl status vesprun-collect.timer\" for what should do it");
    }
  }

  void judgeErrors() {
    std::size_t errors = 0;
    std::string lastError;
    std::size_t errorsBeforeStart = 0;  // the start that was seen last
    const auto take = [&](std::string_view line) {
      // Most lines are neither.
      if (line.find("\"error\"") == line.npos && line.find("vesprun started") == line.npos &&
          line.find("daily tasks for day ") == line.npos) {
        return;
      }
      std::string ignored;
      const std::optional<PropertyValue> value = valueFromJsonText(line, ignored);
      const PropertyDict* const members = value ? value->dict() : nullptr;
      const std::string* const level = members != nullptr ? members->findString("level") : nullptr;
      const std::string* const message =
          members != nullptr ? members->findString("message") : nullptr;
      if (level == nullptr || message == nullptr) {
        return;
      }
      if (*level == "error") {
        ++errors;
        lastError = *message;
      } else if (*message == "vesprun started") {
        errorsBeforeStart = errors;
      } else if (message->starts_with("daily tasks for day ")) {
        errors -= std::exchange(errorsBeforeStart, 0);
      }
    };
    orFail([&](std::string& error) {
      return forEachLineOf(_directory.hostPath(kSystemLogFile), take, error);
    });
    if (errors != 0) {
      tell("errors", pathOf(kSystemLogFile) + ": " + std::to_string(errors) +
                         (errors == 1 ? " error" : " errors") +
                         " since the last daily run began, the last of them: " +
                         shortened(lastError) + "; \"vespctl show log\" has all");
    }
  }

  HostPlatform& _device;
  const DeviceDirectory& _directory;
  DeviceStatus& _status;
  std::optional<Counted> _counted;  ///< nothing when the database cannot be read
  std::unique_ptr<TBConfig> _config;
  std::optional<WhitelistDocument> _document;
};

}  // namespace

DeviceStatus readStatus(HostPlatform& device) {
  DeviceStatus status;
  status.device = exportedName(device);
  status.today = device.tallybook().TBDaysSince1970();
  forEachSubmittedLog(device.directory(), [&status](SubmittedLog&& log) {
    status.lastReport = {log.day, std::move(log.name)};
  });
  Findings(device, status).judge();
  return status;
}

}  // namespace vesprun
