#pragma once

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "NANDInfo/tables/FieldName.h"
#include "common/PropertyKey.h"

namespace vesprun {

/// A row of a field table: consecutively numbered fields, or a single one, with the significant
/// digits that they keep, where the table says so.
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
  constexpr bool contains(std::uint32_t number) const { return first <= number && number <= last; }

 private:
  consteval FieldRange(std::uint8_t digitCount, FieldName name)
      : stem(name.stem), first(name.number), last(name.number), digits(digitCount) {}
};

/// A compile-time hash index over the stems of a table's ranges; ranges of one stem are chained in
/// table order. A duplicate name does not compile.
template <std::size_t RangeCount>
struct FieldIndex {
  // Positions of ranges, counted from 1; 0: none.
  std::array<std::uint16_t, std::bit_ceil(2 * RangeCount)> slots{};
  std::array<std::uint16_t, RangeCount> nextOfStem{};
  std::size_t fieldCount = 0;

  explicit consteval FieldIndex(const std::array<FieldRange, RangeCount>& ranges) {
    for (std::size_t i = 0; i < RangeCount; ++i) {
      fieldCount += ranges[i].size();
      std::uint16_t* link = &slots[hashOfText(ranges[i].stem) % slots.size()];
      while (*link != 0 && ranges[*link - 1].stem != ranges[i].stem) {
        link = link == &slots.back() ? &slots.front() : link + 1;
      }
      for (; *link != 0; link = &nextOfStem[*link - 1U]) {
        const FieldRange& earlier = ranges[*link - 1];
        if (earlier.first <= ranges[i].last && ranges[i].first <= earlier.last) {
          throw "a name is in the table twice";
        }
      }
      *link = static_cast<std::uint16_t>(i + 1);
    }
  }
};

/// An ordered set of field names with their digits. Ranges and index are constants; nothing is
/// built at start.
class FieldTable {
 public:
  template <std::size_t RangeCount>
  constexpr FieldTable(const std::array<FieldRange, RangeCount>& ranges,
                       const FieldIndex<RangeCount>& index)
      : _ranges(ranges),
        _slots(index.slots),
        _nextOfStem(index.nextOfStem),
        _fieldCount(index.fieldCount) {}

  constexpr std::size_t size() const { return _fieldCount; }

  /// The range of `name`, or null, in constant time and without memory.
  const FieldRange* find(std::string_view name) const { return find(splitFieldName(name)); }
  const FieldRange* find(const FieldName& name) const;
  bool contains(std::string_view name) const { return find(name) != nullptr; }

  std::span<const FieldRange> ranges() const { return _ranges; }

  /// Calls `visit(name, range)` for each name in table order. The name lives as long as the call.
  template <typename Visit>
  void forEach(Visit&& visit) const {
    std::string name;
    for (const FieldRange& range : _ranges) {
      for (std::size_t i = 0; i < range.size(); ++i) {
        assignFieldName(name, range.stem, range.first + static_cast<std::uint32_t>(i));
        visit(std::string_view(name), range);
      }
    }
  }

 private:
  std::span<const FieldRange> _ranges;
  std::span<const std::uint16_t> _slots;
  std::span<const std::uint16_t> _nextOfStem;
  std::size_t _fieldCount;
};

inline const FieldRange* FieldTable::find(const FieldName& name) const {
  const std::size_t mask = _slots.size() - 1;
  std::size_t slot = hashOfText(name.stem) & mask;
  while (_slots[slot] != 0 && _ranges[_slots[slot] - 1U].stem != name.stem) {
    slot = (slot + 1) & mask;
  }
  for (std::size_t range = _slots[slot]; range != 0; range = _nextOfStem[range - 1]) {
    if (_ranges[range - 1].contains(name.number)) {
      return &_ranges[range - 1];
    }
  }
  return nullptr;
}

template <const auto& kRanges>
inline constexpr FieldIndex<kRanges.size()> kFieldIndexOf(kRanges);

/// The table of ranges that hold `kFieldCount` names.
template <const auto& kRanges, std::size_t kFieldCount>
constexpr FieldTable fieldTable() {
  static_assert(kFieldIndexOf<kRanges>.fieldCount == kFieldCount);
  return FieldTable(kRanges, kFieldIndexOf<kRanges>);
}

}  // namespace vesprun
