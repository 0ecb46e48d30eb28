#include "platform/host/counters/CounterFile.h"

#include <sys/stat.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdio>
#include <string_view>

#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

constexpr std::string_view kFolder = "var/mobile/Library/Tallybook";
constexpr const char* kName = "TBDataStore.sqlitedb";

// SQLite's companion files. We use only the first; other tools may enable the rest.
constexpr std::array kCompanions{"-journal", "-wal", "-shm"};

constexpr int kMostAttempts = 3;

CounterTrouble troubleOf(const SqliteFailure& failure) {
  return failure.isBusy()                         ? CounterTrouble::Busy
         : (failure.code & 0xFF) == SQLITE_FULL   ? CounterTrouble::Full
         : failure.code == kWrittenByNewerProgram ? CounterTrouble::NewerFile
                                                  : CounterTrouble::Other;
}

bool exists(const std::string& path) {
  struct stat status {};
  return lstat(path.c_str(), &status) == 0;
}

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
  const std::string folder = _directory.hostPath(kFolder);
  if (writes && _directory.isReadOnly()) {
    _directory.makeFolder(kFolder, error);  // which says why not
    return false;
  }
  const std::string path = folder + '/' + kName;
  struct stat status {};
  std::optional<FileDescriptor> shared;
  // Between making and locking, another process may move the new file away.
  for (int attempt = 1; !shared; ++attempt) {
    if (stat(path.c_str(), &status) != 0 && errno == ENOENT) {
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
    if (stat(path.c_str(), &status) != 0) {
      if (errno != ENOENT || attempt == kMostAttempts) {
        error = systemError(path);
        return false;
      }
      shared.reset();
    }
  }
  if (!S_ISREG(status.st_mode)) {
    error = path + ": not a regular file";
    return false;
  }
  // SQLite would wait at a pipe for ever.
  for (const char* companion : kCompanions) {
    struct stat beside {};
    if (stat((path + companion).c_str(), &beside) == 0 && !S_ISREG(beside.st_mode)) {
      error = path + companion + ": not a regular file";
      return false;
    }
  }
  const auto attempt = [&] {
    CounterStore store(path, _longestWait, access);
    if (!work(store)) {
      return false;
    }
    if (writes) {
      store.commit();
    }
    return true;
  };
  try {
    try {
      return attempt();
    } catch (const SqliteFailure& failure) {
      // Reading has been tried twice already.
      if (!writes || !failure.isCorruption()) {
        throw;
      }
    }
    return attempt();
  } catch (const SqliteFailure& failure) {
    error = failure.text;
    trouble = troubleOf(failure);
    if (failure.isCorruption() && !_directory.isReadOnly()) {
      damage = Damage{status.st_dev, status.st_ino, failure.text};
    }
    return false;
  }
}

bool CounterFile::make(std::string& error, CounterTrouble& trouble) {
  const std::optional<std::string> folder = _directory.makeFolder(kFolder, error);
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

// The file gets its name complete, so an empty one is never ours.
bool CounterFile::makeLocked(std::string& error) {
  const std::string folder = _directory.hostPath(kFolder);
  const std::string path = folder + '/' + kName;
  if (exists(path)) {
    return true;
  }
  // The journal of a lost file would be replayed into the new one.
  const std::string aside = unusedNameAside();
  for (const char* companion : kCompanions) {
    if (std::rename((path + companion).c_str(), (aside + companion).c_str()) != 0 &&
        errno != ENOENT) {
      error = systemError(path + companion);
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
  return file->addNew(kName, error) != AtomicFile::Added::Failed;
}

std::optional<std::string> CounterFile::replace(const Damage& damage, std::string& error) {
  const std::string folder = _directory.hostPath(kFolder);
  const std::string path = folder + '/' + kName;
  const auto exclusive = lockFolder(folder, error, LOCK_EX, _longestWait);
  if (!exclusive) {
    return std::nullopt;
  }
  std::string aside;
  struct stat status {};
  if (stat(path.c_str(), &status) == 0 && status.st_dev == damage.device &&
      status.st_ino == damage.number) {
    aside = unusedNameAside();
    // The file first: if we are killed here, its journal is moved aside later.
    if (std::rename(path.c_str(), aside.c_str()) != 0) {
      error = systemError(path);
      return std::nullopt;
    }
    for (const char* companion : kCompanions) {
      std::rename((path + companion).c_str(), (aside + companion).c_str());
    }
  }
  if (!makeLocked(error)) {
    return std::nullopt;
  }
  return aside;
}

std::string CounterFile::unusedNameAside() const {
  const std::string aside =
      nameAside(_directory.hostPath(kFolder) + '/' + kName, "corrupt", _clock);
  std::string name = aside;
  const auto isTaken = [&name] {
    return exists(name) || std::any_of(kCompanions.begin(), kCompanions.end(),
                                       [&](const char* end) { return exists(name + end); });
  };
  for (int number = 2; isTaken(); ++number) {
    name = aside + '-' + std::to_string(number);
  }
  return name;
}

}  // namespace vesprun
