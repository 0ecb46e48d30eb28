#include "page/KeyGroups.h"

#include <algorithm>
#include <numeric>

namespace vesprun {
namespace {

constexpr std::size_t kLongPart = 40;
constexpr std::size_t kSmallPart = 4;
constexpr int kDeepest = 6;

using Places = std::vector<std::size_t>;

class Grouping {
 public:
  explicit Grouping(const std::vector<std::string_view>& keys) : _keys(keys) {}

  void part(Places places, int depth) {
    const std::size_t prefix = commonPrefix(places);
    const std::string_view first = _keys[places.front()];
    if (places.size() <= kLongPart || depth == kDeepest) {
      groups.push_back({std::string(first.substr(0, prefix)), false, std::move(places)});
      return;
    }
    KeyGroup rest{std::string(first.substr(0, prefix)), true, {}};
    for (auto from = places.begin(); from != places.end();) {
      const std::string_view stem = stemOf(_keys[*from], prefix);
      const auto to = std::find_if(from, places.end(), [&](std::size_t place) {
        return stemOf(_keys[place], prefix) != stem;
      });
      if (to - from < static_cast<std::ptrdiff_t>(kSmallPart)) {
        rest.keys.insert(rest.keys.end(), from, to);
      } else {
        part(Places(from, to), depth + 1);
      }
      from = to;
    }
    if (!rest.keys.empty()) {
      rest.isRest = rest.keys.size() < places.size();
      groups.push_back(std::move(rest));
    }
  }

  std::vector<KeyGroup> groups;

 private:
  /// How long the beginning is that all have in common, up to a dot.
  std::size_t commonPrefix(const Places& places) const {
    const std::string_view first = _keys[places.front()];
    const std::string_view last = _keys[places.back()];
    const auto common = std::mismatch(first.begin(), first.end(), last.begin(), last.end()).first;
    const auto length = static_cast<std::size_t>(common - first.begin());
    const std::size_t dot = first.substr(0, length).rfind('.');
    return dot == std::string_view::npos ? 0 : dot + 1;
  }

  /// A key up to the first dot after `prefix`.
  static std::string_view stemOf(std::string_view key, std::size_t prefix) {
    const std::size_t dot = key.find('.', prefix);
    return dot == std::string_view::npos ? key : key.substr(0, dot + 1);
  }

  const std::vector<std::string_view>& _keys;
};

}  // namespace

std::vector<KeyGroup> groupKeys(const std::vector<std::string_view>& keys) {
  Grouping grouping(keys);
  if (!keys.empty()) {
    Places all(keys.size());
    std::iota(all.begin(), all.end(), std::size_t{0});
    grouping.part(std::move(all), 0);
  }
  std::stable_sort(grouping.groups.begin(), grouping.groups.end(),
                   [](const KeyGroup& left, const KeyGroup& right) {
                     return left.keys.front() < right.keys.front();
                   });
  return std::move(grouping.groups);
}

}  // namespace vesprun
