#include "platform/DictionaryHelpers.h"

#include <cstring>
#include <optional>

#include "platform/SystemLog.h"

namespace vesprun {
namespace {

template <NumberType T>
Number load(const void* value) {
  T number;
  std::memcpy(&number, value, sizeof number);
  return Number(number);
}

std::optional<Number> numberOf(const void* value, PVNumberType kind) {
  if (value != nullptr) {
    switch (kind) {
      case PVNumberType::Int8:
        return load<std::int8_t>(value);
      case PVNumberType::Int64:
        return load<std::int64_t>(value);
      case PVNumberType::Int:
        return load<std::int32_t>(value);
      case PVNumberType::Double:
        return load<double>(value);
    }
  }
  logMessage(LogLevel::Error, "Failed to create PVNumber from value: %p", value);
  return std::nullopt;
}

}  // namespace

PropertyValue GetNumberFromDictionarySafe(const PropertyDict& dict, std::string_view key) {
  const PropertyValue* value = dict.find(key);
  return value != nullptr ? *value : PropertyValue(std::int32_t{0});
}

void setNumberValueForType(PropertyDict& dict, std::string_view key, const void* value,
                           PVNumberType kind) {
  if (const std::optional<Number> number = numberOf(value, kind)) {
    dict.set(key, *number);
  }
}

void appendNumberValueForType(PropertyArray& array, const void* value, PVNumberType kind) {
  if (const std::optional<Number> number = numberOf(value, kind)) {
    array.emplace_back(*number);
  }
}

void CopyDictionary(std::string_view key, const PropertyValue& value, PropertyDict& destination) {
  destination.set(key, value);
}

}  // namespace vesprun
