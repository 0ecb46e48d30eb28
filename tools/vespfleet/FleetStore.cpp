#include "FleetStore.h"

#include "ClickHouseStore.h"
#include "SqliteStore.h"

namespace vesprun {

std::unique_ptr<FleetStore> openFleetStore(const std::string& address, bool toBeLoaded) {
  if (address.starts_with("http://")) {
    return std::make_unique<ClickHouseStore>(address, toBeLoaded);
  }
  return std::make_unique<SqliteStore>(address, toBeLoaded);
}

}  // namespace vesprun
