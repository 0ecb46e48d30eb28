#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "NANDInfo/tables/FieldName.h"

namespace vesprun {

/// A row of a field table: consecutively numbered fields, or a single one, and in tables of digits
/// the significant digits that they keep.
struct FieldRange {
  std::string_view stem;
  std::uint32_t first;  ///< `FieldName::kNoNumber`, as `last`, for a name without a number
  std::uint32_t last;
  std::uint8_t digits;

  consteval FieldRange(const char* name) : FieldRange(0, name) {}
  consteval FieldRange(const char* nameStem, std::uint32_t firstNumber, std::uint32_t lastNumber)
      : FieldRange(0, nameStem, firstNumber, lastNumber) {}
  consteval FieldRange(std::uint8_t digitCount, const char* name)
      : FieldRange(digitCount, splitFieldName(name)) {}
  consteval FieldRange(std::uint8_t digitCount, const char* nameStem, std::uint32_t firstNumber,
                       std::uint32_t lastNumber)
      : stem(nameStem), first(firstNumber), last(lastNumber), digits(digitCount) {
    if (firstNumber > lastNumber || splitFieldName(nameStem).number != FieldName::kNoNumber) {
      throw "a range runs upwards and its stem does not end in a digit";
    }
  }

  constexpr std::size_t size() const { return std::size_t{last - first} + 1; }
  constexpr bool contains(std::string_view name) const {
    if (!name.starts_with(stem)) {
      return false;
    }
    const FieldName rest = splitFieldName(name.substr(stem.size()));
    return rest.stem.empty() && first <= rest.number && rest.number <= last;
  }
  /// Calls `visit(name)` for each name. It lives as long as the call.
  template <typename Visit>
  constexpr void forEach(Visit&& visit) const {
    for (std::size_t i = 0; i < size(); ++i) {
      visit(
          std::string_view(NameText().append(stem).append(first + static_cast<std::uint32_t>(i))));
    }
  }

 private:
  consteval FieldRange(std::uint8_t digitCount, FieldName name)
      : stem(name.stem), first(name.number), last(name.number), digits(digitCount) {}
};

/// The number of names that the ranges hold.
template <std::size_t kRangeCount>
constexpr std::size_t countNames(const std::array<FieldRange, kRangeCount>& ranges) {
  std::size_t names = 0;
  for (const FieldRange& range : ranges) {
    names += range.size();
  }
  return names;
}

/// A name's place in the hash index of a table.
struct FieldSlot {
  std::uint16_t hash = 0;   ///< upper half of the name's hash, so that few others are compared
  std::uint16_t range = 0;  ///< counted from 1; 0: the slot is free
};

/// A compile-time hash index over the names of `kRanges`. A duplicate name does not compile.
template <const auto& kRanges>
struct FieldIndex {
  std::array<FieldSlot, std::bit_ceil(2 * countNames(kRanges))> slots{};

  consteval FieldIndex() {
    for (std::size_t i = 0; i < kRanges.size(); ++i) {
      kRanges[i].forEach([&](std::string_view name) {
        const std::uint32_t hash = hashOfFieldName(name);
        std::size_t slot = hash % slots.size();
        for (; slots[slot].range != 0; slot = (slot + 1) % slots.size()) {
          if (slots[slot].hash == hash >> 16 && kRanges[slots[slot].range - 1U].contains(name)) {
            throw "a name is in the table twice";
          }
        }
        slots[slot] = {static_cast<std::uint16_t>(hash >> 16), static_cast<std::uint16_t>(i + 1)};
      });
    }
  }
};

/// An ordered set of field names with their digits. Ranges and index are compile-time constants.
class FieldTable {
 public:
  /// `placesOfRows`: for each row of `kFieldRows`, counted from 1, the row's place in `kRanges`,
  /// counted from 1; 0 for none. Empty for a table that is not made of such rows.
  template <const auto& kRanges>
  constexpr explicit FieldTable(const FieldIndex<kRanges>& index,
                                std::span<const std::uint16_t> placesOfRows = {})
      : _ranges(kRanges),
        _slots(index.slots),
        _placesOfRows(placesOfRows),
        _size(countNames(kRanges)) {}

  constexpr std::size_t size() const { return _size; }

  /// The range of `name`, or null. Takes constant time and allocates nothing.
  constexpr const FieldRange* find(std::string_view name) const {
    const std::uint32_t hash = hashOfFieldName(name);
    const std::size_t mask = _slots.size() - 1;
    for (std::size_t slot = hash & mask; _slots[slot].range != 0; slot = (slot + 1) & mask) {
      if (_slots[slot].hash == hash >> 16 && _ranges[_slots[slot].range - 1U].contains(name)) {
        return &_ranges[_slots[slot].range - 1U];
      }
    }
    return nullptr;
  }
  bool contains(std::string_view name) const { return find(name) != nullptr; }

  bool isMadeOfRows() const { return !_placesOfRows.empty(); }
  /// The range of a name whose row is known; null also for row 0. The table is made of rows.
  const FieldRange* findRow(std::uint16_t row) const {
    const std::uint16_t range = _placesOfRows[row];
    return range != 0 ? &_ranges[range - 1U] : nullptr;
  }

  std::span<const FieldRange> ranges() const { return _ranges; }

  /// Calls `visit(name, range)` for each name in table order. The name lives as long as the call.
  template <typename Visit>
  void forEach(Visit&& visit) const {
    for (const FieldRange& range : _ranges) {
      range.forEach([&](std::string_view name) { visit(name, range); });
    }
  }

 private:
  std::span<const FieldRange> _ranges;
  std::span<const FieldSlot> _slots;
  std::span<const std::uint16_t> _placesOfRows;
  std::size_t _size;
};

template <const auto& kRanges>
inline constexpr FieldIndex<kRanges> kFieldIndexOf;

template <const auto& kRanges>
constexpr FieldTable fieldTable() {
  return FieldTable(kFieldIndexOf<kRanges>);
}

}  // namespace vesprun
