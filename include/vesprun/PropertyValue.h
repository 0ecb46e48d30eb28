#pragma once

#include <concepts>
#include <string>
#include <string_view>
#include <utility>
#include <variant>

#include "Date.h"
#include "Number.h"
#include "PropertyDict.h"

namespace vesprun {

/// A dynamically typed value: dictionary, array, string, number, boolean, data or date. It owns its
/// content; copies are deep, moves cheap.
///
/// The readers `dict()` to `date()` return null for another type. Their pointer is valid until the
/// value is changed, moved or destroyed.
class PropertyValue {
 public:
  // NOLINTBEGIN(google-explicit-constructor): a value is any of these
  PropertyValue(PropertyDict dict) : _content(std::move(dict)) {}
  PropertyValue(PropertyArray array) : _content(std::move(array)) {}
  PropertyValue(std::string text) : _content(std::move(text)) {}
  PropertyValue(std::string_view text) : _content(std::string(text)) {}
  PropertyValue(const char* text) : _content(std::string(text)) {}
  PropertyValue(Bytes data) : _content(std::move(data)) {}
  PropertyValue(Date date) : _content(date) {}
  PropertyValue(Number number) : _content(number) {}
  PropertyValue(NumberType auto number) : _content(Number(number)) {}
  PropertyValue(std::same_as<bool> auto boolean) : _content(boolean) {}
  // NOLINTEND(google-explicit-constructor)

  const PropertyDict* dict() const { return std::get_if<PropertyDict>(&_content); }
  PropertyDict* dict() { return std::get_if<PropertyDict>(&_content); }
  const PropertyArray* array() const { return std::get_if<PropertyArray>(&_content); }
  const std::string* string() const { return std::get_if<std::string>(&_content); }
  const Number* number() const { return std::get_if<Number>(&_content); }
  const bool* boolean() const { return std::get_if<bool>(&_content); }
  const Bytes* data() const { return std::get_if<Bytes>(&_content); }
  const Date* date() const { return std::get_if<Date>(&_content); }

  /// Equal in type and content. Numbers compare by value, whatever the kind; dictionaries
  /// regardless of order.
  bool operator==(const PropertyValue&) const = default;

 private:
  std::variant<Number, bool, Date, std::string, Bytes, PropertyArray, PropertyDict> _content;
};

template <std::convertible_to<std::string_view> Key>
void PropertyDict::set(Key&& key, PropertyValue value) {
  insertOrAssign(std::string(std::forward<Key>(key)), std::move(value));
}

}  // namespace vesprun
