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
/// The prefixes are sorted, and each knows the longest other one that it begins with. A key's
/// longest prefix is then the last one not above the key, or one that this one begins with.
class PrefixTable {
 public:
  /// Fewer than 2^32 different prefixes, whose texts outlive the table.
  explicit PrefixTable(const std::vector<std::string_view>& prefixes = {});
  // Not to be copied: entries refer to one another.
  PrefixTable(PrefixTable&&) noexcept = default;
  PrefixTable& operator=(PrefixTable&&) noexcept = default;

  std::optional<std::size_t> find(std::string_view key) const;

 private:
  struct Entry {
    std::string_view text;
    std::uint32_t first;             ///< lowest place of this prefix and of those it begins with
    std::uint32_t depth = 0;         ///< how many others it begins with
    const Entry* longest = nullptr;  ///< the longest other prefix that it begins with
    const Entry* far = nullptr;      ///< a shorter one, so that few steps lead to any of them
  };

  /// The last prefix that is not above the key, or another one that begins with all prefixes of
  /// the key; or null.
  const Entry* nearest(std::string_view key) const;

  std::vector<Entry> _sorted;
  std::string_view _common;           ///< beginning of all prefixes
  std::vector<std::uint64_t> _heads;  ///< bytes after it, to search without going to the texts
};

}  // namespace vesprun
