#pragma once

#include <tsl/ordered_map.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <initializer_list>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "PropertyKey.h"
#include "PropertyValue.h"

namespace vesprun {

/// A dictionary of `PropertyValue` by string. Entries keep the order in which keys were first set;
/// setting a key again replaces its value in place. Look-up takes constant time.
class PropertyDict {
  struct KeyHash {
    using is_transparent = void;
    std::size_t operator()(const PropertyKey& key) const { return key.hash(); }
    std::size_t operator()(std::string_view key) const { return hashOfText(key); }
  };
  using Entries = std::vector<std::pair<PropertyKey, PropertyValue>>;
  using Map = tsl::ordered_map<PropertyKey, PropertyValue, KeyHash, std::equal_to<>,
                               Entries::allocator_type, Entries>;

 public:
  using const_iterator = Entries::const_iterator;  ///< over pairs of key and value, in order

  PropertyDict() = default;
  PropertyDict(std::initializer_list<std::pair<std::string, PropertyValue>> entries) {
    for (const auto& [key, value] : entries) {
      set(key, value);
    }
  }
  PropertyDict(const PropertyDict& other)
      : _few(other._few), _many(other._many ? std::make_unique<Map>(*other._many) : nullptr) {}
  PropertyDict(PropertyDict&&) noexcept = default;
  PropertyDict& operator=(const PropertyDict& other) { return *this = PropertyDict(other); }
  PropertyDict& operator=(PropertyDict&&) noexcept = default;
  ~PropertyDict() = default;

  /// Null for a missing key. Valid until the dictionary is changed.
  const PropertyValue* find(std::string_view key) const {
    if (_many) {
      const auto entry = _many->find(key);
      return entry != _many->end() ? &entry->second : nullptr;
    }
    const auto entry = findFew(key);
    return entry != _few.end() ? &entry->second : nullptr;
  }
  bool contains(std::string_view key) const { return find(key) != nullptr; }

  // Null also for a value of another type.
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
  /// The key's number as a 64-bit integer, or `otherwise` if it has none.
  std::int64_t integerOr(std::string_view key, std::int64_t otherwise) const {
    const Number* number = findNumber(key);
    return number != nullptr ? number->asInt64() : otherwise;
  }
  const Bytes* findData(std::string_view key) const { return find(key, &PropertyValue::data); }
  const Date* findDate(std::string_view key) const { return find(key, &PropertyValue::date); }

  void set(std::string_view key, PropertyValue value) {
    if (PropertyValue* const expected = findExpected(key)) {
      *expected = std::move(value);
    } else {
      set(PropertyKey(key), std::move(value));
    }
  }
  void set(PropertyKey key, PropertyValue value) {
    if (!_many) {
      if (const auto entry = findFew(key); entry != _few.end()) {
        _few[static_cast<std::size_t>(entry - _few.begin())].second = std::move(value);
        return;
      }
      if (_few.size() < kMostFew) {
        _few.emplace_back(std::move(key), std::move(value));
        return;
      }
      makeMap(kMostFew + 1);
    }
    // Most keys are new: one search finds that out and where they go.
    auto [entry, isNew] = _many->try_emplace(std::move(key), std::move(value));
    if (!isNew) {
      entry.value() = std::move(value);  // which was not taken
    }
    _expected = static_cast<std::size_t>(entry - _many->begin()) + 1;
  }
  /// Keeps the order of the others; false when there was none.
  bool remove(std::string_view key) {
    if (_many) {
      return _many->erase(key) != 0;
    }
    const auto entry = findFew(key);
    if (entry == _few.end()) {
      return false;
    }
    _few.erase(entry);
    return true;
  }
  /// Sets every entry of `other`, in its order.
  void merge(PropertyDict&& other) {
    if (empty()) {
      *this = std::move(other);
    } else {
      merge(std::as_const(other));
    }
  }
  void merge(const PropertyDict& other) {
    for (const auto& [key, value] : other) {
      set(key, value);
    }
  }
  void clear() { *this = {}; }
  void reserve(std::size_t count) {
    if (_many) {
      _many->reserve(count);
    } else if (count > kMostFew) {
      makeMap(count);
    } else {
      _few.reserve(count);
    }
  }

