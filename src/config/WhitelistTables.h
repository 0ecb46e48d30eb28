#pragma once

#include "common/PropertyDict.h"

namespace vesprun {

/// The tables of a whitelist: key or prefix to options, in the order in which they were first
/// named. Whatever is no dictionary in them stands for options that cannot be read.
struct WhitelistTables {
  PropertyDict scalarKeys;
  PropertyDict scalarPrefixes;
  PropertyDict distributionKeys;
  PropertyDict distributionPrefixes;
};

/// Gathers the tables of the groups that count on this device, as `TBConfig` describes.
WhitelistTables gatherWhitelistTables(const PropertyDict& groups, bool isInternalDevice);

}  // namespace vesprun
