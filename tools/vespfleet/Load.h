#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "store/FleetStore.h"

namespace vesprun {

struct LoadCounts {
  std::uint64_t lines = 0;  ///< all that were met
  std::uint64_t malformed = 0;
  Outcomes outcomes{};  ///< of the others
  bool failed = false;  ///< a file could not be read to its end
};

/// Loads the lines of files into the store at `address`; "-" is standard input, a folder stands for
/// its files and those of its folders. With `spools`, a file is removed once its lines are in the
/// store, and moved to the folder "rejected" beside it when it has malformed lines; a file in a
/// folder of a given folder has lines of the device of that name alone.
LoadCounts loadFiles(const std::string& address, std::optional<int> least,
                     const std::vector<std::string>& paths, bool spools);

}  // namespace vesprun
