#pragma once

#include <string>
#include <utility>

#include "vesprun/vesprun.h"

namespace vesprun {

/// Why an operation failed: for programs, and for people.
struct CallFailure {
  vesprun_error code = VESPRUN_ERROR_OTHER;
  std::string text;

  /// False, after taking both.
  bool set(vesprun_error why, std::string what) {
    code = why;
    text = std::move(what);
    return false;
  }
};

}  // namespace vesprun
