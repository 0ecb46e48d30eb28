#pragma once

#include <optional>

#include "../Export.h"
#include "../common/PropertyDict.h"

namespace vesprun {

// The legacy NAND info: keys that begin with "com.quill.NANDInfo.", in a fixed order, to numbers of
// the type that their figure has: signed 32-bit for the driver version, unsigned 32-bit for the
// export version and the geometry, unsigned 64-bit for all others.

/// The legacy NAND info with its version fields and the purgeable space. When the statistics cannot
/// be had, a dictionary with "com.quill.NANDInfo.Error" and "com.quill.NANDInfo.ErrorMessage".
VESPRUN_EXPORT PropertyDict CopyNANDInfo() noexcept;

/// `CopyNANDInfo` for the daily log; empty on a day on which the statistics go to analytics events
/// alone, every other day (UTC). `options` is not consulted.
VESPRUN_EXPORT std::optional<PropertyDict> CopyNANDInfoWithOptions(
    const PropertyDict& options) noexcept;

/// Sets the legacy NAND info without its version fields in `info`, replacing what has the same
/// keys. Nothing happens when the statistics cannot be had.
VESPRUN_EXPORT void DumpNANDInfo(PropertyDict& info) noexcept;

}  // namespace vesprun
