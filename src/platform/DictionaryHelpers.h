#pragma once

#include <cstdint>
#include <string_view>

#include "vesprun/PropertyDict.h"

namespace vesprun {

/// The value under `key`, or the 32-bit number 0 if the key is missing.
inline PropertyValue GetNumberFromDictionarySafe(const PropertyDict& dict, std::string_view key) {
  const PropertyValue* value = dict.find(key);
  return value != nullptr ? *value : PropertyValue(std::int32_t{0});
}

/// Stores a number under `key`; it keeps its type.
template <NumberType T>
void setNumberValueForType(PropertyDict& dict, std::string_view key, T value) {
  dict.set(key, PropertyValue(Number(value)));
}

/// The same, appended to an array.
template <NumberType T>
void appendNumberValueForType(PropertyArray& array, T value) {
  array.emplace_back(Number(value));
}

/// Stores `value` under `key`, for a walk over another dictionary's entries.
inline void CopyDictionary(std::string_view key, const PropertyValue& value,
                           PropertyDict& destination) {
  destination.set(key, value);
}

}  // namespace vesprun
