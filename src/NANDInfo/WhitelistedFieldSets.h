#pragma once

#include <optional>

#include "common/PropertyDict.h"

namespace vesprun {

// The sets of storage statistics that may leave the device. Each is cut down to the fields of its
// table (see `FieldSets.h`) and, with `round`, its numbers keep the digits that the table gives. No
// operation fails as a whole: a set holds what could be had, and always "HLT_APIErrorMessage", the
// first error text of the process.

/// The FTL fields of now and the fields derived from them. Without the former the error text is all
/// there is.
PropertyDict CopyWhitelistedNANDFTLInfo(bool round);

/// Nothing. Other programs may look for it.
std::optional<PropertyDict> CopyWhitelistedNANDFTLCountersInfo();

/// The set of each MSP under its index ("0", "1" and so on), beside the error text. A set goes with
/// the derived fields of `gatherORUOtherData` and the 16-bit parts of the firmware's version,
/// "fw_version_identifier_0" (the lowest) to "fw_version_identifier_3", none of them rounded. There
/// are neither when the derived fields cannot be had.
PropertyDict CopyWhitelistedNANDMSPInfo(bool round);

/// Six derived fields, each when it can be had, and the sizes and update counts of the stored
/// images, 0 where the service does not tell.
PropertyDict CopyWhitelistedStorageStats(bool round);

}  // namespace vesprun
