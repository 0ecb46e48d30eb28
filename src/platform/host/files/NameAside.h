#pragma once

#include <string>
#include <string_view>

#include "common/Calendar.h"
#include "platform/Clock.h"

namespace vesprun {

/// "PATH.WHY-20240305T091502Z": where a file that cannot be used is kept.
inline std::string nameAside(const std::string& path, std::string_view why, Clock& clock) {
  std::string time = dateText({clock.now().seconds, 0});
  std::erase_if(time, [](char c) { return c == '-' || c == ':'; });
  return path + '.' + std::string(why) + '-' + time;
}

}  // namespace vesprun
