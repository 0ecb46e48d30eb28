#pragma once

#include <string>
#include <string_view>

#include "page/Quantity.h"

namespace vesprun {

/// What a key tells of.
struct KeyWords {
  std::string words;  ///< empty when no table knows the key
  Unit unit = Unit::None;
  /// It only ever grows, over days and starts: not the value tells, but how fast it grows.
  bool isRunningTotal = false;
};

/// By the table of Linux figures, the storage's fields, and what the key ends in.
KeyWords wordsOf(std::string_view key);

}  // namespace vesprun
