#pragma once

#include <optional>

#include "common/PropertyValue.h"

namespace vesprun {

/// The service that knows how much space of a volume could be freed.
class Reclaimer {
 public:
  virtual ~Reclaimer() = default;

  /// False on a system that does not have the service.
  virtual bool isAvailable() = 0;

  /// The purgeable space of a volume, in bytes by item; `options` names the volume. Nothing when
  /// the service does not answer.
  virtual std::optional<PropertyDict> ReclaimerCopyItemizedPurgeableSpaceWithInfo(
      const PropertyDict& options) = 0;
};

}  // namespace vesprun
