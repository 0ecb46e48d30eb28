#include "config/PrefixTable.h"

#include <algorithm>
#include <cstddef>

namespace vesprun {
namespace {

/// So many places are tried for a state's children before they go behind all others, which bounds
/// the time that unfavourable prefixes can take.
constexpr std::uint32_t kMostPlacesTried = 1024;

struct SortedPrefix {
  std::string_view text;
  std::uint32_t place;
};

/// A state whose children are still to be made: the prefixes that lead through it.
struct OpenState {
  std::uint32_t state;
  std::uint32_t begin;
  std::uint32_t end;
  std::size_t depth;
};

std::vector<SortedPrefix> sortedPrefixes(const PropertyDict& optionsByPrefix) {
  std::vector<SortedPrefix> sorted;
  sorted.reserve(optionsByPrefix.size());
  for (const auto& [prefix, options] : optionsByPrefix) {
    sorted.push_back({prefix, static_cast<std::uint32_t>(sorted.size())});
  }
  std::sort(sorted.begin(), sorted.end(),
            [](const auto& left, const auto& right) { return left.text < right.text; });
  return sorted;
}

}  // namespace

PrefixTable::PrefixTable(PropertyDict optionsByPrefix)
    : _optionsByPrefix(std::move(optionsByPrefix)), _cells(1) {
  const std::vector<SortedPrefix> sorted = sortedPrefixes(_optionsByPrefix);
  std::uint32_t firstFree = 1;
  std::vector<Branch> branches;
  std::vector<OpenState> open{{0, 0, static_cast<std::uint32_t>(sorted.size()), 0}};
  while (!open.empty()) {
    const auto [state, begin, end, depth] = open.back();
    open.pop_back();
    branches.clear();
    for (std::uint32_t i = begin; i < end; ++i) {
      if (sorted[i].text.size() == depth) {
        _cells[state].answer = std::min(_cells[state].answer, sorted[i].place);
        continue;
      }
      const auto byte = static_cast<std::uint8_t>(sorted[i].text[depth]);
      if (branches.empty() || branches.back().byte != byte) {
        branches.push_back({byte, i, i});
      }
      branches.back().end = i + 1;
    }
    if (branches.empty()) {
      continue;
    }
    const std::uint32_t base = baseFor(branches, firstFree);
    _cells[state].base = base;
    for (const Branch& branch : branches) {
      const std::uint32_t child = base + branch.byte;
      if (child >= _cells.size()) {
        _cells.resize(child + std::size_t{1});
      }
      _cells[child].parent = state;
      _cells[child].answer = _cells[state].answer;
      open.push_back({child, branch.begin, branch.end, depth + 1});
    }
  }
}

std::uint32_t PrefixTable::baseFor(std::span<const Branch> branches, std::uint32_t& firstFree) {
  while (!isFree(firstFree)) {
    ++firstFree;
  }
  for (std::uint32_t cell = firstFree; cell - firstFree < kMostPlacesTried; ++cell) {
    const std::uint32_t base = cell - branches.front().byte;
    if (std::all_of(branches.begin(), branches.end(),
                    [&](const Branch& branch) { return isFree(base + branch.byte); })) {
      return base;
    }
  }
  return static_cast<std::uint32_t>(_cells.size()) - branches.front().byte;
}

const PrefixTable::Entry* PrefixTable::find(std::string_view key) const {
  std::uint32_t state = 0;
  for (const char c : key) {
    const std::uint32_t next = _cells[state].base + static_cast<std::uint8_t>(c);
    if (next >= _cells.size() || _cells[next].parent != state) {
      break;
    }
    state = next;
  }
  const std::uint32_t answer = _cells[state].answer;
  return answer != kNone ? &*(_optionsByPrefix.begin() + answer) : nullptr;
}

}  // namespace vesprun
