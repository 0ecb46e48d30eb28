#pragma once

#include "../Export.h"
#include "../common/RegistryHandle.h"

namespace vesprun {

struct nand_exporter_t;

/// A connection to the storage controller, the caller's from `openORUConnection` to
/// `closeORUConnection`.
struct ORUConnection {
  RegistryHandle service = 0;
  RegistryHandle connection = 0;
  nand_exporter_t* exporter = nullptr;  ///< the library's own entry for the controller's class
};

/// Opens the storage controller. The handle also stays in the exporter, even after closing. False,
/// with lines on standard error and nothing left open, when there is no controller, it refuses, or
/// it has no base statistics.
VESPRUN_EXPORT bool openORUConnection(ORUConnection& connection) noexcept;

/// Closes the connection and releases the service, if any, and forgets them.
VESPRUN_EXPORT void closeORUConnection(ORUConnection& connection) noexcept;

}  // namespace vesprun
