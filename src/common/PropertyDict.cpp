#include "vesprun/PropertyDict.h"

#include <tsl/ordered_map.h>

#include <algorithm>
#include <functional>

#include "common/KeyHash.h"

namespace vesprun {
namespace {

constexpr std::size_t kMaxFew = 8;

template <typename T>
const T* typed(const PropertyValue* value, const T* (PropertyValue::*read)() const) {
  return value != nullptr ? (value->*read)() : nullptr;
}

}  // namespace

struct PropertyDict::Map : tsl::ordered_map<std::string, PropertyValue, KeyHash, std::equal_to<>,
                                            Entries::allocator_type, Entries> {};

PropertyDict::PropertyDict() noexcept = default;
PropertyDict::PropertyDict(PropertyDict&&) noexcept = default;
PropertyDict& PropertyDict::operator=(PropertyDict&&) noexcept = default;
PropertyDict::~PropertyDict() = default;

PropertyDict::PropertyDict(std::initializer_list<std::pair<std::string, PropertyValue>> entries) {
  for (const auto& [key, value] : entries) {
    set(key, value);
  }
}

PropertyDict::PropertyDict(const PropertyDict& other)
    : _few(other._few), _many(other._many ? std::make_unique<Map>(*other._many) : nullptr) {}

PropertyDict& PropertyDict::operator=(const PropertyDict& other) {
  return *this = PropertyDict(other);
}

const PropertyValue* PropertyDict::find(std::string_view key) const {
  if (_many) {
    const auto entry = _many->find(key);
    return entry != _many->end() ? &entry->second : nullptr;
  }
  const auto entry = std::ranges::find(_few, key, &Entries::value_type::first);
  return entry != _few.end() ? &entry->second : nullptr;
}

const PropertyDict* PropertyDict::findDict(std::string_view key) const {
  return typed<PropertyDict>(find(key), &PropertyValue::dict);
}
const PropertyArray* PropertyDict::findArray(std::string_view key) const {
  return typed(find(key), &PropertyValue::array);
}
const std::string* PropertyDict::findString(std::string_view key) const {
  return typed(find(key), &PropertyValue::string);
}
const Number* PropertyDict::findNumber(std::string_view key) const {
  return typed(find(key), &PropertyValue::number);
}
const Bytes* PropertyDict::findData(std::string_view key) const {
  return typed(find(key), &PropertyValue::data);
}
const Date* PropertyDict::findDate(std::string_view key) const {
  return typed(find(key), &PropertyValue::date);
}
std::int64_t PropertyDict::integerOr(std::string_view key, std::int64_t otherwise) const {
  const Number* const number = findNumber(key);
  return number != nullptr ? number->asInt64() : otherwise;
}

void PropertyDict::insertOrAssign(std::string&& key, PropertyValue&& value) {
  if (!_many) {
    const auto entry = std::ranges::find(_few, key, &Entries::value_type::first);
    if (entry != _few.end()) {
      entry->second = std::move(value);
      return;
    }
    if (_few.size() < kMaxFew) {
      _few.emplace_back(std::move(key), std::move(value));
      return;
    }
    makeMap(_few.size() + 1);
  }
  // Most keys are new: one search finds that out and where they go.
  auto [entry, isNew] = _many->try_emplace(std::move(key), std::move(value));
  if (!isNew) {
    entry.value() = std::move(value);  // which was not taken
  }
}

bool PropertyDict::remove(std::string_view key) {
  if (_many) {
    return _many->erase(key) != 0;
  }
  return std::erase_if(_few, [key](const auto& entry) { return entry.first == key; }) != 0;
}

void PropertyDict::merge(PropertyDict&& other) {
  if (empty()) {
    *this = std::move(other);
  } else {
    merge(std::as_const(other));
  }
}

void PropertyDict::merge(const PropertyDict& other) {
  for (const auto& [key, value] : other) {
    set(key, value);
  }
}

void PropertyDict::clear() { *this = PropertyDict(); }

void PropertyDict::reserve(std::size_t count) {
  if (_many) {
    _many->reserve(count);
  } else if (count > kMaxFew) {
    makeMap(count);
  } else {
    _few.reserve(count);
  }
}

std::size_t PropertyDict::size() const { return entries().size(); }
PropertyDict::const_iterator PropertyDict::begin() const { return entries().begin(); }
PropertyDict::const_iterator PropertyDict::end() const { return entries().end(); }

const PropertyDict::Entries& PropertyDict::entries() const {
  return _many ? _many->values_container() : _few;
}

void PropertyDict::makeMap(std::size_t count) {
  auto map = std::make_unique<Map>();
  map->reserve(count);
  for (auto& [key, value] : _few) {
    map->try_emplace(std::move(key), std::move(value));
  }
  _few = {};
  _many = std::move(map);
}

bool operator==(const PropertyDict& left, const PropertyDict& right) {
  return left.size() == right.size() &&
         std::all_of(left.begin(), left.end(), [&right](const auto& entry) {
           const PropertyValue* value = right.find(entry.first);
           return value != nullptr && *value == entry.second;
         });
}

}  // namespace vesprun
