#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "NANDInfo/parsers/KnownNames.h"
#include "common/PropertyDict.h"

namespace vesprun {

/// The result of the statistics parsers: an ordered list of named unsigned 64-bit fields, possibly
/// with repeated names. Names of known fields are referred to; all others share one text, so that a
/// field needs no allocation of its own.
class GenericParserCxt {
 public:
  static constexpr std::size_t kMaxNameLength = 98;  ///< longer names are cut

  struct Field {
    std::string_view name;  ///< valid until the context is changed
    std::uint64_t value;
    std::optional<std::uint32_t> knownHash;  ///< of a known name

    /// In decimal.
    std::string text() const { return std::to_string(value); }
    PropertyKey key() const {
      return knownHash ? PropertyKey::permanent(name, *knownHash) : PropertyKey(name);
    }
  };

  /// In the order in which fields were appended.
  class const_iterator {
   public:
    using iterator_category = std::input_iterator_tag;
    using value_type = Field;
    using difference_type = std::ptrdiff_t;
    using pointer = const Field*;
    using reference = Field;

    const_iterator(const GenericParserCxt& ctx, std::size_t index) : _ctx(&ctx), _index(index) {}
    Field operator*() const { return (*_ctx)[_index]; }
    const_iterator& operator++() {
      ++_index;
      return *this;
    }
    const_iterator operator++(int) {
      const_iterator before = *this;
      ++_index;
      return before;
    }
    friend bool operator==(const const_iterator&, const const_iterator&) = default;

   private:
    const GenericParserCxt* _ctx;
    std::size_t _index;
  };

  std::size_t size() const { return _entries.size(); }
  bool empty() const { return _entries.empty(); }
  /// `index` is below `size()`.
  Field operator[](std::size_t index) const {
    const Entry& entry = _entries[index];
    if (entry.known != nullptr) {
      return {{entry.known, entry.nameSize}, entry.value, entry.hashOrBegin};
    }
    return {std::string_view(_names).substr(entry.hashOrBegin, entry.nameSize), entry.value, {}};
  }
  const_iterator begin() const { return {*this, 0}; }
  const_iterator end() const { return {*this, size()}; }

  /// Appends a field named `prefix` + `suffix`, cut to `kMaxNameLength`. False, and nothing
  /// appended, when memory runs out.
  bool append(std::string_view prefix, std::string_view suffix, std::uint64_t value) noexcept;
  bool append(std::string_view name, std::uint64_t value) noexcept {
    return append({}, name, value);
  }
  /// Appends `count` fields under these names: the little-endian values of `width` bytes, 1 to 8,
  /// at `source`. False when memory ran out for some, which are missing.
  bool appendKnown(KnownNames names, const std::uint8_t* source, std::size_t width,
                   std::size_t count) noexcept;
  /// Empties the context and frees its memory.
  void release() { *this = GenericParserCxt(); }

 private:
  struct Entry {
    const char* known;  ///< the name; null when it is in `_names`
    std::uint32_t nameSize;
    std::uint32_t hashOrBegin;  ///< of a known name its hash, else its place in `_names`
    std::uint64_t value;
  };

  std::string _names;
  std::vector<Entry> _entries;
};

/// Appends a field named `prefix` + `suffix`, cut to 98 characters. False, and nothing appended,
/// when memory runs out.
bool AddSingleValueToGenericContext(GenericParserCxt& ctx, std::string_view prefix,
                                    std::string_view suffix, std::uint64_t value);

inline constexpr std::uint32_t kMaxFieldsOfOneCall = 65'535;

/// Appends the `count` little-endian elements of `width` bytes at `source`, at any address. A
/// single element is named `name`, several `name` + index from 0, cut to 98 characters.
///
/// True, and nothing appended, when `width` or `count` is 0. False, and nothing appended, when
/// `width` is above 8, or `count` above `kMaxFieldsOfOneCall`: a part of the array would pass for
/// all of it. False also when memory runs out for some elements, which are missing.
bool AddMultipleFieldsToGenericContext(GenericParserCxt& ctx, std::string_view name,
                                       const std::uint8_t* source, std::uint32_t width,
                                       std::uint32_t count);

/// Empties the context for further use.
void ReleaseGenericParserCxt(GenericParserCxt& ctx);

/// The fields whose names `keeps` accepts as a dictionary of unsigned 64-bit numbers. A repeated
/// name keeps its first place and its last value.
template <std::predicate<std::string_view> Filter>
PropertyDict CreateDictFromCxt(const GenericParserCxt& ctx, const Filter& keeps) {
  PropertyDict dict;
  for (const GenericParserCxt::Field field : ctx) {
    if (keeps(field.name)) {
      dict.set(field.key(), field.value);
    }
  }
  return dict;
}

/// The same for all fields.
PropertyDict CreateDictFromCxt(const GenericParserCxt& ctx);

}  // namespace vesprun