  std::size_t size() const { return entries().size(); }
  bool empty() const { return entries().empty(); }
  const_iterator begin() const { return entries().begin(); }
  const_iterator end() const { return entries().end(); }

  friend bool operator==(const PropertyDict& left, const PropertyDict& right);

 private:
  template <typename T>
  const T* find(std::string_view key, const T* (PropertyValue::*typed)() const) const {
    const PropertyValue* value = find(key);
    return value != nullptr ? (value->*typed)() : nullptr;
  }

  // Most dictionaries are small and need no hash table.
  static constexpr std::size_t kMostFew = 8;

  const Entries& entries() const { return _many ? _many->values_container() : _few; }

  const_iterator findFew(std::string_view key) const {
    return std::find_if(_few.begin(), _few.end(),
                        [key](const auto& entry) { return entry.first == key; });
  }

  /// Keys that are set again mostly come in their first order: this saves a search.
  PropertyValue* findExpected(std::string_view key) {
    if (!_many || _expected >= _many->size()) {
      return nullptr;
    }
    auto entry = _many->nth(_expected);
    if (entry.key() != key) {
      return nullptr;
    }
    ++_expected;
    return &entry.value();
  }

  void makeMap(std::size_t count) {
    auto map = std::make_unique<Map>();
    map->reserve(count);
    for (auto& [key, value] : _few) {
      map->try_emplace(std::move(key), std::move(value));
    }
    _few = {};
    _many = std::move(map);
  }

  Entries _few;
  std::unique_ptr<Map> _many;  // once there have been more than a few
  std::size_t _expected = 0;   // in `_many`, the place after the last one that was set
};

// What a value can only do where a dictionary is complete.

inline PropertyValue::PropertyValue(PropertyDict dict)
    : PropertyValue(Type::Dict, std::move(dict)) {}

inline PropertyDict* PropertyValue::dict() {
  if (_type == Type::Dict && _number.asUInt64() == 0) {
    setBox(new PropertyDict);
  }
  return const_cast<PropertyDict*>(std::as_const(*this).dict());
}

template <typename Visit>
void PropertyValue::visitBox(Visit visit) const {
  switch (_type) {
    case Type::Number:
    case Type::Boolean:
      break;
    case Type::Dict:
      return visit(box<PropertyDict>());
    case Type::Array:
      return visit(box<PropertyArray>());
    case Type::String:
      return visit(box<std::string>());
    case Type::Data:
      return visit(box<Bytes>());
    case Type::Date:
      return visit(box<Date>());
  }
}

inline PropertyValue::PropertyValue(const PropertyValue& other)
    : _number(other._number), _type(other._type), _boolean(other._boolean) {
  visitBox([this](auto* box) {
    if (box != nullptr) {
      setBox(new std::decay_t<decltype(*box)>(*box));
    }
  });
}

inline void PropertyValue::deleteBox() {
  visitBox([](auto* box) { delete box; });
}

inline bool operator==(const PropertyValue& left, const PropertyValue& right) {
  if (left._type != right._type) {
    return false;
  }
  if (left._type == PropertyValue::Type::Number) {
    return left._number == right._number;
  }
  bool areEqual = left._boolean == right._boolean;
  left.visitBox([&](const auto* box) {
    using Content = std::decay_t<decltype(*box)>;
    areEqual = *left.content<Content>(left._type) == *right.content<Content>(right._type);
  });
  return areEqual;
}

inline bool operator==(const PropertyDict& left, const PropertyDict& right) {
  return left.size() == right.size() &&
         std::all_of(left.begin(), left.end(), [&right](const auto& entry) {
           const PropertyValue* value = right.find(entry.first);
           return value != nullptr && *value == entry.second;
         });
}

}  // namespace vesprun
