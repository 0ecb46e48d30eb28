#pragma once

#include <cstdint>
#include <optional>
#include <string>

#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// What `vespctl prune` remembers of its last runs, in the outbox: a clock that jumped ahead would
/// make everything old. Days are those of the device's clock, since 1970.
struct PruneDays {
  std::optional<std::int64_t> removed;  ///< on which it last removed what was old
  std::optional<std::int64_t> doubted;  ///< that it has seen since and not believed

  /// Nothing remembered without a file of ours.
  static PruneDays read(const DeviceDirectory& directory);
  bool write(const DeviceDirectory& directory, std::string& error) const;

  /// False for a day more than a week ahead of the last one, unless an earlier such day has been
  /// seen before.
  bool believe(std::int64_t today) const;
};

}  // namespace vesprun
