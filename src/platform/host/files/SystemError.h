#pragma once

#include <cerrno>
#include <cstring>
#include <string>

namespace vesprun {

/// "PATH: REASON", the reason being that of `errno`.
inline std::string systemError(const std::string& path) {
  return path + ": " + std::strerror(errno);
}

}  // namespace vesprun
