#pragma once

#include <optional>
#include <string>
#include <vector>

namespace vesprun {

/// The names in a folder, sorted by their bytes; none in one that is not there. Nothing, with a
/// text in `error` that names the folder and the cause, when it cannot be read to its end.
std::optional<std::vector<std::string>> namesInFolder(const std::string& folder,
                                                      std::string& error);

}  // namespace vesprun
