#pragma once

#include <string>
#include <vector>

#include "page/Element.h"

namespace vesprun {

/// Something that changed, for the first screen.
struct ChangeItem {
  enum class Level { Plain, Look, Act };

  double rank = 0;  ///< the highest comes first
  Level level = Level::Look;
  std::string what;  ///< in words
  std::string key{};
  std::string now{};
  std::string then{};
  Element line{};  ///< the days
};

/// At most ten of them, and how many there are besides.
Element changeList(std::vector<ChangeItem> items);

inline constexpr std::size_t kMaxChanges = 10;

}  // namespace vesprun
