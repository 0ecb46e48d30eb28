#pragma once

#include "Export.h"
#include "RegistryHandle.h"

namespace vesprun {

struct nand_exporter_t;

/// A connection to the storage controller, which the caller owns from `openORUConnection` to
/// `closeORUConnection`.
struct ORUConnection {
  RegistryHandle service = 0;
  RegistryHandle connection = 0;
  nand_exporter_t* exporter = nullptr;  ///< the library's own entry for the controller's class
};

/// Opens the storage controller. The exporter keeps the handle, even after closing. False, with
/// lines on standard error and nothing left open, when no controller is found, the controller
/// refuses, or it lacks base statistics.
VESPRUN_EXPORT bool openORUConnection(ORUConnection& connection) noexcept;

/// Closes the connection and releases the service, if there are any, and sets both to 0.
VESPRUN_EXPORT void closeORUConnection(ORUConnection& connection) noexcept;

}  // namespace vesprun
