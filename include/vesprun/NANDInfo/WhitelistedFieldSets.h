#pragma once

#include <cstdint>
#include <optional>

#include "../Export.h"
#include "../common/PropertyDict.h"

namespace vesprun {

/// The FTL fields of now with "HLT_APIErrorMessage", unfiltered. Nothing when `enabled` is 0 or on
/// failure.
VESPRUN_EXPORT std::optional<PropertyDict> CopyNANDFTLInfo(bool useStatKeyParser,
                                                           std::uint32_t enabled) noexcept;

// The sets of storage statistics that may leave the device. Each is cut down to the fields of its
// table and, with `round`, its numbers keep the digits that the table gives. A set holds what could
// be had, and "HLT_APIErrorMessage", the first error text of the process.

/// The FTL fields of now and the fields derived from them. Without the former the error text is all
/// there is.
VESPRUN_EXPORT PropertyDict CopyWhitelistedNANDFTLInfo(bool round) noexcept;

/// Nothing. Other programs may look for it.
VESPRUN_EXPORT std::optional<PropertyDict> CopyWhitelistedNANDFTLCountersInfo() noexcept;

/// The set of each MSP under its index ("0", "1" and so on), beside the error text. With each come,
/// unrounded, the fields derived for the storage as a whole and the 16-bit parts of the firmware's
/// version, "fw_version_identifier_0" (the lowest) to "fw_version_identifier_3".
VESPRUN_EXPORT PropertyDict CopyWhitelistedNANDMSPInfo(bool round) noexcept;

/// Six derived fields, each when it can be had, and the sizes and update counts of the stored
/// images, 0 where the service does not know.
VESPRUN_EXPORT PropertyDict CopyWhitelistedStorageStats(bool round) noexcept;

}  // namespace vesprun
