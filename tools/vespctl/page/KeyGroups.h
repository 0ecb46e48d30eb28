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

/// Parts a sorted list of dotted keys where it is long: by what they begin with up to a dot, deeper
/// where a part is still long. Small parts at one level are put together. Every key is in one
/// group.
std::vector<KeyGroup> groupKeys(const std::vector<std::string_view>& keys);

}  // namespace vesprun
