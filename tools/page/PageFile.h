#pragma once

#include <string>

namespace vesprun {

/// Writes a page to a file, whole or not at all; what a link leads to is replaced, not the link.
/// Without a name, or with "-", to standard output. Throws `CommandFailure`.
void writePage(const std::string& file, const std::string& page);

}  // namespace vesprun
