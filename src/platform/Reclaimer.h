#pragma once

#include <optional>

#include "common/PropertyValue.h"

namespace vesprun {

/// Knows how much space of a volume could be freed.
class Reclaimer {
 public:
  virtual ~Reclaimer() = default;

  /// False on a system without the service.
  virtual bool isAvailable() = 0;

  /// Bytes by item, for the volume named in `options`; nothing when the service does not answer.
  virtual std::optional<PropertyDict> ReclaimerCopyItemizedPurgeableSpaceWithInfo(
      const PropertyDict& options) = 0;
};

}  // namespace vesprun
