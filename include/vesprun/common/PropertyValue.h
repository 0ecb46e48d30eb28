#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "Date.h"
#include "Number.h"

namespace vesprun {

class PropertyDict;
class PropertyValue;

using PropertyArray = std::vector<PropertyValue>;
using Bytes = std::vector<std::uint8_t>;

/// The dynamically typed value that the whole system exchanges: dictionary, array, string, number,
/// boolean, byte data or date. A value owns everything in it; copying copies deeply, moving is
/// cheap.
///
/// The readers `dict()` to `date()` return a pointer into the value, or null when it is of another
/// type. The pointer is valid as long as the value is neither changed nor destroyed.
class PropertyValue {
 public:
  PropertyValue(PropertyDict dict);  // NOLINT(google-explicit-constructor): a value is any of these
  PropertyValue(PropertyArray array) : _value(std::move(array)) {}
  PropertyValue(std::string text) : _value(std::move(text)) {}
  PropertyValue(std::string_view text) : _value(std::string(text)) {}
  PropertyValue(const char* text) : _value(std::string(text)) {}
  PropertyValue(Bytes data) : _value(std::move(data)) {}
  PropertyValue(Date date) : _value(date) {}
  PropertyValue(Number number) : _value(number) {}
  template <NumberType T>
  PropertyValue(T number) : _value(Number(number)) {}
  PropertyValue(std::same_as<bool> auto boolean) : _value(boolean) {}

  PropertyValue(const PropertyValue& other);
  PropertyValue(PropertyValue&& other) noexcept = default;
  PropertyValue& operator=(const PropertyValue& other);
  PropertyValue& operator=(PropertyValue&& other) noexcept = default;
  ~PropertyValue();

  const PropertyDict* dict() const {
    const auto* box = std::get_if<DictBox>(&_value);
    return box != nullptr ? box->get() : nullptr;
  }
  PropertyDict* dict() { return const_cast<PropertyDict*>(std::as_const(*this).dict()); }
  const PropertyArray* array() const { return std::get_if<PropertyArray>(&_value); }
  const std::string* string() const { return std::get_if<std::string>(&_value); }
  const Number* number() const { return std::get_if<Number>(&_value); }
  const bool* boolean() const { return std::get_if<bool>(&_value); }
  const Bytes* data() const { return std::get_if<Bytes>(&_value); }
  const Date* date() const { return std::get_if<Date>(&_value); }

  /// Equal type and content. Numbers compare by value, not by kind; dictionaries compare as sets of
  /// entries, whatever their order.
  friend bool operator==(const PropertyValue& left, const PropertyValue& right);

 private:
  // Boxed because a dictionary holds values; never null but in a moved-from value.
  using DictBox = std::unique_ptr<PropertyDict>;
  using Value = std::variant<DictBox, PropertyArray, std::string, Number, bool, Bytes, Date>;

  static Value copyOf(const Value& value);

  Value _value;
};

}  // namespace vesprun

#include "PropertyDict.h"  // IWYU pragma: export: a value is complete only with it
