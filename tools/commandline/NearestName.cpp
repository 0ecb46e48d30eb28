#include "commandline/NearestName.h"

#include <algorithm>
#include <numeric>
#include <utility>
#include <vector>

namespace vesprun {
namespace {

constexpr std::size_t kMaxCompared = 256;

/// The number of characters to change, insert or remove, or `enough` when it is not less.
std::size_t editDistance(std::string_view left, std::string_view right, std::size_t enough) {
  std::vector<std::size_t> row(right.size() + 1);
  std::iota(row.begin(), row.end(), std::size_t{0});
  for (std::size_t i = 0; i < left.size(); ++i) {
    std::size_t diagonal = std::exchange(row[0], i + 1);
    std::size_t least = row[0];
    for (std::size_t j = 0; j < right.size(); ++j) {
      const std::size_t changed = diagonal + (left[i] == right[j] ? 0 : 1);
      diagonal = row[j + 1];
      row[j + 1] = std::min({changed, row[j] + 1, diagonal + 1});
      least = std::min(least, row[j + 1]);
    }
    if (least >= enough) {
      return enough;
    }
  }
  return std::min(row.back(), enough);
}

}  // namespace

NearestName::NearestName(std::string_view typed, bool isBeginning)
    : _typed(typed.substr(0, kMaxCompared)), _isBeginning(isBeginning) {}

void NearestName::take(std::string_view name) {
  const std::string_view other = name.substr(0, _isBeginning ? _typed.size() : kMaxCompared);
  const std::size_t longer = std::max(_typed.size(), other.size());
  if (longer - std::min(_typed.size(), other.size()) >= _least ||
      !_compared.emplace(other).second) {
    return;
  }
  if (const std::size_t distance = editDistance(_typed, other, _least); distance < _least) {
    _least = distance;
    _found = name;
  }
}

}  // namespace vesprun
