#include "common/PropertyValue.h"

#include <algorithm>

namespace vesprun {

PropertyValue::PropertyValue(PropertyDict dict)
    : _value(std::make_unique<PropertyDict>(std::move(dict))) {}

PropertyValue::PropertyValue(const PropertyValue& other) : _value(copyOf(other._value)) {}

PropertyValue& PropertyValue::operator=(const PropertyValue& other) {
  if (this != &other) {
    _value = copyOf(other._value);
  }
  return *this;
}

PropertyValue::~PropertyValue() = default;

PropertyValue::Value PropertyValue::copyOf(const Value& value) {
  return std::visit(
      [](const auto& held) -> Value {
        if constexpr (std::same_as<std::decay_t<decltype(held)>, DictBox>) {
          return std::make_unique<PropertyDict>(*held);
        } else {
          return held;
        }
      },
      value);
}

bool operator==(const PropertyValue& left, const PropertyValue& right) {
  if (left._value.index() != right._value.index()) {
    return false;
  }
  if (const PropertyDict* dict = left.dict()) {
    return *dict == *right.dict();
  }
  return left._value == right._value;
}

bool operator==(const PropertyDict& left, const PropertyDict& right) {
  return left.size() == right.size() &&
         std::all_of(left.begin(), left.end(), [&right](const auto& entry) {
           const PropertyValue* value = right.find(entry.first);
           return value != nullptr && *value == entry.second;
         });
}

}  // namespace vesprun
