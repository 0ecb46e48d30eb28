#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// The numbers of the logs in `outbox/logs`, which only ever go up, also past removed logs. The
/// newest is remembered in `outbox/.log-number`, with the modification time of the folder, which is
/// read only when that has changed: the time does not depend on how many logs lie there.
class LogNumbers {
 public:
  /// To be made before the folder is touched; to be used by who holds its lock.
  explicit LogNumbers(const DeviceDirectory& directory);

  /// The largest number that a log has or had; 0 when there was none. Nothing, with a text in
  /// `error`, when it cannot be found out.
  std::optional<std::uint64_t> newest(std::string& error) const;

  /// Remembers the number, for the folder as it is now. False, with a text in `error`, when that
  /// failed; what was remembered before holds on then.
  bool remember(std::uint64_t number, bool durably, std::string& error) const;

 private:
  const DeviceDirectory& _directory;
  std::string _stateBefore;
};

}  // namespace vesprun
