#pragma once

#include <algorithm>
#include <array>
#include <compare>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <limits>
#include <string_view>
#include <utility>

#include "NANDInfo/tables/FieldTable.h"

namespace vesprun {

/// What a field can be in: the sets that may leave the device, the views of the stats magazine, the
/// derived fields that go into other sets than the FTL's, and the analytics events.
enum class FieldList : std::uint8_t {
  None,
  InNoSet,  ///< an event adds the field itself, or lists it and never has it
  FTL,
  MSP,
  Storage,
  Accumulating,
  Dynamic,
  Derived,
  FTLCounters,
  FTLHistograms1,
  FTLHistograms2,
  MSPCounters,
  StorageStats,
  Daily,
  Weekly,
  Monthly,
};

/// A list that a field is in.
struct FieldListEntry {
  FieldList list = FieldList::None;
  /// Orders the list; fields without one come last. Sets have the fields with the fewest digits
  /// first, views of the magazine are sorted by name.
  std::uint16_t place = std::numeric_limits<std::uint16_t>::max();

  consteval FieldListEntry() = default;
  consteval FieldListEntry(FieldList fieldList) : list(fieldList) {}
  consteval FieldListEntry(FieldList fieldList, std::uint16_t placeInList)
      : list(fieldList), place(placeInList) {}
};

/// All that is known of a field, or of consecutively numbered ones.
struct FieldRow {
  FieldRange fields;  ///< digits: of the sets that round
  std::array<FieldListEntry, 10> lists;

  /// A field that is in an event but in no set would never be sent: it does not compile.
  consteval FieldRow(FieldRange range, std::array<FieldListEntry, 10> entries)
      : fields(range), lists(entries) {
    bool isInSet = false;
    bool isInEvent = false;
    bool isInNoSet = false;
    for (const FieldListEntry& entry : lists) {
      isInSet = isInSet || (FieldList::FTL <= entry.list && entry.list <= FieldList::Derived);
      isInEvent = isInEvent || FieldList::FTLCounters <= entry.list;
      isInNoSet = isInNoSet || entry.list == FieldList::InNoSet;
    }
    if (isInEvent && isInSet == isInNoSet) {
      throw "a field of an event is in a set, or marked as in none";
    }
  }

  /// Null when it is not in the list.
  constexpr const FieldListEntry* in(FieldList list) const {
    for (const FieldListEntry& entry : lists) {
      if (entry.list == list) {
        return &entry;
      }
    }
    return nullptr;
  }
};

namespace fieldRows {

using enum FieldList;

inline constexpr auto kFieldRows = std::to_array<FieldRow>({
#include "NANDInfo/tables/StorageFields.inc"
// The sets have this order where digits are the same.
#include "NANDInfo/tables/FTLFields.inc"
#include "NANDInfo/tables/MSPFields.inc"
});

inline constexpr auto kRanges = []<std::size_t... kRow>(std::index_sequence<kRow...>) {
  return std::array<FieldRange, sizeof...(kRow)>{kFieldRows[kRow].fields...};
}
(std::make_index_sequence<kFieldRows.size()>());

}  // namespace fieldRows

/// The rows of a list, in its order.
template <FieldList kList>
inline constexpr auto kRowsOf = [] {
  struct Sorted {
    std::uint16_t place;
    std::uint8_t digits;
    std::string_view stem;
    std::uint32_t number;
    std::uint16_t row;

    constexpr auto operator<=>(const Sorted&) const = default;
  };
  constexpr const auto& kRows = fieldRows::kFieldRows;
  constexpr bool kSortedByDigits = kList <= FieldList::Storage;
  constexpr bool kSortedByName = kList == FieldList::Accumulating || kList == FieldList::Dynamic;
  constexpr auto kCount = [] {
    std::size_t count = 0;
    for (const FieldRow& row : kRows) {
      if (row.in(kList) != nullptr) {
        ++count;
      }
    }
    return count;
  }();
  std::array<Sorted, kCount> sorted{};
  std::size_t count = 0;
  for (std::size_t i = 0; i < kRows.size(); ++i) {
    const auto& [fields, lists] = kRows[i];
    if (const FieldListEntry* entry = kRows[i].in(kList)) {
      sorted[count++] = {entry->place, kSortedByDigits ? fields.digits : std::uint8_t{0},
                         kSortedByName ? fields.stem : std::string_view(),
                         kSortedByName ? fields.first : 0, static_cast<std::uint16_t>(i)};
    }
  }
  std::sort(sorted.begin(), sorted.end());
  std::array<std::uint16_t, kCount> rows{};
  std::transform(sorted.begin(), sorted.end(), rows.begin(), std::mem_fn(&Sorted::row));
  return rows;
}();

/// Their fields.
template <FieldList kList>
inline constexpr auto kFieldsOf = []<std::size_t... kPlace>(std::index_sequence<kPlace...>) {
  return std::array<FieldRange, sizeof...(kPlace)>{
      fieldRows::kFieldRows[kRowsOf<kList>[kPlace]].fields...};
}
(std::make_index_sequence<kRowsOf<kList>.size()>());

/// The place of each row in a list, both counted from 1; 0 for a row outside. A class, as the
/// library would show the symbol of a plain array.
struct PlacesOfRows {
  std::array<std::uint16_t, fieldRows::kFieldRows.size() + 1> places{};
};

template <FieldList kList>
inline constexpr PlacesOfRows kPlacesOfRows = [] {
  PlacesOfRows rows;
  std::uint16_t place = 0;
  for (const std::uint16_t row : kRowsOf<kList>) {
    rows.places[row + 1U] = ++place;
  }
  return rows;
}();

/// The list as a table, to be searched.
template <FieldList kList>
constexpr FieldTable fieldTableOf() {
  return FieldTable(kFieldIndexOf<kFieldsOf<kList>>, kPlacesOfRows<kList>.places);
}

/// All of them. A field in two rows does not compile.
inline constexpr FieldTable kAllFields = fieldTable<fieldRows::kRanges>();

/// The row of a field, counted from 1; 0 when it has none.
constexpr std::uint16_t rowOfField(std::string_view name) {
  const FieldRange* const fields = kAllFields.find(name);
  return fields != nullptr ? static_cast<std::uint16_t>(fields - fieldRows::kRanges.data() + 1)
                           : std::uint16_t{0};
}

}  // namespace vesprun
