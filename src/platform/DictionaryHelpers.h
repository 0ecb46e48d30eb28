#pragma once

#include <cstdint>
#include <string_view>

#include "common/PropertyDict.h"

namespace vesprun {

/// The platform's codes for kinds of number in memory.
enum class PVNumberType : std::uint32_t { Int8 = 1, Int64 = 4, Int = 9, Double = 13 };

/// The value under `key`, or the 32-bit number 0 if the key is missing.
PropertyValue GetNumberFromDictionarySafe(const PropertyDict& dict, std::string_view key);

/// Stores under `key` the number of that kind at `value`, aligned or not. A null `value` or an
/// unknown kind is logged at level error, and the dictionary stays as it is.
void setNumberValueForType(PropertyDict& dict, std::string_view key, const void* value,
                           PVNumberType kind);

/// The same, appended to an array.
void appendNumberValueForType(PropertyArray& array, const void* value, PVNumberType kind);

/// Stores `value` under `key`, for a walk over another dictionary's entries.
void CopyDictionary(std::string_view key, const PropertyValue& value, PropertyDict& destination);

}  // namespace vesprun
