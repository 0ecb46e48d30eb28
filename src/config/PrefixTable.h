#pragma once

#include <cstdint>
#include <limits>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "common/PropertyDict.h"

namespace vesprun {

/// Answers a key by the first prefix, in the order of a dictionary of prefixes, that it begins
/// with; the empty prefix fits every key.
///
/// The prefixes are a trie in a double array: the child of a state for a byte lies in the cell at
/// the state's base plus the byte, and belongs to it when the cell names the state as its parent.
/// Each state knows the first prefix in order among those that end on the way to it, so that a
/// look-up goes along the key as far as states lead and has its answer. It costs at most the length
/// of the key, however many prefixes there are.
class PrefixTable {
 public:
  using Entry = std::pair<std::string, PropertyValue>;  ///< prefix and options

  /// All prefixes together must be shorter than 2^31 bytes.
  explicit PrefixTable(PropertyDict optionsByPrefix = {});

  /// The first prefix in order with which `key` begins, and its options, or null. Valid as long as
  /// the table.
  const Entry* find(std::string_view key) const;

 private:
  static constexpr std::uint32_t kNone = std::numeric_limits<std::uint32_t>::max();

  struct Cell {
    std::uint32_t base = 0;  ///< wraps: a base may lie before the first cell
    std::uint32_t parent = kNone;
    std::uint32_t answer = kNone;  ///< place in the order
  };
  /// The prefixes, in sorted order, that lead through one byte of one state.
  struct Branch {
    std::uint8_t byte;
    std::uint32_t begin;
    std::uint32_t end;
  };

  bool isFree(std::uint32_t cell) const {
    return cell >= _cells.size() || (cell != 0 && _cells[cell].parent == kNone);
  }
  std::uint32_t baseFor(std::span<const Branch> branches, std::uint32_t& firstFree);

  PropertyDict _optionsByPrefix;
  std::vector<Cell> _cells;  ///< the first is the state of the empty text
};

}  // namespace vesprun
