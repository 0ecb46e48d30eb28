#pragma once

#include <optional>
#include <string>

namespace vesprun {

/// The whole content of a regular file. Nothing, with a text in `error` that names the file and the
/// cause, when it cannot be read. `missing`, when given, tells whether the cause is that there is
/// no such file.
std::optional<std::string> readWholeFile(const std::string& path, std::string& error,
                                         bool* missing = nullptr);

}  // namespace vesprun
