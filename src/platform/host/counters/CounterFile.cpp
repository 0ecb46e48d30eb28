#include "platform/host/counters/CounterFile.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <charconv>
#include <map>
#include <string_view>
#include <utility>

#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

// SQLite's companion files. We use only the first; other tools may enable the rest.
constexpr std::array kCompanions{"-journal", "-wal", "-shm"};

constexpr const char* kWhyAside = "corrupt";

constexpr int kMaxFileAttempts = 3;

CounterTrouble troubleOf(const SqliteFailure& failure) {
  return failure.isBusy()                         ? CounterTrouble::Busy
         : (failure.code & 0xFF) == SQLITE_FULL   ? CounterTrouble::Full
         : failure.code == kWrittenByNewerProgram ? CounterTrouble::NewerFile
                                                  : CounterTrouble::Other;
}

bool exists(const HostPath& path) { return path.status() || errno != ENOENT; }

}  // namespace

bool CounterFile::write(const std::function<bool(CounterStore&)>& work, std::string& error,
                        std::optional<Damage>& damage, CounterTrouble* trouble) {
  CounterTrouble ignored = CounterTrouble::Other;
  return use(CounterStore::Access::Writing, work, error, damage,
             trouble != nullptr ? *trouble : ignored);
}

bool CounterFile::read(const std::function<void(CounterStore&)>& work, std::string& error,
                       std::optional<Damage>& damage) {
  const auto reading = [&work](CounterStore& store) {
    work(store);
    return true;
  };
  const auto access =
      _directory.isReadOnly() ? CounterStore::Access::Looking : CounterStore::Access::Reading;
  CounterTrouble ignored = CounterTrouble::Other;
  return use(access, reading, error, damage, ignored);
}

bool CounterFile::use(CounterStore::Access access, const std::function<bool(CounterStore&)>& work,
                      std::string& error, std::optional<Damage>& damage, CounterTrouble& trouble) {
  const bool writes = access == CounterStore::Access::Writing;
  const HostPath folder = _directory.hostPath(kCounterFolder);
  if (writes && _directory.isReadOnly()) {
    _directory.makeFolder(kCounterFolder, error);  // which says why not
    return false;
  }
  const HostPath path = folder.below(kCounterDatabase);
  std::optional<struct stat> status;
  std::optional<FileDescriptor> shared;
  // Between making and locking, another process may move the new file away.
  for (int attempt = 1; !shared; ++attempt) {
    if (!(status = path.status()) && errno == ENOENT) {
      if (!writes) {
        return true;
      }
      if (!make(error, trouble)) {
        return false;
      }
    }
    bool isBusy = false;
    shared = lockFolder(folder, error, LOCK_SH, _longestWait, &isBusy);
    if (!shared) {
      trouble = isBusy ? CounterTrouble::Busy : CounterTrouble::Other;
      return false;
    }
    if (!(status = path.status())) {
      if (errno != ENOENT || attempt == kMaxFileAttempts) {
        error = systemError(path);
        return false;
      }
      shared.reset();
    }
  }
  if (!S_ISREG(status->st_mode)) {
    error = path.string() + ": not a regular file";
    return false;
  }
  try {
    CounterStore store(path, _longestWait, access);
    if (!work(store)) {
      return false;
    }
    if (writes) {
      store.commit();
    }
    return true;
  } catch (const SqliteFailure& failure) {
    error = failure.text;
    trouble = troubleOf(failure);
    if (failure.isCorruption() && !_directory.isReadOnly()) {
      damage = Damage{status->st_dev, status->st_ino, failure.text};
    }
    return false;
  }
}

bool CounterFile::make(std::string& error, CounterTrouble& trouble) {
  const std::optional<HostPath> folder = _directory.makeFolder(kCounterFolder, error);
  if (!folder) {
    return false;
  }
  bool isBusy = false;
  const auto exclusive = lockFolder(*folder, error, LOCK_EX, _longestWait, &isBusy);
  errno = 0;
  if (exclusive && makeLocked(error)) {
    return true;
  }
  trouble = isBusy                               ? CounterTrouble::Busy
            : errno == ENOSPC || errno == EDQUOT ? CounterTrouble::Full
                                                 : CounterTrouble::Other;
  return false;
}

