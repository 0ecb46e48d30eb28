#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// Keys that are shown together.
struct KeyGroup {
  std::string title;              ///< what all begin with; may be empty
  bool isRest = false;            ///< other groups have keys that begin so, too
  std::vector<std::size_t> keys;  ///< places in the list
};

/// Parts a long list of sorted, dotted keys by their beginnings up to a dot, and a part that is
/// still long by the next dot. Small parts of one level form one group. Every key is in one group.
std::vector<KeyGroup> groupKeys(const std::vector<std::string_view>& keys);

}  // namespace vesprun
