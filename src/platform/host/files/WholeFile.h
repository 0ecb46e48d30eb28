#pragma once

#include <optional>
#include <string>

namespace vesprun {

/// The content of a regular file. Nothing, with the cause in `error`, when it cannot be read;
/// `missing`, if given, tells whether it does not exist.
std::optional<std::string> readWholeFile(const std::string& path, std::string& error,
                                         bool* missing = nullptr);

}  // namespace vesprun
