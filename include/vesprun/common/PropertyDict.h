#pragma once

#include <tsl/ordered_map.h>

#include <algorithm>
#include <cstddef>
#include <functional>
#include <initializer_list>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "PropertyValue.h"

namespace vesprun {

/// A dictionary of `PropertyValue` with string keys. Entries keep the order in which their keys
/// were first set; setting a key again replaces its value in place. Look-up takes constant time.
class PropertyDict {
  struct KeyHash {
    using is_transparent = void;
    std::size_t operator()(std::string_view key) const {
      return std::hash<std::string_view>{}(key);
    }
  };
  // Entries lie in a vector: an empty dictionary, and there are many, allocates nothing.
  using Entry = std::pair<std::string, PropertyValue>;
  using Map = tsl::ordered_map<std::string, PropertyValue, KeyHash, std::equal_to<>,
                               std::allocator<Entry>, std::vector<Entry>>;

 public:
  using const_iterator = Map::const_iterator;  ///< over pairs of key and value, in order

  PropertyDict() = default;
  PropertyDict(std::initializer_list<std::pair<std::string, PropertyValue>> entries) {
    for (const auto& [key, value] : entries) {
      set(key, value);
    }
  }

  /// The value under `key`, or null. Valid until the dictionary is changed.
  const PropertyValue* find(std::string_view key) const {
    const auto entry = _entries.find(key);
    return entry != _entries.end() ? &entry->second : nullptr;
  }
  bool contains(std::string_view key) const { return find(key) != nullptr; }

  // The same for one type: null too when the value is of another.
  const PropertyDict* findDict(std::string_view key) const {
    return find<PropertyDict>(key, &PropertyValue::dict);
  }
  const PropertyArray* findArray(std::string_view key) const {
    return find(key, &PropertyValue::array);
  }
  const std::string* findString(std::string_view key) const {
    return find(key, &PropertyValue::string);
  }
  const Number* findNumber(std::string_view key) const { return find(key, &PropertyValue::number); }
  const Bytes* findData(std::string_view key) const { return find(key, &PropertyValue::data); }
  const Date* findDate(std::string_view key) const { return find(key, &PropertyValue::date); }

  void set(std::string_view key, PropertyValue value) {
    // Most keys are new: one search finds that out and where they go.
    auto [entry, isNew] = _entries.try_emplace(std::string(key), std::move(value));
    if (!isNew) {
      entry.value() = std::move(value);  // which was not taken
    }
  }
  /// Removes the entry, keeping the order of the others; false when there was none.
  bool remove(std::string_view key) {
    const auto entry = _entries.find(key);
    if (entry == _entries.end()) {
      return false;
    }
    _entries.erase(entry);
    return true;
  }
  /// Sets every entry of `other`, in its order.
  void merge(const PropertyDict& other) {
    for (const auto& [key, value] : other) {
      set(key, value);
    }
  }
  void clear() { _entries.clear(); }
  void reserve(std::size_t count) { _entries.reserve(count); }

  std::size_t size() const { return _entries.size(); }
  bool empty() const { return _entries.empty(); }
  const_iterator begin() const { return _entries.begin(); }
  const_iterator end() const { return _entries.end(); }

  friend bool operator==(const PropertyDict& left, const PropertyDict& right);

 private:
  template <typename T>
  const T* find(std::string_view key, const T* (PropertyValue::*typed)() const) const {
    const PropertyValue* value = find(key);
    return value != nullptr ? (value->*typed)() : nullptr;
  }

  Map _entries;
};

// What a value can only do where a dictionary is complete.

inline PropertyValue::PropertyValue(PropertyDict dict)
    : _value(std::make_unique<PropertyDict>(std::move(dict))) {}

inline PropertyValue::PropertyValue(const PropertyValue& other) : _value(copyOf(other._value)) {}

inline PropertyValue& PropertyValue::operator=(const PropertyValue& other) {
  if (this != &other) {
    _value = copyOf(other._value);
  }
  return *this;
}

inline PropertyValue::~PropertyValue() = default;

inline PropertyValue::Value PropertyValue::copyOf(const Value& value) {
  return std::visit(
      [](const auto& held) -> Value {
        if constexpr (std::same_as<std::decay_t<decltype(held)>, DictBox>) {
          return held ? std::make_unique<PropertyDict>(*held) : nullptr;
        } else {
          return held;
        }
      },
      value);
}

inline bool operator==(const PropertyValue& left, const PropertyValue& right) {
  if (left._value.index() != right._value.index()) {
    return false;
  }
  const PropertyDict* leftDict = left.dict();
  const PropertyDict* rightDict = right.dict();
  if (leftDict != nullptr && rightDict != nullptr) {
    return *leftDict == *rightDict;
  }
  return left._value == right._value;
}

inline bool operator==(const PropertyDict& left, const PropertyDict& right) {
  return left.size() == right.size() &&
         std::all_of(left.begin(), left.end(), [&right](const auto& entry) {
           const PropertyValue* value = right.find(entry.first);
           return value != nullptr && *value == entry.second;
         });
}

}  // namespace vesprun
