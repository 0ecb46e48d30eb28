#pragma once

#include <optional>
#include <string>
#include <vector>

namespace vesprun {

/// The names in a folder, sorted by bytes; none when it does not exist. Nothing, with the cause in
/// `error`, when it cannot be read to its end.
std::optional<std::vector<std::string>> namesInFolder(const std::string& folder,
                                                      std::string& error);

}  // namespace vesprun
