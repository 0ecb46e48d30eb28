#pragma once

#include "../Export.h"
#include "../common/RegistryHandle.h"

namespace vesprun {

struct nand_exporter_t;

/// A connection to the storage controller for other programs; theirs to keep between
/// `openORUConnection` and `closeORUConnection`.
struct ORUConnection {
  RegistryHandle service = 0;
  RegistryHandle connection = 0;
  nand_exporter_t* exporter = nullptr;  ///< the library's own entry for the controller's class
};

/// Opens the storage controller. The connection's handle is written into the exporter, too, and
/// stays there when the connection is closed. False, with lines on the standard error stream and
/// nothing left open, when there is no controller, when it refuses, or when it offers no base
/// statistics.
VESPRUN_EXPORT bool openORUConnection(ORUConnection& connection) noexcept;

/// Closes the record's connection and releases its service, if any, and forgets them.
VESPRUN_EXPORT void closeORUConnection(ORUConnection& connection) noexcept;

}  // namespace vesprun
