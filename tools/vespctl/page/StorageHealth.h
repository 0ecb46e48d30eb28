#pragma once

#include <string>
#include <vector>

#include "page/PageData.h"

namespace vesprun {

/// One sentence about the flash storage.
struct HealthStatement {
  enum class Level { Plain, Good, Look, Act };

  Level level;
  std::string text;
  double day;  ///< of the newest figure in it, since 1970
};

/// What the newest figures that were submitted say: the StorageStatus log, the storage's analytics
/// events, and the scalars of the daily logs. A figure that none of them has, or that is negative,
/// which means unknown, is left out; so the list may be empty.
std::vector<HealthStatement> storageHealth(const PageData& data);

}  // namespace vesprun
