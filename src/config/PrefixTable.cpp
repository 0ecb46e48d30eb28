#include "config/PrefixTable.h"

#include <algorithm>

namespace vesprun {
namespace {

std::size_t commonLength(std::string_view left, std::string_view right) {
  const auto [end, ignored] = std::mismatch(left.begin(), left.end(), right.begin(), right.end());
  return static_cast<std::size_t>(end - left.begin());
}

/// The half byte at that place plus 1, or 0 behind the end: these numbers sort as the texts do.
unsigned halfByte(std::string_view text, std::size_t at) {
  if (at / 2 >= text.size()) {
    return 0;
  }
  const auto byte = static_cast<std::uint8_t>(text[at / 2]);
  return (at % 2 == 0 ? byte >> 4 : byte & 0xF) + 1;
}

/// The first half byte in which two different texts differ.
std::size_t firstDifference(std::string_view left, std::string_view right) {
  const std::size_t at = 2 * commonLength(left, right);
  return halfByte(left, at) != halfByte(right, at) ? at : at + 1;
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
  std::uint32_t longest = kNone;
  for (Entry& entry : _sorted) {
    while (longest != kNone && !entry.text.starts_with(_sorted[longest].text)) {
      longest = _sorted[longest].longest;
    }
    if (longest != kNone) {
      entry.longest = longest;
      entry.first = std::min(entry.first, _sorted[longest].first);
    }
    longest = static_cast<std::uint32_t>(&entry - _sorted.data());
  }

  /// The entries below a node.
  struct Range {
    std::size_t node;
    std::uint32_t from, to;
  };
  std::vector<Range> ranges = {{0, 0, static_cast<std::uint32_t>(_sorted.size())}};
  _nodes.push_back({0});
  while (!ranges.empty()) {
    const auto [node, from, to] = ranges.back();
    ranges.pop_back();
    if (to - from == 1) {
      _nodes[node] = {from};
      continue;
    }
    const std::size_t at = firstDifference(_sorted[from].text, _sorted[to - 1].text);
    const unsigned low = halfByte(_sorted[from].text, at);
    const unsigned high = halfByte(_sorted[to - 1].text, at);
    const std::size_t children = _nodes.size();
    _nodes[node] = {static_cast<std::uint32_t>(children), static_cast<std::uint8_t>(low),
                    static_cast<std::uint8_t>(high - low), at};
    // A key without a child of its own has the same beginning in common with all entries: any will
    // do.
    _nodes.resize(children + high - low + 1, {from});
    for (std::uint32_t begin = from; begin != to;) {
      const unsigned half = halfByte(_sorted[begin].text, at);
      std::uint32_t end = begin + 1;
      while (end != to && halfByte(_sorted[end].text, at) == half) {
        ++end;
      }
      ranges.push_back({children + half - low, begin, end});
      begin = end;
    }
  }
}

std::optional<std::size_t> PrefixTable::find(std::string_view key) const {
  if (_nodes.empty()) {
    return std::nullopt;
  }
  const Node* node = _nodes.data();
  while (node->span != 0) {
    node =
        &_nodes[node->next + std::min<unsigned>(halfByte(key, node->at) - node->low, node->span)];
  }
  const Entry* entry = &_sorted[node->next];
  if (!key.starts_with(entry->text)) {
    const std::size_t length = entry->longest != kNone ? commonLength(entry->text, key) : 0;
    do {
      if (entry->longest == kNone) {
        return std::nullopt;
      }
      entry = &_sorted[entry->longest];
    } while (entry->text.size() > length);
  }
  return entry->first;
}

}  // namespace vesprun
