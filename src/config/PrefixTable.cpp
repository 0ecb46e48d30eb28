#include "config/PrefixTable.h"

#include <algorithm>

namespace vesprun {
namespace {

std::size_t commonLength(std::string_view left, std::string_view right) {
  const auto [end, ignored] = std::mismatch(left.begin(), left.end(), right.begin(), right.end());
  return static_cast<std::size_t>(end - left.begin());
}

/// The first eight bytes as a number that orders as the text does; a shorter text may tie.
std::uint64_t head(std::string_view text) {
  std::uint64_t head = 0;
  for (std::size_t i = 0; i < sizeof head; ++i) {
    head = head << 8 | (i < text.size() ? static_cast<std::uint8_t>(text[i]) : 0);
  }
  return head;
}

}  // namespace

PrefixTable::PrefixTable(const std::vector<std::string_view>& prefixes) {
  for (const std::string_view prefix : prefixes) {
    _sorted.push_back({prefix, static_cast<std::uint32_t>(_sorted.size()), nullptr});
  }
  if (_sorted.empty()) {
    return;
  }
  std::sort(_sorted.begin(), _sorted.end(),
            [](const Entry& left, const Entry& right) { return left.text < right.text; });
  const std::string_view front = _sorted.front().text;
  _common = front.substr(0, commonLength(front, _sorted.back().text));
  const Entry* longest = nullptr;
  for (Entry& entry : _sorted) {
    while (longest != nullptr && !entry.text.starts_with(longest->text)) {
      longest = longest->longest;
    }
    if (longest != nullptr) {
      entry.longest = longest;
      entry.first = std::min(entry.first, longest->first);
    }
    longest = &entry;
    _heads.push_back(head(entry.text.substr(_common.size())));
  }
}

std::optional<std::size_t> PrefixTable::find(std::string_view key) const {
  if (!key.starts_with(_common)) {
    return std::nullopt;
  }
  const auto [from, to] =
      std::equal_range(_heads.begin(), _heads.end(), head(key.substr(_common.size())));
  const auto above = std::upper_bound(
      _sorted.begin() + (from - _heads.begin()), _sorted.begin() + (to - _heads.begin()), key,
      [](std::string_view text, const Entry& entry) { return text < entry.text; });
  if (above == _sorted.begin()) {
    return std::nullopt;
  }
  const Entry* entry = &*(above - 1);
  if (!key.starts_with(entry->text)) {
    const std::size_t length = commonLength(entry->text, key);
    while (entry != nullptr && entry->text.size() > length) {
      entry = entry->longest;
    }
  }
  return entry != nullptr ? std::optional<std::size_t>(entry->first) : std::nullopt;
}

}  // namespace vesprun
