#pragma once

#include <bit>
#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Date.h"
#include "Number.h"
#include "PropertyKey.h"

namespace vesprun {

class PropertyDict;
class PropertyValue;

using PropertyArray = std::vector<PropertyValue>;
using Bytes = std::vector<std::uint8_t>;

/// A dynamically typed value: dictionary, array, string, number, boolean, data or date. It owns its
/// content; copies are deep, moves cheap. It takes 16 bytes; an empty dictionary, array, string or
/// data takes no others.
///
/// The readers `dict()` to `date()` return null for another type. Their pointer is valid until the
/// value is changed, moved or destroyed.
class PropertyValue {
 public:
  PropertyValue(PropertyDict dict);  // NOLINT(google-explicit-constructor): a value is any of these
  PropertyValue(PropertyArray array) : PropertyValue(Type::Array, std::move(array)) {}
  PropertyValue(std::string text) : PropertyValue(Type::String, std::move(text)) {}
  PropertyValue(std::string_view text) : PropertyValue(std::string(text)) {}
  PropertyValue(const char* text) : PropertyValue(std::string(text)) {}
  PropertyValue(const PropertyKey& text) : PropertyValue(std::string(text)) {}
  PropertyValue(Bytes data) : PropertyValue(Type::Data, std::move(data)) {}
  PropertyValue(Date date) : PropertyValue(Type::Date, date) {}
  PropertyValue(Number number) : _number(number), _type(Type::Number) {}
  template <NumberType T>
  PropertyValue(T number) : PropertyValue(Number(number)) {}
  PropertyValue(std::same_as<bool> auto boolean)
      : _number(0U), _type(Type::Boolean), _boolean(boolean) {}

  PropertyValue(const PropertyValue& other);
  PropertyValue(PropertyValue&& other) noexcept
      : _number(other._number), _type(other._type), _boolean(other._boolean) {
    other._type = Type::Boolean;  // has no box
  }
  PropertyValue& operator=(const PropertyValue& other) {
    PropertyValue(other).swap(*this);
    return *this;
  }
  PropertyValue& operator=(PropertyValue&& other) noexcept {
    PropertyValue(std::move(other)).swap(*this);
    return *this;
  }
  ~PropertyValue() {
    if (_type > Type::Boolean && _number.asUInt64() != 0) {
      deleteBox();
    }
  }

  const PropertyDict* dict() const { return content<PropertyDict>(Type::Dict); }
  PropertyDict* dict();
  const PropertyArray* array() const { return content<PropertyArray>(Type::Array); }
  const std::string* string() const { return content<std::string>(Type::String); }
  const Number* number() const { return _type == Type::Number ? &_number : nullptr; }
  const bool* boolean() const { return _type == Type::Boolean ? &_boolean : nullptr; }
  const Bytes* data() const { return content<Bytes>(Type::Data); }
  const Date* date() const { return content<Date>(Type::Date); }

  /// Equal in type and content. Numbers compare by value, whatever the kind; dictionaries
  /// regardless of order.
  friend bool operator==(const PropertyValue& left, const PropertyValue& right);

 private:
  enum class Type : std::uint8_t { Number, Boolean, Dict, Array, String, Data, Date };

  // Other types lie in a box on the heap. The number is its address, or 0 for empty content.
  template <typename T>
  PropertyValue(Type type, T content) : _number(0U), _type(type) {
    if (content != T()) {
      setBox(new T(std::move(content)));
    }
  }

  template <typename T>
  T* box() const {
    return std::bit_cast<T*>(_number.asUInt64());
  }
  template <typename T>
  void setBox(T* box) {
    _number = Number(std::bit_cast<std::uint64_t>(box));
  }
  template <typename T>
  const T* content(Type type) const {
    static const T kEmpty{};
    return _type != type ? nullptr : _number.asUInt64() != 0 ? box<T>() : &kEmpty;
  }

  template <typename Visit>
  void visitBox(Visit visit) const;
  void deleteBox();
  void swap(PropertyValue& other) noexcept {
    std::swap(_number, other._number);
    std::swap(_type, other._type);
    std::swap(_boolean, other._boolean);
  }

  [[no_unique_address]] Number _number;  // the other two lie in its padding
  Type _type;
  bool _boolean = false;
};

}  // namespace vesprun

#include "PropertyDict.h"  // IWYU pragma: export: a value is complete only with it
