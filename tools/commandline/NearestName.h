#pragma once

#include <cstddef>
#include <limits>
#include <string>
#include <string_view>
#include <unordered_set>

namespace vesprun {

/// Of the names that it takes, finds the one that is most like a mistyped one.
class NearestName {
 public:
  /// What was typed, whose text must outlive the object; the beginning of names with `isBeginning`.
  explicit NearestName(std::string_view typed, bool isBeginning = false);

  void take(std::string_view name);

  /// Empty when no name was taken.
  const std::string& found() const { return _found; }

  /// Whether it is so near that it may have been meant.
  bool isNear() const { return _least <= 2; }

 private:
  std::string_view _typed;
  bool _isBeginning;
  std::unordered_set<std::string> _compared;
  std::size_t _least = std::numeric_limits<std::size_t>::max();
  std::string _found;
};

}  // namespace vesprun
