#pragma once

#include <cstdint>
#include <span>
#include <string>

#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// The kernel's queue of ECC events: the files kernel/ecc/*.bin, the oldest first by name (byte
/// order). Several processes may take events at once; each event goes to one of them.
class ECCEventQueue {
 public:
  static constexpr std::size_t kEventLength = 72;

  /// What the references name must outlive the object.
  ECCEventQueue(const DeviceDirectory& directory, SystemLog& log)
      : _directory(directory), _log(log) {}

  /// Takes the oldest event out of the queue. 0, and the bytes in `buffer`; otherwise an error
  /// number: ENOENT when the queue is empty, EINVAL when the buffer is not of an event's length,
  /// EIO, and an error in the system log, when the folder cannot be read or a file is in the way
  /// that cannot be removed.
  ///
  /// A file that is not an event (of another length, or not to be read) is renamed to
  /// NAME.bin.unusable, an error in the system log says why, and the next one is taken.
  int takeNext(std::span<std::uint8_t> buffer, std::size_t& length);

 private:
  bool setAside(const std::string& path, const std::string& why);

  const DeviceDirectory& _directory;
  SystemLog& _log;
};

}  // namespace vesprun
