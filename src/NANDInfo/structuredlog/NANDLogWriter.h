#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The validity-list handler of the structured storage log: when the list is wanted
/// (`gNeedValidityList`), submits the write amplification, the NAND info and the list as a NAND
/// log. False, with a text on standard error, when `buffer` does not hold the wanted list.
bool WriteValidityListNANDLog(std::span<const std::uint8_t> buffer, const PropertyValue* properties,
                              std::string_view className);

/// Submits a text log "StorageStatus": the diagnostic header and one line of `fields`, in order,
/// with only numbers and arrays that hold a number. Its date is kept in the user defaults, even
/// when the submission fails; until 7 days later, and while the date lies in the future, nothing is
/// written. Null `fields` are never written.
void NLW_WriteLog(std::string_view logType, const PropertyDict* fields);

/// The device's identifier for fault reports, or "error" when it is unknown.
std::string GetFaultlineKey();

}  // namespace vesprun
