#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace vesprun {

/// Finds the first prefix, in the given order, with which a key begins; every key begins with the
/// empty one.
///
/// A tree that branches on the half bytes in which the prefixes differ leads to the prefix that
/// shares the longest beginning with the key. The key then begins with this prefix, or with
/// prefixes of it, or with none.
class PrefixTable {
 public:
  /// Fewer than a hundred million different prefixes, whose texts outlive the table.
  explicit PrefixTable(const std::vector<std::string_view>& prefixes = {});

  std::optional<std::size_t> find(std::string_view key) const;

 private:
  static constexpr std::uint32_t kNone = 0xFFFF'FFFF;

  struct Entry {
    std::string_view text;
    std::uint32_t first;            ///< lowest place of this prefix and of those it begins with
    std::uint32_t longest = kNone;  ///< the longest other prefix that it begins with
  };

  struct Node {
    std::uint32_t next;     ///< the first of its children, or a leaf's entry
    std::uint8_t low = 0;   ///< the first child's half byte
    std::uint8_t span = 0;  ///< children behind the first one; 0: a leaf
    std::uint64_t at = 0;   ///< the half byte of the key that chooses
  };

  std::vector<Entry> _sorted;
  std::vector<Node> _nodes;
};

}  // namespace vesprun
