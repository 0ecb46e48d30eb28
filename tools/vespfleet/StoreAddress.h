#pragma once

#include <memory>
#include <optional>
#include <string>

#include "store/FleetStore.h"

namespace vesprun {

/// What is wrong with an address; empty when nothing is.
std::string storeFault(const std::string& address);

/// Opens the store at an address: a ClickHouse database when it begins with "http://" or
/// "https://", else an SQLite file. To be loaded, what is missing is made: the file, readable for
/// its owner alone, or the tables, and a store of an earlier version is brought up to date. `least`
/// is the least number of devices of a store that is made. Throws `StoreFailure`.
std::unique_ptr<FleetStore> openFleetStore(const std::string& address, StoreUse use,
                                           std::optional<int> least = {});

}  // namespace vesprun
