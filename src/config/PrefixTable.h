#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string_view>
#include <vector>

namespace vesprun {

/// Answers a key by the first prefix, in the order given, that it begins with; the empty prefix
/// fits every key.
///
/// The prefixes are sorted, and each knows the longest other one that it begins with. The longest
/// prefix of a key is then the last one not above the key, or else one that this one begins with.
class PrefixTable {
 public:
  /// Different prefixes, whose texts must outlive the table; fewer than 2^32.
  explicit PrefixTable(const std::vector<std::string_view>& prefixes = {});

  /// The place of the first prefix in order with which `key` begins.
  std::optional<std::size_t> find(std::string_view key) const;

 private:
  struct Entry {
    std::string_view text;
    std::uint32_t first;   ///< lowest place of this prefix and of those that it begins with
    const Entry* longest;  ///< other prefix that it begins with, or null
  };

  std::vector<Entry> _sorted;
  std::string_view _common;           ///< beginning of all
  std::vector<std::uint64_t> _heads;  ///< bytes after it, to search without going to the texts
};

}  // namespace vesprun
