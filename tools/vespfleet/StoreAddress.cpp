#include "StoreAddress.h"

#include "clickhouse/ClickHouseStore.h"
#include "sqlite/SqliteStore.h"

namespace vesprun {

std::string storeFault(const std::string& address) {
  const std::size_t scheme = address.find("://");
  if (address.starts_with("http://") || address.starts_with("https://")) {
    return ClickHouseServer::faultOf(address);
  }
  const bool isScheme =
      scheme != std::string::npos && scheme != 0 &&
      address.find_first_not_of(
          "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ0123456789+.-") == scheme;
  return isScheme ? "a store is an SQLite file, http://HOST:PORT/DATABASE or https://..." : "";
}

std::unique_ptr<FleetStore> openFleetStore(const std::string& address, StoreUse use,
                                           std::optional<int> least) {
  if (address.starts_with("http://") || address.starts_with("https://")) {
    return std::make_unique<ClickHouseStore>(address, use, least);
  }
  return std::make_unique<SqliteStore>(address, use, least);
}

}  // namespace vesprun
