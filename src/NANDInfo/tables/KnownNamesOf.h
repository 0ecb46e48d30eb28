#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string_view>
#include <type_traits>

#include "NANDInfo/tables/FieldName.h"
#include "NANDInfo/tables/FieldRows.h"
#include "NANDInfo/tables/KnownNames.h"

namespace vesprun {

/// The names of all elements of all statistics in `kTable`, laid out at compile time: the
/// statistic's own for a single value; for an array's element followed by `kSeparator` and the
/// index.
template <const auto& kTable, const char* kSeparator>
class KnownNamesOf {
 public:
  using Row = typename std::decay_t<decltype(kTable)>::value_type;

  /// Of a row of the table.
  static KnownNames of(const Row& row) {
    const auto index = static_cast<std::size_t>(&row - kTable.data());
    return {kLayout.text.data(), &kLayout.places[kLayout.firstOfRow[index]]};
  }

 private:
  /// Calls `visit(row, name)` for each.
  template <typename Visit>
  static constexpr void forEach(Visit visit) {
    for (std::size_t row = 0; row < kTable.size(); ++row) {
      for (std::uint32_t element = 0; element < kTable[row].count; ++element) {
        NameText name;
        name.append(kTable[row].name);
        if (kTable[row].count > 1) {
          name.append(kSeparator).append(element);
        }
        visit(row, std::string_view(name));
      }
    }
  }

  static constexpr auto kSizes = [] {
    struct Sizes {
      std::size_t names = 0;
      std::size_t characters = 0;
    } sizes;
    forEach([&sizes](std::size_t, std::string_view name) {
      ++sizes.names;
      sizes.characters += name.size();
    });
    return sizes;
  }();

  struct Layout {
    std::array<char, kSizes.characters> text{};
    std::array<KnownNames::Place, kSizes.names> places{};
    std::array<std::uint16_t, kTable.size()> firstOfRow{};
  };

  static constexpr Layout kLayout = [] {
    Layout layout;
    std::uint16_t names = 0;
    std::uint32_t begin = 0;
    std::size_t lastRow = kTable.size();
    forEach([&](std::size_t row, std::string_view name) {
      if (row != lastRow) {
        layout.firstOfRow[row] = names;
        lastRow = row;
      }
      layout.places[names++] = {begin, static_cast<std::uint16_t>(name.size()), rowOfField(name)};
      for (const char character : name) {
        layout.text[begin++] = character;
      }
    });
    return layout;
  }();
};

}  // namespace vesprun
