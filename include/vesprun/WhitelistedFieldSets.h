#pragma once

#include <cstdint>
#include <optional>

#include "Export.h"
#include "PropertyDict.h"

namespace vesprun {

/// The current FTL fields with "HLT_APIErrorMessage", unfiltered. Nothing on failure or when
/// `enabled` is 0.
VESPRUN_EXPORT std::optional<PropertyDict> CopyNANDFTLInfo(bool useStatKeyParser,
                                                           std::uint32_t enabled) noexcept;

// Storage statistics that may leave the device: the fields of each set's table that are known, with
// `round` rounded to the table's digits, and "HLT_APIErrorMessage", the first error text of the
// process.

/// The current FTL fields and those derived from them; only the error text without the former.
VESPRUN_EXPORT PropertyDict CopyWhitelistedNANDFTLInfo(bool round) noexcept;

/// Always empty; kept because programs look up the symbol.
VESPRUN_EXPORT std::optional<PropertyDict> CopyWhitelistedNANDFTLCountersInfo() noexcept;

/// The set of each MSP by index ("0", "1", ...), and the error text beside them. Each also has,
/// unrounded, the derived fields of the whole storage and the 16-bit parts of the firmware version,
/// "fw_version_identifier_0" (lowest) to "fw_version_identifier_3".
VESPRUN_EXPORT PropertyDict CopyWhitelistedNANDMSPInfo(bool round) noexcept;

/// Six derived fields, and the sizes and update counts of the stored images, 0 when unknown.
VESPRUN_EXPORT PropertyDict CopyWhitelistedStorageStats(bool round) noexcept;

}  // namespace vesprun