// The file is named only when it is complete, so an empty one is never ours.
bool CounterFile::makeLocked(std::string& error) {
  const HostPath folder = _directory.hostPath(kCounterFolder);
  const HostPath path = folder.below(kCounterDatabase);
  if (exists(path)) {
    return true;
  }
  // The journal of a lost file would be replayed into the new one.
  removeLeftOvers(folder);
  const std::string aside = unusedNameAside();
  for (const char* companion : kCompanions) {
    const HostPath left = folder.below(std::string(kCounterDatabase) + companion);
    if (!renameFile(left, aside + companion) && errno != ENOENT) {
      error = systemError(left);
      return false;
    }
  }
  std::string content;
  try {
    content = CounterStore::emptyDatabase();
  } catch (const SqliteFailure& failure) {
    error = failure.text;
    return false;
  }
  std::optional<AtomicFile> file = AtomicFile::create(folder, error);
  if (!file) {
    return false;
  }
  file->append(content);
  return file->addNew(kCounterDatabase, error) != AtomicFile::Added::Failed;
}

std::optional<std::string> CounterFile::replace(const Damage& damage, std::string& error) {
  const HostPath folder = _directory.hostPath(kCounterFolder);
  const HostPath path = folder.below(kCounterDatabase);
  const auto exclusive = lockFolder(folder, error, LOCK_EX, _longestWait);
  if (!exclusive) {
    return std::nullopt;
  }
  std::string aside;
  const std::optional<struct stat> status = path.status();
  if (status && status->st_dev == damage.device && status->st_ino == damage.number) {
    aside = unusedNameAside();
    // The file first: if we are killed here, its journal is moved aside later.
    if (!renameFile(path, aside)) {
      error = systemError(path);
      return std::nullopt;
    }
    for (const char* companion : kCompanions) {
      renameFile(folder.below(std::string(kCounterDatabase) + companion), aside + companion);
    }
    aside = folder.below(aside);
  }
  if (!makeLocked(error)) {
    return std::nullopt;
  }
  return aside;
}

std::string CounterFile::unusedNameAside() const {
  const HostPath folder = _directory.hostPath(kCounterFolder);
  const std::string aside = nameAside(kCounterDatabase, kWhyAside, _clock);
  std::string name = aside;
  const auto isTaken = [&] {
    return exists(folder.below(name)) ||
           std::any_of(kCompanions.begin(), kCompanions.end(),
                       [&](const char* end) { return exists(folder.below(name + end)); });
  };
  for (int number = 2; isTaken(); ++number) {
    name = aside + '-' + std::to_string(number);
  }
  return name;
}

bool removeOldDamaged(const DeviceDirectory& directory, const Date& time, std::string& error) {
  const HostPath folder = directory.hostPath(kCounterFolder);
  const auto names = namesInFolder(folder, error);
  if (!names) {
    return false;
  }
  // The time, and a number among those of one second.
  using Place = std::pair<std::string, int>;
  std::map<std::string, Place> places;
  Place newest;
  for (const std::string& name : *names) {
    if (!name.starts_with(kDamagedDatabase)) {
      continue;
    }
    std::string_view rest = std::string_view(name).substr(kDamagedDatabase.size());
    const bool isCompanion = std::ranges::any_of(kCompanions, [&](std::string_view end) {
      const bool ends = rest.ends_with(end);
      rest.remove_suffix(ends ? end.size() : 0);
      return ends;
    });
    const std::size_t dash = rest.find('-');
    Place place{rest.substr(0, dash), 1};
    if (dash != std::string_view::npos) {
      std::from_chars(rest.data() + dash + 1, rest.data() + rest.size(), place.second);
    }
    newest = isCompanion ? newest : std::max(newest, place);
    places.emplace(name, std::move(place));
  }
  const std::string oldest = timeInName(time);
  for (const auto& [name, place] : places) {
    const HostPath path = folder.below(name);
    if ((place < newest || place.first < oldest) && !removeFile(path) && errno != ENOENT) {
      error = systemError(path);
      return false;
    }
  }
  return true;
}

}  // namespace vesprun
