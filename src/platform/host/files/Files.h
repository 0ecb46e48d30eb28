#pragma once

#include <fcntl.h>
#include <sys/file.h>

#include <cerrno>
#include <chrono>
#include <cstdint>
#include <cstring>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "platform/Clock.h"
#include "platform/host/files/HostPath.h"

namespace vesprun {

inline FileDescriptor openFolder(const HostPath& path) { return path.open(O_RDONLY | O_DIRECTORY); }

/// "PATH: REASON", the reason being that of `errno`.
inline std::string systemError(const std::string& path) {
  return path + ": " + (errno == ELOOP ? "a symbolic link" : std::strerror(errno));
}

/// How long to wait for another process's lock: longer than any of ours works, but not for one that
/// is stopped.
inline constexpr std::chrono::milliseconds kMaxLockWait(20'000);

/// Takes the lock (LOCK_SH or LOCK_EX) of the open file or folder at `path`, waiting `longestWait`
/// at most. On failure `error` names the path; `busy`, if given, becomes true when another holder
/// is the reason.
bool takeLock(int descriptor, int operation, std::chrono::milliseconds longestWait,
              const std::string& path, std::string& error, bool* busy = nullptr);

/// The folder, whose lock keeps other holders, in this process and others, from replacing files in
/// it until the descriptor is closed. Nothing on failure, as `takeLock` reports it.
std::optional<FileDescriptor> lockFolder(const HostPath& folder, std::string& error,
                                         int operation = LOCK_EX,
                                         std::chrono::milliseconds longestWait = kMaxLockWait,
                                         bool* busy = nullptr);

/// No document is larger; one that seems so may be all hole.
inline constexpr std::uint64_t kMaxDocument = std::uint64_t{256} << 20;

/// Opens a regular file to be read. Not open, with the cause in `error`, for anything else;
/// `missing`, if given, tells whether nothing is there.
FileDescriptor openToRead(const HostPath& path, std::string& error, bool* missing = nullptr);

/// The content of a regular file. Nothing, with the cause in `error`, when it cannot be read or is
/// larger than `maxSize`; `missing`, if given, tells whether it does not exist.
std::optional<std::string> readWholeFile(const HostPath& path, std::string& error,
                                         bool* missing = nullptr,
                                         std::uint64_t maxSize = kMaxDocument);

/// The names in a folder, sorted by bytes; none when it does not exist. Nothing, with the cause in
/// `error`, when it cannot be read to its end.
std::optional<std::vector<std::string>> namesInFolder(const HostPath& folder, std::string& error);

/// Opens a regular file to be changed in place, for its owner alone. Refuses one that belongs to
/// someone else than this process's user and the folder's owner, or that has a second name.
FileDescriptor openToChange(const HostPath& path, int flags, std::string& error);

/// Removes the file, or renames it within its folder. False, with the cause in `errno`, on failure.
bool removeFile(const HostPath& path);
bool renameFile(const HostPath& path, const std::string& newName);

/// "20240305T091502Z".
std::string timeInName(const Date& time);

/// "PATH.WHY-20240305T091502Z": where a file that cannot be used is kept.
std::string nameAside(const std::string& path, std::string_view why, Clock& clock);

}  // namespace vesprun
