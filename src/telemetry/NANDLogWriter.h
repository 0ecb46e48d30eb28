#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

/// The validity-list handler of the structured storage log: submits the write amplification, the
/// NAND info and the list itself as a NAND log, when the list is wanted (`gNeedValidityList`).
/// `properties` and `className` are not used. False, with a text on the standard error stream, when
/// the list is wanted and `buffer` does not hold one.
bool WriteValidityListNANDLog(std::span<const std::uint8_t> buffer, const PropertyValue* properties,
                              std::string_view className);

/// Submits a text log named "StorageStatus" with one line made of `fields`, in their order, under
/// the diagnostic header. Numbers and arrays that hold a number are written, everything else is
/// left out. Whatever the submission's outcome, its date is kept in the user defaults, and for 7
/// days from it on nothing more is written; nor is it while that date lies in the future. Nothing
/// is written when there are no fields (null).
void NLW_WriteLog(std::string_view logType, const PropertyDict* fields);

/// The device's identifier for fault reports, or "error" when the platform does not tell.
std::string GetFaultlineKey();

}  // namespace vesprun
