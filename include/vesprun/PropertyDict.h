#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "Export.h"

namespace vesprun {

struct Date;
class Number;
class PropertyValue;

using PropertyArray = std::vector<PropertyValue>;
using Bytes = std::vector<std::uint8_t>;

/// A dictionary of `PropertyValue` by string. Entries keep the order in which keys were first set;
/// setting a key again replaces its value in place. Look-up takes constant time, whoever chose the
/// keys.
class VESPRUN_EXPORT PropertyDict {
  using Entries = std::vector<std::pair<std::string, PropertyValue>>;

 public:
  using const_iterator = Entries::const_iterator;  ///< over pairs of key and value, in order

  PropertyDict() noexcept;
  PropertyDict(std::initializer_list<std::pair<std::string, PropertyValue>> entries);
  PropertyDict(const PropertyDict& other);
  PropertyDict(PropertyDict&& other) noexcept;
  PropertyDict& operator=(const PropertyDict& other);
  PropertyDict& operator=(PropertyDict&& other) noexcept;
  ~PropertyDict();

  /// Null for a missing key. Valid until the dictionary is changed.
  const PropertyValue* find(std::string_view key) const;
  bool contains(std::string_view key) const { return find(key) != nullptr; }

  // Null also for a value of another type.
  const PropertyDict* findDict(std::string_view key) const;
  const PropertyArray* findArray(std::string_view key) const;
  const std::string* findString(std::string_view key) const;
  const Number* findNumber(std::string_view key) const;
  const Bytes* findData(std::string_view key) const;
  const Date* findDate(std::string_view key) const;
  /// The key's number as a 64-bit integer, or `otherwise` if it has none.
  std::int64_t integerOr(std::string_view key, std::int64_t otherwise) const;

  template <std::convertible_to<std::string_view> Key>
  void set(Key&& key, PropertyValue value);
  /// Keeps the order of the others; false when there was none.
  bool remove(std::string_view key);
  /// Sets every entry of `other`, in its order.
  void merge(PropertyDict&& other);
  void merge(const PropertyDict& other);
  void clear();
  void reserve(std::size_t count);

  std::size_t size() const;
  bool empty() const { return size() == 0; }
  const_iterator begin() const;
  const_iterator end() const;

  /// Equal entries, in any order.
  friend VESPRUN_EXPORT bool operator==(const PropertyDict& left, const PropertyDict& right);

 private:
  struct Map;

  void insertOrAssign(std::string&& key, PropertyValue&& value);
  const Entries& entries() const;
  void makeMap(std::size_t count);

  // A list of 100,000 keys is as many dictionaries of one entry: those have no hash table.
  Entries _few;
  std::unique_ptr<Map> _many;  // in place of `_few` from the ninth entry
};

}  // namespace vesprun

#include "PropertyValue.h"  // IWYU pragma: export: a dictionary is complete only with it
