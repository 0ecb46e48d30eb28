#pragma once

#include <optional>

#include "Export.h"
#include "PropertyDict.h"

namespace vesprun {

// The legacy NAND info: keys "com.quill.NANDInfo.…" in a fixed order, to numbers: the driver
// version signed 32-bit, export version and geometry unsigned 32-bit, all others unsigned 64-bit.

/// With version fields and purgeable space. Without statistics: "com.quill.NANDInfo.Error" and
/// "com.quill.NANDInfo.ErrorMessage".
VESPRUN_EXPORT PropertyDict CopyNANDInfo() noexcept;

/// For the daily log; empty every other day (UTC), when the statistics go to analytics events
/// alone. `options` is ignored.
VESPRUN_EXPORT std::optional<PropertyDict> CopyNANDInfoWithOptions(
    const PropertyDict& options) noexcept;

/// Sets the legacy NAND info without version fields in `info`. Leaves `info`
/// unchanged if no statistics are available.
VESPRUN_EXPORT void DumpNANDInfo(PropertyDict& info) noexcept;

}  // namespace vesprun
