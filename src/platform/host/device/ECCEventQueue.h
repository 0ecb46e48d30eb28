#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>

#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/files/Files.h"

namespace vesprun {

/// The kernel's queue of ECC events: the files kernel/ecc/*.bin in byte order. For the process that
/// has the lock of the day's work.
class ECCEventQueue {
 public:
  static constexpr std::size_t kEventLength = 72;

  /// The references must outlive the object.
  ECCEventQueue(const DeviceDirectory& directory, SystemLog& log)
      : _directory(directory), _log(log) {}

  /// Takes the oldest event; its file stays until `removeTaken`. 0, and the bytes in `buffer`; or
  /// ENOENT when the queue is empty, EINVAL when the buffer is not of an event's length, EROFS on a
  /// read-only device, EIO, with an error in the system log, for what may be mended.
  ///
  /// A file that can never be an event (of another kind or length, or unreadable) is renamed to
  /// NAME.bin.unusable with an error in the system log, and the next one is taken.
  int takeNext(std::span<std::uint8_t> buffer, std::size_t& length);

  /// Deletes the file of the event taken last. False, with an error in the system log, on failure:
  /// the event is then taken again.
  bool removeTaken();

 private:
  enum class Outcome { Taken, Skipped, Unusable, Failed };

  Outcome take(const HostPath& path, std::span<std::uint8_t> buffer, std::string& error);
  /// After a call that takes the path away, by its result and `errno`; else logs why not.
  bool isGone(const HostPath& path, bool isDone);

  const DeviceDirectory& _directory;
  SystemLog& _log;
  std::optional<HostPath> _taken;
};

}  // namespace vesprun
