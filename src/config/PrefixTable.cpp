#include "config/PrefixTable.h"

#include <algorithm>
#include <cstring>

namespace vesprun {
namespace {

std::size_t commonLength(std::string_view left, std::string_view right) {
  const auto [end, ignored] = std::mismatch(left.begin(), left.end(), right.begin(), right.end());
  return static_cast<std::size_t>(end - left.begin());
}

/// The first eight bytes as a number that orders as the text does; a shorter text may compare
/// equal.
std::uint64_t head(std::string_view text) {
  std::uint64_t bytes = 0;
  if (text.size() >= sizeof bytes) {
    std::memcpy(&bytes, text.data(), sizeof bytes);
  } else if (!text.empty()) {
    std::memcpy(&bytes, text.data(), text.size());
  }
  return __builtin_bswap64(bytes);
}

}  // namespace

PrefixTable::PrefixTable(const std::vector<std::string_view>& prefixes) {
  for (const std::string_view prefix : prefixes) {
    _sorted.push_back({prefix, static_cast<std::uint32_t>(_sorted.size())});
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
      entry.depth = longest->depth + 1;
      // Two jumps of one width become one of both, as in a skew-binary number.
      const Entry* const jump = longest->far;
      entry.far = jump != nullptr && jump->far != nullptr &&
                          longest->depth - jump->depth == jump->depth - jump->far->depth
                      ? jump->far
                      : longest;
    }
    longest = &entry;
    _heads.push_back(head(entry.text.substr(_common.size())));
  }
}

const PrefixTable::Entry* PrefixTable::nearest(std::string_view key) const {
  if (_sorted.empty() || key.size() < _common.size()) {
    return nullptr;
  }
  const std::uint64_t sought = head(key.substr(_common.size()));
  // Branch-free: a processor could not predict the branches.
  const std::uint64_t* last = _heads.data();
  for (std::size_t rest = _heads.size(); rest > 1; rest -= rest / 2) {
    const std::uint64_t* const middle = last + rest / 2;
    last = *middle <= sought ? middle : last;
  }
  const auto place = last - _heads.data();
  if (place == 0 || last[0] != sought || last[-1] != sought) {
    return &_sorted[static_cast<std::size_t>(place)];
  }
  const auto tied = std::lower_bound(_heads.begin(), _heads.begin() + place, sought);
  const Entry* const first = &_sorted[static_cast<std::size_t>(tied - _heads.begin())];
  return std::upper_bound(
             first + 1, _sorted.data() + place + 1, key,
             [](std::string_view text, const Entry& entry) { return text < entry.text; }) -
         1;
}

std::optional<std::size_t> PrefixTable::find(std::string_view key) const {
  const Entry* entry = nearest(key);
  if (entry != nullptr && !key.starts_with(entry->text)) {
    entry = entry->longest;
    const std::size_t length = entry != nullptr ? commonLength(entry->text, key) : 0;
    while (entry != nullptr && entry->text.size() > length) {
      const bool isFar = entry->far != nullptr && entry->far->text.size() > length;
      entry = isFar ? entry->far : entry->longest;
    }
  }
  return entry != nullptr ? std::optional<std::size_t>(entry->first) : std::nullopt;
}

}  // namespace vesprun
